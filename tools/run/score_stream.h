// All five scores of the detector, of which the module's reports tell two: the module's own front
// end and network, compiled into this program, over the samples that the module gets.
#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <deque>
#include <memory>

#include "dataset/clip_features.h"
#include "model/reference_network.h"
#include "network/network.h"

namespace qz::tools {

// By output.
using Scores = std::array<float, model::kClasses>;

// Each the highest over the network runs of a pass (two seconds, three or four runs); 0 without
// any.
struct PassScores {
  int runs = 0;
  Scores single{};  // as the network gave them, k / 256 with k from 0 to 255
  // As the classifier holds them against its thresholds: outputs 1 and 3 smoothed over runs.
  Scores confidences{};
};

// There is one front end in the program, so one stream at a time.
class ScoreStream {
 public:
  // Begins with a fresh start. The model has passed the checker.
  explicit ScoreStream(const model::PackedModel& model);

  // A pass over the samples that come next, mono at 16 kHz.
  PassScores Follow(const int16_t* samples, size_t count);

 private:
  void TakeFrame(const uint16_t* features, PassScores* pass);
  void FoldRun(PassScores* pass);

  model::PackedModel model_;
  std::unique_ptr<network::Arena> arena_;
  dataset::FeatureStream stream_;
  // The newest `frames_` frames, oldest first.
  std::array<int8_t, size_t{model::kInputRows} * model::kInputChannels> window_{};
  size_t frames_ = 0;
  std::deque<float> short_scores_, long_scores_;
};

}  // namespace qz::tools
