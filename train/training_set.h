// SPDX-License-Identifier: Apache-2.0
// The recordings that a model is trained and validated on.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "dataset/manifest.h"
#include "model/labels.h"
#include "train/matrix.h"

namespace qz::train {

struct Clip {
  std::string file;
  int fold = 0;
  int output = -1;               // of its class; -1: of none
  std::vector<int16_t> samples;  // mono, 16 kHz
};

struct ClipList {
  std::vector<Clip> clips;
  std::vector<std::string> skipped;  // a line for each that can't be read
};

// Decodes all recordings, in their order.
ClipList LoadClips(const std::vector<dataset::Recording>& recordings, const model::Labels& labels);

// Frames of a sequence that the network looks at `windows` times.
constexpr int FramesFor(int windows) {
  return static_cast<int>(config::kWindowFrames + config::kFramesBetweenRuns * (windows - 1));
}

// A clip from a fresh start and the silence after it, as features 0 to 255, for all network runs on
// which it is validated: FramesFor(runs) x features.
Batch ValidationFeatures(const std::vector<int16_t>& samples);

// Writes as many frames of features as a sequence of the batch holds, as floats from 0 to 255.
void CopyFeatures(const std::vector<uint16_t>& features, Eigen::Index sequence, Batch* batch);

}  // namespace qz::train
