#!/usr/bin/env bash
# Runs a Windows test that opens windows: under Wine in a prefix of its own (so that no Wine session started
# without a display serves it), on the display in DISPLAY, or on a private 24-bit Xvfb when none is set.
# Usage: with-display.sh WINE-RUN PROGRAM [ARGS...]
set -euo pipefail
here="$(cd "$(dirname "$0")" && pwd)"
root="$(cd "${here}/../.." && pwd)"
if [ -z "${DISPLAY:-}" ]; then
  exec xvfb-run -a -s "-screen 0 1280x1024x24" bash "$0" "$@"
fi
export ULVETTA_WINEPREFIX="${ULVETTA_WINEPREFIX:-${root}/build/wineprefix-display}"
rc=0
"$@" || rc=$?
# The prefix's Wine session must end while its display still exists.
WINEPREFIX="${ULVETTA_WINEPREFIX}" wineserver -w || true
exit $rc
