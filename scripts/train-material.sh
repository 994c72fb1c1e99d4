#!/usr/bin/env bash
# SPDX-License-Identifier: Apache-2.0
# Lists what the demonstration model is trained on: the recordings of DATA, a folder of class folders whose
# files begin with their fold, and sounds out of Debian packages as negatives.
# Usage: scripts/train-material.sh DATA FOLDER     writes FOLDER/negatives/ and FOLDER/manifest.tsv
set -euo pipefail

[ $# -eq 2 ] || { echo "usage: train-material.sh DATA FOLDER" >&2; exit 2; }
data=$1
folder=$2
here=$(dirname "$0")

[ -d "$data" ] || {
  echo "train-material.sh: '$data' is no folder; name the recordings: make train DATA=folder" >&2
  exit 3
}
mkdir -p "$folder"
"$here/make-negatives.sh" "$folder/negatives"
"$here/make-manifest.py" "$data" --extra "$folder/negatives" -o "$folder/manifest.tsv"
