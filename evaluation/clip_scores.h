// SPDX-License-Identifier: Apache-2.0
// A model's scores of a clip, by the module's own front end and network and at its classifier's
// cadence. Each clip begins with a fresh start. May be called on any number of threads.
#pragma once

#include <cstddef>
#include <cstdint>
#include <vector>

#include "detector/scores.h"
#include "model/reference_network.h"

namespace qz::evaluation {

using detector::Scores;

struct ClipScores {
  std::vector<Scores> runs;  // of each network run, in order; each score k / 256, k from 0 to 255
  Scores max{};              // over the runs
};

// The samples of whole 2 s buffers that a clip fills together with the silence behind it: enough
// that two network runs or more end at or behind its last sample. Each part of a clip of 3.8 s or
// more, but the first 0.64 s, is then seen by at least two runs.
size_t SamplesToPlay(size_t clip_samples);

// The features of so many samples, frames x 48: of the clip and the silence behind it.
std::vector<uint16_t> FeaturesToPlay(std::vector<int16_t> clip);

// All network runs over features, frames x 48. The model has passed the checker.
ClipScores ScoreFeatures(const model::PackedModel& model, const std::vector<uint16_t>& features);

// The same of a clip's samples, mono at 16 kHz.
ClipScores ScoreClip(const model::PackedModel& model, std::vector<int16_t> clip);

}  // namespace qz::evaluation
