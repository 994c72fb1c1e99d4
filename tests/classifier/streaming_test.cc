// SPDX-License-Identifier: Apache-2.0
// How samples become frames and frames become windows: with a front end and a network that only
// look on, and with the tables that the module ships with. One suite, one test: the streaming state
// is set at load and never again.

#include <algorithm>
#include <array>
#include <vector>

#include "classifier/audio_classifier.h"
#include "frontend/audio_frontend.h"
#include "tests/support/random.h"
#include "tests/support/stub_network.h"
#include "tests/support/test_hub.h"

namespace {

using Frame = std::array<int16_t, 400>;

int16_t frontend_input[400];
uint16_t frontend_output[48];
std::vector<Frame> frames;
int frontend_resets = 0;

// Takes every value around the limits of the narrowing to eight bits.
uint16_t Feature(size_t frame, size_t channel) {
  return static_cast<uint16_t>((frame * 7 + channel * 11) % 300);
}

}  // namespace

int16_t* const audio_frontend_input_ptr = frontend_input;
const uint16_t* const audio_frontend_output_ptr = frontend_output;
void audio_frontend_reset() { ++frontend_resets; }
void audio_frontend_invoke() {
  for (size_t i = 0; i < 48; ++i) frontend_output[i] = Feature(frames.size(), i);
  std::copy_n(frontend_input, 400, frames.emplace_back().begin());
  // As the real one does, spoil the input.
  std::fill_n(frontend_input, 400, int16_t{-1});
}

namespace tarn::contexthub::sound {
namespace {

constexpr size_t kPassSamples = 32000;
constexpr size_t kPasses = 9;

TEST(AudioClassifier, CutsTheStreamIntoFramesAndWindows) {
  qz::test::TestHub runtime;
  AudioClassifier classifier;
  EXPECT_EQ(frontend_resets, 1);
  qz::test::StubNetwork& network = qz::test::stub_network;
  network.scores = [](int) { return qz::test::Scores{1, 1, 1, 1, 1}; };

  qz::test::Random random(1);
  std::vector<int16_t> samples = random.Fill<int16_t>(kPasses * kPassSamples, -9000, 9000);
  const int16_t limits[] = {-32768, -8193, -8192, 8191, 8192, 32767};
  std::copy(std::begin(limits), std::end(limits), samples.begin());

  const int runs_by_pass[kPasses] = {0, 1, 4, 7, 10, 13, 16, 20, 23};
  for (size_t pass = 0; pass < kPasses; ++pass) {
    ConfidenceEvent report[2] = {};
    uint32_t version = 0;
    classifier.Classify(samples.data() + pass * kPassSamples, report, 2, &version);
    EXPECT_EQ(frames.size(), 198 + 200 * pass);
    EXPECT_EQ(network.runs, runs_by_pass[pass]);
    EXPECT_EQ(runtime.hub.counts().clock_raises, pass + 1);
    EXPECT_FALSE(runtime.hub.clock_raised());
    EXPECT_EQ(version, 202208270u);
    // The audio stopping and starting again changes nothing.
    if (pass == 1) classifier.ClearConfidenceBuffer();
  }
  // Not even the surest scores, kept up until all smoothing is over, are a detection.
  EXPECT_EQ(runtime.TakeLog(), std::vector<std::string>{"I audio model initialization"});

  for (size_t f = 0; f < frames.size(); ++f) {
    Frame expected;
    for (size_t i = 0; i < expected.size(); ++i) {
      expected[i] = static_cast<int16_t>(std::clamp(samples[160 * f + i] * 4, -32768, 32767));
    }
    ASSERT_EQ(frames[f], expected) << "frame " << f;
  }
  ASSERT_EQ(network.windows.size(), 23u);
  for (size_t run = 0; run < network.windows.size(); ++run) {
    qz::test::Window expected;
    for (size_t f = 64 * run; f < 64 * run + 382; ++f) {
      for (size_t i = 0; i < 48; ++i) {
        expected.push_back(static_cast<int8_t>(std::clamp(Feature(f, i) - 128, -128, 127)));
      }
    }
    ASSERT_EQ(network.windows[run], expected) << "run " << run;
  }
}

}  // namespace
}  // namespace tarn::contexthub::sound
