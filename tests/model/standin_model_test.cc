#include "standin_model.h"

#include <gmock/gmock.h>

#include <algorithm>

#include "check_weights.h"
#include "reference_network.h"
#include "synthetic_features.h"

namespace qz::model {
namespace {

uint64_t Fnv1a(const PackedModel& bytes) {
  uint64_t hash = 0xCBF29CE484222325u;
  for (const uint8_t byte : bytes) hash = (hash ^ byte) * 0x100000001B3u;
  return hash;
}

// On every machine, compiler and optimisation level.
TEST(StandinModel, FollowsItsSeedAndNothingElse) {
  EXPECT_EQ(Fnv1a(MakeStandinModel(1)), 5163167844880385850u);
  EXPECT_NE(MakeStandinModel(2), MakeStandinModel(3));
}

// Width of the middle 98 % of a channel's bytes over time and windows: a pattern over channels that
// stands still counts for nothing.
int UsedRange(const std::vector<NetworkRun>& runs, size_t op, int channel) {
  std::vector<int8_t> values;
  for (const NetworkRun& run : runs) {
    const Tensor& tensor = run.outputs[op];
    for (int row = 0; row < tensor.rows; ++row) values.push_back(tensor.Row(row)[channel]);
  }
  std::sort(values.begin(), values.end());
  return values[values.size() * 99 / 100] - values[values.size() / 100];
}

class StandinSeeds : public testing::TestWithParam<uint64_t> {};
INSTANTIATE_TEST_SUITE_P(Seeds, StandinSeeds, testing::Values(1, 2, ~uint64_t{0}));

TEST_P(StandinSeeds, IsSoundAndAlive) {
  const PackedModel model = MakeStandinModel(GetParam());
  EXPECT_THAT(CheckWeights(model), testing::IsEmpty());

  std::vector<NetworkRun> runs;  // on windows that the calibration did not see
  for (uint64_t s = 0; s < 40; ++s) runs.push_back(RunNetwork(model, SyntheticWindow(s)));
  for (size_t op = 0; op < 19; ++op) {
    const int channels = runs[0].outputs[op].channels;
    int narrowest = 255, sum = 0;
    for (int c = 0; c < channels; ++c) {
      const int range = UsedRange(runs, op, c);
      narrowest = std::min(narrowest, range);
      sum += range;
    }
    // Logits live within 21 steps of the zero point; the depthwise outputs are not rectified.
    EXPECT_GE(sum / channels, op == 18 ? 40 : op == 0 || op == 3 ? 90 : 180) << "operator " << op;
    EXPECT_GE(narrowest, 20) << "operator " << op;
  }
  for (size_t i = 0; i < kClasses; ++i) {
    int low = 0, middle = 0, high = 0;
    for (const NetworkRun& run : runs) {
      const float score = run.scores[i];
      ++(score < 0.2f ? low : score > 0.8f ? high : middle);
    }
    EXPECT_GE(std::min({low, middle, high}), 3)
        << "class " << i << ": " << low << " low, " << middle << " middle, " << high << " high";
  }
}

}  // namespace
}  // namespace qz::model
