#!/usr/bin/env bash
# Installs the Debian packages the build, the tests and the tools need, and only
# those that are missing, so a second run costs nothing.
set -euo pipefail

packages=(
    cmake make g++ pkg-config
    libboost-dev libboost-program-options-dev libboost-iostreams-dev libboost-date-time-dev
    libjpeg-dev libtiff-dev libssl-dev
    libgtest-dev libbenchmark-dev
    libjpeg-turbo-progs libtiff-tools
    python3                 # the report tests check the page with Python's HTML parser
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
$sudo apt-get update -qq
$sudo apt-get install -y -qq --no-install-recommends "${missing[@]}"
