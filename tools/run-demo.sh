#!/usr/bin/env bash
# The main job of `make demo`: the product command on the bundled demo data, on the
# user's display or under a private Xvfb with a screenshot.
set -u
build=${1:-build}
kestrel="$build/bin/kestrel"
here=$(cd "$(dirname "$0")" && pwd)

run() {
  "$kestrel" -view -version
}

if [ -n "${DISPLAY:-}" ]; then
  run
else
  shot="$build/demo-screenshot.png"
  "$here/xvfb-run-here.sh" bash -c '
    "$1" -view -version; status=$?
    import -window root "$2" 2>/dev/null || xwd -root | convert xwd:- "$2"
    exit $status' _ "$kestrel" "$shot"
  status=$?
  echo "Screenshot: $shot"
  exit $status
fi
