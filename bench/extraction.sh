#!/bin/sh
# Times the extraction of a generated wide-swath product (all five
# sub-swaths) against two references measured in the same run, on a warm
# page cache:
#   - GDAL: gdal_translate -of ENVI -ot CFloat32 of sub-swath 1 alone, in
#     samples per second;
#   - the floor: reading the product once (cat to /dev/null) plus writing
#     twice its size (dd from /dev/zero), which any copy that turns 16-bit
#     samples into 32-bit floats must pay.
# Prints the samples per second of each, the ratio of the extraction's time
# to the floor and its peak memory.
#
#   bench/extraction.sh [BUILD_DIR] [SIZE]
#
# BUILD_DIR defaults to build-release beside this script's parent (build the
# envisat_synth and bench_extraction targets there with
# -DCMAKE_BUILD_TYPE=Release); SIZE is the generator's size, realistic by
# default (about 1.7 GB; the run needs about four times that in $TMPDIR).
set -eu

here=$(cd "$(dirname "$0")" && pwd)
build=${1:-$here/../build-release}
size=${2:-realistic}
for b in envisat_synth bench_extraction; do
  [ -x "$build/bin/$b" ] || { echo "missing $build/bin/$b: build it first" >&2; exit 2; }
done
command -v gdal_translate > /dev/null 2>&1 || { echo "gdal_translate is missing" >&2; exit 2; }

work=$(mktemp -d "${TMPDIR:-/tmp}/extraction_bench_XXXXXX")
trap 'rm -rf "$work"' EXIT INT TERM
"$build/bin/envisat_synth" --out "$work" --size "$size" > /dev/null
product=$(ls "$work"/ASA_WSS_1P*)
bytes=$(wc -c < "$product")
samples=$(awk -F' = ' '/^\[SubSwath/ { s = 1 } s && $1 == "Samples" { n = $2 }
  s && $1 == "Records" { total += n * $2; s = 0 } END { printf "%.0f", total }' "$work/synth_truth.txt")
ss1=$(awk -F' = ' '/^\[SubSwath1\]/ { s = 1 } s && $1 == "Samples" { n = $2 }
  s && $1 == "Records" { printf "%.0f", n * $2; exit }' "$work/synth_truth.txt")

# One timed run of a command; its outputs are removed and the file system
# synchronised after it, so that no run pays for an earlier one's writes.
timed() {
  t0=$(date +%s.%N)
  "$@" > /dev/null 2>&1
  t1=$(date +%s.%N)
  rm -f "$work"/R? "$work"/R?.hdr "$work"/dd.bin "$work"/gdal.bin*
  sync
  awk "BEGIN { print $t1 - $t0 }"
}
min() { awk -v a="$1" -v b="$2" 'BEGIN { print (b == "" || a < b) ? a : b }'; }

# Rounds of all four commands, interleaved so that a slow spell of the
# machine does not fall on one of them only; the best time of each counts.
cat "$product" > /dev/null
read_s=; write_s=; gdal_s=; ours_s=
for round in 1 2 3 4 5; do
  read_s=$(min "$(timed cat "$product")" "$read_s")
  write_s=$(min "$(timed dd if=/dev/zero of="$work/dd.bin" bs=1M count=$(( 2 * bytes / 1048576 )))" "$write_s")
  ours_s=$(min "$(timed "$build/bin/bench_extraction" "$product" "$work/R")" "$ours_s")
  gdal_s=$(min "$(timed gdal_translate -q -of ENVI -ot CFloat32 -b 1 "$product" "$work/gdal.bin")" "$gdal_s")
done
"$build/bin/bench_extraction" "$product" "$work/R" > "$work/last.txt"
rss=$(awk '$1 == "peak_rss_mib" { print $2 }' "$work/last.txt")

awk -v bytes="$bytes" -v samples="$samples" -v ss1="$ss1" -v r="$read_s" -v w="$write_s" \
    -v g="$gdal_s" -v o="$ours_s" -v rss="$rss" 'BEGIN {
  floor = r + w
  printf "product %.0f MB, %.1f M samples in five sub-swaths\n", bytes / 1e6, samples / 1e6
  printf "%-34s %8.2f s\n", "read product (cat)", r
  printf "%-34s %8.2f s\n", "write twice its size (dd)", w
  printf "%-34s %8.2f s  %6.1f M samples/s\n", "floor (read + write)", floor, samples / floor / 1e6
  printf "%-34s %8.2f s  %6.1f M samples/s\n", "GDAL, sub-swath 1 only", g, ss1 / g / 1e6
  printf "%-34s %8.2f s  %6.1f M samples/s\n", "extraction, five sub-swaths", o, samples / o / 1e6
  printf "extraction / floor: %.2f   extraction / GDAL (samples per second): %.2f\n",
         o / floor, (samples / o) / (ss1 / g)
  printf "peak memory of the extraction: %.1f MiB\n", rss
}'
