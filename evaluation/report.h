// SPDX-License-Identifier: Apache-2.0
// What an evaluation comes to, in words and numbers.
#pragma once

#include <cstddef>
#include <string>
#include <vector>

#include "evaluation/metrics.h"
#include "model/labels.h"

namespace qz::evaluation {

// Of the clips that one model scored.
struct Part {
  std::string model;
  int fold = 0;  // 0: the folds of the clips don't matter
  Metrics metrics;
};

struct Evaluation {
  std::string manifest;
  model::Labels labels;
  std::vector<Part> parts;  // one, or in cross-validation one a fold
  Confusion confusion;      // of all clips
  size_t skipped = 0;       // clips that can't be read
};

// Tables for people: some lines without a newline at the end.
std::string TextReport(const Evaluation& evaluation);

// One JSON object on one line.
std::string JsonReport(const Evaluation& evaluation);

}  // namespace qz::evaluation
