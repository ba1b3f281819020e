#!/usr/bin/env bash
# Reads 1 GiB sequentially from a loop device over a cached image file, once through
# CDevice::ReadSectors in 1 MiB requests (bench_device_read) and once with dd bs=1M, and
# prints the throughput ratio (kernel / dd). Needs root for the loop device.
#   bench/device_read_vs_dd.sh [BUILD_DIR]   (default build/bench)
set -euo pipefail
cd "$(dirname "$0")/.."
build=${1:-build/bench}
bench="$build/bench/bench_device_read"
[ -x "$bench" ] || { echo "build $bench first (scripts/build bench)" >&2; exit 2; }

work=$(mktemp -d)
loop=""
cleanup() {
    exec 3<&- || true
    [ -n "$loop" ] && losetup -d "$loop" || true
    rm -rf "$work"
}
trap cleanup EXIT

image="$work/disk.img"
dd if=/dev/urandom of="$image" bs=1M count=1024 status=none
cat "$image" >/dev/null # keep the image file in the page cache
loop=$(losetup -f --show "$image")
bytes=$(blockdev --getsize64 "$loop")
# The block device's cache is dropped at its last close: hold it open for the whole run so
# both readers find the same warm cache.
exec 3<"$loop"
dd if="$loop" of=/dev/null bs=1M status=none

dd_rate() {
    local best=0
    for _ in 1 2 3 4 5; do
        local start end
        start=$(date +%s.%N)
        dd if="$loop" of=/dev/null bs=1M status=none
        end=$(date +%s.%N)
        best=$(echo "$best $bytes $start $end" | awk '{r = $2 / ($4 - $3); print (r > $1) ? r : $1}')
    done
    echo "$best"
}

ddr=$(dd_rate)
# Both sides take their best of five runs: the machine may be busy with other work.
kr=$(BRINDLE_BENCH_DEVICE="$loop" BRINDLE_BENCH_BYTES="$bytes" "$bench" --benchmark_format=json \
         --benchmark_repetitions=5 --benchmark_min_time=1 2>/dev/null |
     awk -F'[:,]' '/"bytes_per_second"/ {gsub(/ /, "", $2); if ($2 + 0 > best) best = $2 + 0} END {if (best) printf "%.0f\n", best}')
[ -n "$kr" ] || { echo "benchmark produced no figure" >&2; exit 1; }
awk -v k="$kr" -v d="$ddr" 'BEGIN {
    printf "CDevice::ReadSectors: %.1f MiB/s\n", k / 1048576
    printf "dd bs=1M:             %.1f MiB/s\n", d / 1048576
    printf "ratio:                %.2f\n", k / d
}'
