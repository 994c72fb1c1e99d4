// SPDX-License-Identifier: Apache-2.0
// Metrics of sets of clips whose scores were made up.

#include "evaluation/metrics.h"

#include <gmock/gmock.h>

#include <stdexcept>

namespace qz::evaluation {
namespace {

using testing::ElementsAre;

constexpr uint64_t kMinute = 60 * kSampleRateHz;

// A clip of a minute.
ScoredClip Clip(int output, const Scores& max, const std::string& class_name = "") {
  ScoredClip clip;
  clip.class_name = class_name;
  clip.output = output;
  clip.samples = kMinute;
  clip.max = max;
  return clip;
}

// Output 4 scores its class no higher than the negatives.
std::vector<ScoredClip> SixMinutes() {
  return {Clip(0, {0.9f, 0, 0, 0, 0.25f}),   Clip(1, {0.1f, 0.9f, 0, 0, 0.25f}),
          Clip(2, {0, 0, 0.9f, 0, 0.25f}),   Clip(3, {0, 0, 0, 0.9f, 0.25f}),
          Clip(4, {0.5f, 0, 0, 0.5f, 0.5f}), Clip(-1, {0, 0.5f, 0.75f, 0, 0.75f}, "rain")};
}

TEST(Metrics, AllowOneFalseAlarmInFiveMinutes) {
  std::vector<ScoredClip> clips = SixMinutes();
  const Metrics six = MetricsOf(clips);
  EXPECT_EQ(six.clips, 6u);
  EXPECT_EQ(six.samples, 6 * kMinute);
  EXPECT_EQ(six.allowed_false_alarms, 1u);
  EXPECT_EQ(six.classes[4].clips, 1u);
  EXPECT_DOUBLE_EQ(six.classes[4].merit.average_precision, 0.5);
  EXPECT_DOUBLE_EQ(six.classes[4].merit.roc_auc, 0.8);
  EXPECT_DOUBLE_EQ(six.classes[4].merit.recall, 1);
  EXPECT_DOUBLE_EQ(six.mean.average_precision, 0.9);
  EXPECT_DOUBLE_EQ(six.mean.roc_auc, 0.96);
  EXPECT_DOUBLE_EQ(six.mean.recall, 1);

  clips[0].samples -= kMinute + 1;
  const Metrics less_than_five = MetricsOf(clips);
  EXPECT_EQ(less_than_five.allowed_false_alarms, 0u);
  EXPECT_DOUBLE_EQ(less_than_five.classes[4].merit.recall, 0);

  const Metrics mean = MeanOverFolds({six, less_than_five});
  EXPECT_EQ(mean.clips, 12u);
  EXPECT_EQ(mean.classes[4].clips, 2u);
  EXPECT_EQ(mean.samples, 11 * kMinute - 1);
  EXPECT_EQ(mean.allowed_false_alarms, 1u);
  EXPECT_DOUBLE_EQ(mean.classes[4].merit.recall, 0.5);
  EXPECT_DOUBLE_EQ(mean.mean.recall, 0.9);
  EXPECT_DOUBLE_EQ(mean.mean.average_precision, 0.9);
}

TEST(Metrics, NeedAClipOfEachClass) {
  std::vector<ScoredClip> clips = SixMinutes();
  EXPECT_THAT(EmptyClasses(clips), ElementsAre());
  clips.erase(clips.begin() + 2);
  clips.erase(clips.begin());
  EXPECT_THAT(EmptyClasses(clips), ElementsAre(0, 2));
  EXPECT_THROW(MetricsOf(clips), std::invalid_argument);
}

TEST(Confusion, CountsTheHighestOutputOfEqualOnesTheFirst) {
  std::vector<ScoredClip> clips = SixMinutes();
  clips.push_back(Clip(-1, {0, 0.5f, 0, 0, 0}, "rain"));
  clips.push_back(Clip(-1, {0, 0, 0, 0, 1}, "chainsaw"));
  const Confusion confusion = ConfusionOf(clips);
  EXPECT_THAT(confusion.classes[3], ElementsAre(0, 0, 0, 1, 0));
  EXPECT_THAT(confusion.classes[4], ElementsAre(1, 0, 0, 0, 0));
  EXPECT_THAT(confusion.negatives,
              ElementsAre(testing::Pair("chainsaw", ElementsAre(0, 0, 0, 0, 1, 0)),
                          testing::Pair("rain", ElementsAre(0, 0, 1, 0, 0, 1))));
}

}  // namespace
}  // namespace qz::evaluation
