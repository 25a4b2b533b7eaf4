#!/usr/bin/env bash
# Builds the bundled demo program with coverage, runs it a few times, and imports gcov's
# JSON into BUILD/demo/demo.kgv. Usage: build-demo.sh BUILD
set -eu
build=$(cd "${1:-build}" && pwd)
src=$(cd "$(dirname "$0")/../data/demo" && pwd)
out="$build/demo"
rm -rf "$out"
mkdir -p "$out/obj"
cp -r "$src/src" "$out/src"
cd "$out"
gcc --coverage -O0 -c src/core/main.c -o obj/main.o
gcc --coverage -O0 -c src/util/text.c -o obj/text.o
gcc --coverage -o wordcount obj/main.o obj/text.o
./wordcount hello level world > /dev/null
./wordcount -u kayak racecar > /dev/null
./wordcount > /dev/null 2>&1 || true
(cd obj && gcov --json-format main.o text.o > /dev/null 2>&1)
"$build/bin/kestrel-import" -o demo.kgv obj/main.gcov.json.gz obj/text.gcov.json.gz
echo "$out/demo.kgv"
