#!/usr/bin/env bash
# Installs what the 32-bit ARM (Debian armhf) cross build and its emulated test
# run need: the cross compiler, qemu's user-mode emulator and the armhf builds of
# the libraries the tool links. Installs only what is missing, so a second run
# costs nothing.
set -euo pipefail

packages=(
    cmake make pkg-config
    g++-arm-linux-gnueabihf qemu-user
    libc6:armhf libstdc++6:armhf
    libboost-dev:armhf libboost-program-options-dev:armhf
    libboost-iostreams-dev:armhf libboost-date-time-dev:armhf
    libjpeg-dev:armhf libtiff-dev:armhf libssl-dev:armhf
    libgtest-dev:armhf
    nlohmann-json3-dev      # header-only (any architecture): the --json result, flatgen, the tests
    python3 python3-jsonschema  # the host runs the result tests' schema check
)

before_install() {
    if ! dpkg --print-foreign-architectures | grep -qx armhf; then
        $sudo dpkg --add-architecture armhf
    fi
}
. "$(dirname "$0")/lib/apt-missing.sh"
install_missing "${packages[@]}"
