#!/usr/bin/env bash
# Whole-run benchmark: times the complete tool on synthetic flat fields of 5,
# 12 and 50 megapixels at 10 and 12 bits, against reading the input file once,
# and reports the stage times of the --debug timer lines and the peak memory.
#
#   bench/whole_run.sh            uses build/lsc and build/flatgen
#   BUILD_DIR=build-x RUNS=5 bench/whole_run.sh
#
# Environment: BUILD_DIR (build), LSC and FLATGEN (the programs, by default
# in BUILD_DIR), WORK_DIR (a fresh temporary directory,
# removed afterwards unless given), RUNS per case (3; the median run is
# reported), SIZES (a list of WIDTHxHEIGHT, default 5, 12 and 50 megapixels),
# BITS (10 12).
#
# Goals: the whole run within 4 times the file read, peak resident memory at
# most 10 bytes per input pixel. Stage times are the tool's own timer lines
# (processor seconds); wall and CPU times come from GNU time. When the input
# can be dropped from the page cache (dd iflag=nocache), both the file read and
# every tool run start cold; otherwise both are warm, and the table says which.
set -euo pipefail
cd "$(dirname "$0")/.."

build_dir="${BUILD_DIR:-build}"
runs="${RUNS:-3}"
sizes="${SIZES:-2592x1944 4000x3000 8192x6144}"
bit_depths="${BITS:-10 12}"
lsc="${LSC:-$build_dir/lsc}"
flatgen="${FLATGEN:-$build_dir/flatgen}"
for tool in "$lsc" "$flatgen"; do
    [[ -x "$tool" ]] || { echo "missing $tool: build first (scripts/build.sh)" >&2; exit 1; }
done

if [[ ! -x /usr/bin/time ]]; then
    echo "installing GNU time" >&2
    if [[ $(id -u) -eq 0 ]]; then apt-get install -y -qq time >/dev/null; else sudo apt-get install -y -qq time >/dev/null; fi
fi

if [[ -n "${WORK_DIR:-}" ]]; then
    work="$WORK_DIR"
    mkdir -p "$work"
else
    work="$(mktemp -d /tmp/lsc-whole-run.XXXXXX)"
    trap 'rm -rf "$work"' EXIT
fi

export LC_ALL=C

# Drops a file from the page cache; true when it is gone (or cannot be checked).
drop_cache() {
    sync "$1" 2>/dev/null || true
    dd if="$1" iflag=nocache count=0 status=none 2>/dev/null || return 1
    if command -v fincore >/dev/null; then
        [[ "$(fincore --noheadings --output PAGES "$1" 2>/dev/null | tr -d ' ')" == "0" ]]
    fi
}

# Seconds since the epoch with microseconds (bash 5), for wall times finer
# than GNU time's hundredths.
now() { echo "${EPOCHREALTIME/,/.}"; }
elapsed() { awk -v a="$1" -v b="$2" 'BEGIN { printf "%.4f\n", b - a }'; }

median() { sort -g | awk '{ v[NR] = $1 } END { print v[int((NR + 1) / 2)] }'; }

# The configuration: empty for 10 bits; for other depths the pixel limits
# (50, 1014 and 716 in 10-bit units) scaled to the depth.
write_config() {
    local bits=$1 file=$2
    if [[ $bits -eq 10 ]]; then
        : >"$file"
    else
        awk -v b="$bits" 'BEGIN {
            s = (2 ^ b - 1) / 1023
            printf "shared.bit_res = %d;\n", b
            printf "proc.min_pixel_val = %d;\n", int(50 * s + 0.5)
            printf "proc.max_pixel_val = %d;\n", int(1014 * s + 0.5)
            printf "proc.peak_pixel_min = %d;\n", int(716 * s + 0.5)
        }' >"$file"
    fi
}

cache_state=cold
summary="$work/summary.txt"
stages="$work/stages.txt"
: >"$summary"
: >"$stages"

for size in $sizes; do
    width=${size%x*}
    height=${size#*x}
    for bits in $bit_depths; do
        case_name="$(awk -v w="$width" -v h="$height" 'BEGIN { printf "%.0fMP", w * h / 1e6 }')/${bits}b"
        input="$work/flat-${size}-${bits}.kqraw"
        config="$work/lsc-${bits}.cfg"
        write_config "$bits" "$config"
        "$flatgen" --width "$width" --height "$height" --bits "$bits" "$input"
        pixels=$((width * height))
        file_bytes=$(stat -c %s "$input")

        reads=()
        for ((i = 0; i < runs; i++)); do
            drop_cache "$input" || cache_state=warm
            start=$(now)
            cat "$input" >/dev/null
            reads+=("$(elapsed "$start" "$(now)")")
        done
        read_s=$(printf '%s\n' "${reads[@]}" | median)

        out="$work/out-${size}-${bits}"
        mkdir -p "$out"
        runs_file="$work/runs-${size}-${bits}.txt"
        : >"$runs_file"
        for ((i = 0; i < runs; i++)); do
            drop_cache "$input" || cache_state=warm
            log="$out/run-$i.log"
            start=$(now)
            /usr/bin/time -f '%U %S %M' -o "$out/time-$i.txt" \
                "$lsc" --config "$config" --input "$input" --calibrate "$out/cal.txt" \
                --binary "$out/cal.bin" --flat "$out/flat.kqraw" --jpeg "$out/flat.jpg" \
                --kq --debug >"$log" 2>&1 || { echo "run failed: $case_name" >&2; cat "$log" >&2; exit 1; }
            grep -q '^Completed\.$' "$log" || { echo "no Completed. in $log" >&2; exit 1; }
            echo "$(elapsed "$start" "$(now)") $(tail -1 "$out/time-$i.txt") $i" >>"$runs_file"
        done
        # The run with the median wall time stands for the case.
        chosen=$(sort -g "$runs_file" | awk -v n="$runs" 'NR == int((n + 1) / 2)')
        read -r wall user sys rss_kb index <<<"$chosen"
        awk -v c="$case_name" '/ sec$/ {
                line = $0; sub(/ sec$/, "", line)
                n = split(line, parts, ": ")
                printf "%s\t%s\t%s\n", c, parts[1], parts[n]
            }' "$out/run-$index.log" >>"$stages"
        awk -v c="$case_name" -v p="$pixels" -v fb="$file_bytes" -v r="$read_s" -v w="$wall" \
            -v u="$user" -v s="$sys" -v k="$rss_kb" 'BEGIN {
                ratio = r > 0 ? w / r : 0
                cpu_ratio = r > 0 ? (u + s) / r : 0
                printf "%s\t%.1f\t%.1f\t%.3f\t%.3f\t%.2f\t%.1f\t%.1f\t%.1f\t%.2f\n",
                    c, p / 1e6, fb / 1048576, r, w, u + s, ratio, cpu_ratio, k / 1024, k * 1024 / p
            }' >>"$summary"
    done
done

echo "Per-stage processor seconds (--debug timer lines, median run):"
awk -F'\t' '
    !($1 in seen_case) { seen_case[$1] = 1; cases[++nc] = $1 }
    !($2 in seen_stage) { seen_stage[$2] = 1; stage[++ns] = $2 }
    { t[$1, $2] = $3 }
    END {
        printf "%-38s", "stage"; for (c = 1; c <= nc; c++) printf " %10s", cases[c]; print ""
        for (s = 1; s <= ns; s++) {
            printf "%-38s", stage[s]
            for (c = 1; c <= nc; c++) printf " %10s", ((cases[c], stage[s]) in t) ? t[cases[c], stage[s]] : "-"
            print ""
        }
    }' "$stages"
echo
echo "Whole run (median of $runs; file read and runs $cache_state):"
printf '%-10s %6s %8s %8s %8s %7s %10s %9s %9s %8s\n' case MP "file MiB" "read s" "wall s" "cpu s" "wall/read" "cpu/read" "peak MiB" "B/pixel"
awk -F'\t' '{ printf "%-10s %6s %8s %8s %8s %7s %10s %9s %9s %8s\n", $1, $2, $3, $4, $5, $6, $7, $8, $9, $10 }' "$summary"
echo
echo "Goals: wall/read <= 4, B/pixel <= 10. cpu s is user + system time of the tool. Load average: $(cut -d' ' -f1-3 /proc/loadavg) on $(nproc) cores."
