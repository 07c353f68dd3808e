#!/usr/bin/env bash
# Rewrites every kept output under tests/data from the current build: the
# byte-identity test (golden/), the end-to-end cases (e2e/) and the modules'
# case transcripts and files (config/, prep/, image/, blob/, lsc/, report/).
# Only for an intended change of output: review every diff it makes
# (git diff tests/data) before committing it.
set -euo pipefail
cd "$(dirname "$0")/.."
build_dir="${BUILD_DIR:-build}"
cmake --build "$build_dir" -j "$(nproc)" --target all
rm -rf tests/data/golden/case* tests/data/golden/example
LSC_GOLDEN_UPDATE=1 "$build_dir/tests/e2e_tests" --gtest_filter='*GoldenOutputs*:Table/Cases.*'
for module in config prep image blob lsc report; do
    LSC_GOLDEN_UPDATE=1 "$build_dir/tests/${module}_tests" > /dev/null
done
git status --short tests/data
