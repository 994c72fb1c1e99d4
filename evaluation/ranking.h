// SPDX-License-Identifier: Apache-2.0
// How well scores separate the clips of a class from the others, for every threshold at once.
//
// `scores` and `positives` have one entry a clip: the score of the class, and whether the clip is
// of the class. Order is free; equal scores are never separated. A score that is not a number
// counts as the minimum. Sizes that differ throw std::invalid_argument. Without a positive, or
// without a negative, there is nothing to separate: std::nullopt.
#pragma once

#include <cstddef>
#include <optional>
#include <vector>

namespace qz::evaluation {

// The mean, over the positives, of the precision at the threshold that just lets the positive in:
// the sum over all distinct scores, from the maximum, of precision x growth of recall. 0 to 1; the
// share of positives where all scores are equal.
std::optional<double> AveragePrecision(const std::vector<float>& scores,
                                       const std::vector<bool>& positives);

// The probability that a positive scores higher than a negative, ties counted as half. 0 to 1; 0.5
// where all scores are equal.
std::optional<double> RocAuc(const std::vector<float>& scores, const std::vector<bool>& positives);

// The maximum recall, 0 to 1, among the thresholds that no more than `allowed` negatives reach. A
// clip reaches a threshold that equals its score.
std::optional<double> RecallAtFalseAlarms(const std::vector<float>& scores,
                                          const std::vector<bool>& positives, size_t allowed);

}  // namespace qz::evaluation
