#include "evaluation/clip_scores.h"

#include <algorithm>
#include <cstring>
#include <memory>
#include <stdexcept>
#include <string>
#include <utility>

#include "base/digest.h"
#include "dataset/clip_features.h"
#include "network/network.h"

namespace qz::evaluation {
namespace {

constexpr size_t kBufferSamples = 32000;
constexpr size_t kFramesBetweenRuns = 64;
constexpr size_t kRunsBehindTheEnd = 2;

using config::kWindow;
static_assert(config::kScores.Bytes() == sizeof(Scores));

// How many frames hold all of the samples, the last ones filled up with others.
size_t FramesAround(size_t samples) {
  return dataset::FramesOf(samples + dataset::kHopSamples - 1);
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
  const size_t seen = std::max<size_t>(FramesAround(clip_samples), kWindow.rows);
  const size_t first_run = (seen - kWindow.rows + kFramesBetweenRuns - 1) / kFramesBetweenRuns;
  const size_t frames = kWindow.rows + (first_run + kRunsBehindTheEnd - 1) * kFramesBetweenRuns;
  const size_t samples = std::max(dataset::SamplesOf(frames), clip_samples);
  return (samples + kBufferSamples - 1) / kBufferSamples * kBufferSamples;
}

std::vector<uint16_t> FeaturesToPlay(std::vector<int16_t> clip) {
  clip.resize(SamplesToPlay(clip.size()));
  return dataset::FeaturesOf(clip.data(), clip.size());
}

ClipScores ScoreFeatures(const model::PackedModel& model, const std::vector<uint16_t>& features) {
  if (model.size() != model::kModelBytes) {
    throw std::invalid_argument("the model has " + std::to_string(model.size()) +
                                " bytes, should be " + std::to_string(model::kModelBytes));
  }
  const auto arena = std::make_unique<network::Arena>();
  const network::Weights weights = network::WeightsOf(model.data());
  ClipScores scores;
  scores.digest = base::kEmptyDigest;
  for (size_t first = 0; first + kWindow.Bytes() <= features.size();
       first += kFramesBetweenRuns * kWindow.channels) {
    std::transform(features.data() + first, features.data() + first + kWindow.Bytes(),
                   network::InputOf(*arena), dataset::NetworkInput);
    RunOperators(arena.get(), weights, &scores.digest);
    Scores& run = scores.runs.emplace_back();
    std::memcpy(run.data(), network::ScoresOf(*arena), sizeof run);
    for (size_t i = 0; i < run.size(); ++i) scores.max[i] = std::max(scores.max[i], run[i]);
  }
  return scores;
}

ClipScores ScoreClip(const model::PackedModel& model, std::vector<int16_t> clip) {
  return ScoreFeatures(model, FeaturesToPlay(std::move(clip)));
}

}  // namespace qz::evaluation
