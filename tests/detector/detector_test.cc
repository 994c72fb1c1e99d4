// SPDX-License-Identifier: Apache-2.0
// Many detectors in one program, each with state and a model of its own, and the preconditions of
// the framing.

#include "detector/detector.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <memory>
#include <set>
#include <thread>
#include <vector>

#include "model/synthetic_model.h"
#include "tests/support/random.h"

namespace qz::detector {
namespace {

constexpr size_t kDetectors = 8;
constexpr size_t kSamples = 100000;
constexpr size_t kFrames = 1 + (kSamples - config::kFrameSamples) / config::kHopSamples;
constexpr int kRuns = 1 + (kFrames - config::kWindowFrames) / config::kFramesBetweenRuns;

const model::PackedModel& Model(size_t number) {
  static const model::PackedModel models[] = {model::MakeSyntheticModel(1),
                                              model::MakeSyntheticModel(2)};
  return models[number % 2];
}

// A detector with its input, and all its output.
struct Stream {
  explicit Stream(size_t number)
      : samples(test::Random(number).Fill<int16_t>(kSamples, -900, 900)),
        model(Model(number)),
        detector(std::make_unique<Detector>()) {
    // Noise that swells, so that the scores change from run to run.
    for (size_t i = 0; i < kSamples; ++i) {
      samples[i] = static_cast<int16_t>(samples[i] * static_cast<int>(i % 30000) / 3000);
    }
  }

  // Classifies the next samples; false at the end.
  bool Step(size_t count) {
    count = std::min(count, kSamples - played);
    if (count == 0) return false;
    const Pass pass =
        Classify(samples.data() + played, count, network::WeightsOf(model.data()), detector.get());
    played += count;
    runs += pass.runs;
    for (const Scores& scores : {pass.single, pass.confidences}) {
      output.insert(output.end(), scores.begin(), scores.end());
    }
    return true;
  }
  void PlayAll() {
    while (Step(7777)) {
    }
  }

  std::vector<int16_t> samples;
  const model::PackedModel& model;
  std::unique_ptr<Detector> detector;
  size_t played = 0;
  int runs = 0;
  std::vector<float> output;
};

class ManyDetectors : public testing::Test {
 protected:
  ManyDetectors() {
    for (size_t i = 0; i < kDetectors; ++i) {
      streams_.emplace_back(i);
      Stream alone(i);
      alone.PlayAll();
      EXPECT_EQ(alone.runs, kRuns);
      expected_.push_back(alone.output);
    }
    EXPECT_EQ(std::set(expected_.begin(), expected_.end()).size(), kDetectors);
  }
  ~ManyDetectors() override {
    for (size_t i = 0; i < kDetectors; ++i) EXPECT_EQ(streams_[i].output, expected_[i]) << i;
  }

  std::vector<Stream> streams_;
  std::vector<std::vector<float>> expected_;
};

TEST_F(ManyDetectors, InterleavedGiveWhatEachGivesAlone) {
  bool any = true;
  while (any) {
    any = false;
    for (Stream& stream : streams_) any |= stream.Step(7777);
  }
}

TEST_F(ManyDetectors, OnThreadsGiveWhatEachGivesAlone) {
  std::vector<std::thread> threads;
  threads.reserve(kDetectors);
  for (Stream& stream : streams_) threads.emplace_back([&stream] { stream.PlayAll(); });
  for (std::thread& thread : threads) thread.join();
}

TEST(Detector, TheSizeOfABufferMakesNoDifference) {
  Stream whole(1), pieces(1);
  while (whole.Step(kSamples)) {
  }
  while (pieces.Step(1 + pieces.played % 999)) {
  }
  EXPECT_EQ(whole.runs, pieces.runs);
  // The maximum of the passes' maxima, by output, is that of the one pass.
  std::vector<float> max(whole.output.size());
  for (size_t i = 0; i < pieces.output.size(); ++i) {
    float& each = max[i % max.size()];
    each = std::max(each, pieces.output[i]);
  }
  EXPECT_EQ(max, whole.output);
}

#ifndef QZ_WITHOUT_CHECKS
TEST(FramingDeathTest, StopsAtABrokenPrecondition) {
  const int16_t sample = 0;
  std::vector<int16_t> frame(config::kFrameSamples);
  size_t held = config::kFrameSamples;
  EXPECT_DEATH(PushSamples(&sample, 1, frame.data(), &held, [] {}), "");
  held = 0;
  EXPECT_DEATH(PushSamples(nullptr, 1, frame.data(), &held, [] {}), "");
  const std::vector<uint16_t> features(config::kFeatureChannels);
  std::vector<int8_t> window(kWindowBytes);
  held = config::kWindowFrames;
  EXPECT_DEATH(TakeFrame(features.data(), window.data(), &held, [] {}), "");
}
#endif

}  // namespace
}  // namespace qz::detector
