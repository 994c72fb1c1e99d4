// SPDX-License-Identifier: Apache-2.0
#include "evaluation/clip_scores.h"

#include <algorithm>
#include <cstring>
#include <memory>
#include <stdexcept>
#include <string>
#include <utility>

#include "base/digest.h"
#include "dataset/clip_features.h"
#include "detector/window.h"
#include "network/network.h"

namespace qz::evaluation {
namespace {

constexpr size_t kRunsBehindTheEnd = 2;

using config::kBufferSamples;
using config::kFramesBetweenRuns;
using config::kWindowFrames;
static_assert(config::kScores.Bytes() == sizeof(Scores));

// The frames that hold all of the samples, the last ones filled up with others.
size_t FramesAround(size_t samples) {
  return detector::FramesOf(samples + config::kHopSamples - 1);
}

void RunOperators(network::Arena* arena, const network::Weights& weights, uint64_t* digest) {
  for (size_t op = 0; op < config::kOperatorCount; ++op) {
    network::RunOperator(op, *arena, weights);
    const config::Tensor& output = config::kOperators[op].output;
    *digest = base::Digest(network::BytesOf(*arena, output), output.Bytes(), *digest);
  }
}

}  // namespace

size_t SamplesToPlay(size_t clip_samples) {
  const size_t seen = std::max(FramesAround(clip_samples), kWindowFrames);
  const size_t first_run = (seen - kWindowFrames + kFramesBetweenRuns - 1) / kFramesBetweenRuns;
  const size_t frames = kWindowFrames + (first_run + kRunsBehindTheEnd - 1) * kFramesBetweenRuns;
  const size_t samples = std::max(detector::SamplesOf(frames), clip_samples);
  return (samples + kBufferSamples - 1) / kBufferSamples * kBufferSamples;
}

std::vector<uint16_t> FeaturesToPlay(std::vector<int16_t> clip) {
  clip.resize(SamplesToPlay(clip.size()));
  return dataset::FeaturesOf(clip.data(), clip.size());
}

ClipScores ScoreFeatures(const model::PackedModel& model, const std::vector<uint16_t>& features) {
  if (model.size() != model::kModelBytes) {
    throw std::invalid_argument("the model has " + std::to_string(model.size()) +
                                " bytes, expected " + std::to_string(model::kModelBytes));
  }
  const network::Weights weights = network::WeightsOf(model.data());
  const auto arena = std::make_unique<network::Arena>();
  std::vector<int8_t> window(detector::kWindowBytes);
  size_t frames = 0;
  ClipScores scores;
  scores.digest = base::kEmptyDigest;
  const auto run = [&] {
    std::copy(window.begin(), window.end(), network::InputOf(*arena));
    RunOperators(arena.get(), weights, &scores.digest);
  };
  for (size_t first = 0; first < features.size(); first += config::kFeatureChannels) {
    if (!detector::TakeFrame(features.data() + first, window.data(), &frames, run)) continue;
    Scores& newest = scores.runs.emplace_back();
    std::memcpy(newest.data(), network::ScoresOf(*arena), sizeof newest);
    for (size_t i = 0; i < newest.size(); ++i) scores.max[i] = std::max(scores.max[i], newest[i]);
  }
  return scores;
}

ClipScores ScoreClip(const model::PackedModel& model, std::vector<int16_t> clip) {
  return ScoreFeatures(model, FeaturesToPlay(std::move(clip)));
}

}  // namespace qz::evaluation
