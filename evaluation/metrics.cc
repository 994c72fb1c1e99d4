// SPDX-License-Identifier: Apache-2.0
#include "evaluation/metrics.h"

#include <algorithm>
#include <stdexcept>

#include "evaluation/ranking.h"

namespace qz::evaluation {
namespace {

void Add(const Merit& merit, double weight, Merit* sum) {
  sum->average_precision += weight * merit.average_precision;
  sum->roc_auc += weight * merit.roc_auc;
  sum->recall += weight * merit.recall;
}

ClassMetrics MetricsOfClass(const std::vector<ScoredClip>& clips, int output, size_t allowed) {
  std::vector<float> scores;
  std::vector<bool> positives;
  for (const ScoredClip& clip : clips) {
    scores.push_back(clip.max[static_cast<size_t>(output)]);
    positives.push_back(clip.output == output);
  }
  ClassMetrics metrics;
  metrics.clips = static_cast<size_t>(std::count(positives.begin(), positives.end(), true));
  // Each has a value, since no class is empty.
  metrics.merit = {AveragePrecision(scores, positives).value(), RocAuc(scores, positives).value(),
                   RecallAtFalseAlarms(scores, positives, allowed).value()};
  return metrics;
}

}  // namespace

std::vector<int> EmptyClasses(const std::vector<ScoredClip>& clips) {
  std::vector<int> empty;
  for (int output = 0; output < model::kClasses; ++output) {
    const bool detected = std::any_of(clips.begin(), clips.end(), [output](const ScoredClip& clip) {
      return clip.output == output;
    });
    if (!detected) empty.push_back(output);
  }
  return empty;
}

Metrics MetricsOf(const std::vector<ScoredClip>& clips) {
  const std::vector<int> empty = EmptyClasses(clips);
  if (!empty.empty()) {
    throw std::invalid_argument("output " + std::to_string(empty[0]) +
                                " has no clip of its class, should have one or more");
  }
  Metrics metrics;
  metrics.clips = clips.size();
  for (const ScoredClip& clip : clips) metrics.samples += clip.samples;
  metrics.allowed_false_alarms = metrics.samples / kSamplesPerFalseAlarm;
  for (int output = 0; output < model::kClasses; ++output) {
    ClassMetrics& of_class = metrics.classes[static_cast<size_t>(output)];
    of_class = MetricsOfClass(clips, output, metrics.allowed_false_alarms);
    Add(of_class.merit, 1.0 / model::kClasses, &metrics.mean);
  }
  return metrics;
}

Metrics MeanOverFolds(const std::vector<Metrics>& folds) {
  const double weight = 1.0 / static_cast<double>(folds.size());
  Metrics mean;
  for (const Metrics& fold : folds) {
    mean.clips += fold.clips;
    mean.samples += fold.samples;
    mean.allowed_false_alarms += fold.allowed_false_alarms;
    for (size_t i = 0; i < mean.classes.size(); ++i) {
      mean.classes[i].clips += fold.classes[i].clips;
      Add(fold.classes[i].merit, weight, &mean.classes[i].merit);
    }
    Add(fold.mean, weight, &mean.mean);
  }
  return mean;
}

Confusion ConfusionOf(const std::vector<ScoredClip>& clips) {
  Confusion confusion;
  for (const ScoredClip& clip : clips) {
    const auto max = std::max_element(clip.max.begin(), clip.max.end());
    const auto output = static_cast<size_t>(max - clip.max.begin());
    if (clip.output >= 0) {
      ++confusion.classes[static_cast<size_t>(clip.output)][output];
    } else {
      auto& raised = confusion.negatives[clip.class_name];
      ++raised[*max > kRaised ? output : raised.size() - 1];
    }
  }
  return confusion;
}

}  // namespace qz::evaluation
