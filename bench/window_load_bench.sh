#!/bin/bash
# Opening the window on a large merged data set: "kestrel -view" on a generated file of
# about KG_BENCH_MB (1000) MB, timed by the program itself (KG_TIMINGS: start to window up),
# with its CPU time and peak memory against the file's size.
# Usage: bench/window_load_bench.sh BUILD_DIR
set -euo pipefail
BUILD=$(cd "${1:-build}" && pwd)
HERE=$(cd "$(dirname "$0")" && pwd)
if [ -z "${KG_BENCH_INNER:-}" ]; then
  KG_BENCH_INNER=1 exec "$HERE/../tools/xvfb-run-here.sh" "$0" "$@"
fi
MB=${KG_BENCH_MB:-1000}
TIME=/usr/bin/time
[ -x "$TIME" ] || { echo "window_load_bench: /usr/bin/time is needed (Debian package 'time')"; exit 1; }
if [ -z "${TMPDIR:-}" ] && [ -d /dev/shm ] && [ -w /dev/shm ]; then TMPDIR=/dev/shm; fi
WORK=$(mktemp -d "${TMPDIR:-/tmp}/kg-window-bench.XXXXXX")
trap 'kill "${pid:-0}" 2>/dev/null || true; rm -rf "$WORK"' EXIT

# A record of 50 functions of 20 blocks takes about 7.6 KB.
records=$((MB * 1000000 / 7600))
echo "window_load_bench: generating $records records (about $MB MB)..."
echo "generate records=$records functions=50 blocks=20 seed=1" | "$BUILD/bin/kgv-make" - "$WORK/big.kgv"
bytes=$(stat -c %s "$WORK/big.kgv")
cat "$WORK/big.kgv" >/dev/null  # read from the page cache, as a file just merged is

export KG_TIMINGS="$WORK/timings" HOME="$WORK" KESTREL_HOME="$BUILD"
"$TIME" -f "%U %S %M" -o "$WORK/time.txt" "$BUILD/bin/kestrel" -view "$WORK/big.kgv" 2>"$WORK/err" &
pid=$!
for _ in $(seq 1200); do
  grep -q '^window-up' "$KG_TIMINGS" 2>/dev/null && break
  sleep 0.05
done
grep -q '^window-up' "$KG_TIMINGS" 2>/dev/null || { echo "window_load_bench: the window did not come up"; cat "$WORK/err"; exit 1; }
# The CPU time and memory to the window are those of the whole run, ended at once.
kill -TERM "$(pgrep -P "$pid" | head -1)" 2>/dev/null || kill -TERM "$pid"
wait "$pid" 2>/dev/null || true
awk -v b="$bytes" -v t="$(cat "$WORK/time.txt" | tail -1)" '
  /^window-up/ { up = $2 }
  END {
    split(t, f, " ")
    printf "window_load_bench: %.0f MB of data\n", b / 1e6
    printf "  window up after start: %.2f s (target < 3 s), CPU %.2f s\n", up / 1000, f[1] + f[2]
    printf "  peak memory %.0f MB: %.2f of the file (target < 2)\n", f[3] * 1024 / 1e6, f[3] * 1024 / b
  }' "$KG_TIMINGS"
