#!/usr/bin/env bash
# Checks kestrel's figures against lcov's on real coverage, and times both tool chains.
# Usage: lcov_check.sh BUILD
#  1. Builds the demo program with coverage, runs it, captures an lcov tracefile with
#     Debian's lcov (branch coverage on), and imports the coverage by three routes: the
#     tracefile, gcov's JSON, and the build directory itself. For each, file by file, lcov's
#     LF/LH/FNF/FNH/BRF/BRH must equal kestrel's lines, used lines, functions, used
#     functions, and blocks beyond the lines, used and all, from `kestrel -export` (the
#     "(file scope)" function is not one of lcov's).
#  2. Times `lcov --summary` and `genhtml` against `kestrel-import` + `kestrel -export` on
#     the demo's tracefile and on a large tracefile made from it (many copies of each file),
#     and `lcov --capture` against `kestrel-import` of the build directory.
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
lcov_capture() {
  lcov -q --rc lcov_branch_coverage=1 --capture --directory "$demo/obj" --output-file "$1" 2>/dev/null
}
lcov_capture "$work/demo.info" || { echo "lcov --capture failed"; exit 1; }
# gcov's JSON with branch counts, one file per object.
for gcda in "$demo"/obj/*.gcda; do
  gcov --branch-probabilities --json-format --stdout "$gcda" 2>/dev/null
done > "$work/demo.json"

# lcov's figures per file: path LF LH FNF FNH BRF BRH. Repeated records of a file, a
# line, a function or a branch (a header in several objects, a line holding several
# functions) are one, their counts added, as lcov reads them.
lcov_figures() {
  awk -F: '
    /^SF:/ { sf = substr($0, 4); files[sf] = 1 }
    /^DA:/ { split($2, a, ","); da[sf, a[1]] += a[2] }
    /^FN:/ { fn[sf, substr($2, index($2, ",") + 1)] = 1 }
    /^FNDA:/ { c = index($2, ","); fnda[sf, substr($2, c + 1)] += substr($2, 1, c - 1) }
    /^BRDA:/ { v = substr($0, 6); n = split(v, a, ","); t = a[n]; br[sf, substr(v, 1, length(v) - length(t) - 1)] += (t == "-" ? 0 : t) }
    END {
      for (k in da) { split(k, p, SUBSEP); lf[p[1]]++; if (da[k] > 0) lh[p[1]]++ }
      for (k in fn) { split(k, p, SUBSEP); fnf[p[1]]++; if (fnda[k] > 0) fnh[p[1]]++ }
      for (k in br) { split(k, p, SUBSEP); brf[p[1]]++; if (br[k] > 0) brh[p[1]]++ }
      for (f in files) print f, lf[f] + 0, lh[f] + 0, fnf[f] + 0, fnh[f] + 0, brf[f] + 0, brh[f] + 0
    }' "$1" | sort
}

# kestrel's figures per file from the export report, without the "(file scope)" function:
# the blocks beyond a line's own block are its branch outcomes.
kestrel_figures() {
  awk -F '\t' '
    function flush() {
      if (file != "") print file, lines, lines - unused, funcs - fs, funcs - ufuncs - fsused,
                            blocks - lines, (blocks - ublocks) - (lines - unused)
    }
    $1 == "di" { dir = $2 }
    $1 == "fi" { flush(); file = dir $2; ublocks = $3; blocks = $4; unused = $5; lines = $6; ufuncs = $7; funcs = $8; fs = fsused = 0 }
    $1 == "fu" && $2 == "(file scope)" { fs = 1; fsused = ($7 > 0) }
    END { flush() }' "$1" | sort
}

# check LABEL TRACEFILE INPUT...: the import of the inputs against lcov's figures.
check() {
  local label=$1 info=$2
  shift 2
  "$build/bin/kestrel-import" -o "$work/check.kgv" "$@" || return 1
  "$build/bin/kestrel" -export "$noadj" "$work/check.kgv" > "$work/check.export" || return 1
  lcov_figures "$info" > "$work/lcov.txt"
  kestrel_figures "$work/check.export" > "$work/kestrel.txt"
  if diff "$work/lcov.txt" "$work/kestrel.txt" > "$work/diff.txt"; then
    awk -v label="$label" '{ f++; l += $2; lh += $3; fn += $4; fh += $5; b += $6; bh += $7 }
      END { printf "%s: %d files agree exactly (hit/found: lines %d/%d, functions %d/%d, branches %d/%d)\n",
                   label, f, lh, l, fh, fn, bh, b }' \
      "$work/lcov.txt"
  else
    echo "$label: DISAGREEMENT (lcov <, kestrel >):"; cat "$work/diff.txt"; return 1
  fi
}

status=0
check "demo program, tracefile" "$work/demo.info" "$work/demo.info" || status=1
check "demo program, gcov JSON" "$work/demo.info" "$work/demo.json" || status=1
check "demo program, build directory" "$work/demo.info" "$demo/obj" || status=1

# A large tracefile: the demo's records under 5000 other paths each.
awk -v copies=5000 '
  { rec = rec $0 "\n" }
  /^end_of_record/ { recs[n++] = rec; rec = "" }
  END { for (c = 0; c < copies; c++) for (i = 0; i < n; i++) {
          r = recs[i]; sub(/SF:\//, "SF:/big/d" int(c / 50) "/c" c "/", r); printf "%s", r } }' \
  "$work/demo.info" > "$work/big.info"
check "large tracefile ($(du -h "$work/big.info" | cut -f1))" "$work/big.info" "$work/big.info" || status=1

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
# Milliseconds of wall time: the demo's two objects take gcov a few of them.
millis() {
  local start=$EPOCHREALTIME
  "$@" > /dev/null 2>&1
  awk -v a="$start" -v b="$EPOCHREALTIME" 'BEGIN { printf "%.1f", (b - a) * 1000 }'
}
s_cap=$(millis lcov -q --rc lcov_branch_coverage=1 --capture --directory "$demo/obj" --output-file "$work/again.info")
s_tree=$(millis "$build/bin/kestrel-import" -o "$work/tree.kgv" "$demo/obj")
awk -v a="$s_cap" -v k="$s_tree" 'BEGIN {
  printf "build directory  lcov --capture %7.1fms  kestrel-import %7.1fms", a, k
  if (k > 0) printf "  (%.1fx)", a / k
  printf "\n" }'
exit $status
