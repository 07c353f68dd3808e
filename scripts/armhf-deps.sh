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
)

missing=()
for p in "${packages[@]}"; do
    if ! dpkg-query -W -f='${Status}' "$p" 2>/dev/null | grep -q 'install ok installed'; then
        missing+=("$p")
    fi
done

if [ "${#missing[@]}" -eq 0 ]; then
    exit 0
fi

echo "Installing: ${missing[*]}"
sudo=""
if [ "$(id -u)" -ne 0 ]; then
    sudo="sudo"
fi
export DEBIAN_FRONTEND=noninteractive
if ! dpkg --print-foreign-architectures | grep -qx armhf; then
    $sudo dpkg --add-architecture armhf
fi
$sudo apt-get -o DPkg::Lock::Timeout=600 update -qq
$sudo apt-get -o DPkg::Lock::Timeout=600 install -y -qq --no-install-recommends "${missing[@]}"
