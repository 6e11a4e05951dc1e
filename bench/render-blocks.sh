#!/usr/bin/env bash
# Times whole `ulvetta render` runs of a minute of stereo 16-bit noise at --block 64 against --block 4096.
# The two alternate so that load from elsewhere on the machine falls on both alike. Prints the median
# user, system and wall seconds of each block size and the ratios 64 / 4096.
# Usage: bench/render-blocks.sh [ULVETTA] [RUNS] [ALGORITHM]
set -euo pipefail
cli="${1:-build/native/apps/cli/ulvetta}"
runs="${2:-7}"
algorithm="${3:-0}"
work="$(mktemp -d)"
trap 'rm -rf "$work"' EXIT

# -R: the same noise on every run of the script.
sox -R -n -r 44100 -c 2 -b 16 "$work/in.wav" synth 60 pinknoise vol 0.5
# The shell's own timer reports to the microsecond; one line per run: block user system wall.
TIMEFORMAT='%3U %3S %3R'
for ((i = 0; i < runs; i++)); do
  for block in 64 4096; do
    { time "$cli" render "$work/in.wav" "$work/out.wav" --algorithm "$algorithm" --block "$block"; } 2>"$work/t"
    echo "$block $(tail -n 1 "$work/t")" >>"$work/times"
  done
done

# The median over the runs of one block size; the column is 2 user, 3 system, 4 wall, 5 user + system.
median() {
  awk -v b="$1" -v c="$2" '$1 == b { $5 = $2 + $3; print $c }' "$work/times" | sort -g |
    awk '{ v[NR] = $1 } END { print (NR % 2) ? v[(NR + 1) / 2] : (v[NR / 2] + v[NR / 2 + 1]) / 2 }'
}
ratio() { awk -v a="$(median 64 "$1")" -v b="$(median 4096 "$1")" 'BEGIN { printf "%.2f", (b > 0) ? a / b : 0 }'; }

echo "ulvetta render, 60 s of 44100 Hz stereo, algorithm ${algorithm}: median of ${runs} runs in seconds"
printf '%-10s %8s %8s %8s %8s\n' block user system wall cpu
for block in 64 4096; do
  printf '%-10s %8s %8s %8s %8s\n' "$block" "$(median "$block" 2)" "$(median "$block" 3)" \
    "$(median "$block" 4)" "$(median "$block" 5)"
done
printf '%-10s %8s %8s %8s %8s\n' "64/4096" "$(ratio 2)" "$(ratio 3)" "$(ratio 4)" "$(ratio 5)"
