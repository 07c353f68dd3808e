#!/usr/bin/env bash
# Installs the Debian packages the build, the tests and the tools need, and only
# those that are missing, so a second run costs nothing. With --program, only
# those that building the program itself needs (scripts/run-example.sh).
set -euo pipefail

program_packages=(
    cmake make g++ pkg-config
    libboost-dev libboost-program-options-dev libboost-iostreams-dev libboost-date-time-dev
    libjpeg-dev libtiff-dev libssl-dev
    nlohmann-json3-dev      # the --json result; flatgen and the tests read tuning files
)
test_packages=(
    libgtest-dev libbenchmark-dev
    libjpeg-turbo-progs libtiff-tools
    python3                 # the report tests; the man page and bash completion
    python3-jsonschema      # the result tests validate --json documents against their schema
    groff-base              # the install test renders the man page
    clang-format-14         # scripts/check-format.sh: the sources follow .clang-format
)

. "$(dirname "$0")/lib/apt-missing.sh"
if [ "${1:-}" = "--program" ]; then
    install_missing "${program_packages[@]}"
else
    install_missing "${program_packages[@]}" "${test_packages[@]}"
fi
