#!/usr/bin/env bash
# Renders the calibration report of the bundled example in headless Chromium
# and checks what a reader gets: a page that passes the structure check, a
# screenshot that is not blank, and a print on one or two A4 pages.
#
# Chromium is installed here and not by scripts/install-deps.sh, so the test
# command stays lean. Uses $BUILD_DIR (default build/), building it when it
# has no lsc yet. With --update-docs the screenshot becomes
# docs/report-example.png.
set -euo pipefail
cd "$(dirname "$0")/.."
build_dir="${BUILD_DIR:-build}"
update_docs=false
[ "${1:-}" = "--update-docs" ] && update_docs=true

. scripts/lib/apt-missing.sh
install_missing chromium python3
[ -x "$build_dir/lsc" ] || BUILD_DIR="$build_dir" scripts/build.sh

# The example's outputs go where scripts/run-example.sh puts them, so the
# page shows the paths a reader of the README knows; the pictures go to a
# scratch directory.
mkdir -p examples/out
page="examples/out/report.html"
"$build_dir/lsc" --config examples/lsc.cfg --input examples/flatfield.kqraw \
    --calibrate examples/out/calibration.txt --kq --quiet --report "$page"
python3 tests/report/check_report.py "$page" --verdict=pass --figures=7
out="$(mktemp -d)"
trap 'rm -rf "$out"' EXIT

# A fresh profile per run, nothing fetched, no sandbox (CI runs as root).
render() {
    local profile
    profile="$(mktemp -d "$out/profile.XXXXXX")"
    if ! timeout 180 chromium --headless --no-sandbox --disable-gpu --no-first-run \
        --disable-background-networking --disable-component-update --disable-sync \
        --disable-dev-shm-usage --hide-scrollbars --user-data-dir="$profile" \
        "$@" "file://$PWD/$page" >"$out/chromium.log" 2>&1; then
        cat "$out/chromium.log" >&2
        echo "Chromium could not render the report." >&2
        return 1
    fi
}

render --window-size=900,1900 --screenshot="$out/report.png"
python3 tests/report/png_check.py "$out/report.png"

render --no-pdf-header-footer --print-to-pdf="$out/report.pdf"
pages="$(python3 - "$out/report.pdf" <<'PY'
import re, sys
data = open(sys.argv[1], "rb").read()
print(len(re.findall(rb"/Type\s*/Page(?![a-zA-Z])", data)))
PY
)"
echo "The report prints on $pages A4 page(s)."
if [ "$pages" -lt 1 ] || [ "$pages" -gt 2 ]; then
    echo "The report should print on one or two A4 pages." >&2
    exit 1
fi

if $update_docs; then
    mkdir -p docs
    cp "$out/report.png" docs/report-example.png
    echo "Wrote docs/report-example.png"
fi
