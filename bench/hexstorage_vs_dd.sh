#!/bin/sh
# Pages through a sparse image with the hex editor's storage (bench_hexstorage) and reads the same
# range with dd in 64 KiB blocks; prints the median wall-clock and CPU times of both over REPS runs
# (default 3), their ratios, and the storage's peak RSS.
# Usage: bench/hexstorage_vs_dd.sh BUILD_DIR [BYTES]   (BUILD_DIR configured with -DBRINDLE_BENCH=ON)
#        BENCH=path/to/bench_hexstorage overrides the program (to compare two builds).
set -eu
build=${1:?build directory}
bytes=${2:-4294967296}
reps=${REPS:-3}
bench=${BENCH:-$build/bench/bench_hexstorage}
tmp=$(mktemp -d)
trap 'rm -rf "$tmp"' EXIT
truncate -s "$bytes" "$tmp/sparse.img"

median() { sort -n | awk '{ v[NR] = $1 } END { print (NR % 2) ? v[(NR + 1) / 2] : (v[NR / 2] + v[NR / 2 + 1]) / 2 }'; }

i=0
while [ "$i" -lt "$reps" ]; do
    start=$(date +%s.%N)
    /usr/bin/time -f '%U %S' -o "$tmp/time" dd if="$tmp/sparse.img" of=/dev/null bs=64K status=none
    end=$(date +%s.%N)
    echo "($end - $start) * 1000" | bc -l >>"$tmp/dd_real"
    awk '{ printf "%.1f\n", ($1 + $2) * 1000 }' "$tmp/time" >>"$tmp/dd_cpu"
    i=$((i + 1))
done
BRINDLE_BENCH_BYTES=$bytes "$bench" --benchmark_filter=BM_StoragePaging --benchmark_repetitions="$reps" \
    --benchmark_format=csv 2>/dev/null | grep '^"BM_StoragePaging/iterations:1",' >"$tmp/runs"
cut -d, -f3 "$tmp/runs" >"$tmp/st_real"
cut -d, -f4 "$tmp/runs" >"$tmp/st_cpu"

dd_real=$(median <"$tmp/dd_real")
dd_cpu=$(median <"$tmp/dd_cpu")
st_real=$(median <"$tmp/st_real")
st_cpu=$(median <"$tmp/st_cpu")
rss=$(cut -d, -f12 "$tmp/runs" | sort -n | tail -1)
cache=$(cut -d, -f11 "$tmp/runs" | sort -n | tail -1)
echo "bytes: $bytes; runs: $reps (medians)"
echo "dd: ${dd_real} ms wall, ${dd_cpu} ms cpu; storage: ${st_real} ms wall, ${st_cpu} ms cpu"
echo "ratio storage/dd: wall $(echo "$st_real / $dd_real" | bc -l | cut -c1-6), cpu $(echo "$st_cpu / $dd_cpu" | bc -l | cut -c1-6)"
echo "storage peak RSS: ${rss} MiB (cache ${cache} MiB)"
