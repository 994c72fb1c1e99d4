// SPDX-License-Identifier: Apache-2.0
// All scores of the detector, of which the module's reports carry two: the module's front end and
// network, compiled into this program, over the samples that the module gets.
#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>
#include <utility>

#include "detector/detector.h"
#include "model/reference_network.h"

namespace qz::tools {

using detector::Scores;
using PassScores = detector::Pass;

class ScoreStream {
 public:
  // Begins with a fresh start. The model has passed the checker.
  explicit ScoreStream(model::PackedModel model)
      : model_(std::move(model)), detector_(std::make_unique<detector::Detector>()) {}

  // A pass over the samples that come next, mono at 16 kHz.
  PassScores Follow(const int16_t* samples, size_t count) {
    return Classify(samples, count, network::WeightsOf(model_.data()), detector_.get());
  }

 private:
  model::PackedModel model_;
  std::unique_ptr<detector::Detector> detector_;
};

}  // namespace qz::tools
