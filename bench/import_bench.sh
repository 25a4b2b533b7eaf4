#!/bin/bash
# Import throughput: "kestrel-import" of generated lcov tracefiles (~10 MB and ~20 MB, with
# branch records) and of gcov JSON (~20 MB, as gcov --json-format writes it), each with its
# peak memory, and "kestrel-import" + "kestrel -export" of the result against
# "lcov --summary" of the same tracefile. Usage: bench/import_bench.sh BUILD_DIR
# Size: KG_BENCH_LCOV_FILES (13000) source files make the smaller tracefile (twice as many
# the larger), KG_BENCH_JSON_FILES (3800) the gcov JSON; each file has 4 functions and 34
# instrumented lines, every fourth line with two branch outcomes.
set -euo pipefail
BUILD=$(cd "${1:-build}" && pwd)
LCOV_FILES=${KG_BENCH_LCOV_FILES:-13000}
JSON_FILES=${KG_BENCH_JSON_FILES:-3800}
TIME=/usr/bin/time
[ -x "$TIME" ] || { echo "import_bench: /usr/bin/time is needed (Debian package 'time')"; exit 1; }
command -v lcov >/dev/null || { echo "import_bench: lcov is needed (Debian package 'lcov')"; exit 1; }
for p in kestrel-import kestrel; do
  [ -x "$BUILD/bin/$p" ] || { echo "import_bench: $BUILD/bin/$p is missing; build it first"; exit 1; }
done
# In memory when possible: the figures are the program's, not those of a shared disk.
if [ -z "${TMPDIR:-}" ] && [ -d /dev/shm ] && [ -w /dev/shm ]; then TMPDIR=/dev/shm; fi
WORK=$(mktemp -d "${TMPDIR:-/tmp}/kg-import-bench.XXXXXX")
trap 'rm -rf "$WORK"' EXIT

# lcov 1.x tracefile of $1 source files (absolute paths), each in a record of its own.
gen_lcov() {
  awk -v n="$1" 'BEGIN {
    for (f = 0; f < n; f++) {
      printf "TN:\nSF:/src/d%d/file%d.c\n", f % 400, f
      for (k = 0; k < 4; k++) printf "FN:%d,func_%d_%d\n", k * 25 + 1, f, k
      for (k = 0; k < 4; k++) printf "FNDA:%d,func_%d_%d\n", (f + k) % 3, f, k
      printf "FNF:4\nFNH:3\n"
      for (l = 1; l <= 100; l += 3) {
        printf "DA:%d,%d\n", l, (l * f) % 7
        if (l % 12 == 1) printf "BRDA:%d,0,0,%d\nBRDA:%d,0,1,%s\n", l, (l + f) % 5, l, (f % 4 ? (l * f) % 3 : "-")
      }
      printf "BRF:18\nBRH:9\nLF:34\nLH:29\nend_of_record\n"
    }
  }'
}

# gcov JSON of $1 source files (relative to each document's working directory), as
# "gcov --json-format --stdout" writes it: one document of 100 files a line.
gen_json() {
  awk -v n="$1" 'BEGIN {
    per = 100
    for (d = 0; d * per < n; d++) {
      printf "{\"format_version\": \"1\", \"gcc_version\": \"12.2.0\", \"current_working_directory\": \"/build/obj%d\", \"data_file\": \"obj%d.gcda\", \"files\": [", d, d
      for (f = d * per; f < n && f < (d + 1) * per; f++) {
        if (f > d * per) printf ", "
        printf "{\"file\": \"../src/d%d/file%d.c\", \"functions\": [", f % 400, f
        for (k = 0; k < 4; k++) {
          if (k) printf ", "
          printf "{\"blocks\": 7, \"end_column\": 1, \"start_line\": %d, \"name\": \"func_%d_%d\", \"blocks_executed\": 5, \"execution_count\": %d, \"demangled_name\": \"func_%d_%d\", \"start_column\": 5, \"end_line\": %d}", k * 25 + 1, f, k, (f + k) % 3, f, k, k * 25 + 24
        }
        printf "], \"lines\": ["
        for (l = 1; l <= 100; l += 3) {
          if (l > 1) printf ", "
          printf "{\"branches\": ["
          if (l % 12 == 1) printf "{\"fallthrough\": true, \"count\": %d, \"throw\": false}, {\"fallthrough\": false, \"count\": %d, \"throw\": false}", (l + f) % 5, (l * f) % 3
          printf "], \"count\": %d, \"line_number\": %d, \"unexecuted_block\": %s, \"function_name\": \"func_%d_%d\"}", (l * f) % 7, l, ((l * f) % 7 ? "false" : "true"), f, int((l - 1) / 25)
        }
        printf "]}"
      }
      printf "]}\n"
    }
  }'
}

echo "import_bench: generating tracefiles of $LCOV_FILES and $((2 * LCOV_FILES)) source files and gcov JSON of $JSON_FILES..."
gen_lcov "$LCOV_FILES" >"$WORK/small.info"
gen_lcov "$((2 * LCOV_FILES))" >"$WORK/large.info"
gen_json "$JSON_FILES" >"$WORK/gcov.json"
cat "$WORK"/* >/dev/null  # every run reads from the page cache

export HOME=$WORK  # no per-user settings of the machine's user
for input in small.info large.info gcov.json; do
  if ! "$BUILD/bin/kestrel-import" -o "$WORK/probe.kgv" "$WORK/$input"; then
    echo "import_bench: kestrel-import failed on $input"
    exit 1
  fi
done
if ! "$BUILD/bin/kestrel" -export "$WORK/probe.kgv" >/dev/null; then echo "import_bench: kestrel -export failed"; exit 1; fi
if ! lcov -q --summary "$WORK/small.info" >/dev/null 2>&1; then echo "import_bench: lcov --summary failed"; exit 1; fi
rm -f "$WORK/probe.kgv"

. "$(dirname "$0")/timing.inc"
echo "import_bench: best of $RUNS runs of each; files in $WORK"
report() {  # NAME INPUT TARGET_MBPS
  local name=$1 input=$WORK/$2 target=$3 s kb cpu bytes
  bytes=$(wc -c <"$input")
  read -r s kb cpu < <(best "$BUILD/bin/kestrel-import" -o "$WORK/$2.kgv" "$input")
  awk -v n="$name" -v b="$bytes" -v s="$s" -v kb="$kb" -v c="$cpu" -v t="$target" 'BEGIN {
    printf "  import %-22s %6.1f MB  %6.2f s  %7.1f MB/s (target >= %d)  CPU %.2f s  peak memory %.1f MB\n",
      n, b / 1e6, s, (s > 0 ? b / 1e6 / s : 1e9), t, c, kb * 1024 / 1e6
  }'
  echo "$s" >"$WORK/$2.import_s"
}
report "lcov tracefile (small)" small.info 150
report "lcov tracefile (large)" large.info 150
report "gcov JSON" gcov.json 100

# The whole route to a report against lcov's own summary of the same tracefile.
for input in small.info large.info; do
  read -r exp_s exp_kb exp_cpu < <(best "$BUILD/bin/kestrel" -export "$WORK/$input.kgv")
  read -r lcov_s lcov_kb lcov_cpu < <(best lcov -q --summary "$WORK/$input")
  awk -v n="$input" -v i="$(cat "$WORK/$input.import_s")" -v e="$exp_s" -v l="$lcov_s" -v ek="$exp_kb" 'BEGIN {
    t = i + e
    printf "  %-10s import %.2f s + export %.2f s (peak %.1f MB) = %.2f s; lcov --summary %.2f s; ratio %.1f (target >= 10)\n",
      n, i, e, ek * 1024 / 1e6, t, l, (t > 0 ? l / t : 1e9)
  }'
done
