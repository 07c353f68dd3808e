#!/usr/bin/env bash
# Builds the Debian package of the build in $BUILD_DIR (default build/; the
# armhf cross build gives an armhf package) into <build dir>/packages/, and
# checks it: the architecture it names is the one of the program it carries,
# its Depends lists the libraries the program links, and the packaged program
# calibrates the packaged example exactly as the build's program does.
set -euo pipefail
cd "$(dirname "$0")/.."
. scripts/lib/apt-missing.sh
install_missing dpkg-dev binutils   # dpkg-shlibdeps for Depends, readelf for the check
build_dir="${BUILD_DIR:-build}"
if [ -f "$build_dir/CMakeCache.txt" ]; then
    cmake --build "$build_dir" -j "$(nproc)" >/dev/null   # as configured (cross or not)
else
    BUILD_DIR="$build_dir" scripts/build.sh
fi
rm -rf "$build_dir/packages"
(cd "$build_dir" && cpack -G DEB >/dev/null)
deb=$(echo "$build_dir"/packages/lsc_*.deb)
[ -f "$deb" ] || { echo "CPack wrote no package" >&2; exit 1; }

fail() {
    echo "$deb: $*" >&2
    exit 1
}
out=$(mktemp -d)
trap 'rm -rf "$out"' EXIT
dpkg-deb -x "$deb" "$out/root"
architecture=$(dpkg-deb --field "$deb" Architecture)
machine=$(readelf -h "$out/root/usr/bin/lsc" | sed -n 's/^ *Machine: *//p')
case "$architecture/$machine" in
    amd64/*X86-64 | armhf/ARM) ;;
    *) fail "names architecture $architecture but carries a program for $machine" ;;
esac
depends=$(dpkg-deb --field "$deb" Depends)
[[ $depends == *libboost-program-options* && $depends == *libtiff* ]] ||
    fail "Depends lacks the program's libraries: $depends"

# In a cross build the programs run through its emulator.
emulator=$(sed -n 's/^LSC_QEMU_ARM:FILEPATH=//p' "$build_dir/CMakeCache.txt")
examples=$out/root/usr/share/doc/lsc/examples
run_example() { # PROGRAM DIR
    mkdir "$2"
    (cd "$2" && $emulator "$1" --config "$examples/lsc.cfg" --input "$examples/flatfield.kqraw" \
        --calibrate cal.txt --binary cal.bin >/dev/null) || fail "$1 failed on the example"
}
run_example "$out/root/usr/bin/lsc" "$out/packaged"
run_example "$(cd "$build_dir" && pwd)/lsc" "$out/built"
for f in cal.txt cal.bin; do
    cmp -s "$out/packaged/$f" "$out/built/$f" ||
        fail "the packaged program's $f differs from the build's"
done
echo "$deb: $architecture, $(du -k "$deb" | cut -f1) KiB, Depends: $depends"
