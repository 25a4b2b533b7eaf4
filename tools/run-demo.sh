#!/usr/bin/env bash
# The main job of `make demo`: the bundled demo program's real coverage, built with gcc
# --coverage and imported from gcov, with the adjustments its source markers carry.
set -u
build=${1:-build}
here=$(cd "$(dirname "$0")" && pwd)
kestrel="$build/bin/kestrel"

kgv=$("$here/build-demo.sh" "$build") || exit 1
demo=$(dirname "$kgv")
adjust="-adjustmentfilename=$demo/demo.adjust"

echo "== Adjustments from the demo's source markers"
"$kestrel" -extract "$adjust" "$kgv" || exit 1
echo
echo "== Coverage per file (adjusted)"
"$kestrel" -export "$adjust" "$kgv" | "$build/scripts/file-coverage"
echo
echo "== Unused lines"
"$kestrel" -export "$adjust" "$kgv" | "$build/scripts/unused-lines"
echo
echo "Data file: $kgv"
echo
"$here/demo-viewer.sh" "$build" "$kgv" "$adjust"
