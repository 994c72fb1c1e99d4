#!/usr/bin/env bash
# SPDX-License-Identifier: Apache-2.0
# Puts a clip of real recorded sounds together that the detector should and should not know, from Debian
# packages, and beside it a table of its sounds and their times. Prints the table.
# Usage: scripts/make-demo-clip.sh OUT.wav        (the table: OUT.txt)
#
# Where the sounds come from, and under which licence (/usr/share/doc/PACKAGE/copyright):
#   scratch                  Media: 2011 Massachusetts Institute of Technology, CC BY-SA 3.0
#   elpa-redtick             rest.wav: 2012 unfa (freesound 154906), CC BY 3.0
#   alsa-utils               the ALSA developers, GPL-2
#   sound-theme-freedesktop  alarm-clock-elapsed.oga: Tim/corsica_s, CC BY-SA 3.0
set -euo pipefail

[ $# -eq 1 ] || { echo "usage: make-demo-clip.sh OUT.wav" >&2; exit 2; }
out=$1
animal=/usr/share/scratch/Media/Sounds/Animal
things=/usr/share/scratch/Media/Sounds/Effects
human=/usr/share/scratch/Media/Sounds/Human
clock=/usr/share/redtick/resources
speech=/usr/share/sounds/alsa
effects=/usr/share/sounds/freedesktop/stereo

# What it is; how often, how many seconds after each time and after all of them; the file.
sounds=(
  "speech         1 0.0 2.0 $speech/Front_Center.wav"
  "dog_bark       6 0.3 4.0 $animal/Dog1.wav"
  "alarm          1 0.0 4.0 $effects/alarm-clock-elapsed.oga"
  "baby_cry       2 0.3 4.0 $human/BabyCry.mp3"
  "speech         1 0.0 2.0 $speech/Rear_Left.wav"
  "rooster        1 0.0 4.0 $animal/Rooster.wav"
  "typing         1 0.0 4.0 $things/Typing.mp3"
  "person_sneeze  1 0.0 4.0 $human/Sneeze-female.wav"
  "water          1 0.0 4.0 $things/WaterRunning.mp3"
  "clock_tick     7 0.0 2.0 $clock/rest.wav"
)

folder=$(dirname "$out")
mkdir -p "$folder"
parts=$(mktemp -d "$folder/demo-XXXXXX")
trap 'rm -rf "$parts"' EXIT

files=()
start_s=0
printf '%8s  %-14s %s\n' seconds sound file >"$parts/table"
for i in "${!sounds[@]}"; do
  read -r sound times gap_s pause_s file <<<"${sounds[$i]}"
  [ -r "$file" ] || {
    echo "make-demo-clip.sh: $file is missing; scripts/setup-debian.sh demo brings the sounds" >&2
    exit 1
  }
  part=$parts/$(printf '%02d' "$i").wav
  # No dither, so that the clip is the same each time; all sounds with the same peak.
  sox -D "$file" -b 16 "$part" gain -n -6 rate 48000 channels 1 pad 0 "$gap_s" \
    repeat "$((times - 1))" pad 0 "$pause_s"
  printf '%8.1f  %-14s %s\n' "$start_s" "$sound" "$file" >>"$parts/table"
  start_s=$(awk -v a="$start_s" -v b="$(soxi -D "$part")" 'BEGIN { print a + b }')
  files+=("$part")
done
sox -D "${files[@]}" "$parts/whole.wav"
mv "$parts/table" "${out%.wav}.txt"
mv "$parts/whole.wav" "$out"
cat "${out%.wav}.txt"
