#!/usr/bin/env bash
# Frame-averaging benchmark: how much several frames of one flat field
# (--input given N times) lower the noise the calibration sees.
#
#   bench/frame_averaging.sh          uses build/lsc and build/flatgen
#
# For each seed set, 1 and N frames (different noise seeds, same shading) of
# a generated 10-bit flat field with photon shot noise and read noise are
# calibrated, and so is the noiseless flat field. Reported, averaged over the
# sets:
#   noise floor  the RMS sample deviation of the fit (lsc.log_err_flag), which
#                sensor noise on the samples sets;
#   calibration  the RMS difference of the 400 control points from those of
#   error        the noiseless calibration, relative to them (noise-driven
#                calibration error);
# and the ratio of the single frame's figure to the averaged one's (ideal:
# sqrt(N)). Environment: BUILD_DIR (build), FRAMES (4), SETS (5), SIZE
# (2000x1500), SETTINGS ("default" or "raw": no median filter and no
# reduction, where the noise reaches the samples undamped), WORK_DIR.
set -euo pipefail
cd "$(dirname "$0")/.."

build_dir="${BUILD_DIR:-build}"
lsc="${LSC:-$build_dir/lsc}"
flatgen="${FLATGEN:-$build_dir/flatgen}"
frames="${FRAMES:-4}"
sets="${SETS:-5}"
size="${SIZE:-2000x1500}"
settings="${SETTINGS:-default}"
work="${WORK_DIR:-$(mktemp -d)}"
[ -n "${WORK_DIR:-}" ] || trap 'rm -rf "$work"' EXIT

width=${size%x*}
height=${size#*x}
config="$work/lsc.cfg"
{
    echo "lsc.log_err_flag = 1; shared.bit_res = 10;"
    if [ "$settings" = raw ]; then
        echo "proc.median_filter_flag = 0; shared.proc_sampling_factor = 1;"
        echo "apply_lsc.sampling_factor = 1; proc.min_pixel_val = 0; proc.max_pixel_val = 1023;"
        echo "lsc.max_err = 1; lsc.max_rms_err = 1;"  # the noise reaches the samples undamped
    fi
} > "$config"

generate() { # output seed noise-args...
    local out=$1 seed=$2
    shift 2
    "$flatgen" --width "$width" --height "$height" --corner 0.5 --seed "$seed" "$@" "$out" >/dev/null
}

calibrate() { # register-file inputs...
    local cal=$1
    shift
    local args=()
    for input in "$@"; do args+=(--input "$input"); done
    "$lsc" --config "$config" "${args[@]}" --calibrate "$cal" --json "$cal.json" > "$cal.out" ||
        { cat "$cal.out" >&2; exit 1; }
}

generate "$work/clean.kqraw" 1
calibrate "$work/clean.txt" "$work/clean.kqraw"

python3 - "$work" "$frames" "$sets" <<'PY' > "$work/plan.txt"
import sys
work, frames, sets = sys.argv[1], int(sys.argv[2]), int(sys.argv[3])
for s in range(sets):
    print(s, " ".join(str(100 + s * frames + i) for i in range(frames)))
PY
while read -r set seeds; do
    inputs=()
    for seed in $seeds; do
        generate "$work/f$seed.kqraw" "$seed" --full-well 5000 --read-noise 2.5
        inputs+=("$work/f$seed.kqraw")
    done
    calibrate "$work/one$set.txt" "${inputs[0]}"
    calibrate "$work/avg$set.txt" "${inputs[@]}"
    rm -f "${inputs[@]}"
done < "$work/plan.txt"

python3 - "$work" "$frames" "$sets" "$settings" "$size" <<'PY'
import json, math, re, sys
work, frames, sets, settings, size = sys.argv[1], int(sys.argv[2]), int(sys.argv[3]), sys.argv[4], sys.argv[5]

def points(path):
    return [float(v) for v in re.findall(r"controlPoint\w+\[\d\]\[\d\]\s*=\s*([-0-9.e]+);",
                                         open(path).read())]

def floor(path):
    rms = json.load(open(path + ".json"))["measurements"]["fit_deviation"]["rms"]
    return math.sqrt(sum(v * v for v in rms.values()) / 4)

def error(path, clean):
    p = points(path)
    return math.sqrt(sum(((a - b) / b) ** 2 for a, b in zip(p, clean)) / len(p))

clean = points(work + "/clean.txt")
rows = {"one": [0, 0], "avg": [0, 0]}
for s in range(sets):
    for kind in rows:
        path = "%s/%s%d.txt" % (work, kind, s)
        rows[kind][0] += floor(path) / sets
        rows[kind][1] += error(path, clean) / sets
print("frame averaging: %s, %s settings, %d sets, sqrt(%d) = %.2f" %
      (size, settings, sets, frames, math.sqrt(frames)))
print("| frames | noise floor (RMS sample deviation) | calibration error (RMS, %) |")
print("|---|---|---|")
print("| 1 | %.5f | %.4f |" % (rows["one"][0], 100 * rows["one"][1]))
print("| %d | %.5f | %.4f |" % (frames, rows["avg"][0], 100 * rows["avg"][1]))
print("| ratio | %.2f | %.2f |" % (rows["one"][0] / rows["avg"][0], rows["one"][1] / rows["avg"][1]))
PY
