#!/usr/bin/env bash
# Whole-run benchmark: times the complete tool on synthetic flat fields of 5,
# 13 and 50 megapixels at 10 and 12 bits against reading the input file once,
# with the file in the page cache (warm) and dropped from it (cold), and
# reports the stage times of the --debug timer lines and the peak memory.
#
#   bench/whole_run.sh            uses build/lsc and build/flatgen
#   BUILD_DIR=build-x RUNS=7 bench/whole_run.sh
#
# Environment: BUILD_DIR (build), LSC and FLATGEN (the programs, by default
# in BUILD_DIR), WORK_DIR (a fresh temporary directory, removed afterwards
# unless given), RUNS per case and cache state (5; the fastest run is
# reported, since other work on the machine only ever adds time), SIZES (a
# list of WIDTHxHEIGHT, default 5, 13 and 50 megapixels), BITS (10 12).
#
# Goals: the whole run within 2 times the file read, peak resident memory at
# most 4 bytes per input pixel. The timed runs are plain runs
# (--calibrate --binary --flat --jpeg); the stage times come from one more run
# with --debug (processor seconds of its timer lines). Wall and CPU times come
# from GNU time and the shell's clock. When the input cannot be dropped from
# the page cache (dd iflag=nocache), the cold columns say "-".
set -euo pipefail
cd "$(dirname "$0")/.."

build_dir="${BUILD_DIR:-build}"
runs="${RUNS:-5}"
sizes="${SIZES:-2592x1944 4208x3120 8192x6144}"
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

fastest() { sort -g | head -1; }

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

summary="$work/summary.txt"
stages="$work/stages.txt"
: >"$summary"
: >"$stages"

# Times `cat input` RUNS times, cold or warm; prints the fastest, or "-" when
# the file cannot be dropped from the cache.
time_read() {
    local input=$1 state=$2 times=() start
    for ((i = 0; i < runs; i++)); do
        if [[ $state == cold ]]; then drop_cache "$input" || { echo -; return; }; else cat "$input" >/dev/null; fi
        start=$(now)
        cat "$input" >/dev/null
        times+=("$(elapsed "$start" "$(now)")")
    done
    printf '%s\n' "${times[@]}" | fastest
}

# Runs the tool RUNS times, cold or warm; prints "wall user sys rss_kb" of the
# fastest run, or "- - - -" when the file cannot be dropped from the cache.
time_runs() {
    local input=$1 config=$2 out=$3 state=$4 runs_file="$3/runs-$4.txt" start
    : >"$runs_file"
    for ((i = 0; i < runs; i++)); do
        if [[ $state == cold ]]; then drop_cache "$input" || { echo "- - - -"; return; }; else cat "$input" >/dev/null; fi
        start=$(now)
        /usr/bin/time -f '%U %S %M' -o "$out/time.txt" \
            "$lsc" --config "$config" --input "$input" --calibrate "$out/cal.txt" \
            --binary "$out/cal.bin" --flat "$out/flat.kqraw" --jpeg "$out/flat.jpg" \
            --kq >"$out/run.log" 2>&1 || { echo "run failed: $input" >&2; cat "$out/run.log" >&2; exit 1; }
        grep -q '^Completed\.$' "$out/run.log" || { echo "no Completed. in $out/run.log" >&2; exit 1; }
        echo "$(elapsed "$start" "$(now)") $(tail -1 "$out/time.txt")" >>"$runs_file"
    done
    sort -g "$runs_file" | head -1
}

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
        out="$work/out-${size}-${bits}"
        mkdir -p "$out"

        read_warm=$(time_read "$input" warm)
        read_cold=$(time_read "$input" cold)
        read -r wall_warm user sys rss_kb <<<"$(time_runs "$input" "$config" "$out" warm)"
        read -r wall_cold _ _ _ <<<"$(time_runs "$input" "$config" "$out" cold)"

        # Stage times: one more, warm run in debug mode.
        "$lsc" --config "$config" --input "$input" --calibrate "$out/cal.txt" \
            --binary "$out/cal.bin" --flat "$out/flat.kqraw" --jpeg "$out/flat.jpg" \
            --kq --debug >"$out/debug.log" 2>&1
        awk -v c="$case_name" '/ sec$/ {
                line = $0; sub(/ sec$/, "", line)
                n = split(line, parts, ": ")
                printf "%s\t%s\t%s\n", c, parts[1], parts[n]
            }' "$out/debug.log" >>"$stages"
        awk -v c="$case_name" -v p="$pixels" -v fb="$file_bytes" -v rw="$read_warm" \
            -v rc="$read_cold" -v ww="$wall_warm" -v wc="$wall_cold" -v u="$user" -v s="$sys" \
            -v k="$rss_kb" 'function ratio(a, b) { return (a == "-" || b == "-" || b <= 0) ? "-" : sprintf("%.1f", a / b) }
            BEGIN {
                printf "%s\t%.1f\t%.1f\t%s\t%s\t%s\t%s\t%.3f\t%s\t%s\t%.1f\t%.2f\n",
                    c, p / 1e6, fb / 1048576, rw, ww, rc, wc, u + s, ratio(ww, rw), ratio(wc, rc),
                    k / 1024, k * 1024 / p
            }' >>"$summary"
    done
done

echo "Per-stage processor seconds (--debug timer lines of one warm run):"
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
echo "Whole run (fastest of $runs; warm: file in the page cache, cold: dropped from it):"
printf '%-10s %6s %8s %8s %8s %8s %8s %7s %9s %9s %9s %8s\n' case MP "file MiB" "read w" "run w" "read c" "run c" "cpu s" "run/read" "cold r/r" "peak MiB" "B/pixel"
awk -F'\t' '{ printf "%-10s %6s %8s %8s %8s %8s %8s %7s %9s %9s %9s %8s\n", $1, $2, $3, $4, $5, $6, $7, $8, $9, $10, $11, $12 }' "$summary"
echo
echo "Goals: run/read <= 2 (warm and cold), B/pixel <= 4. Times in seconds; cpu s is user + system time of the fastest warm run. Load average: $(cut -d' ' -f1-3 /proc/loadavg) on $(nproc) cores."
