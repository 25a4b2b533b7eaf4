#!/bin/bash
# Eight "kestrel -merge" writers into one file at the same moment: the locks must let each
# add its run exactly once. Usage: tests/stress/concurrent_writers.sh BUILD_DIR [ROUNDS]
set -euo pipefail
BUILD=$(cd "${1:-build}" && pwd)
ROUNDS=${2:-${KG_STRESS_ROUNDS:-10}}
WRITERS=8
K="$BUILD/bin/kestrel"
WORK=$(mktemp -d "${TMPDIR:-/tmp}/kg-writers.XXXXXX")
trap 'rm -rf "$WORK"' EXIT
cd "$WORK"
fail() { echo "concurrent_writers: $*" >&2; exit 1; }

run() {  # run NAME HITS
  printf 'record src/a.c build=100 first=1700000000 last=1700000100\nfunction main line=3 calls=1\nblock 4 hits=%d\n' "$2" |
    "$BUILD/bin/kgv-make" - "$1"
}
hits() { "$K" -export all.kgv | awk -F '\t' '$1 == "bl" { print $3; exit }'; }

for ((i = 1; i <= WRITERS; i++)); do run "run$i.kgv" "$i"; done
expected_add=$((WRITERS * (WRITERS + 1) / 2))
for ((r = 1; r <= ROUNDS; r++)); do
  run all.kgv 1
  pids=()
  for ((i = 1; i <= WRITERS; i++)); do
    "$K" -merge=all.kgv all.kgv "run$i.kgv" 2>"err$i" &
    pids+=($!)
  done
  for ((i = 0; i < WRITERS; i++)); do
    wait "${pids[$i]}" || fail "round $r: writer $((i + 1)) failed: $(cat "err$((i + 1))")"
  done
  got=$(hits)
  [ "$got" = "$((1 + expected_add))" ] || fail "round $r: $got hits, expected $((1 + expected_add))"
  ls -A | grep -q -e '\.new\.' -e '^\.lock' && fail "round $r: left behind: $(ls -A | grep -e '\.new\.' -e '^\.lock')"
done
echo "concurrent_writers: $ROUNDS rounds of $WRITERS writers, every run added exactly once"
