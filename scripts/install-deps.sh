#!/usr/bin/env bash
# Installs the Debian packages the build, the tests and the tools need, and only
# those that are missing, so a second run costs nothing.
set -euo pipefail

packages=(
    cmake make g++ pkg-config
    libboost-dev libboost-program-options-dev libboost-iostreams-dev libboost-date-time-dev
    libjpeg-dev libtiff-dev libssl-dev
    libgtest-dev libbenchmark-dev
    nlohmann-json3-dev      # the --json result; flatgen and the tests read tuning files
    libjpeg-turbo-progs libtiff-tools
    python3                 # the report tests check the page with Python's HTML parser
    python3-jsonschema      # the result tests validate --json documents against their schema
)

. "$(dirname "$0")/lib/apt-missing.sh"
install_missing "${packages[@]}"
