#!/usr/bin/env bash
# Cross-builds the tool and its tests for 32-bit ARM (Debian armhf) into
# build-armhf/ (or $BUILD_DIR) and runs the whole suite under qemu-arm: test
# programs through CTest's emulator, build/lsc and build/flatgen through the
# tests' own emulator prefix, so binfmt_misc is not needed. Extra arguments go
# to CMake's configure step.
set -euo pipefail
cd "$(dirname "$0")/.."
scripts/armhf-deps.sh
build_dir="${BUILD_DIR:-build-armhf}"
# -O1: the emulated run checks results, not speed, and -O3 would double the
# cross build's time. The numbers are the same at every level (no contraction).
cmake -S . -B "$build_dir" -DCMAKE_TOOLCHAIN_FILE=cmake/armhf-toolchain.cmake \
    -DCMAKE_CXX_FLAGS_RELEASE="-O1 -DNDEBUG" \
    -DCMAKE_BUILD_TYPE="${BUILD_TYPE:-Release}" -DBUILD_TESTING=ON \
    -DBUILD_BENCHMARKS=OFF -DBUILD_FUZZERS=OFF -DENABLE_SANITIZERS=OFF "$@" >/dev/null
cmake --build "$build_dir" -j "$(nproc)"
ctest --test-dir "$build_dir" --output-on-failure -j "$(nproc)"
