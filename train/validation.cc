// SPDX-License-Identifier: Apache-2.0
#include "train/validation.h"

#include <algorithm>
#include <cmath>

#include "evaluation/ranking.h"

namespace qz::train {
namespace {

Scores Max(const Batch& logits) {
  Scores scores;
  for (size_t c = 0; c < scores.size(); ++c) {
    scores[c] = logits.values.col(static_cast<Eigen::Index>(c)).maxCoeff();
  }
  return scores;
}

}  // namespace

float DeviceScore(float logit_steps) {
  const double logistic = 1 / (1 + std::exp(-kLogitScale * static_cast<double>(logit_steps)));
  return static_cast<float>(std::min(std::floor(256 * logistic + 0.5), 255.0) / 256);
}

std::vector<Scores> ScoresOf(const Values& folded, const std::vector<Batch>& features) {
  FloatNetwork network;
  std::vector<Scores> all;
  for (const Batch& clip : features) {
    Scores scores = Max(network.Forward(folded, clip, nullptr));
    for (float& score : scores) score = 1 / (1 + std::exp(-score));
    all.push_back(scores);
  }
  return all;
}

std::vector<Scores> ScoresOf(const QuantisedParameters& parameters,
                             const std::vector<Batch>& features) {
  QuantisedNetwork network;
  std::vector<Scores> all;
  for (const Batch& clip : features) {
    Scores scores = Max(network.Forward(parameters, clip));
    std::transform(scores.begin(), scores.end(), scores.begin(), DeviceScore);
    all.push_back(scores);
  }
  return all;
}

std::vector<Scores> MeanLogits(const std::vector<std::vector<Scores>>& networks) {
  std::vector<Scores> means(networks[0].size());
  for (size_t i = 0; i < means.size(); ++i) {
    for (size_t c = 0; c < means[i].size(); ++c) {
      float sum = 0;
      for (const std::vector<Scores>& scores : networks) {
        sum += std::log(scores[i][c] / (1 - scores[i][c] + 1e-7f));
      }
      means[i][c] = 1 / (1 + std::exp(-sum / static_cast<float>(networks.size())));
    }
  }
  return means;
}

Metrics MetricsOf(const std::vector<Scores>& scores, const std::vector<Clip>& clips) {
  Metrics metrics;
  for (int output = 0; output < model::kClasses; ++output) {
    std::vector<float> column;
    std::vector<bool> positives;
    for (size_t i = 0; i < clips.size(); ++i) {
      column.push_back(scores[i][static_cast<size_t>(output)]);
      positives.push_back(clips[i].output == output);
    }
    const auto precision = evaluation::AveragePrecision(column, positives);
    const auto auc = evaluation::RocAuc(column, positives);
    if (!precision || !auc) continue;
    metrics.average_precision += *precision;
    metrics.roc_auc += *auc;
    ++metrics.outputs;
  }
  if (metrics.outputs > 0) {
    metrics.average_precision /= metrics.outputs;
    metrics.roc_auc /= metrics.outputs;
  }
  return metrics;
}

}  // namespace qz::train
