// From scores to reports and detections: a network with chosen scores, tables with low thresholds.

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <string>
#include <vector>

#include "audio_classifier.h"
#include "stub_network.h"
#include "test_hub.h"

namespace tarn::contexthub::sound {
namespace {

using qz::test::Scores;
using qz::test::stub_network;
using ::testing::ElementsAre;
using ::testing::IsEmpty;

constexpr int64_t kHostOffsetNs = -300'000'000;

class RecordingListener : public SoundDetectionEventListenerInterface {
 public:
  void OnSoundDetectionEvent(const ConfidenceEvents& events, uint32_t model_version,
                             uint64_t timestamp_ns) override {
    std::string call = std::to_string(timestamp_ns) + " v" + std::to_string(model_version);
    for (const ConfidenceEvent& event : events) {
      call += " " + std::to_string(event.category) + ":" + std::to_string(event.confidence);
    }
    calls.push_back(call);
  }
  void OnRawAudioTransmissibleSegment(uint32_t, uint64_t, RawAudioInfo*) override {
    ADD_FAILURE() << "nothing reports raw audio";
  }

  std::vector<std::string> calls;
};

class Detection : public testing::Test {
 protected:
  Detection() {
    stub_network = {};
    // From here on every pass has three or four runs.
    while (Pass() == 0) {
    }
    classifier_.ClearConfidenceBuffer();
    runtime_.TakeLog();
  }

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

  qz::test::TestHub runtime_{kHostOffsetNs};
  AudioClassifier classifier_;
  ConfidenceEvent report_[3] = {};
};

TEST_F(Detection, SmoothsOverTheCapacityFromTheFirstRun) {
  int runs = 0;
  for (int pass = 0; pass < 8; ++pass) {
    runs += PassWith({{0, 0.5f, 0, 0.5f, 0}});
    EXPECT_EQ(report_[0].category, 6);
    EXPECT_EQ(report_[0].confidence, std::min(runs, 5) * 0.5f / 5.0f);
    EXPECT_EQ(report_[1].category, 15);
    EXPECT_EQ(report_[1].confidence, std::min(runs, 16) * 0.5f / 16.0f);
  }
  EXPECT_GT(runs, 16);
  classifier_.ClearConfidenceBuffer();
  runs = PassWith({{0, 0.5f, 0, 0.5f, 0}});
  EXPECT_EQ(report_[0].confidence, runs * 0.5f / 5.0f);
}

TEST_F(Detection, SumsInSinglePrecisionOldestFirst) {
  // Added from the other end, these give another last bit.
  const float a = 0.418f;
  const float b = 0.1932f;
  const float c = 0.8118f;
  const float oldest_first = ((0.0f + a) + b) + c;
  ASSERT_NE(oldest_first, (c + b) + a);
  PassWith({{0, a, 0, a, 0}, {0, b, 0, b, 0}, {0, c, 0, c, 0}, {0, 0, 0, 0, 0}});
  EXPECT_EQ(report_[0].confidence, oldest_first / 5.0f);
  EXPECT_EQ(report_[1].confidence, oldest_first * 0.0625f);
}

TEST_F(Detection, ReportsTheGreatestOfThePassAndNoNaN) {
  RecordingListener listener;
  classifier_.RegisterListener(&listener);
  const float nan = std::numeric_limits<float>::quiet_NaN();
  PassWith({{0.75f, 0, 0, 0, nan}, {0.875f, 0, 0, 0, nan}, {0.625f, 0, 0, 0, nan}});
  EXPECT_THAT(listener.calls, ElementsAre(testing::HasSubstr(" 0:0.875000")));
  PassWith({{0, nan, nan, nan, 0}});
  EXPECT_EQ(report_[0].confidence, 0.0f);
  EXPECT_EQ(report_[1].confidence, 0.0f);
  EXPECT_EQ(listener.calls.size(), 1u);
}

TEST_F(Detection, AScoreAboveOneMakesAColdStart) {
  RecordingListener listener;
  classifier_.RegisterListener(&listener);
  const float above = std::nextafter(1.0f, 2.0f);
  PassWith({{1.0f, 0.5f, 1.0f, 0.5f, 1.0f}});
  EXPECT_THAT(runtime_.TakeLog(), IsEmpty());
  EXPECT_EQ(listener.calls.size(), 1u);

  PassWith({{1.0f, 0.5f, above, 0.5f, 1.0f}, {1.0f, 0.5f, 1.0f, 0.5f, 1.0f}});
  const std::string line =
      "I Invalid sound confidence found. Model is still in cold start stage. Skip the detection "
      "events for now.";
  EXPECT_THAT(runtime_.TakeLog(), ElementsAre(line));
  EXPECT_EQ(report_[0].category, 6);
  EXPECT_EQ(report_[0].confidence, 0.0f);
  EXPECT_EQ(report_[1].category, 15);
  EXPECT_EQ(report_[1].confidence, 0.0f);
  EXPECT_EQ(listener.calls.size(), 1u);

  // The pass after it is armed again and begins with empty buffers.
  const int runs = PassWith({{0, 0.5f, 0, 0.5f, 0}});
  EXPECT_EQ(report_[0].confidence, runs * 0.5f / 5.0f);

  // The caller's size is not looked at before a cold start.
  stub_network.scores = [=](int) { return Scores{above, 0, 0, 0, 0}; };
  Pass(/*confidence_size=*/3);
  EXPECT_THAT(runtime_.TakeLog(), ElementsAre(line));
}

TEST_F(Detection, DetectsAboveTheThresholdInOneCallInOutputOrder) {
  RecordingListener listener;
  classifier_.RegisterListener(&listener);
  const auto stamp = [&] {
    return std::to_string(runtime_.hub.TimeNs() + static_cast<uint64_t>(kHostOffsetNs));
  };
  PassWith({{0.5f, 0.25f, 0.5f, 0.25f, 0.5f}});
  EXPECT_THAT(listener.calls, IsEmpty());
  PassWith({{0.75f, 1.0f, 0.625f, 1.0f, 0.5625f}});
  ASSERT_EQ(listener.calls.size(), 1u);
  EXPECT_EQ(listener.calls[0].rfind(stamp() + " v202208271 0:0.750000 6:", 0), 0u)
      << listener.calls[0];
  EXPECT_THAT(listener.calls[0], testing::ContainsRegex(" 17:0.625000 15:0.[0-9]+ 18:0.562500$"));
}

TEST_F(Detection, ACoolingCategoryIsSkipped) {
  RecordingListener listener;
  classifier_.RegisterListener(&listener);
  const Scores both = {0, 0, 0.75f, 0, 0.75f};
  std::vector<std::string> categories;
  for (int pass = 0; pass < 5; ++pass) {
    PassWith({both});
    categories.push_back(
        listener.calls.back().substr(listener.calls.back().find("v202208271") + 11));
  }
  // Output 2 rests for five seconds: passes two seconds apart at +2 and +4 are within, +6 is not.
  EXPECT_THAT(categories, ElementsAre("17:0.750000 18:0.750000", "18:0.750000", "18:0.750000",
                                      "17:0.750000 18:0.750000", "18:0.750000"));
}

TEST_F(Detection, WithoutACoolingTimeACategoryRestsUntilTheClockMoves) {
  RecordingListener listener;
  classifier_.RegisterListener(&listener);
  PassWith({{0.75f, 0, 0, 0, 0}});
  for (int pass = 0; pass < 2; ++pass) Pass(2, /*seconds=*/0);
  EXPECT_EQ(listener.calls.size(), 1u);
  Pass();
  EXPECT_EQ(listener.calls.size(), 2u);
}

TEST_F(Detection, MisuseIsLoggedAndTheRestGoesOn) {
  stub_network.scores = [](int) { return Scores{0.75f, 0, 0, 0, 0}; };
  report_[0] = {9, 0.9f};
  Pass(/*confidence_size=*/3);
  EXPECT_THAT(runtime_.TakeLog(), ElementsAre("E Confidence size is expected to be 2",
                                              "W ES detected but no listener registered"));
  EXPECT_EQ(report_[0].category, 9);
}

}  // namespace
}  // namespace tarn::contexthub::sound
