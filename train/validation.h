// Metrics of parameters on clips that they were not trained on.
#pragma once

#include <vector>

#include "detector/scores.h"
#include "train/parameters.h"
#include "train/quantised_network.h"
#include "train/training_set.h"

namespace qz::train {

using detector::Scores;

// The maximum score of each output over the network's runs, a clip each. `folded`: in float.
std::vector<Scores> ScoresOf(const Values& folded, const std::vector<Batch>& validated);
// By the device's arithmetic: multiples of 1/256.
std::vector<Scores> ScoresOf(const QuantisedParameters& parameters,
                             const std::vector<Batch>& validated);

// The ensemble of networks: the logistic of their mean logits, of float scores.
std::vector<Scores> MeanLogits(const std::vector<std::vector<Scores>>& networks);

// The device's score for a logit in steps of 0.256.
float DeviceScore(float logit_steps);

struct Metrics {
  double average_precision = 0;  // means over the outputs that some clip is labelled with
  double roc_auc = 0;
  int outputs = 0;  // that were evaluated
};

Metrics MetricsOf(const std::vector<Scores>& scores, const std::vector<Clip>& clips);

}  // namespace qz::train
