#!/usr/bin/env bash
# Makes tests/data/dry.wav, the dry sample the demo renders: a few drum-like hits, a spoken sentence
# and a plucked chord, 44.1 kHz 16-bit mono, 5.8 seconds with a little silence at the
# end for the tail. Needs espeak-ng and sox (scripts/bootstrap installs both).
set -euo pipefail
cd "$(dirname "$0")"

tmp=$(mktemp -d)
trap 'rm -rf "$tmp"' EXIT
sx() { sox -R -q "$@"; }
fmt=(-r 44100 -c 1 -b 16)

# Drums: a kick (a falling sine) and a snare (filtered noise over a short tone), each with a fast decay.
sx -n "${fmt[@]}" "$tmp/kick.wav" synth 0.35 sine 150-45 fade q 0.002 0.35 0.3 gain -2
sx -n "${fmt[@]}" "$tmp/snare-noise.wav" synth 0.25 noise gain -8 highpass 300 lowpass 7000 fade q 0.001 0.25 0.22
sx -n "${fmt[@]}" "$tmp/snare-tone.wav" synth 0.25 sine 190 fade q 0.001 0.25 0.2 gain -8
sx -m "$tmp/snare-noise.wav" "$tmp/snare-tone.wav" "$tmp/snare.wav" gain 3

# Speech.
espeak-ng -v en -s 160 -w "$tmp/speech-raw.wav" "Ulvetta. A plate, a room, a hall."
# Resampled to the sample's rate, with the silence before and after the words cut off.
sx "$tmp/speech-raw.wav" "${fmt[@]}" "$tmp/speech.wav" silence 1 0.02 1% reverse silence 1 0.02 1% reverse

# A C major chord of plucked strings, strummed.
sx -n -r 44100 -b 16 "$tmp/chord-wide.wav" synth 1.4 pluck C3 pluck G3 pluck C4 pluck E4 pluck G4 \
  delay 0 0.03 0.06 0.09 0.12 remix - fade q 0.005 1.4 0.6
sx "$tmp/chord-wide.wav" "${fmt[@]}" "$tmp/chord.wav" norm -4

# Place everything on the time line (seconds) and mix.
parts=()
place() {
  local src=$1 at=$2 out="$tmp/at-$3.wav"
  sx "$src" "$out" pad "$at"
  parts+=(-v 0.5 "$out")
}
place "$tmp/kick.wav" 0.10 1
place "$tmp/snare.wav" 0.45 2
place "$tmp/kick.wav" 0.80 3
place "$tmp/kick.wav" 0.98 4
place "$tmp/snare.wav" 1.15 5
place "$tmp/speech.wav" 1.55 6
place "$tmp/chord.wav" 4.05 7
sx -m "${parts[@]}" "${fmt[@]}" "$tmp/mix.wav" norm -1
sx "$tmp/mix.wav" "$tmp/padded.wav" pad 0 1
sx "$tmp/padded.wav" "${fmt[@]}" dry.wav trim 0 5.8
soxi dry.wav | grep -E 'Duration|Sample Rate|Precision|Channels'
