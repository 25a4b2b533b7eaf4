#!/bin/bash
# Runs the libFuzzer targets of a build (cmake -DKG_LIBFUZZER=ON) one after another, each for
# SECONDS over its working corpus and its seeds, and prints one line of figures per target.
# Exits non-zero when any target crashed, failed a check, timed out or ran out of memory;
# the input that did it is kept in BUILD/fuzz/NAME_artifacts/.
#
# usage: fuzz/run_fuzz.sh BUILD SECONDS [NAME...]   (no NAME: every target of the build)
# FUZZ_FLAGS adds libFuzzer options, e.g. "-fork=1 -ignore_crashes=1" to go on past a known crash.
set -u

build=${1:?usage: run_fuzz.sh BUILD SECONDS [NAME...]}
seconds=${2:?usage: run_fuzz.sh BUILD SECONDS [NAME...]}
shift 2
case "$seconds" in '' | *[!0-9]*) echo "run_fuzz.sh: SECONDS must be a whole number" >&2; exit 2 ;; esac
src=$(cd "$(dirname "$0")" && pwd)

# Longest input per target: a data file needs room for several records; text formats are
# searched better in small inputs.
max_len() {
  case "$1" in
    kgv_reader_fuzz) echo 65536 ;;
    gcov_json_reader_fuzz | settings_resources_fuzz) echo 16384 ;;
    *) echo 8192 ;;
  esac
}

if [ $# -eq 0 ]; then
  for f in "$src"/*_fuzz.cpp; do set -- "$@" "$(basename "$f" .cpp)"; done
fi

failed=()
summary=()
for name in "$@"; do
  exe=$build/fuzz/$name
  if [ ! -x "$exe" ]; then
    echo "run_fuzz.sh: $exe is not built" >&2
    failed+=("$name (not built)")
    continue
  fi
  work=$(cd "$build" && pwd)/fuzz/${name}_corpus
  artifacts=$(cd "$build" && pwd)/fuzz/${name}_artifacts
  log=$(cd "$build" && pwd)/fuzz/${name}.log
  mkdir -p "$work" "$artifacts" "$src/seeds/$name"
  touch "$artifacts/.started"
  echo "== $name: ${seconds}s, -max_len=$(max_len "$name"), log in $log"
  # A target's dictionary holds the words of its format that mutation seldom spells out.
  dict=()
  [ -f "$src/dicts/$name.dict" ] && dict=(-dict="$src/dicts/$name.dict")
  # Inputs that once crashed the target are read at the start: a fault that came back stops it.
  regressions=()
  [ -d "$src/regressions/$name" ] && regressions=("$src/regressions/$name")
  started=$SECONDS
  # The working corpus comes first: libFuzzer adds what it finds to the first directory.
  KG_FUZZ_CORPUS=$work nice -n 10 "$exe" \
      -max_total_time="$seconds" -max_len="$(max_len "$name")" -rss_limit_mb=2048 -timeout=30 \
      -print_final_stats=1 -artifact_prefix="$artifacts/" "${dict[@]}" ${FUZZ_FLAGS:-} \
      "$work" "$src/seeds/$name" "${regressions[@]}" >"$log" 2>&1
  rc=$?
  took=$((SECONDS - started))
  # The last status line ("#N DONE cov: … ft: … corp: …", "#N: cov: …" in fork mode) and the
  # final statistics, which fork mode does not print: then N of the last line over the time.
  last=$(grep -E '^#[0-9]+[:[:space:]]' "$log" | tail -n 1)
  execs=$(sed -n 's/^stat::number_of_executed_units: *//p' "$log")
  rate=$(sed -n 's/^stat::average_exec_per_sec: *//p' "$log")
  [ -n "$execs" ] || execs=$(sed -n 's/^#\([0-9]*\).*/\1/p' <<<"$last")
  [ -n "$rate" ] || { [ -n "$execs" ] && [ "$took" -gt 0 ] && rate=$((execs / took)); }
  cov=$(sed -n 's/.* cov: \([0-9]*\).*/\1/p' <<<"$last")
  ft=$(sed -n 's/.* ft: \([0-9]*\).*/\1/p' <<<"$last")
  corp=$(sed -n 's/.* corp: \([0-9][0-9/]*[a-zA-Z]*\).*/\1/p' <<<"$last")
  line=$(printf '%-26s %6ss  execs %-11s exec/s %-7s cov %-6s ft %-7s corpus %s' \
           "$name" "$took" "${execs:-?}" "${rate:-?}" "${cov:-?}" "${ft:-?}" "${corp:-?}")
  # With -ignore_crashes a run ends well however many inputs it kept; those count as well.
  kept=$(find "$artifacts" -type f -newer "$artifacts/.started" ! -name .started | wc -l)
  if [ $rc -ne 0 ] || [ "$kept" -ne 0 ]; then
    line="$line  FAILED (exit $rc, $kept inputs kept)"
    failed+=("$name")
    grep -E '^(==[0-9]+==ERROR|SUMMARY|import check failed|.*runtime error)' "$log" | head -n 3
    find "$artifacts" -type f -newer "$artifacts/.started" ! -name .started | sed 's|^|  kept: |'
  fi
  echo "$line"
  summary+=("$line")
done

echo
echo "== fuzzing summary"
printf '%s\n' "${summary[@]}"
if [ ${#failed[@]} -ne 0 ]; then
  echo "failed: ${failed[*]}" >&2
  echo "reproduce with: $build/fuzz/NAME $build/fuzz/NAME_artifacts/FILE" >&2
  exit 1
fi
