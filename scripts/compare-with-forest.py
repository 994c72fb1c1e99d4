#!/usr/bin/python3
# SPDX-License-Identifier: Apache-2.0
"""Measures a random forest on averaged features by cross-validation: what the network's metrics are compared with.

Usage: compare-with-forest.py FEATURES [LABELS]     (default model/labels.tsv)

FEATURES is a folder that `qz features --manifest MANIFEST -o FEATURES` wrote. A forest of 500 trees sees of each
clip, per channel, the mean, the deviation, the 90th percentile and the mean absolute step of the features. Each fold
is scored by a forest of all the other folds' clips, fold 0's included; the metrics are those of `qz eval`, with a
--fold-model for each fold: means over the folds. Needs Debian's python3-sklearn (setup-debian.sh validation).
"""

import csv
import pathlib
import sys

import numpy as np
from sklearn.ensemble import RandomForestClassifier
from sklearn.metrics import average_precision_score, roc_auc_score

ROOT = pathlib.Path(__file__).resolve().parent.parent
SECONDS_PER_FALSE_ALARM = 300


def rows_of(path):
    """The lines of a table with tabs, by the names in its first line."""
    with open(path, newline="") as file:
        lines = (line for line in file if line.strip() and not line.startswith("#"))
        return list(csv.DictReader(lines, delimiter="\t", quoting=csv.QUOTE_NONE))


def averages(features):
    step = np.abs(np.diff(features, axis=0)).mean(axis=0)
    return np.concatenate([features.mean(axis=0), features.std(axis=0), np.percentile(features, 90, axis=0), step])


def recall_at(allowed, scores, positives):
    """Of the positives, how many score more than all but `allowed` negatives."""
    negatives = np.sort(scores[~positives])[::-1]
    return np.mean(scores[positives] > (negatives[allowed] if allowed < len(negatives) else -1))


def figures_of(labels, classes, scores, seconds):
    """Average precision, ROC AUC and recall of each label: (labels, 3)."""
    allowed = int(seconds / SECONDS_PER_FALSE_ALARM)
    rows = []
    for label, of_label in zip(labels, scores.T):
        positives = classes == label
        rows.append((average_precision_score(positives, of_label), roc_auc_score(positives, of_label),
                     recall_at(allowed, of_label, positives)))
    return np.array(rows)


def check_folds(labels, classes, folds):
    for fold in sorted(set(folds) - {0}):
        for label in labels:
            for where, chosen in (("in", folds == fold), ("outside", folds != fold)):
                if label not in classes[chosen]:
                    raise ValueError(f"no clip of {label} {where} fold {fold}, should be one or more")


def print_table(labels, metrics):
    print(f"{'class':16}  average precision  ROC AUC  recall")
    for name, row in zip([*labels, "mean"], [*metrics, metrics.mean(axis=0)]):
        print(f"{name:16}  {row[0]:17.3f}  {row[1]:7.3f}  {row[2]:6.3f}")


def main():
    if len(sys.argv) not in (2, 3):
        sys.exit(__doc__)
    folder = pathlib.Path(sys.argv[1])
    labels = [row["class"] for row in rows_of(sys.argv[2] if len(sys.argv) == 3 else ROOT / "model/labels.tsv")]
    clips = rows_of(folder / "features.tsv")
    classes = np.array([clip["class"] for clip in clips])
    folds = np.array([int(clip["fold"]) for clip in clips])
    check_folds(labels, classes, folds)
    features = [np.load(folder / clip["file"]).astype(float) for clip in clips]
    # A clip of k frames of 25 ms, 10 ms apart, lasts k + 1.5 to k + 2.5 times 10 ms.
    seconds = np.array([(len(clip) + 2) / 100 for clip in features])
    inputs = np.array([averages(clip) for clip in features])

    of_folds, right, measured = [], 0, 0
    for fold in sorted(set(folds) - {0}):
        test = folds == fold
        forest = RandomForestClassifier(n_estimators=500, random_state=1, n_jobs=-1)
        forest.fit(inputs[~test], classes[~test])
        scores = forest.predict_proba(inputs[test])
        right += np.sum(forest.classes_[scores.argmax(axis=1)] == classes[test])
        measured += np.sum(test)
        columns = [list(forest.classes_).index(label) for label in labels]
        of_folds.append(figures_of(labels, classes[test], scores[:, columns], seconds[test].sum()))
    print_table(labels, np.mean(of_folds, axis=0))
    print(f"{len(of_folds)} folds, {measured} clips, {right / measured:.3f} of them put into the right one "
          f"of {len(set(classes))} classes")


try:
    main()
except (KeyError, OSError, ValueError) as error:
    print(f"compare-with-forest.py: {sys.argv[1]}: {error}", file=sys.stderr)
    sys.exit(3)
