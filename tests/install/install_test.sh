#!/usr/bin/env bash
# Installs the build into a scratch DESTDIR as a user's `cmake --install` does
# and checks what lands under the prefix: exactly the files a user needs; the
# installed program calibrates the installed example exactly as the build's
# program does; the man page renders without a warning; the bash completion
# offers every long option of the help text and completes file names.
# Usage: install_test.sh BUILD_DIR [EMULATOR...]   (the emulator of a cross build)
set -euo pipefail
build=$(cd "$1" && pwd)
shift
run=("$@")
dest=$(mktemp -d)
trap 'rm -rf "$dest"' EXIT
fail() {
    echo "FAIL: $*" >&2
    exit 1
}

DESTDIR="$dest" cmake --install "$build" --prefix /usr >/dev/null
cd "$dest"
expected="./usr/bin/lsc
./usr/share/bash-completion/completions/lsc
./usr/share/doc/lsc/CHANGELOG.md
./usr/share/doc/lsc/LICENSE
./usr/share/doc/lsc/README.md
./usr/share/doc/lsc/docs/report-example.png
./usr/share/doc/lsc/examples/flatfield.kqraw
./usr/share/doc/lsc/examples/lsc.cfg
./usr/share/man/man1/lsc.1"
installed=$(find . -type f | LC_ALL=C sort)
[ "$installed" = "$expected" ] || fail "installed files differ:
$(diff <(echo "$expected") <(echo "$installed"))"

# The installed program on the installed example, against the build's program.
examples=../usr/share/doc/lsc/examples
calibrate() { # PROGRAM DIR
    mkdir "$2"
    (cd "$2" && "${run[@]}" "$1" --config $examples/lsc.cfg --input $examples/flatfield.kqraw \
        --calibrate cal.txt --binary cal.bin >out.txt) || fail "$1 failed on the example"
}
calibrate "$dest/usr/bin/lsc" installed
calibrate "$build/lsc" built
[ "$(tail -n 1 installed/out.txt)" = "Completed." ] || fail "the example run did not complete"
for f in out.txt cal.txt cal.bin; do
    cmp -s installed/$f built/$f || fail "$f of the installed program differs from the build's"
done

# The man page renders with groff's warnings on, and says nothing.
command -v groff >/dev/null || fail "groff is missing (scripts/install-deps.sh installs groff-base)"
warnings=$(groff -man -Tutf8 -ww -z usr/share/man/man1/lsc.1 2>&1) || fail "groff failed: $warnings"
[ -z "$warnings" ] || fail "the man page draws warnings: $warnings"

# What the completion offers for the last word of a command line.
complete_words() {
    bash -c 'source "$1"; shift; COMP_WORDS=("$@"); COMP_CWORD=$(($# - 1)); _lsc
             printf "%s\n" "${COMPREPLY[@]}" | LC_ALL=C sort' \
        _ "$dest/usr/share/bash-completion/completions/lsc" "$@"
}
long_options() { # the long options a help text lists
    grep -oE '^  (-. \[ )?--[a-z]+' | grep -oE -- '--[a-z]+' | LC_ALL=C sort
}
help_all=$("${run[@]}" usr/bin/lsc --help --kq | long_options)
help_basic=$( ("${run[@]}" usr/bin/lsc --help | long_options; echo --kq) | LC_ALL=C sort)
[ "$(complete_words lsc --kq --)" = "$help_all" ] ||
    fail "with --kq the completion does not offer every long option"
[ "$(complete_words lsc --)" = "$help_basic" ] ||
    fail "without --kq the completion should offer the basic options and --kq"
[ "$(complete_words lsc --ca)" = "--calibrate" ] || fail "--ca does not complete to --calibrate"
[ "$(cd installed && complete_words lsc --input ca)" = "$(printf 'cal.bin\ncal.txt')" ] ||
    fail "the argument of --input does not complete to file names"
echo "install test passed: $(echo "$installed" | wc -l) files under the prefix"
