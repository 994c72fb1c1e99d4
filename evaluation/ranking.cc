// SPDX-License-Identifier: Apache-2.0
#include "evaluation/ranking.h"

#include <algorithm>
#include <cmath>
#include <limits>
#include <stdexcept>
#include <string>
#include <utility>

namespace qz::evaluation {
namespace {

// The clips of one score.
struct Tie {
  double positives = 0;
  double negatives = 0;
};

// Highest score first. Empty unless there are both positives and negatives.
std::vector<Tie> Ranked(const std::vector<float>& scores, const std::vector<bool>& positives) {
  if (scores.size() != positives.size()) {
    throw std::invalid_argument("ranking: " + std::to_string(positives.size()) +
                                " truths, should be " + std::to_string(scores.size()) +
                                ": one a score");
  }
  std::vector<std::pair<float, bool>> clips;
  for (size_t i = 0; i < scores.size(); ++i) {
    const float min = -std::numeric_limits<float>::infinity();
    clips.emplace_back(std::isnan(scores[i]) ? min : scores[i], positives[i]);
  }
  std::sort(clips.begin(), clips.end(), [](const auto& a, const auto& b) { return a > b; });

  std::vector<Tie> ties;
  for (size_t i = 0; i < clips.size(); ++i) {
    if (i == 0 || clips[i].first != clips[i - 1].first) ties.emplace_back();
    ++(clips[i].second ? ties.back().positives : ties.back().negatives);
  }
  const auto all = static_cast<std::ptrdiff_t>(positives.size());
  const auto of_class = std::count(positives.begin(), positives.end(), true);
  if (of_class == 0 || of_class == all) ties.clear();
  return ties;
}

}  // namespace

std::optional<double> AveragePrecision(const std::vector<float>& scores,
                                       const std::vector<bool>& positives) {
  Tie above;
  double sum = 0;
  for (const Tie& tie : Ranked(scores, positives)) {
    above.positives += tie.positives;
    above.negatives += tie.negatives;
    sum += tie.positives * above.positives / (above.positives + above.negatives);
  }
  if (above.positives == 0) return std::nullopt;
  return sum / above.positives;
}

std::optional<double> RocAuc(const std::vector<float>& scores, const std::vector<bool>& positives) {
  Tie above;
  double won = 0;  // pairs of a positive and a lower negative
  for (const Tie& tie : Ranked(scores, positives)) {
    won += tie.negatives * (above.positives + tie.positives / 2);
    above.positives += tie.positives;
    above.negatives += tie.negatives;
  }
  if (above.positives == 0) return std::nullopt;
  return won / (above.positives * above.negatives);
}

std::optional<double> RecallAtFalseAlarms(const std::vector<float>& scores,
                                          const std::vector<bool>& positives, size_t allowed) {
  Tie above;
  double detected = 0;
  for (const Tie& tie : Ranked(scores, positives)) {
    above.positives += tie.positives;
    above.negatives += tie.negatives;
    if (above.negatives <= static_cast<double>(allowed)) detected = above.positives;
  }
  if (above.positives == 0) return std::nullopt;
  return detected / above.positives;
}

}  // namespace qz::evaluation
