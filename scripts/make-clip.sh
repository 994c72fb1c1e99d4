#!/usr/bin/env bash
# SPDX-License-Identifier: Apache-2.0
# Puts a clip of real recorded sound together from the sounds of two Debian packages: spoken words
# among alarm, telephone, bell and camera sounds, 48 kHz stereo.
# Usage: scripts/make-clip.sh OUT.wav
set -euo pipefail

[ $# -eq 1 ] || { echo "usage: make-clip.sh OUT.wav" >&2; exit 2; }
out=$1
speech=/usr/share/sounds/alsa                  # alsa-utils
effects=/usr/share/sounds/freedesktop/stereo   # sound-theme-freedesktop
sounds=(
  $speech/Front_Center.wav $effects/alarm-clock-elapsed.oga
  $speech/Front_Left.wav $effects/phone-incoming-call.oga $effects/phone-incoming-call.oga
  $speech/Front_Right.wav $effects/camera-shutter.oga $effects/bell.oga
  $speech/Side_Left.wav $effects/phone-outgoing-busy.oga
  $speech/Side_Right.wav $effects/complete.oga
  $speech/Rear_Left.wav $effects/service-login.oga
  $speech/Rear_Right.wav
)
pause_s=0.2
min_s=20

for sound in "${sounds[@]}"; do
  [ -r "$sound" ] || {
    echo "make-clip.sh: $sound is missing; packages alsa-utils and sound-theme-freedesktop" \
      "bring the sounds" >&2
    exit 1
  }
done

folder=$(dirname "$out")
mkdir -p "$folder"
parts=$(mktemp -d "$folder/clip-XXXXXX")
trap 'rm -rf "$parts"' EXIT

files=()
for i in "${!sounds[@]}"; do
  part=$parts/$(printf '%02d' "$i").wav
  # No dither, so that the clip is the same each time; -G keeps a change of rate from clipping.
  sox -D -G "${sounds[$i]}" -b 16 "$part" rate 48000 channels 2 pad 0 "$pause_s"
  files+=("$part")
done
sox -D "${files[@]}" "$parts/whole.wav"

length_s=$(soxi -D "$parts/whole.wav")
awk -v have="$length_s" -v min="$min_s" 'BEGIN { exit !(have >= min) }' || {
  echo "make-clip.sh: the clip lasts $length_s s, should be at least $min_s s" >&2
  exit 1
}
mv "$parts/whole.wav" "$out"
