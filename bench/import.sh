#!/bin/sh
# Times the whole import command ("main_import_ESA#") of a generated
# wide-swath product, run the way the host runs it (a throw-away
# installation, an argument-list file, the working file and "_batch_ok"),
# against references measured in the same run, on a warm page cache:
#   - the floor: reading the product once (cat to /dev/null) plus writing
#     twice its size (dd from /dev/zero), which any import that turns 16-bit
#     samples into 32-bit floats must pay;
#   - the extraction alone (bench_extraction, with the same orbit), the
#     import's first step;
#   - GDAL: gdal_translate -of ENVI -ot CFloat32 of sub-swath 1 alone.
# Prints each best time, the ratios import/floor and import/extraction, the
# time the import spends after the extraction (header conversion and list
# file) and the import's peak memory.
#
#   bench/import.sh [BUILD_DIR] [SIZE] [ROUNDS]
#
# BUILD_DIR defaults to build-release beside this script's parent (build the
# import_wss, main_delete_file, envisat_synth and bench_extraction targets
# there with -DCMAKE_BUILD_TYPE=Release); SIZE is the generator's size,
# realistic by default (about 1.7 GB; the run needs about three times that in
# $TMPDIR); ROUNDS defaults to 5.
set -eu

here=$(cd "$(dirname "$0")" && pwd)
build=${1:-$here/../build-release}
size=${2:-realistic}
rounds=${3:-5}
for b in import_wss main_delete_file envisat_synth bench_extraction; do
  [ -x "$build/bin/$b" ] || { echo "missing $build/bin/$b: build it first" >&2; exit 2; }
done
command -v gdal_translate > /dev/null 2>&1 || { echo "gdal_translate is missing" >&2; exit 2; }

work=$(mktemp -d "${TMPDIR:-/tmp}/import_bench_XXXXXX")
trap 'rm -rf "$work"' EXIT INT TERM
inst=$("$here/../scripts/make-installation" --bin "$build/bin" "$work/installation")
"$build/bin/envisat_synth" --out "$work/data" --size "$size" > /dev/null
product=$(ls "$work"/data/ASA_WSS_1P*)
orbit=$(ls "$work"/data/DOR_VOR_*)
bytes=$(wc -c < "$product")
samples=$(awk -F' = ' '/^\[SubSwath/ { s = 1 } s && $1 == "Samples" { n = $2 }
  s && $1 == "Records" { total += n * $2; s = 0 } END { printf "%.0f", total }' "$work/data/synth_truth.txt")
# The auxiliary files are chosen from the installation's list, as the host
# leaves them to the tool.
cp "$work"/data/ASA_AUX_list.dat "$work"/data/ASA_XCA_* "$work"/data/ASA_INS_* "$inst/des/"
mkdir -p "$work/out"
args="$inst/working/import_args.txt"
printf '%s\n' "IMPORT ARGUMENTS" "$product" "$orbit" NotOK "$work/out/R" NotOK \
  NotOK NotOK NotOK NotOK NotOK NotOK NotOK NotOK NotOK > "$args"

# One import as the host starts it; a failed one is remembered.
run_import() {
  printf '0\nStarting\n' > "$inst/working/Process.working"
  : > "$inst/working/Process.working_batch_ok"
  VELORAN_INIT_DIR="$inst" "$@" "$build/bin/import_wss" "main_import_ESA#$args" \
    || echo "import failed with status $?" >> "$work/failed"
}

# One timed run of a command; its outputs are removed and the file system
# synchronised after it, so that no run pays for an earlier one's writes.
timed() {
  t0=$(date +%s.%N)
  "$@" > /dev/null 2>&1
  t1=$(date +%s.%N)
  rm -f "$work"/out/* "$work"/R? "$work"/R?.hdr "$work"/dd.bin "$work"/gdal.bin*
  sync
  awk "BEGIN { print $t1 - $t0 }"
}
min() { awk -v a="$1" -v b="$2" 'BEGIN { print (b == "" || a < b) ? a : b }'; }

# Rounds of all five commands, interleaved so that a slow spell of the
# machine does not fall on one of them only; the best time of each counts.
cat "$product" > /dev/null
read_s=; write_s=; gdal_s=; extract_s=; import_s=
round=0
while [ $round -lt "$rounds" ]; do
  round=$((round + 1))
  read_s=$(min "$(timed cat "$product")" "$read_s")
  write_s=$(min "$(timed dd if=/dev/zero of="$work/dd.bin" bs=1M count=$((2 * bytes / 1048576)))" "$write_s")
  extract_s=$(min "$(timed "$build/bin/bench_extraction" "$product" "$work/R" "$orbit")" "$extract_s")
  import_s=$(min "$(timed run_import)" "$import_s")
  gdal_s=$(min "$(timed gdal_translate -q -of ENVI -ot CFloat32 -b 1 "$product" "$work/gdal.bin")" "$gdal_s")
done
if [ -f "$work/failed" ]; then
  cat "$work/failed" >&2
  tail -n 30 "$inst/working/Process.log" >&2
  exit 1
fi
# A last, untimed import for its peak memory and its list file.
rss=
if [ -x /usr/bin/time ]; then
  run_import /usr/bin/time -f "%M" -o "$work/rss.txt"
  rss=$(tail -n 1 "$work/rss.txt")
else
  run_import
fi
[ "$(wc -l < "$work/out/R")" -eq 5 ] || { echo "the import wrote no list file" >&2; exit 1; }

awk -v bytes="$bytes" -v samples="$samples" -v r="$read_s" -v w="$write_s" -v g="$gdal_s" \
    -v e="$extract_s" -v i="$import_s" -v rss="$rss" -v rounds="$rounds" 'BEGIN {
  floor = r + w
  printf "product %.0f MB, %.1f M samples in five sub-swaths; best of %d rounds\n",
         bytes / 1e6, samples / 1e6, rounds
  printf "%-38s %8.2f s\n", "read product (cat)", r
  printf "%-38s %8.2f s\n", "write twice its size (dd)", w
  printf "%-38s %8.2f s  %6.1f M samples/s\n", "floor (read + write)", floor, samples / floor / 1e6
  printf "%-38s %8.2f s\n", "GDAL, sub-swath 1 only", g
  printf "%-38s %8.2f s  %6.1f M samples/s\n", "extraction alone, five sub-swaths", e, samples / e / 1e6
  printf "%-38s %8.2f s  %6.1f M samples/s\n", "import (main_import_ESA#)", i, samples / i / 1e6
  printf "import / floor: %.2f   import / extraction: %.2f\n", i / floor, i / e
  printf "after the extraction (conversion, list file, start-up): %.2f s\n", i - e
  if (rss != "") printf "peak memory of the import: %.1f MiB\n", rss / 1024
}'
