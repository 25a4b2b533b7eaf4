#!/bin/bash
# "kill -9" at random moments of "kestrel -merge": the target must always be the old file
# or the whole new one, and the next writer that holds the lock must clear the new copies
# the killed ones left. Usage: tests/stress/kill_writers.sh BUILD_DIR [ROUNDS]
# Size: KG_STRESS_RECORDS (20000) records per file, about 20 MB.
set -euo pipefail
BUILD=$(cd "${1:-build}" && pwd)
ROUNDS=${2:-${KG_STRESS_ROUNDS:-10}}
RECORDS=${KG_STRESS_RECORDS:-20000}
K="$BUILD/bin/kestrel"
WORK=$(mktemp -d "${TMPDIR:-/tmp}/kg-kill.XXXXXX")
trap 'rm -rf "$WORK"' EXIT
cd "$WORK"
fail() { echo "kill_writers: $*" >&2; exit 1; }

echo "generate records=$RECORDS functions=10 blocks=10 seed=1" | "$BUILD/bin/kgv-make" - all.kgv
echo "generate records=$RECORDS functions=10 blocks=10 seed=2" | "$BUILD/bin/kgv-make" - run.kgv
# The sessions of the first file record: each completed merge adds one.
sessions() { "$K" -export -locking=no all.kgv | awk -F '\t' '$1 == "fi" { print $9; exit }'; }

# How long one merge takes here, to spread the kills over it.
cp all.kgv probe.kgv
t0=$(date +%s%N)
"$K" -merge=probe.kgv probe.kgv run.kgv
t1=$(date +%s%N)
rm -f probe.kgv
span_ms=$(( (t1 - t0) / 1000000 + 1 ))

kept=0 replaced=0 left=0
for ((r = 1; r <= ROUNDS; r++)); do
  before=$(sessions) || fail "round $r: the target cannot be read before the kill"
  "$K" -merge=all.kgv all.kgv run.kgv 2>/dev/null &
  pid=$!
  sleep "$(awk -v s="$RANDOM" -v ms="$span_ms" 'BEGIN { srand(s); printf "%.3f", (0.2 + rand()) * ms / 1000 }')"
  kill -9 "$pid" 2>/dev/null || true
  wait "$pid" 2>/dev/null || true
  after=$(sessions) || fail "round $r: the target cannot be read after the kill"
  if [ "$after" = "$before" ]; then
    kept=$((kept + 1))
  elif [ "$after" = "$((before + 1))" ]; then
    replaced=$((replaced + 1))
  else
    fail "round $r: sessions went from $before to $after"
  fi
  # Each writer that takes the lock clears the copies earlier ones left; count them here.
  left=$((left + $(ls -A | grep -c '\.new\.' || true)))
  # A peer breaks a dead writer's locks (of the target, or of the input it was reading)
  # after the break age; here at once.
  for l in .lock.quor.*; do [ -d "$l" ] && rmdir "$l"; done
done
"$K" -merge=all.kgv all.kgv run.kgv
now=$(ls -A | grep -c '\.new\.' || true)
[ "$now" = 0 ] || fail "$now new copies are still there after the next writer"
[ ! -e .lock.quor.all.kgv ] || fail "the lock is left behind"
echo "kill_writers: $ROUNDS kills at random moments of a ${span_ms} ms merge: old file kept $kept times," \
     "whole new file $replaced times, never anything else; the $left new copies killed writers left were cleared"
