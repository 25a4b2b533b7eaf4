#!/usr/bin/env bash
# Checks kestrel's figures against lcov's on real coverage, and times both tool chains.
# Usage: lcov_check.sh BUILD
#  1. Builds the demo program with coverage, runs it, captures an lcov tracefile with
#     Debian's lcov, imports it, and compares file by file lcov's LF/LH/FNF/FNH with
#     kestrel's lines, used lines, functions and used functions from `kestrel -export`
#     (the "(file scope)" function is not one of lcov's). They must agree exactly.
#  2. Times `lcov --summary` and `genhtml` against `kestrel-import` + `kestrel -export` on
#     the demo's tracefile and on a large tracefile made from it (many copies of each file).
set -u
build=$(cd "${1:-build}" && pwd)
here=$(cd "$(dirname "$0")" && pwd)
work=$(mktemp -d /tmp/kg-lcov-check.XXXXXX)
trap 'rm -rf "$work"' EXIT
export HOME="$work/home"
mkdir -p "$HOME"
noadj="-adjustmentfilename=$work/none.adjust"   # actual figures: no adjustments

"$here/../tools/build-demo.sh" "$build" > /dev/null || exit 1
demo="$build/demo"
lcov -q --capture --directory "$demo/obj" --output-file "$work/demo.info" 2>/dev/null || {
  echo "lcov --capture failed"; exit 1; }

# lcov's figures per file: path LF LH FNF FNH
lcov_figures() {
  awk -F: '
    /^SF:/ { sf = substr($0, 4); lf = lh = fnf = fnh = 0 }
    /^DA:/ { split($2, a, ","); lf++; if (a[2] + 0 > 0) lh++ }
    /^FN:/ { fnf++ }
    /^FNDA:/ { split($2, a, ","); if (a[1] + 0 > 0) fnh++ }
    /^end_of_record/ { print sf, lf, lh, fnf, fnh }' "$1" | sort
}

# kestrel's figures per file from the export report, without the "(file scope)" function.
kestrel_figures() {
  awk -F '\t' '
    function flush() { if (file != "") print file, lines, lines - unused, funcs - fs, funcs - ufuncs - fsused }
    $1 == "di" { dir = $2 }
    $1 == "fi" { flush(); file = dir $2; unused = $5; lines = $6; ufuncs = $7; funcs = $8; fs = fsused = 0 }
    $1 == "fu" && $2 == "(file scope)" { fs = 1; fsused = ($7 > 0) }
    END { flush() }' "$1" | sort
}

check() {
  local info=$1 label=$2
  "$build/bin/kestrel-import" -o "$work/check.kgv" "$info" || return 1
  "$build/bin/kestrel" -export "$noadj" "$work/check.kgv" > "$work/check.export" || return 1
  lcov_figures "$info" > "$work/lcov.txt"
  kestrel_figures "$work/check.export" > "$work/kestrel.txt"
  if diff "$work/lcov.txt" "$work/kestrel.txt" > "$work/diff.txt"; then
    echo "$label: $(wc -l < "$work/lcov.txt") files agree exactly (lines found/hit, functions found/hit)"
  else
    echo "$label: DISAGREEMENT (lcov <, kestrel >):"; cat "$work/diff.txt"; return 1
  fi
}

status=0
check "$work/demo.info" "demo program" || status=1

# A large tracefile: the demo's records under 5000 other paths each.
awk -v copies=5000 '
  { rec = rec $0 "\n" }
  /^end_of_record/ { recs[n++] = rec; rec = "" }
  END { for (c = 0; c < copies; c++) for (i = 0; i < n; i++) {
          r = recs[i]; sub(/SF:\//, "SF:/big/d" int(c / 50) "/c" c "/", r); printf "%s", r } }' \
  "$work/demo.info" > "$work/big.info"
check "$work/big.info" "large tracefile ($(du -h "$work/big.info" | cut -f1))" || status=1

seconds() { /usr/bin/time -f %e "$@" 2>&1 >/dev/null | tail -1; }
for t in demo big; do
  info="$work/$t.info"
  s_lcov=$(seconds lcov -q --summary "$info")
  s_html=$(seconds genhtml -q -o "$work/html-$t" "$info")
  s_kg=$(/usr/bin/time -f %e sh -c "'$build/bin/kestrel-import' -o '$work/t.kgv' '$info' && '$build/bin/kestrel' -export $noadj '$work/t.kgv' > /dev/null" 2>&1 | tail -1)
  awk -v t="$t" -v a="$s_lcov" -v g="$s_html" -v k="$s_kg" 'BEGIN {
    printf "%-5s lcov --summary %6.2fs  genhtml %6.2fs  kestrel-import + kestrel -export %6.2fs", t, a, g, k
    if (k > 0) printf "  (lcov/kestrel %.1fx, genhtml/kestrel %.1fx)", a / k, g / k
    printf "\n" }'
done
exit $status
