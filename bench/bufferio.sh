#!/bin/sh
# Times BufferIO reading a 1 GiB big-endian SHORT_COMPLEX raster with 17-byte
# line prefixes, line by line into FLOAT_COMPLEX (as BufferIO opens the file
# itself, and through an unbuffered file), against a plain sequential
# read of the same file (cat), both on a warm page cache, and prints the
# ratios.
#
#   bench/bufferio.sh [BUILD_DIR] [MiB]
#
# BUILD_DIR defaults to build-release beside this script's parent; build it
# with -DCMAKE_BUILD_TYPE=Release.  The scratch file goes to $TMPDIR (/tmp)
# and is deleted on exit.
set -eu

here=$(cd "$(dirname "$0")" && pwd)
build=${1:-$here/../build-release}
mib=${2:-1024}
bin=$build/bin/bench_bufferio
[ -x "$bin" ] || { echo "missing $bin: build the bench_bufferio target first" >&2; exit 2; }

file=$(mktemp "${TMPDIR:-/tmp}/bufferio_XXXXXX")
results=$(mktemp "${TMPDIR:-/tmp}/bufferio_results_XXXXXX")
trap 'rm -f "$file" "$file.hdr" "$results"' EXIT INT TERM

"$bin" make "$file" "$mib"
cat "$file" > /dev/null  # warm the page cache

if command -v hyperfine > /dev/null 2>&1; then
  hyperfine -N --warmup 3 --runs 15 --export-csv "$results" \
    -n plain-read "cat $file" \
    -n bufferio "$bin read $file" \
    -n bufferio-unbuffered "$bin read $file 0"
  # CSV: command,mean,stddev,median,user,system,min,max
  awk -F, -v bytes="$(wc -c < "$file")" '
    NR == 1 { next }
    { name[NR] = $1; median[NR] = $4; cpu[NR] = $5 + $6 }
    END {
      printf "\n%-22s %10s %10s %12s\n", "", "median s", "cpu s", "GB/s"
      for (i = 2; i <= NR; i++)
        printf "%-22s %10.3f %10.3f %12.2f\n", name[i], median[i], cpu[i], bytes / median[i] / 1e9
      for (i = 3; i <= NR; i++)
        printf "ratio %s / plain-read: %.2f (median), %.2f (cpu)\n", name[i], median[i] / median[2], cpu[i] / cpu[2]
    }' "$results"
else
  run() {  # best wall time of five runs
    best=
    for i in 1 2 3 4 5; do
      t=$( { /usr/bin/time -f %e "$@" > /dev/null; } 2>&1 | tail -n 1)
      if [ -z "$best" ] || awk "BEGIN { exit !($t < $best) }"; then best=$t; fi
    done
    echo "$best"
  }
  plain=$(run cat "$file")
  buffered=$(run "$bin" read "$file")
  unbuffered=$(run "$bin" read "$file" 0)
  echo "plain read $plain s, bufferio $buffered s, bufferio unbuffered $unbuffered s"
  awk "BEGIN { printf \"ratio bufferio / plain-read: %.2f, unbuffered: %.2f\n\", \
        $buffered / $plain, $unbuffered / $plain }"
fi
