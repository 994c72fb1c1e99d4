// SPDX-License-Identifier: Apache-2.0
#include "evaluation/clip_scores.h"

#include <algorithm>
#include <memory>
#include <stdexcept>
#include <string>
#include <utility>

#include "dataset/clip_features.h"
#include "detector/window.h"
#include "network/stream_network.h"

namespace qz::evaluation {
namespace {

constexpr size_t kRunsBehindTheEnd = 2;

using config::kBufferSamples;
using config::kFramesBetweenRuns;
using config::kWindowFrames;

// The frames that hold all of the samples, the last ones filled up with others.
size_t FramesAround(size_t samples) {
  return detector::FramesOf(samples + config::kHopSamples - 1);
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
  const auto stream = std::make_unique<network::Stream<network::kChunkTileRows>>();
  ClipScores scores;
  for (size_t first = 0; first < features.size(); first += config::kFeatureChannels) {
    int8_t frame[config::kFeatureChannels];
    detector::MakeNetworkInput(features.data() + first, frame);
    if (!network::Push(frame, weights, stream.get())) continue;
    Scores& newest = scores.runs.emplace_back();
    std::copy_n(stream->scores, newest.size(), newest.begin());
    for (size_t i = 0; i < newest.size(); ++i) scores.max[i] = std::max(scores.max[i], newest[i]);
  }
  return scores;
}

ClipScores ScoreClip(const model::PackedModel& model, std::vector<int16_t> clip) {
  return ScoreFeatures(model, FeaturesToPlay(std::move(clip)));
}

}  // namespace qz::evaluation
