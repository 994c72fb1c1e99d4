#!/usr/bin/env bash
# SPDX-License-Identifier: Apache-2.0
# Runs every benchmark of build/host, then measures `qz run` on an hour of recorded sound: as the
# detector takes it, and as it must be decoded, mixed down and resampled.
set -euo pipefail
cd "$(dirname "$0")/.."

clip=build/host/clip.wav
length_s=3600

# An hour of the clip over and over, in the format of the file name's extension.
make_hour() {
  local out=$1 rate_hz=$2 channels=$3
  [ ! -e "$out" ] || return 0
  local part=${out%/*}/part-${out##*/}
  sox -D -G "$clip" -b 16 "$part" rate "$rate_hz" channels "$channels" repeat - trim 0 "$length_s"
  mv "$part" "$out"
}

ran=0
for bench in build/host/bin/*_bench; do
  [ -x "$bench" ] || continue
  echo "== $(basename "$bench")"
  "$bench"
  ran=$((ran + 1))
done
[ "$ran" -gt 0 ] || { echo "bench.sh: no benchmark in build/host/bin" >&2; exit 1; }

make_hour build/host/hour.wav 16000 1
make_hour build/host/hour.flac 44100 2
for hour in build/host/hour.wav build/host/hour.flac; do
  echo "== qz run $hour"
  build/host/bin/qz run "$hour" 2>&1 | grep -E ' Hz, |^summary|heap blocks|speed'
done
