#!/usr/bin/env bash
# The plugin and its editor in jalv (GTK), as a user opens them, on a private X server (Xvfb, 24-bit) and a
# private dummy JACK server, started on a factory preset: the editor's window must show exactly what `ulvetta
# snapshot` draws for the same preset, and jalv must quit cleanly when asked to. With a third argument the jalv window is saved there.
# Usage: jalv-ui.sh BUNDLE ULVETTA [PICTURE.png]
set -euo pipefail
bundle=$1
ulvetta=$2
picture=${3:-}
python=/usr/bin/python3  # Debian's, with Pillow

work=$(mktemp -d)
pids=()
cleanup() {
  for p in "${pids[@]}"; do kill "$p" 2>/dev/null || true; done
  wait 2>/dev/null || true
  rm -rf "$work"
}
trap cleanup EXIT
fail() {
  echo "jalv-ui: $*" >&2
  [ -f "$work/jalv.log" ] && tail -n 20 "$work/jalv.log" >&2
  exit 1
}
# Waits up to 60 s for a command to succeed (a loaded machine can be slow to start a GTK program; nothing here
# waits the whole time when things work).
await() {
  for _ in $(seq 600); do
    if "$@" >/dev/null 2>&1; then return 0; fi
    sleep 0.1
  done
  return 1
}

Xvfb -displayfd 3 -screen 0 1024x400x24 -nolisten tcp -noreset 3>"$work/display" 2>"$work/xvfb.log" &
pids+=($!)
await test -s "$work/display" || fail "the X server did not start"
export DISPLAY=":$(head -n 1 "$work/display")"

export JACK_DEFAULT_SERVER="ulvetta-ui-test-$$"
jackd --no-realtime -n "$JACK_DEFAULT_SERVER" -d dummy -r 44100 -p 256 >"$work/jackd.log" 2>&1 &
pids+=($!)
await jack_lsp || fail "the dummy JACK server did not start"

# One tick, as the editor in jalv has long had: the load bar is drawn by the tick.
echo "tick 1" >"$work/tick.events"
"$ulvetta" snapshot --page reverb --preset "classic plate" --events "$work/tick.events" "$work/expected.png" ||
  fail "ulvetta snapshot failed"

mkdir "$work/lv2"
ln -s "$(realpath "$bundle")" "$work/lv2/ulvetta.lv2"
LV2_PATH="$work/lv2" jalv.gtk3 -p urn:ulvetta:reverb:preset:classic-plate urn:ulvetta:reverb >"$work/jalv.log" 2>&1 &
jalv=$!
pids+=($jalv)

# The editor is the one 750 x 167 window.
editor_window() { xwininfo -root -tree | awk '/ 750x167\+/ {print $1; exit}' | grep -q .; }
await editor_window || fail "the editor's window did not appear"
id=$(xwininfo -root -tree | awk '/ 750x167\+/ {print $1; exit}')
x=$(xwininfo -id "$id" | awk '/Absolute upper-left X/ {print $4}')
y=$(xwininfo -id "$id" | awk '/Absolute upper-left Y/ {print $4}')

# The window system may show the window before its first paint: compare until equal or 10 s have passed.
compare() {
  "$python" - "$x" "$y" "$work/expected.png" <<'PY'
import sys
from PIL import Image, ImageChops, ImageGrab
x, y = int(sys.argv[1]), int(sys.argv[2])
shown = ImageGrab.grab(xdisplay=None).crop((x, y, x + 750, y + 167)).convert("RGB")
expected = Image.open(sys.argv[3]).convert("RGB")
box = ImageChops.difference(shown, expected).getbbox()
if box is not None:
    print("differs in", box, file=sys.stderr)
sys.exit(0 if box is None else 1)
PY
}
await compare 2>"$work/compare.log" ||
  fail "the editor in jalv differs from ulvetta snapshot of the same settings ($(tail -n 1 "$work/compare.log"))"

if [ -n "$picture" ]; then
  "$python" -c "from PIL import ImageGrab; ImageGrab.grab(xdisplay=None).crop((0, 0, 750, $((y + 167)))).save('$picture')"
fi

kill -INT "$jalv"
status=0
wait "$jalv" || status=$?
[ "$status" -eq 0 ] || fail "jalv did not quit cleanly (status $status)"
if grep -qiE 'error|assert|segmentation' "$work/jalv.log"; then fail "jalv reported a problem"; fi
echo "jalv-ui: the editor in jalv equals the snapshot pixel for pixel; jalv quit cleanly"
