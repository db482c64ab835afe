#!/bin/sh
# Times the wide-swath multilook of a generated product against the same
# range transforms alone and against the import, all in one run on a warm
# page cache:
#   - import: extraction of the five sub-swaths and their header conversion;
#   - multilook: reading the converted sub-swaths, burst processing and
#     recomposition, in slant and in ground range;
#   - transforms alone: the forward and inverse transforms the multilook ran
#     (same lengths, same line counts, two threads), without any I/O;
#   - geocoding of the ground-range output onto its UTM grid (Cloud Optimized
#     GeoTIFF), in the same process as that multilook, with the memory it
#     added.
# Prints the times, the ratio of the multilook to its transforms and the
# peak memory of each step.
#
#   bench/multilook.sh [BUILD_DIR] [SIZE]
#
# BUILD_DIR defaults to build-release beside this script's parent (build the
# envisat_synth, main_delete_file and bench_multilook targets there with
# -DCMAKE_BUILD_TYPE=Release); SIZE is the generator's size, realistic by
# default (about 1.7 GB; the run needs about six times that in $TMPDIR).
set -eu

here=$(cd "$(dirname "$0")" && pwd)
build=${1:-$here/../build-release}
size=${2:-realistic}
for b in envisat_synth bench_multilook main_delete_file; do
  [ -x "$build/bin/$b" ] || { echo "missing $build/bin/$b: build it first" >&2; exit 2; }
done

work=$(mktemp -d "${TMPDIR:-/tmp}/multilook_bench_XXXXXX")
trap 'rm -rf "$work"' EXIT INT TERM
"$build/bin/envisat_synth" --out "$work" --size "$size" --pattern uniform --band-limit > /dev/null
product=$(ls "$work"/ASA_WSS_1P*)
orbit="$work/$(awk -F' = ' '$1 == "OrbitFile" { print $2; exit }' "$work/synth_truth.txt")"
xca="$work/$(awk -F' = ' '$1 == "XcaFile" { print $2; exit }' "$work/synth_truth.txt")"
VELORAN_INIT_DIR=$("$here/../scripts/make-installation" --bin "$build/bin" "$work/install" | tail -1)
export VELORAN_INIT_DIR

value() { awk -v k="$1" '$1 == k { $1 = ""; sub(/^ /, ""); print; exit }' "$2"; }

best() { awk -v a="$1" -v b="$2" 'BEGIN { print (b == "" || a < b) ? a : b }'; }

# Rounds of every step, interleaved so that a slow spell of the machine
# does not fall on one of them only; the best time of each counts.
cat "$product" > /dev/null
import_s=; slant_s=; ground_s=; fft_s=; geo_s=
for round in 1 2 3; do
  "$build/bin/bench_multilook" import "$product" "$orbit" "$xca" "$work/R" > "$work/import.txt"
  import_s=$(best "$(value seconds "$work/import.txt")" "$import_s")
  rm -f "$work"/R?.hdr
  sync
  "$build/bin/bench_multilook" multilook "$work/R" "$xca" "$work/R_pwr" slant > "$work/slant.txt"
  slant_s=$(best "$(value seconds "$work/slant.txt")" "$slant_s")
  rm -f "$work/R_pwr"
  sync
  "$build/bin/bench_multilook" multilook "$work/R" "$xca" "$work/R_gr" ground "$work/R_geo.tif" \
    > "$work/ground.txt"
  ground_s=$(best "$(value seconds "$work/ground.txt")" "$ground_s")
  geo_s=$(best "$(value geocode_seconds "$work/ground.txt")" "$geo_s")
  rm -f "$work/R_gr" "$work/R_geo.tif" "$work/R_geo.tif.sml"
  sync
  # shellcheck disable=SC2046
  "$build/bin/bench_multilook" fft $(value plan "$work/ground.txt") > "$work/fft.txt"
  fft_s=$(best "$(value seconds "$work/fft.txt")" "$fft_s")
done

awk -v i="$import_s" -v im="$(value peak_rss_mib "$work/import.txt")" \
    -v s="$slant_s" -v sm="$(value peak_rss_mib "$work/slant.txt")" \
    -v g="$ground_s" -v gm="$(value peak_rss_mib "$work/ground.txt")" \
    -v f="$fft_s" -v geo="$geo_s" -v map="$(value geocode_map "$work/ground.txt")" \
    -v g0="$(value geocode_start_rss_mib "$work/ground.txt")" \
    -v g1="$(value geocode_peak_rss_mib "$work/ground.txt")" \
    -v looks="$(value looks "$work/ground.txt")" -v d="$(value decimation "$work/ground.txt")" \
    -v gs="$(value samples "$work/ground.txt")" -v ss="$(value samples "$work/slant.txt")" \
    -v lines="$(value lines "$work/ground.txt")" -v plan="$(value plan "$work/ground.txt")" \
    -v bytes="$(wc -c < "$product")" -v err="$(value resampling_error "$work/ground.txt")" 'BEGIN {
  n = split(plan, p, " ")
  for (k = 1; k <= n; k += 4) transformed += p[k + 3]
  printf "product %.0f MB; %d range looks, decimation %d; %.0f lines transformed\n",
         bytes / 1e6, looks, d, transformed
  printf "output: slant %d x %d, ground %d x %d samples x lines\n", ss, lines, gs, lines
  printf "%-40s %8.2f s  peak %7.1f MiB\n", "import (extraction + conversion)", i, im
  printf "%-40s %8.2f s  peak %7.1f MiB\n", "multilook, slant range", s, sm
  printf "%-40s %8.2f s  peak %7.1f MiB\n", "multilook, ground range", g, gm
  printf "%-40s %8.2f s\n", "the same transforms alone", f
  printf "multilook / transforms: slant %.2f, ground %.2f\n", s / f, g / f
  printf "%-40s %8.2f s  peak %7.1f MiB (%.1f MiB at its start)\n", "geocoding of the ground-range output", geo, g1, g0
  printf "map %s pixels; geocoding / ground-range multilook: %.2f\n", map, geo / g
  printf "ground-range resampling times within %s composite samples of the exact ones\n", err
}'
