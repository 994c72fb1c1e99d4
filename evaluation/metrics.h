// SPDX-License-Identifier: Apache-2.0
// Metrics of a set of clips whose scores are known.
#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <map>
#include <string>
#include <vector>

#include "evaluation/clip_scores.h"

namespace qz::evaluation {

constexpr uint64_t kSampleRateHz = 16000;
// Audio in which one false alarm of each class is allowed: 5 minutes.
constexpr uint64_t kSamplesPerFalseAlarm = 300 * kSampleRateHz;
// A clip that belongs to no output raises one that scores more than this.
constexpr float kRaised = 0.5f;

struct ScoredClip {
  std::string file;
  std::string class_name;
  int output = -1;  // that answers to the class; -1: a negative, for every output
  int fold = 0;
  uint64_t samples = 0;  // of the file, without the silence behind it
  Scores max{};          // over the network runs
};

// How well one output detects its class; each from 0 to 1, see ranking.h.
struct Merit {
  double average_precision = 0;
  double roc_auc = 0;
  double recall = 0;  // at the false alarms that are allowed
};

struct ClassMetrics {
  size_t clips = 0;
  Merit merit;
};

struct Metrics {
  size_t clips = 0;
  uint64_t samples = 0;
  uint64_t allowed_false_alarms = 0;  // of each class: one per 300 s, rounded down
  std::array<ClassMetrics, model::kClasses> classes;
  Merit mean;  // over the classes
};

// The outputs to whose class no clip belongs, in order: such clips have no metrics.
std::vector<int> EmptyClasses(const std::vector<ScoredClip>& clips);

// Throws std::invalid_argument if there is an empty class.
Metrics MetricsOf(const std::vector<ScoredClip>& clips);

// Clips, samples and false alarms summed up, merits averaged: what cross-validation comes to.
// At least one part.
Metrics MeanOverFolds(const std::vector<Metrics>& folds);

// Clips by the output that scored highest (of equal ones the first).
struct Confusion {
  std::array<std::array<size_t, model::kClasses>, model::kClasses> classes{};  // [class][output]
  // By the name of the negative's class: [output], and behind these how many raised none.
  std::map<std::string, std::array<size_t, model::kClasses + 1>> negatives;
};
Confusion ConfusionOf(const std::vector<ScoredClip>& clips);

}  // namespace qz::evaluation
