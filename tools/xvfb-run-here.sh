#!/usr/bin/env bash
# Runs a command under a private Xvfb on a free display (chosen by the server itself).
# Usage: xvfb-run-here.sh COMMAND [ARGS...]   (DISPLAY is set for the command)
set -u
fifo=$(mktemp -u /tmp/kgxvfb.XXXXXX)
mkfifo "$fifo"
Xvfb -displayfd 3 -screen 0 1280x1024x24 -nolisten tcp 3>"$fifo" >/dev/null 2>&1 &
xpid=$!
read -r -t 20 num <"$fifo"
rm -f "$fifo"
if [ -z "${num:-}" ]; then
  echo "Xvfb did not start" >&2
  kill "$xpid" 2>/dev/null
  exit 1
fi
export DISPLAY=":$num"
"$@"
status=$?
kill "$xpid" 2>/dev/null
wait "$xpid" 2>/dev/null
exit $status
