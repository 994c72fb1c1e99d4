// SPDX-License-Identifier: Apache-2.0
#include "train/loss.h"

#include <algorithm>
#include <cmath>

namespace qz::train {
namespace {

// log(1 + e^x) without overflow.
double SoftPlus(double x) { return x > 0 ? x + std::log1p(std::exp(-x)) : std::log1p(std::exp(x)); }

// Beyond it a score of 8 bits does not change.
constexpr double kMaxLogit = 6;

double Logistic(double x) { return 1 / (1 + std::exp(-x)); }

}  // namespace

double ClipLoss(const Batch& logits, const Matrix& targets, const LossShape& shape, float divisor,
                Batch* dlogits) {
  const Eigen::Index windows = logits.steps();
  dlogits->Resize(logits.sequences, windows, logits.channels());
  const double sharpness = static_cast<double>(shape.sharpness);
  double loss = 0;
  for (int s = 0; s < logits.sequences; ++s) {
    for (Eigen::Index c = 0; c < logits.channels(); ++c) {
      const auto column = logits.values.col(c).segment(s * windows, windows);
      const double max = static_cast<double>(column.maxCoeff());
      double sum = 0;
      for (Eigen::Index w = 0; w < windows; ++w) {
        sum += std::exp(sharpness * (static_cast<double>(column(w)) - max));
      }
      const double logit = max + std::log(sum / static_cast<double>(windows)) / sharpness;
      const double smoothing = static_cast<double>(shape.smoothing);
      const double target = smoothing + (1 - 2 * smoothing) * static_cast<double>(targets(s, c));
      const double weight = static_cast<double>(shape.positive_weight(c));
      loss += weight * target * SoftPlus(-logit) + (1 - target) * SoftPlus(logit);
      const double score = Logistic(logit);
      const double slope =
          ((1 - target) * score - weight * target * (1 - score)) / static_cast<double>(divisor);
      for (Eigen::Index w = 0; w < windows; ++w) {
        const double share = std::exp(sharpness * (static_cast<double>(column(w)) - max)) / sum;
        dlogits->values(s * windows + w, c) = static_cast<float>(slope * share);
      }
    }
  }
  return loss / static_cast<double>(divisor);
}

double DistillationLoss(const Batch& logits, const Batch& distillation_targets, float divisor,
                        Batch* dlogits) {
  dlogits->Resize(logits.sequences, logits.steps(), logits.channels());
  const double parts = static_cast<double>(divisor) * static_cast<double>(logits.steps());
  double loss = 0;
  for (Eigen::Index i = 0; i < logits.values.size(); ++i) {
    const auto target = static_cast<double>(distillation_targets.values.data()[i]);
    const double away =
        static_cast<double>(logits.values.data()[i]) - std::clamp(target, -kMaxLogit, kMaxLogit);
    loss += 0.5 * away * away;
    dlogits->values.data()[i] = static_cast<float>(away / parts);
  }
  return loss / parts;
}

}  // namespace qz::train
