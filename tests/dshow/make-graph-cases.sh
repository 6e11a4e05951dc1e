#!/usr/bin/env bash
# Makes the graph tests' inputs and references: WAV files at several rates in 16-bit PCM and float, a
# settings record per case, and the Linux renderer's output for each as raw interleaved float32.
# Usage: make-graph-cases.sh OUTDIR ULVETTA
set -euo pipefail
out="$1"
cli="$2"
[ -x "$cli" ] || { echo "the graph tests need the Linux renderer at $cli: build the native preset first" >&2; exit 1; }
rm -rf "$out" && mkdir -p "$out/presets" && cd "$out"

: > cases.txt
add_case() {  # rate format algorithm
  local rate="$1" format="$2" algorithm="$3"
  local name="alg${algorithm}-${rate}-${format}"
  local enc=(-b 16)
  [ "$format" = f32 ] && enc=(-e floating-point -b 32)
  # A short stereo phrase: two tones with different envelopes per channel, and a noise burst.
  sox -D -n -r "$rate" -c 2 "${enc[@]}" "$name.wav" synth 0.5 sine 440 sine 660 fade q 0.01 0.5 0.3 gain -14 \
    : synth 0.15 pinknoise fade q 0.005 0.15 0.1 gain -18
  "$cli" presets save "$name" --algorithm "$algorithm" --set "Output Level Wet=-12" --dir presets >/dev/null
  cp "presets/$name.stp" "$name.stp"
  # The WAVE parser delivers 40 ms per sample; the renderer uses the same block size.
  local block=$((rate * 40 / 1000))
  "$cli" render "$name.wav" "$name-ref.wav" --state "$name.stp" --block "$block"
  # sox reads through 32-bit integers: a reference beyond full scale would be clipped, so refuse one.
  if sox "$name-ref.wav" -t f32 "$name-ref.raw" 2>&1 | grep -qi clip; then
    echo "the reference render of $name exceeds full scale; lower the test input" >&2
    exit 1
  fi
  echo "$name $name.wav $name.stp $name-ref.raw" >> cases.txt
}

# Every algorithm once, at four rates in both sample formats.
for c in "22050 s16 1" "22050 f32 3" "44100 s16 2" "44100 f32 4" "48000 s16 6" "48000 f32 5" "96000 s16 0" \
         "96000 f32 7"; do
  add_case $c
done

# 0.3 s of a constant 0.5 followed by 0.3 s of silence, for the seek test.
perl -e 'print pack("f<", 0.5) x (2 * 13230), pack("f<", 0) x (2 * 13230)' > dc-silence.raw
sox -D -t f32 -r 44100 -c 2 dc-silence.raw -e floating-point -b 32 dc-silence-44100-f32.wav
echo "made $(wc -l < cases.txt) graph cases in $out"
