// SPDX-License-Identifier: Apache-2.0
// Scores and metrics of parameters on clips.
#pragma once

#include <vector>

#include "detector/scores.h"
#include "train/parameters.h"
#include "train/quantised_network.h"
#include "train/training_set.h"

namespace qz::train {

using detector::Scores;

// The maximum score of each output over the network's runs, for each clip of which `features` has
// the features. `folded`: in float.
std::vector<Scores> ScoresOf(const Values& folded, const std::vector<Batch>& features);
// By the device's arithmetic: multiples of 1/256.
std::vector<Scores> ScoresOf(const QuantisedParameters& parameters,
                             const std::vector<Batch>& features);

// The ensemble of networks: the logistic of the mean of their logits, from float scores.
std::vector<Scores> MeanLogits(const std::vector<std::vector<Scores>>& networks);

// The device's score for a logit in steps of 0.256.
float DeviceScore(float logit_steps);

struct Metrics {
  double average_precision = 0;  // means over the outputs that have clips
  double roc_auc = 0;
  int outputs = 0;  // that have clips of their class and others
};

Metrics MetricsOf(const std::vector<Scores>& scores, const std::vector<Clip>& clips);

}  // namespace qz::train
