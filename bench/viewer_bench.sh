#!/bin/bash
# The viewer window on a large program: 10,000 files in 500 directories (3 functions each).
# The program times itself (KG_TIMINGS): start to window up, "Expand all" on the overall row
# chosen from the Actions menu, and a page of scrolling with Page Down, each until drawn.
# Usage: bench/viewer_bench.sh BUILD_DIR
set -euo pipefail
BUILD=$(cd "${1:-build}" && pwd)
HERE=$(cd "$(dirname "$0")" && pwd)
if [ -z "${KG_BENCH_INNER:-}" ]; then
  KG_BENCH_INNER=1 exec "$HERE/../tools/xvfb-run-here.sh" "$0" "$@"
fi
WORK=$(mktemp -d /tmp/kg-viewer-bench.XXXXXX)
trap 'kill "${pid:-0}" 2>/dev/null || true; rm -rf "$WORK"' EXIT

# 500 directories of 20 files: generated record K lives in directory K / 100.
for ((d = 0; d < 500; d++)); do
  echo "generate records=20 first=$((d * 100)) functions=3 blocks=6 seed=$((d + 1))"
done >"$WORK/big.txt"
"$BUILD/bin/kgv-make" "$WORK/big.txt" "$WORK/big.kgv"

viewer=("$BUILD/bin/kestrel" -view)
export KG_TIMINGS="$WORK/timings" KG_TEST_HOOK="$WORK/state" HOME="$WORK" KESTREL_HOME="$BUILD"
"${viewer[@]}" "$WORK/big.kgv" 2>"$WORK/err" &
pid=$!
waitline() {  # waits until the timings hold a line starting with $1
  for _ in $(seq 300); do
    grep -q "^$1" "$KG_TIMINGS" 2>/dev/null && return 0
    sleep 0.05
  done
  echo "viewer_bench: no '$1' timing" >&2
  cat "$WORK/err" >&2
  exit 1
}
state() {
  rm -f "$KG_TEST_HOOK"
  kill -USR1 "$pid"
  for _ in $(seq 100); do [ -s "$KG_TEST_HOOK" ] && break; sleep 0.05; done
  cat "$KG_TEST_HOOK"
}
# The centre of a widget whose path ends with the name.
centre() {
  state | grep -F ".$1 class=" | head -1 | sed 's/.* geom=\([0-9-]*\),\([0-9-]*\),\([0-9]*\)x\([0-9]*\).*/\1 \2 \3 \4/' |
    awk '{print int($1 + $3 / 2), int($2 + $4 / 2)}'
}
waitline window-up
read -r ox oy < <(state | grep -F '.kgOutline class=' | sed 's/.* geom=\([0-9]*\),\([0-9]*\),.*/\1 \2/')
xdotool mousemove $((ox + 40)) $((oy + 8)) click 1  # select the overall row
sleep 0.3
read -r x y < <(centre kgActions)
xdotool mousemove "$x" "$y" click 1
sleep 0.3
read -r x y < <(centre "kgExpandCollapseMenu.QR_OutlineExpandAll")
xdotool mousemove "$x" "$y" click 1
waitline "action QR_OutlineExpandAll"
xdotool mousemove $((ox + 300)) $((oy + 200))
for _ in 1 2 3 4 5; do
  xdotool key Next
  sleep 0.1
done
waitline "key Next"
lines=$(state | grep -F '.kgOutline class=' | sed 's/.* lines=\([0-9]*\).*/\1/')
echo "viewer_bench: 10000 files in 500 directories, $lines outline lines after Expand all"
awk '/^window-up/ {printf "  window up after start:        %8.1f ms\n", $2}
     /^action QR_OutlineExpandAll/ {printf "  Expand all (overall row):     %8.1f ms\n", $3}
     /^key Next/ {n++; s += $3; if ($3 > m) m = $3}
     END {if (n) printf "  page down (%d pages): mean %.2f ms, max %.2f ms\n", n, s / n, m}' "$KG_TIMINGS"
