#!/bin/bash
# Export cost: "kestrel -export > /dev/null" against "kestrel -merge" of the same files, with
# peak memory. Usage: bench/export_bench.sh BUILD_DIR
# Data: the generated set of merge_bench.sh (KG_BENCH_FILES (20) files of KG_BENCH_RECORDS
# (5000) records, 50 functions of 20 blocks; consecutive files share half their records),
# plus one file of KG_BENCH_MARKED (50) records under absolute paths whose lines an
# adjustments file marks (60 lines each: dead code, tested and inspected ranges).
set -euo pipefail
BUILD=$(cd "${1:-build}" && pwd)
FILES=${KG_BENCH_FILES:-20}
RECORDS=${KG_BENCH_RECORDS:-5000}
MARKED=${KG_BENCH_MARKED:-50}
if [ -z "${TMPDIR:-}" ] && [ -d /dev/shm ] && [ -w /dev/shm ]; then TMPDIR=/dev/shm; fi
WORK=$(mktemp -d "${TMPDIR:-/tmp}/kg-export-bench.XXXXXX")
trap 'rm -rf "$WORK"' EXIT
TIME=/usr/bin/time
[ -x "$TIME" ] || { echo "export_bench: /usr/bin/time is needed (Debian package 'time')"; exit 1; }

echo "export_bench: generating $FILES files of $RECORDS records and $MARKED marked records..."
inputs=()
for ((i = 0; i < FILES; i++)); do
  echo "generate records=$RECORDS first=$((i * RECORDS / 2)) functions=50 blocks=20 seed=$((i + 1))" |
    "$BUILD/bin/kgv-make" - "$WORK/run$i.kgv"
  inputs+=("$WORK/run$i.kgv")
done

# Records under absolute paths, each with 100 lines of which every other one is unused,
# and the adjustments file that marks 60 lines of each.
{
  for ((k = 0; k < MARKED; k++)); do
    echo "record $WORK/src/marked$k.c build=7"
    for ((f = 0; f < 4; f++)); do
      echo "function fn${k}_$f line=$((f * 25 + 1)) calls=$((f % 2))"
      for ((l = 2; l <= 25; l++)); do echo "block $((f * 25 + l)) hits=$((l % 2))"; done
    done
  done
} | "$BUILD/bin/kgv-make" - "$WORK/marked.kgv"
inputs+=("$WORK/marked.kgv")
{
  echo "Kestrelgauge Adjustments File 1.0"
  for ((k = 0; k < MARKED; k++)); do
    echo -e "$WORK/src/marked$k.c\t1765000000\tdeadcode\tB\t 2-21"
    echo -e "$WORK/src/marked$k.c\t1765000000\ttested\tB\t 30-49"
    echo -e "$WORK/src/marked$k.c\t1765000000\tinspected\tL\t 60-79"
  done
} >"$WORK/adjust"
bytes=$(cat "${inputs[@]}" | wc -c)
cat "${inputs[@]}" >/dev/null  # both runs read from the page cache

export HOME=$WORK  # no per-user settings of the machine's user
run_export() { "$BUILD/bin/kestrel" -export "-adjustmentfilename=$WORK/adjust" "$@" >/dev/null; }
export -f run_export
export BUILD WORK

if ! run_export "${inputs[@]}"; then echo "export_bench: kestrel -export failed"; exit 1; fi
report_bytes=$("$BUILD/bin/kestrel" -export "-adjustmentfilename=$WORK/adjust" "${inputs[@]}" | wc -c)
marked_lines=$("$BUILD/bin/kestrel" -export "-adjustmentfilename=$WORK/adjust" "$WORK/marked.kgv" |
  awk -F'\t' '$1 == "li" && ($3 == "TEST" || $3 == "INSP") { n++ } END { print n + 0 }')

. "$(dirname "$0")/timing.inc"
read -r merge_s merge_kb merge_cpu < <(best "$BUILD/bin/kestrel" "-merge=$WORK/merged.kgv" "${inputs[@]}")
read -r export_s export_kb export_cpu < <(best bash -c 'run_export "$@"' bash "${inputs[@]}")

awk -v runs="$RUNS" -v b="$bytes" -v ms="$merge_s" -v mk="$merge_kb" -v mc="$merge_cpu" -v es="$export_s" \
    -v ek="$export_kb" -v ec="$export_cpu" -v rb="$report_bytes" -v n="$((FILES + 1))" \
    -v marked="$marked_lines" '
  BEGIN {
    printf "export_bench: %d files, %.1f MB in, report %.1f MB, %d tested/inspected lines shown\n", n, b / 1e6, rb / 1e6, marked
    printf "  (best of %d runs; CPU = user + system time)\n", runs
    printf "  merge:  %6.2f s  (CPU %.2f s)  peak memory %.1f MB\n", ms, mc, mk * 1024 / 1e6
    printf "  export: %6.2f s  (CPU %.2f s)  peak memory %.1f MB\n", es, ec, ek * 1024 / 1e6
    ratio = ms > 0 ? es / ms : 0
    printf "  export/merge time: %.2f (target <= 1.5)\n", ratio
    printf "  report text: %.0f MB/s (target >= 300)\n", (es > 0 ? rb / 1e6 / es : 0)
  }'
