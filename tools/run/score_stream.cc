#include "tools/run/score_stream.h"

#include <algorithm>
#include <numeric>

namespace qz::tools {
namespace {

constexpr size_t kChannels = model::kInputChannels;
constexpr size_t kFramesBetweenRuns = 64;

// The outputs that are smoothed, and over how many runs.
constexpr int kShortSmoothed = 1, kLongSmoothed = 3;
constexpr size_t kShortRuns = 5, kLongRuns = 16;

// The mean of the newest `capacity` scores; those not there yet count as 0. Summed in single
// precision and oldest first, as the classifier does: the order decides the last bit.
float Smooth(std::deque<float>* newest, size_t capacity, float score) {
  if (newest->size() == capacity) newest->pop_front();
  newest->push_back(score);
  return std::accumulate(newest->begin(), newest->end(), 0.0f) / static_cast<float>(capacity);
}

}  // namespace

ScoreStream::ScoreStream(const model::PackedModel& model)
    : model_(model), arena_(std::make_unique<network::Arena>()) {}

PassScores ScoreStream::Follow(const int16_t* samples, size_t count) {
  PassScores pass;
  stream_.Push(samples, count, [&](const uint16_t* features) { TakeFrame(features, &pass); });
  return pass;
}

void ScoreStream::TakeFrame(const uint16_t* features, PassScores* pass) {
  std::transform(features, features + kChannels, window_.begin() + frames_ * kChannels,
                 dataset::NetworkInput);
  if (++frames_ < model::kInputRows) return;
  std::copy(window_.begin(), window_.end(), network::InputOf(*arena_));
  network::Run(*arena_, network::WeightsOf(model_.data()));
  FoldRun(pass);
  std::copy(window_.begin() + kFramesBetweenRuns * kChannels, window_.end(), window_.begin());
  frames_ -= kFramesBetweenRuns;
}

// No score is above 1, so no pass is ever invalid.
void ScoreStream::FoldRun(PassScores* pass) {
  ++pass->runs;
  for (int i = 0; i < model::kClasses; ++i) {
    const float score = network::ScoresOf(*arena_)[i];
    float value = score;
    if (i == kShortSmoothed) value = Smooth(&short_scores_, kShortRuns, score);
    if (i == kLongSmoothed) value = Smooth(&long_scores_, kLongRuns, score);
    const auto output = static_cast<size_t>(i);
    pass->single[output] = std::max(pass->single[output], score);
    pass->confidences[output] = std::max(pass->confidences[output], value);
  }
}

}  // namespace qz::tools
