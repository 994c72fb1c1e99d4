#!/usr/bin/env bash
# SPDX-License-Identifier: Apache-2.0
# Validates the recipe of the demonstration model: for each of the four folds of DATA a model trained on
# the other three, all measured on the fold they were not trained on; then a simple reference on the same folds.
# Usage: scripts/cross-validate.sh DATA
set -euo pipefail

[ $# -eq 1 ] || { echo "usage: cross-validate.sh DATA" >&2; exit 2; }
data=$(realpath -e -- "$1" 2>/dev/null) || data=$1  # what is no folder is reported below
cd "$(dirname "$0")/.."
folder=build/cross-validation
folds=(1 2 3 4)

fit() {
  echo "fold $1 begins" >&2
  build/host/bin/qz-train fit $folder/manifest.tsv --recipe model/demonstration.recipe --hold-out "$1" \
    --threads 1 --state "$folder/state-$1" -o "$folder/fold-$1.bin" \
    >"$folder/fold-$1.txt" 2>"$folder/fold-$1.log" || { cat "$folder/fold-$1.log" >&2; return 1; }
  echo "fold $1 is done" >&2
}
export -f fit
export folder

scripts/train-material.sh "$data" $folder
printf '%s\n' "${folds[@]}" | xargs -P 2 -I{} bash -c 'fit {}'

models=()
for fold in "${folds[@]}"; do
  cat $folder/fold-"$fold".txt
  models+=(--fold-model "$fold=$folder/fold-$fold.bin")
done
awk '/^loss of quantisation/ { first += $4; all += $14; n++ }
     END { printf "loss of quantisation, mean over %d folds: %.4f mean AP from the first teacher, %.4f from all " \
                  "teachers together\n\n", n, first / n, all / n }' $folder/fold-?.txt
build/host/bin/qz eval $folder/manifest.tsv "${models[@]}"
printf '\nFor comparison, a random forest on averages of the same features:\n'
build/host/bin/qz features --manifest $folder/manifest.tsv -o $folder/features
scripts/compare-with-forest.py $folder/features
