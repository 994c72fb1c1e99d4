// What a model scores a clip, by the module's own front end and network and at its classifier's
// cadence: a run over the newest 382 frames once there are so many, and then every 64 frames. One
// network for the whole program, so one thread at a time; each clip begins with a fresh start.
#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <vector>

#include "model/reference_network.h"

namespace qz::evaluation {

// By output, each k / 256 with k from 0 to 255.
using Scores = std::array<float, model::kClasses>;

struct ClipScores {
  std::vector<Scores> runs;  // of each network run, in order
  Scores max{};              // over the runs
  // 64-bit FNV-1a over all bytes that the 21 operators put out, run by run; the floats of the last
  // operator little-endian.
  uint64_t digest = 0;
};

// The samples of whole 2 s buffers that a clip fills together with the silence behind it: enough
// that two network runs or more end at or behind its last sample. Of a clip of 3.8 s and more each
// part but the first 0.64 s is then seen by two runs at least.
size_t SamplesToPlay(size_t clip_samples);

// The features of so many samples, frames x 48: of the clip and the silence behind it.
std::vector<uint16_t> FeaturesToPlay(std::vector<int16_t> clip);

// All network runs that the features, frames x 48, are good for. The model has passed the checker.
ClipScores ScoreFeatures(const model::PackedModel& model, const std::vector<uint16_t>& features);

// The same of a clip's samples, mono at 16 kHz.
ClipScores ScoreClip(const model::PackedModel& model, std::vector<int16_t> clip);

}  // namespace qz::evaluation
