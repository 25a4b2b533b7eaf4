#!/bin/bash
# Merge throughput: "kestrel -merge" over a large generated data set against cat of the
# same files into one output file, with peak memory. Usage: bench/merge_bench.sh BUILD_DIR
# Size: KG_BENCH_FILES (20) files of KG_BENCH_RECORDS (5000) records, 50 functions of 20
# blocks each; consecutive files share half of their records.
set -euo pipefail
BUILD=$(cd "${1:-build}" && pwd)
FILES=${KG_BENCH_FILES:-20}
RECORDS=${KG_BENCH_RECORDS:-5000}
# In memory when possible: the figures are the program's, not those of a shared disk.
if [ -z "${TMPDIR:-}" ] && [ -d /dev/shm ] && [ -w /dev/shm ]; then TMPDIR=/dev/shm; fi
WORK=$(mktemp -d "${TMPDIR:-/tmp}/kg-merge-bench.XXXXXX")
trap 'rm -rf "$WORK"' EXIT
TIME=/usr/bin/time
[ -x "$TIME" ] || { echo "merge_bench: /usr/bin/time is needed (Debian package 'time')"; exit 1; }

echo "merge_bench: generating $FILES files of $RECORDS records..."
inputs=()
for ((i = 0; i < FILES; i++)); do
  echo "generate records=$RECORDS first=$((i * RECORDS / 2)) functions=50 blocks=20 seed=$((i + 1))" |
    "$BUILD/bin/kgv-make" - "$WORK/run$i.kgv"
  inputs+=("$WORK/run$i.kgv")
done
bytes=$(cat "${inputs[@]}" | wc -c)

# The program's merge mode when it is reachable, else the stand-in with the same code.
merge=("$BUILD/bin/kestrel")
if ! "$BUILD/bin/kestrel" "-merge=$WORK/probe.kgv" "${inputs[0]}" >/dev/null 2>&1 ||
   [ ! -s "$WORK/probe.kgv" ]; then
  merge=("$BUILD/bench/kgv_merge_driver")
  echo "merge_bench: kestrel -merge is not available yet; timing $BUILD/bench/kgv_merge_driver"
fi
rm -f "$WORK/probe.kgv"

cat "${inputs[@]}" >/dev/null  # both runs read from the page cache

. "$(dirname "$0")/timing.inc"
# cat writes its output as the merge does: the same files in, one file out.
read -r cat_s cat_kb cat_cpu < <(best sh -c 'out=$1; shift; cat "$@" >"$out"' sh "$WORK/cat.out" "${inputs[@]}")
rm -f "$WORK/cat.out"
read -r merge_s merge_kb merge_cpu < <(best "${merge[@]}" "-merge=$WORK/merged.kgv" "${inputs[@]}")
out_bytes=$(wc -c <"$WORK/merged.kgv")

awk -v runs="$RUNS" -v b="$bytes" -v cs="$cat_s" -v ms="$merge_s" -v mk="$merge_kb" -v ob="$out_bytes" -v n="$FILES" \
    -v cc="$cat_cpu" -v mc="$merge_cpu" -v dir="$WORK" '
  function mbps(s) { return s > 0 ? b / 1e6 / s : 1e9 }
  BEGIN {
    printf "merge_bench: %d files, %.1f MB in, merged output %.1f MB\n", n, b / 1e6, ob / 1e6
    printf "  (files in %s; best of %d runs; CPU = user + system time)\n", dir, runs
    printf "  cat:   %6.2f s  %8.1f MB/s  (CPU %.2f s)\n", cs, mbps(cs), cc
    printf "  merge: %6.2f s  %8.1f MB/s  (CPU %.2f s)  peak memory %.1f MB\n", ms, mbps(ms), mc, mk * 1024 / 1e6
    ratio = mbps(ms) / mbps(cs)
    mem = mk * 1024 / ob
    printf "  merge/cat throughput: %.3f (target >= 0.25)  peak memory / output: %.2f (target <= 1.5)\n", ratio, mem
  }'
