#!/usr/bin/env bash
# SPDX-License-Identifier: Apache-2.0
# Makes the demonstration model out of the recordings of DATA and compares it with the committed one, which
# it replaces only where UPDATE=1. A run that was stopped goes on where it was.
# Usage: scripts/train.sh DATA
set -euo pipefail

[ $# -eq 1 ] || { echo "usage: train.sh DATA" >&2; exit 2; }
data=$(realpath -e -- "$1" 2>/dev/null) || data=$1  # what is no folder is reported below
cd "$(dirname "$0")/.."
folder=build/train
committed=model/demonstration.bin

scripts/train-material.sh "$data" $folder
build/host/bin/qz-train fit $folder/manifest.tsv --recipe model/demonstration.recipe \
  --state $folder/state -o $folder/demonstration.bin

if cmp -s $folder/demonstration.bin $committed; then
  echo "$folder/demonstration.bin is $committed again, byte for byte"
elif [ "${UPDATE:-}" = 1 ]; then
  cp $folder/demonstration.bin $committed
  echo "$committed is new"
else
  echo "train.sh: $folder/demonstration.bin differs from $committed; UPDATE=1 takes it" >&2
  exit 1
fi
