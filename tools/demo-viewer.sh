#!/usr/bin/env bash
# Opens the demo data in the viewer. With a display the window opens there; without one the
# viewer runs under a private Xvfb, a few rows are opened as a user would, and a screenshot is
# saved. Usage: demo-viewer.sh BUILD_DIR KGV_FILE ADJUSTMENT_OPTION [SHOT.png]
set -u
build=$1
kgv=$2
adjust=$3
shot=${4:-$build/demo/viewer.png}
here=$(cd "$(dirname "$0")" && pwd)

viewer=("$build/bin/kestrel" -view)

if [ -n "${DISPLAY:-}" ] && [ -z "${KG_DEMO_HEADLESS:-}" ]; then
  echo "== The viewer (close its window or choose File > Exit to finish)"
  KESTREL_HOME="$build" "${viewer[@]}" "$adjust" "$kgv"
  exit $?
fi

if [ -z "${KG_DEMO_INNER:-}" ]; then
  KG_DEMO_INNER=1 KG_DEMO_HEADLESS=1 exec "$here/xvfb-run-here.sh" "$0" "$@"
fi

# Inside the private X server: start the viewer, wait for its window, open some rows.
work=$(mktemp -d /tmp/kgdemo.XXXXXX)
trap 'rm -rf "$work"' EXIT
export KG_TIMINGS="$work/timings" KG_TEST_HOOK="$work/state" HOME="$work"
# No window manager places the source window: it opens over the main window, shot before it.
echo "Kestrelgauge*kgAnnotatedSource.geometry: +0+0" >"$work/.kestrel.Xdefaults"
KESTREL_HOME="$build" "${viewer[@]}" "$adjust" "$kgv" 2>"$work/err" &
pid=$!
up=""
for _ in $(seq 100); do
  if grep -q '^window-up' "$KG_TIMINGS" 2>/dev/null; then up=1; break; fi
  kill -0 "$pid" 2>/dev/null || break
  sleep 0.1
done
if [ -z "$up" ]; then
  echo "The viewer did not open its window:" >&2
  cat "$work/err" >&2
  kill "$pid" 2>/dev/null
  exit 1
fi

# Where the outline is on the screen, from the program's own account of its widgets.
state() {
  rm -f "$KG_TEST_HOOK"
  kill -USR1 "$pid"
  for _ in $(seq 50); do [ -s "$KG_TEST_HOOK" ] && break; sleep 0.05; done
  cat "$KG_TEST_HOOK" 2>/dev/null
}
geom=$(state | grep '\.kgOutline class=' | sed 's/.* geom=\([0-9]*\),\([0-9]*\),.*/\1 \2/')
read -r ox oy <<<"$geom"
if [ -n "${ox:-}" ]; then
  # The first directory: select it and open it, then open its first file.
  xdotool mousemove $((ox + 2 + 12 * 8)) $((oy + 17 + 8)) click 1
  sleep 0.2
  xdotool key Right
  sleep 0.2
  xdotool key Down Right
  sleep 0.3
  xdotool mousemove $((ox + 600)) $((oy + 400))
  sleep 0.2
fi
mkdir -p "$(dirname "$shot")"
xwd -root | convert xwd:- -trim +repage "$shot"
echo "Screenshot of the viewer: $shot"

# The first function of the file in the annotated source window, at its first line of code.
source_shot="${shot%.png}-source.png"
if [ -n "${ox:-}" ]; then
  xdotool mousemove $((ox + 2 + 12 * 8)) $((oy + 17 * 2 + 8)) click 1
  sleep 0.2
  xdotool key Right Down Return
  win=""
  for _ in $(seq 50); do
    win=$(state | grep '^kestrel.kgAnnotatedSource class=' | grep 'viewable=1' |
      sed 's/.* geom=\([0-9]*\),\([0-9]*\),\([0-9]*\)x\([0-9]*\).*/\3x\4+\1+\2/')
    [ -n "$win" ] && break
    sleep 0.1
  done
  if [ -n "$win" ]; then
    sleep 0.3
    xwd -root | convert xwd:- -crop "$win" +repage "$source_shot"
    echo "Screenshot of the annotated source: $source_shot"
  fi
fi
kill "$pid" 2>/dev/null
wait "$pid" 2>/dev/null
