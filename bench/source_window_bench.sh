#!/bin/bash
# The annotated source window on a 250,000-line source (5,000 functions of 50 lines, a block on
# every other line). The program times itself (KG_TIMINGS): opening the file from its first
# function until the window is drawn, a page down, toggling a highlight from the View menu, and
# the heap the window took when it opened. Targets: open under 500 ms, a page under 20 ms,
# a toggle under 200 ms, the heap under 4 times the file's size plus 32 bytes a line.
# Usage: bench/source_window_bench.sh BUILD_DIR
set -euo pipefail
BUILD=$(cd "${1:-build}" && pwd)
HERE=$(cd "$(dirname "$0")" && pwd)
if [ -z "${KG_BENCH_INNER:-}" ]; then
  KG_BENCH_INNER=1 exec "$HERE/../tools/xvfb-run-here.sh" "$0" "$@"
fi
WORK=$(mktemp -d /tmp/kg-source-bench.XXXXXX)
trap 'kill "${pid:-0}" 2>/dev/null || true; rm -rf "$WORK"' EXIT

SRC="$WORK/big.c"
awk -v src="$SRC" -v kgv="$WORK/big.txt" 'BEGIN {
  line = 0
  printf "record %s build=%d\n", src, systime() + 60 > kgv
  for (f = 0; f < 5000; f++) {
    print "int function_" f "(int x) {" > src; line++
    printf "function function_%d line=%d calls=%d\n", f, line, (f % 7 == 0) ? 0 : f % 13 + 1 > kgv
    for (k = 0; k < 47; k++) {
      print "  x = x * 3 + " k "; /* work line " k " of function " f ", a few more words */" > src; line++
      if (k % 2 == 0) printf "block %d hits=%d\n", line, (f % 7 == 0 || k % 10 == 4) ? 0 : (f * k) % 12000 > kgv
    }
    print "  return x;" > src; line++
    printf "block %d hits=1\n", line > kgv
    print "}" > src; line++
  }
}'
touch -d '-1 hour' "$SRC"
"$BUILD/bin/kgv-make" "$WORK/big.txt" "$WORK/big.kgv"
bytes=$(stat -c %s "$SRC")
lines=$(wc -l <"$SRC")

export KG_TIMINGS="$WORK/timings" KG_TEST_HOOK="$WORK/state" HOME="$WORK" KESTREL_HOME="$BUILD"
echo "Kestrelgauge*kgAnnotatedSource.geometry: +500+0" >"$WORK/.kestrel.Xdefaults"
"$BUILD/bin/kestrel" -view -adjustmentfilename="$WORK/adjust" "$WORK/big.kgv" 2>"$WORK/err" &
pid=$!
waitline() {  # waits until the timings hold a line starting with $1
  for _ in $(seq 600); do
    grep -q "^$1" "$KG_TIMINGS" 2>/dev/null && return 0
    sleep 0.05
  done
  echo "source_window_bench: no '$1' timing" >&2
  cat "$WORK/err" >&2
  exit 1
}
state() {
  rm -f "$KG_TEST_HOOK"
  kill -USR1 "$pid"
  for _ in $(seq 200); do [ -s "$KG_TEST_HOOK" ] && break; sleep 0.05; done
  cat "$KG_TEST_HOOK"
}
centre() {  # the centre of the first viewable widget whose path ends with the name
  state | grep -F ".$1 class=" | grep 'viewable=1' | head -1 |
    sed 's/.* geom=\([0-9-]*\),\([0-9-]*\),\([0-9]*\)x\([0-9]*\).*/\1 \2 \3 \4/' |
    awk '{print int($1 + $3 / 2), int($2 + $4 / 2)}'
}
waitline window-up
read -r ox oy < <(state | grep -F '.kgOutline class=' | sed 's/.* geom=\([0-9]*\),\([0-9]*\),.*/\1 \2/')
# The directory, the file, the first function; Return opens its source.
xdotool mousemove $((ox + 80)) $((oy + 17 + 8)) click 1
sleep 0.3
xdotool key Right Down Right
sleep 1
xdotool key Down Return
waitline "source open heap"
read -r x y < <(centre kgSource)
xdotool mousemove "$x" "$y"
for _ in 1 2 3 4 5; do
  xdotool key Next
  sleep 0.1
done
waitline "source key page_down"
read -r x y < <(centre "kgAnnotatedSource.mainWindow.kgTopMenu.kgViewPulldown")
xdotool mousemove "$x" "$y" click 1
sleep 0.3
read -r x y < <(centre "kgView.kgHighlightUsedLines")
xdotool mousemove "$x" "$y" click 1
waitline "source toggle"
echo "source_window_bench: $lines lines, $bytes bytes of source"
awk -v bytes="$bytes" -v lines="$lines" '
  /^source open heap KB/ {heap = $5}
  /^source open / && $3 != "heap" {open = $3}
  /^source key page_down/ {n++; s += $4; if ($4 > m) m = $4}
  /^source toggle/ {toggle = $4}
  END {
    budget = (4 * bytes + 32 * lines) / 1024
    printf "  open the file, drawn:          %8.1f ms   (target 500 ms)\n", open
    if (n) printf "  page down (%d pages):          mean %.2f ms, max %.2f ms   (target 20 ms)\n", n, s / n, m
    printf "  toggle a highlight, drawn:     %8.1f ms   (target 200 ms)\n", toggle
    printf "  heap of the window:            %8.0f KB   (target %.0f KB: 4 x file + 32 B/line)\n", heap, budget
    bad = (open >= 500) + (m >= 20) + (toggle >= 200) + (heap >= budget)
    if (bad) { print "  some figure is over its target"; exit 1 }
  }' "$KG_TIMINGS"
