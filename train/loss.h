// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "model/reference_network.h"
#include "train/matrix.h"

namespace qz::train {

// How the windows of a sequence give one score, and the loss of it.
struct LossShape {
  float sharpness = 3;  // of the soft maximum over the windows of a sequence
  float smoothing = 0;  // targets are moved that far from 0 and 1
  // Loss of a missed positive as a multiple of a false alarm's, by class.
  RowVector positive_weight = RowVector::Ones(model::kClasses);
};

// logits: sequences of windows x classes; targets: sequences x classes, 0 to 1. The clip's logit is
// the soft maximum (1 / sharpness) log mean exp(sharpness x logit) over its windows, its loss the
// cross-entropy of its logistic with the target. Returns the sum over sequences and classes divided
// by `divisor`, and its gradient.
double ClipLoss(const Batch& logits, const Matrix& targets, const LossShape& shape, float divisor,
                Batch* dlogits);

// Half the square of every logit's distance from the teachers' mean logit, which is clamped to -6
// to 6: sum over windows and classes, divided by `divisor` and the windows of a sequence, and its
// gradient. The cross-entropy of the logistics would hardly separate confident scores, whose
// order matters.
double DistillationLoss(const Batch& logits, const Batch& distillation_targets, float divisor,
                        Batch* dlogits);

}  // namespace qz::train
