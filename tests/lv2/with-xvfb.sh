#!/usr/bin/env bash
# Runs a command on a private X server (Xvfb at 24 bits, a free display number chosen by the server; no reset
# when the last client leaves, which would refuse the next connection for a moment).
set -euo pipefail
fifo=$(mktemp)
Xvfb -displayfd 3 -screen 0 1024x400x24 -nolisten tcp -noreset 3>"$fifo" 2>/dev/null &
server=$!
trap 'kill "$server" 2>/dev/null || true; wait "$server" 2>/dev/null || true; rm -f "$fifo"' EXIT
for _ in $(seq 100); do [ -s "$fifo" ] && break; sleep 0.1; done
[ -s "$fifo" ] || { echo "with-xvfb: the X server did not start" >&2; exit 1; }
DISPLAY=":$(head -n 1 "$fifo")" "$@"
