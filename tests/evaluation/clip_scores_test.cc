// SPDX-License-Identifier: Apache-2.0
// Scores of clips against the reference network over windows of the clip's features.

#include "evaluation/clip_scores.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <set>

#include "dataset/clip_features.h"
#include "detector/window.h"
#include "model/synthetic_model.h"
#include "tests/support/random.h"

namespace qz::evaluation {
namespace {

using model::PackedModel;

// Noise of changing loudness, so that the scores change from run to run.
std::vector<int16_t> Sound(size_t samples) {
  test::Random random(samples);
  std::vector<int16_t> sound(samples);
  for (size_t i = 0; i < samples; ++i) {
    const double loudness = std::exp(8 * std::sin(static_cast<double>(i) / 9000));
    sound[i] = static_cast<int16_t>(static_cast<double>(random.Between(-1000, 1000)) * loudness /
                                    (100 + loudness));
  }
  return sound;
}

// The scores of one run by the model's reference.
Scores ReferenceRun(const PackedModel& packed, const uint16_t* features) {
  model::Tensor window(model::kInputRows, model::kInputChannels);
  std::transform(features, features + window.values.size(), window.values.begin(),
                 detector::NetworkInput);
  return model::RunNetwork(packed, window).scores;
}

TEST(ClipScores, EqualTheReferenceOfEachWindow) {
  const PackedModel synthetic = model::MakeSyntheticModel(1);
  const PackedModel other = model::MakeSyntheticModel(2);
  for (const PackedModel* packed : {&synthetic, &other}) {
    std::vector<int16_t> sound = Sound(80000);
    const ClipScores scores = ScoreClip(*packed, sound);
    sound.resize(96000);  // 3 buffers, of which 598 frames come
    const std::vector<uint16_t> features = dataset::FeaturesOf(sound.data(), sound.size());
    Scores max{};
    const size_t frames = features.size() / config::kFeatureChannels;
    ASSERT_EQ(scores.runs.size(),
              1 + (frames - config::kWindowFrames) / config::kFramesBetweenRuns);
    for (size_t run = 0; run < scores.runs.size(); ++run) {
      const Scores expected = ReferenceRun(
          *packed, features.data() + run * config::kFramesBetweenRuns * config::kFeatureChannels);
      EXPECT_EQ(scores.runs[run], expected) << "run " << run;
      for (size_t i = 0; i < max.size(); ++i) max[i] = std::max(max[i], expected[i]);
    }
    EXPECT_EQ(scores.max, max);
    EXPECT_GT(std::set<Scores>(scores.runs.begin(), scores.runs.end()).size(), 1u)
        << "the sound gives the same scores in every run";
  }
  EXPECT_NE(ScoreClip(synthetic, Sound(80000)).runs, ScoreClip(other, Sound(80000)).runs);
}

TEST(ClipScores, DoNotDependOnEarlierClips) {
  const PackedModel packed = model::MakeSyntheticModel(1);
  const std::vector<Scores> fresh = ScoreClip(packed, Sound(50000)).runs;
  ScoreClip(packed, std::vector<int16_t>(200000, 30000));
  EXPECT_EQ(ScoreClip(packed, Sound(50000)).runs, fresh);
}

TEST(ClipScores, TwoRunsOrMoreSeeTheLastSample) {
  for (const size_t samples : {0, 1, 61359, 61360, 61361, 71600, 71601, 80000, 86639, 86641, 96000,
                               96001, 320000, 999999}) {
    const size_t played = SamplesToPlay(samples);
    EXPECT_EQ(played % 32000, 0u);
    ASSERT_GE(played, samples);
    size_t seeing = 0;
    size_t before_last_buffer = 0;
    for (size_t frames = config::kWindowFrames; detector::SamplesOf(frames) <= played;
         frames += config::kFramesBetweenRuns) {
      seeing += detector::SamplesOf(frames) >= samples;
      before_last_buffer +=
          detector::SamplesOf(frames) >= samples && detector::SamplesOf(frames) <= played - 32000;
    }
    EXPECT_GE(seeing, 2u) << samples;
    EXPECT_TRUE(before_last_buffer < 2 || played - 32000 < samples) << samples << ": too long";
  }
  EXPECT_EQ(SamplesToPlay(80000), 96000u);
}

}  // namespace
}  // namespace qz::evaluation
