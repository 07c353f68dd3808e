#!/usr/bin/env bash
# One command from a fresh clone to a green test run: dependencies, build, tests.
set -euo pipefail
cd "$(dirname "$0")/.."
scripts/install-deps.sh
scripts/build.sh
# --no-tests=error: a build without GoogleTest must not pass for a green run.
ctest --test-dir "${BUILD_DIR:-build}" --output-on-failure --no-tests=error -j "$(nproc)"
