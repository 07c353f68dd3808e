#!/usr/bin/env bash
# Checks that every C++ source of the project is formatted with the project's
# .clang-format (clang-format 14, as Debian ships it). Generated files and test
# data are not sources: only tracked *.h and *.cpp outside tests/data/ and
# fuzz/corpus/ are checked.
#
#   scripts/check-format.sh          lists the files that differ, exits 1 if any
#   scripts/check-format.sh --fix    formats them in place
set -euo pipefail
cd "$(dirname "$0")/.."

formatter="${CLANG_FORMAT:-}"
if [[ -z "$formatter" ]]; then
    for candidate in clang-format-14 clang-format; do
        if command -v "$candidate" >/dev/null; then formatter="$candidate"; break; fi
    done
fi
[[ -n "$formatter" ]] || { echo "clang-format not found (scripts/install-deps.sh installs it)" >&2; exit 1; }

if git rev-parse --is-inside-work-tree >/dev/null 2>&1; then
    mapfile -t files < <(git ls-files -- '*.h' '*.cpp' | grep -Ev '^(tests/data|fuzz/corpus)/')
else
    mapfile -t files < <(find . -path ./tests/data -prune -o -path ./fuzz/corpus -prune \
        -o -path './build*' -prune -o \( -name '*.h' -o -name '*.cpp' \) -print | sed 's|^\./||' | sort)
fi

if [[ "${1:-}" == "--fix" ]]; then
    "$formatter" -i "${files[@]}"
    exit 0
fi

differing=()
for file in "${files[@]}"; do
    "$formatter" "$file" | cmp -s - "$file" || differing+=("$file")
done
if (( ${#differing[@]} )); then
    echo "Not formatted with .clang-format ($formatter; scripts/check-format.sh --fix formats them):"
    printf '  %s\n' "${differing[@]}"
    exit 1
fi
echo "format: ${#files[@]} files match .clang-format"
