#!/usr/bin/env bash
# Runs every benchmark of build/host, then measures `qz run` on ten minutes of recorded sound.
set -euo pipefail
cd "$(dirname "$0")/.."

clip=build/host/clip.wav
ten_minutes=build/host/ten_minutes.wav
length_s=600

ran=0
for bench in build/host/bin/*_bench; do
  [ -x "$bench" ] || continue
  echo "== $(basename "$bench")"
  "$bench"
  ran=$((ran + 1))
done
[ "$ran" -gt 0 ] || { echo "bench.sh: no benchmark in build/host/bin" >&2; exit 1; }

if [ ! -e "$ten_minutes" ]; then
  # As the detector takes it, so that its own speed is measured.
  sox -D -G "$clip" -b 16 "$ten_minutes.part.wav" rate 16000 channels 1 repeat - \
    trim 0 "$length_s"
  mv "$ten_minutes.part.wav" "$ten_minutes"
fi
echo "== qz run $ten_minutes"
build/host/bin/qz run "$ten_minutes" 2>&1 | grep -E 'taken as it is|^summary|heap blocks|speed'
