#include "evaluation/clip_scores.h"

#include <algorithm>
#include <cstring>
#include <stdexcept>
#include <string>
#include <utility>

#include "base/digest.h"
#include "dataset/clip_features.h"
#include "network/loaded/loaded_network.h"
#include "network/operators.h"

namespace qz::evaluation {
namespace {

constexpr size_t kBufferSamples = 32000;
constexpr size_t kFramesBetweenRuns = 64;
constexpr size_t kRunsBehindTheEnd = 2;

static_assert(kInput.rows == model::kInputRows && kInput.channels == dataset::kFeatureChannels);
static_assert(kScores.Bytes() == sizeof(Scores) && kLoadedTableBytes == model::kModelBytes);

// How many frames hold all of the samples, the last ones filled up with others.
size_t FramesAround(size_t samples) {
  return dataset::FramesOf(samples + dataset::kHopSamples - 1);
}

void RunOperators(uint64_t* digest) {
  for (const Operator& each : kOperators) {
    each.run();
    *digest = base::Digest(BytesOf(each.output), each.output.Bytes(), *digest);
  }
}

}  // namespace

size_t SamplesToPlay(size_t clip_samples) {
  const size_t seen = std::max<size_t>(FramesAround(clip_samples), kInput.rows);
  const size_t first_run = (seen - kInput.rows + kFramesBetweenRuns - 1) / kFramesBetweenRuns;
  const size_t frames = kInput.rows + (first_run + kRunsBehindTheEnd - 1) * kFramesBetweenRuns;
  const size_t samples = std::max(dataset::SamplesOf(frames), clip_samples);
  return (samples + kBufferSamples - 1) / kBufferSamples * kBufferSamples;
}

std::vector<uint16_t> FeaturesToPlay(std::vector<int16_t> clip) {
  clip.resize(SamplesToPlay(clip.size()));
  return dataset::FeaturesOf(clip.data(), clip.size());
}

ClipScores ScoreFeatures(const model::PackedModel& model, const std::vector<uint16_t>& features) {
  if (model.size() != kLoadedTableBytes) {
    throw std::invalid_argument("the model has " + std::to_string(model.size()) +
                                " bytes, should be " + std::to_string(kLoadedTableBytes));
  }
  std::copy(model.begin(), model.end(), loaded_tables);
  ClipScores scores;
  scores.digest = base::kEmptyDigest;
  for (size_t first = 0; first + kInput.Bytes() <= features.size();
       first += kFramesBetweenRuns * kInput.channels) {
    std::transform(features.data() + first, features.data() + first + kInput.Bytes(),
                   mobilenet_backend_input_ptr, dataset::NetworkInput);
    RunOperators(&scores.digest);
    Scores& run = scores.runs.emplace_back();
    std::memcpy(run.data(), mobilenet_backend_output_ptr, sizeof run);
    for (size_t i = 0; i < run.size(); ++i) scores.max[i] = std::max(scores.max[i], run[i]);
  }
  return scores;
}

ClipScores ScoreClip(const model::PackedModel& model, std::vector<int16_t> clip) {
  return ScoreFeatures(model, FeaturesToPlay(std::move(clip)));
}

}  // namespace qz::evaluation
