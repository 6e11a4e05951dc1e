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
# No window manager runs on the private display: Wine must not wait for one (it would wait 2 s for every
# window that is hidden or destroyed), so its windows are unmanaged.
wine_run="$1"
if ! grep -qs '"Managed"="N"' "${ULVETTA_WINEPREFIX}/user.reg"; then
  "${wine_run}" reg add 'HKCU\Software\Wine\X11 Driver' /v Managed /d N /f >/dev/null 2>&1
fi
rc=0
"$@" || rc=$?
# The prefix's Wine session must end while its display still exists.
WINEPREFIX="${ULVETTA_WINEPREFIX}" wineserver -w || true
exit $rc
