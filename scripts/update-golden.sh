#!/usr/bin/env bash
# Rewrites the kept outputs of the byte-identity test (tests/data/golden/) and
# of the end-to-end cases (tests/data/e2e/) from the current build. Only for an
# intended change of output: review every diff it makes (git diff tests/data)
# before committing it.
set -euo pipefail
cd "$(dirname "$0")/.."
build_dir="${BUILD_DIR:-build}"
cmake --build "$build_dir" -j "$(nproc)" --target lsc flatgen e2e_tests
rm -rf tests/data/golden/case* tests/data/golden/example
LSC_GOLDEN_UPDATE=1 "$build_dir/tests/e2e_tests" --gtest_filter='*GoldenOutputs*:Table/Cases.*'
git status --short tests/data/golden tests/data/e2e
