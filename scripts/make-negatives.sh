#!/usr/bin/env bash
# SPDX-License-Identifier: Apache-2.0
# Makes sounds that none of the classes answers to, out of what Debian packages offer: synthetic speech in
# several voices (espeak-ng), the sounds and spoken words of a desktop (sound-theme-freedesktop), and recordings
# of people, animals and things (scratch), as 16-bit mono WAV of 44.1 kHz. The same files each time. Left out is
# what scripts/make-demo-clip.sh plays, and what rings.
# Usage: scripts/make-negatives.sh FOLDER
set -euo pipefail

[ $# -eq 1 ] || { echo "usage: make-negatives.sh FOLDER" >&2; exit 2; }
folder=$1
effects=/usr/share/sounds/freedesktop/stereo
recorded=/usr/share/scratch/Media/Sounds
voices=(en-us en-gb+f3 de fr+f2 es it+f4 pt ru+m3 pl+f1 sv nl+m5 tr+f5)
sentences=(
  "The quick brown fox jumps over the lazy dog, and then it goes home to have some tea."
  "Seven, eight, nine. Please leave your message after the tone! Left, right. Thank you; good bye."
)
recordings=(
  Human/{Cough-female,FingerSnap,Footsteps-1,Laugh-female,Laugh-male1,Laugh-male2,PartyNoise,Scream-female,Scream-male1}
  Animal/{Bird,Crickets,Duck,Goose,HorseGallop,Meow,Owl,WolfHowl}
  Effects/{BellToll,Bubbles,CarPassing,DoorCreak,MotorcyclePassing,Rattle}
)

for needed in espeak-ng sox; do
  command -v "$needed" >/dev/null || { echo "make-negatives.sh: $needed is missing" >&2; exit 1; }
done
for needed in "$effects" "$recorded"; do
  [ -d "$needed" ] || { echo "make-negatives.sh: $needed is missing" >&2; exit 1; }
done
if [ -e "$folder" ] && [ ! -e "$folder/speech-de-0.wav" ]; then
  echo "make-negatives.sh: $folder exists and is not of this script's making" >&2
  exit 1
fi

mkdir -p "$(dirname "$folder")"
part=$(mktemp -d "$folder.part-XXXXXX")
trap 'rm -rf "$part"' EXIT
mkdir "$part/sounds"

# convert IN NAME: no dither, so that the bytes repeat.
convert() { sox -D "$1" -b 16 "$part/sounds/$2.wav" gain -6 rate 44100 channels 1 gain -n -3; }

for i in "${!voices[@]}"; do
  for j in "${!sentences[@]}"; do
    espeak-ng -v "${voices[$i]}" -s $((130 + 4 * i)) -p $((30 + 5 * i)) -w "$part/speech.wav" "${sentences[$j]}"
    convert "$part/speech.wav" "speech-${voices[$i]}-$j"
  done
done
for file in "$effects"/*.oga; do
  name=$(basename "$file" .oga)
  case "$name" in audio-channel-front-center | audio-channel-rear-left) continue ;; esac
  case "$name" in alarm-clock-elapsed | phone-incoming-call) continue ;; esac
  convert "$file" "desktop-$name"
done
for name in "${recordings[@]}"; do
  convert "$recorded/$name.wav" "recorded-$(basename "$name")"
done
rm -rf "$folder"
mv "$part/sounds" "$folder"
