#!/bin/sh
# Pages through a sparse image with the hex editor's storage (bench_hexstorage) and reads the same
# range with dd in 64 KiB blocks; prints both times and their ratio, and the storage's peak RSS.
# Usage: bench/hexstorage_vs_dd.sh BUILD_DIR [BYTES]   (BUILD_DIR configured with -DBRINDLE_BENCH=ON)
set -eu
build=${1:?build directory}
bytes=${2:-4294967296}
tmp=$(mktemp -d)
trap 'rm -rf "$tmp"' EXIT
truncate -s "$bytes" "$tmp/sparse.img"
start=$(date +%s.%N)
dd if="$tmp/sparse.img" of=/dev/null bs=64K status=none
end=$(date +%s.%N)
dd_ms=$(echo "($end - $start) * 1000" | bc -l)
out=$(BRINDLE_BENCH_BYTES=$bytes "$build/bench/bench_hexstorage" --benchmark_filter=BM_StoragePaging --benchmark_format=csv 2>/dev/null | tail -1)
storage_ms=$(echo "$out" | cut -d, -f3)
echo "dd: ${dd_ms} ms; storage: ${storage_ms} ms; ratio storage/dd: $(echo "$storage_ms / $dd_ms" | bc -l)"
echo "$out"
