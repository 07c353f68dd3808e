#!/usr/bin/env bash
# Calibrates the bundled example flat field with the bundled configuration:
# installs what building the program needs, builds only the program, and
# writes every output into examples/out/. (scripts/test.sh builds the rest.)
set -euo pipefail
cd "$(dirname "$0")/.."
scripts/install-deps.sh --program
BUILD_TARGET=lsc scripts/build.sh
mkdir -p examples/out
set -x
build/lsc --config examples/lsc.cfg --input examples/flatfield.kqraw \
    --calibrate examples/out/calibration.txt \
    --binary examples/out/calibration.bin \
    --flat examples/out/flattened.kqraw \
    --jpeg examples/out/flattened.jpg \
    --kq --delta examples/out/delta.csv --stats examples/out/stats.csv "$@"
