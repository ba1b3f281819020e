#!/usr/bin/env bash
# Disk-image throughput against standard tools, on a 1 GiB disk of random and empty areas:
#  - reading a dynamic VHD through the kernel (bench_image_vhd) against
#    qemu-img convert -O raw of the same file (into a file of the same temporary folder);
#  - writing an own-format image at zlib level 1 against gzip -1 of the raw disk.
# Prints both throughputs and the ratio (kernel / tool) of each; best of several runs.
#   bench/image_vs_tools.sh [BUILD_DIR]   (default build/bench)
set -euo pipefail
cd "$(dirname "$0")/.."
build=${1:-build/bench}
bench="$build/bench/bench_image_vhd"
[ -x "$bench" ] || { echo "build $bench first (scripts/build bench)" >&2; exit 2; }
command -v qemu-img >/dev/null || { echo "qemu-img is needed" >&2; exit 2; }

work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT
raw="$work/disk.raw"
vhd="$work/disk.vhd"
bytes=$((1024 * 1048576))
# Three of every four 2 MiB blocks hold random data, the fourth is empty.
truncate -s $bytes "$raw"
for ((b = 0; b < 512; ++b)); do
    if ((b % 4 != 3)); then
        dd if=/dev/urandom of="$raw" bs=2M count=1 seek=$b conv=notrunc status=none
    fi
done
qemu-img convert -f raw -O vpc -o subformat=dynamic,force_size=on "$raw" "$vhd"
cat "$vhd" "$raw" >/dev/null

best_time() { # command... -> best wall time in seconds of 3 runs
    local best=""
    for _ in 1 2 3; do
        local start end t
        start=$(date +%s.%N)
        "$@" >/dev/null
        end=$(date +%s.%N)
        t=$(echo "$start $end" | awk '{print $2 - $1}')
        if [ -z "$best" ] || awk -v a="$t" -v b="$best" 'BEGIN { exit !(a < b) }'; then
            best=$t
        fi
    done
    echo "$best"
}

qemu_t=$(best_time qemu-img convert -f vpc -O raw "$vhd" "$work/out.raw")
rm -f "$work/out.raw"
gzip_t=$(best_time sh -c "gzip -1 -c '$raw' > '$work/disk.gz'")

json=$(BRINDLE_BENCH_VHD="$vhd" BRINDLE_BENCH_RAW="$raw" BRINDLE_BENCH_OUT="$work/disk.tdi" "$bench" \
           --benchmark_format=json --benchmark_repetitions=3 2>/dev/null)
rate() { # benchmark name -> best bytes per second
    echo "$json" | awk -v name="$1" -F'[:,]' '
        /"name"/ { current = $2 }
        /"bytes_per_second"/ { if (index(current, name) && current !~ /_(mean|median|stddev|cv)"/) {
            gsub(/ /, "", $2); if ($2 + 0 > best) best = $2 + 0 } }
        END { printf "%.0f\n", best }'
}
vhd_rate=$(rate BM_VhdDynamicRead)
tdi_rate=$(rate BM_TarvoCreateLevel1)
awk -v k="$vhd_rate" -v t="$qemu_t" -v c="$tdi_rate" -v g="$gzip_t" -v b="$bytes" \
    -v tsize="$(stat -c %s "$work/disk.tdi")" -v gsize="$(stat -c %s "$work/disk.gz")" 'BEGIN {
    q = b / t; z = b / g
    printf "VHD read through the kernel:   %.1f MiB/s\n", k / 1048576
    printf "qemu-img convert -O raw:       %.1f MiB/s\n", q / 1048576
    printf "ratio (kernel / qemu-img):     %.2f\n", k / q
    printf "own-format creation, level 1:  %.1f MiB/s (%d bytes)\n", c / 1048576, tsize
    printf "gzip -1:                       %.1f MiB/s (%d bytes)\n", z / 1048576, gsize
    printf "ratio (kernel / gzip -1):      %.2f\n", c / z
}'
