#!/usr/bin/env bash
# Configures and builds into build/ (or the directory given as $BUILD_DIR):
# everything, or only the target named by $BUILD_TARGET. Extra arguments go to
# CMake's configure step.
set -euo pipefail
cd "$(dirname "$0")/.."
build_dir="${BUILD_DIR:-build}"
cmake -S . -B "$build_dir" -DCMAKE_BUILD_TYPE="${BUILD_TYPE:-Release}" "$@" >/dev/null
cmake --build "$build_dir" -j "$(nproc)" ${BUILD_TARGET:+--target "$BUILD_TARGET"}
