#!/usr/bin/env bash
# Makes the property page tests' references with the Linux renderer: each page as `ulvetta snapshot` draws it
# (raw 750 x 167 RGB, for the Windows test to read), the settings after scripted events, and a music-like
# stereo file for streaming while the page opens and closes.
# Usage: make-page-cases.sh OUTDIR ULVETTA
set -euo pipefail
out="$1"
cli="$2"
[ -x "$cli" ] || { echo "the page tests need the Linux renderer at $cli: build the native preset first" >&2; exit 1; }
rm -rf "$out" && mkdir -p "$out" && cd "$out"

raw() {  # PNG -> raw RGB rows, top to bottom
  # Debian's own interpreter, where the imaging package is installed.
  /usr/bin/python3 -c 'import sys; from PIL import Image; open(sys.argv[2], "wb").write(Image.open(sys.argv[1]).convert("RGB").tobytes())' "$1" "$2"
}
# One tick of the 50 ms timer draws the load bar, as the page's timer does once it runs.
echo "tick 1" > tick.events
for page in reverb filter about; do
  "$cli" snapshot --page "$page" --events tick.events "$page.png"
  raw "$page.png" "$page.rgb"
done

# A click on the Pre Delay fader's track, then a drag of its thumb.
cat > drag.events <<'EVENTS'
press 284 120
release 284 120
press 284 120
drag 284 60
drag 284 70
release 284 70
EVENTS
"$cli" snapshot --events drag.events --save-state drag.stp drag.png
# The Decay value typed and stored with Enter.
cat > typed.events <<'EVENTS'
press 315 23
release 315 23
type 3.5
key 13
tick 1
EVENTS
"$cli" snapshot --events typed.events --save-state typed.stp typed.png
raw typed.png typed.rgb

# Three presets to browse and a plain one to start from.
"$cli" presets save first --algorithm 0 --set "Decay=1.5" --dir . >/dev/null
"$cli" presets save second --algorithm 3 --set "Pre Delay=80" --dir . >/dev/null
"$cli" presets save third --algorithm 7 --set "Damping=40" --dir . >/dev/null

# 20 s of tremolo tones, long enough to stream at the speed of the clock while the page opens and closes.
sox -D -n -r 44100 -c 2 -b 16 stream.wav synth 20 sine 220 sine 330 tremolo 3 60 gain -9
echo "made the page cases in $out"
