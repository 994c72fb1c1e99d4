// SPDX-License-Identifier: Apache-2.0
// From scores to reports and detections: a network with chosen scores, tables with low thresholds.

#include <cmath>
#include <limits>
#include <string>
#include <vector>

#include "classifier/audio_classifier.h"
#include "tests/support/stub_network.h"
#include "tests/support/test_hub.h"

namespace tarn::contexthub::sound {
namespace {

using qz::test::Scores;
using qz::test::stub_network;
using ::testing::ElementsAre;
using ::testing::IsEmpty;

constexpr int64_t kHostOffsetNs = -300'000'000;

class Detection : public testing::Test, public SoundDetectionEventListenerInterface {
 protected:
  Detection() {
    stub_network = {};
    // From here on every pass has three or four runs.
    while (Pass() == 0) {
    }
    classifier_.ClearConfidenceBuffer();
    runtime_.TakeLog();
    classifier_.RegisterListener(this);
  }

  void OnSoundDetectionEvent(const ConfidenceEvents& events, uint32_t model_version,
                             uint64_t timestamp_ns) override {
    EXPECT_EQ(model_version, 202208271u);
    EXPECT_EQ(timestamp_ns, runtime_.hub.TimeNs() + static_cast<uint64_t>(kHostOffsetNs));
    std::string& call = calls_.emplace_back();
    for (const ConfidenceEvent& event : events) {
      call += " " + std::to_string(event.category) + ":" + std::to_string(event.confidence);
    }
  }
  void OnRawAudioTransmissibleSegment(uint32_t, uint64_t, RawAudioInfo*) override { FAIL(); }

  // One pass, so many seconds later; the number of its runs.
  int Pass(uint32_t confidence_size = 2, uint64_t seconds = 2) {
    static const std::vector<int16_t> silence(32000);
    runtime_.hub.AdvanceTime(seconds * 1'000'000'000);
    const int before = stub_network.runs;
    uint32_t version = 0;
    classifier_.Classify(silence.data(), report_, confidence_size, &version);
    return stub_network.runs - before;
  }

  // A pass in which run i has scores[i], or the last of them.
  int PassWith(const std::vector<Scores>& scores) {
    const int first = stub_network.runs;
    stub_network.scores = [=](int run) {
      return scores[std::min<size_t>(static_cast<size_t>(run - first), scores.size() - 1)];
    };
    return Pass();
  }

  void ExpectReport(float short_smoothed, float long_smoothed) const {
    EXPECT_EQ(report_[0].category, 6);
    EXPECT_EQ(report_[0].confidence, short_smoothed);
    EXPECT_EQ(report_[1].category, 15);
    EXPECT_EQ(report_[1].confidence, long_smoothed);
  }

  qz::test::TestHub runtime_{kHostOffsetNs};
  AudioClassifier classifier_;
  ConfidenceEvent report_[3] = {};
  // The detections that the listener received.
  std::vector<std::string> calls_;
};

TEST_F(Detection, SmoothsOverTheCapacityFromTheFirstRun) {
  int runs = 0;
  for (int pass = 0; pass < 8; ++pass) {
    if (pass == 7) {
      EXPECT_GT(runs, 16);
      classifier_.ClearConfidenceBuffer();
      runs = 0;
    }
    runs += PassWith({{0, 0.5f, 0, 0.5f, 0}});
    ExpectReport(std::min(runs, 5) * 0.5f / 5.0f, std::min(runs, 16) * 0.5f / 16.0f);
  }
}

TEST_F(Detection, SumsInSinglePrecisionOldestFirst) {
  // Added from the other end, these give another last bit.
  const float a = 0.418f;
  const float b = 0.1932f;
  const float c = 0.8118f;
  const float oldest_first = ((0.0f + a) + b) + c;
  ASSERT_NE(oldest_first, (c + b) + a);
  PassWith({{0, a, 0, a, 0}, {0, b, 0, b, 0}, {0, c, 0, c, 0}, {0, 0, 0, 0, 0}});
  ExpectReport(oldest_first / 5.0f, oldest_first * 0.0625f);
}

TEST_F(Detection, ReportsTheGreatestOfThePassAndNoNaN) {
  const float nan = std::numeric_limits<float>::quiet_NaN();
  PassWith({{0.75f, 0, 0, 0, nan}, {0.875f, 0, 0, 0, nan}, {0.625f, 0, 0, 0, nan}});
  PassWith({{0, nan, nan, nan, 0}});
  ExpectReport(0.0f, 0.0f);
  EXPECT_THAT(calls_, ElementsAre(" 0:0.875000"));
}

TEST_F(Detection, AScoreAboveOneMakesAColdStart) {
  const float above = std::nextafter(1.0f, 2.0f);
  PassWith({{1.0f, 0.5f, 1.0f, 0.5f, 1.0f}});
  EXPECT_THAT(runtime_.log, IsEmpty());
  PassWith({{1.0f, 0.5f, above, 0.5f, 1.0f}, {1.0f, 0.5f, 1.0f, 0.5f, 1.0f}});
  ExpectReport(0.0f, 0.0f);
  EXPECT_EQ(calls_.size(), 1u);

  // The pass after it is armed again and begins with empty buffers.
  const int runs = PassWith({{0, 0.5f, 0, 0.5f, 0}});
  ExpectReport(runs * 0.5f / 5.0f, runs * 0.5f / 16.0f);

  // The caller's size is not looked at before a cold start.
  stub_network.scores = [=](int) { return Scores{above, 0, 0, 0, 0}; };
  Pass(/*confidence_size=*/3);
  const std::string line =
      "I Invalid sound confidence found. Model is still in cold start stage. Skip the detection "
      "events for now.";
  EXPECT_THAT(runtime_.TakeLog(), ElementsAre(line, line));
}

TEST_F(Detection, DetectsAboveTheThresholdInOneCallInOutputOrder) {
  PassWith({{0.5f, 0.25f, 0.5f, 0.25f, 0.5f}});
  EXPECT_THAT(calls_, IsEmpty());
  PassWith({{0.75f, 1.0f, 0.625f, 1.0f, 0.5625f}});
  EXPECT_THAT(calls_, ElementsAre(testing::MatchesRegex(
                          " 0:0.750000 6:0.[0-9]+ 17:0.625000 15:0.[0-9]+ 18:0.562500")));
}

TEST_F(Detection, ACoolingCategoryIsSkipped) {
  for (int pass = 0; pass < 5; ++pass) PassWith({{0, 0, 0.75f, 0, 0.75f}});
  // Output 2 rests for five seconds: passes two seconds apart at +2 and +4 are within, +6 is not.
  const std::string both = " 17:0.750000 18:0.750000";
  const std::string second = " 18:0.750000";
  EXPECT_THAT(calls_, ElementsAre(both, second, second, both, second));
  // Without a cooling time a category rests until the clock moves.
  Pass(2, /*seconds=*/0);
  EXPECT_EQ(calls_.size(), 5u);
}

TEST_F(Detection, MisuseIsLoggedAndTheRestGoesOn) {
  classifier_.RegisterListener(nullptr);
  stub_network.scores = [](int) { return Scores{0.75f, 0, 0, 0, 0}; };
  report_[0] = {9, 0.9f};
  Pass(/*confidence_size=*/3);
  EXPECT_THAT(runtime_.TakeLog(), ElementsAre("E Confidence size is expected to be 2",
                                              "W ES detected but no listener registered"));
  EXPECT_EQ(report_[0].category, 9);
}

}  // namespace
}  // namespace tarn::contexthub::sound
