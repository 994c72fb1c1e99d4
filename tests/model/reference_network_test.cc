#include "reference_network.h"

#include <gmock/gmock.h>

#include <limits>
#include <stdexcept>

#include "random.h"

namespace qz::model {
namespace {

using testing::Each;
using testing::ElementsAre;

constexpr int32_t kMost = std::numeric_limits<int32_t>::max();
constexpr int32_t kLeast = std::numeric_limits<int32_t>::min();

TEST(Requantise, FloatRoundsTiesToEvenAndSaturates) {
  const int values[][2] = {{1, 0}, {3, 2}, {5, 2}, {7, 4}, {-1, 0}, {-3, -2}, {-5, -2}};
  for (const auto& [acc, rounded] : values) EXPECT_EQ(RequantiseFloat(acc, 0.5f, 0), rounded);
  EXPECT_EQ(RequantiseFloat(3, 0.5f, 15), 17) << "the zero point comes after the rounding";
  EXPECT_EQ(RequantiseFloat(-600, 0.5f, 82), -128);
  EXPECT_EQ(RequantiseFloat(200, 0.5f, 82), 127);
  EXPECT_EQ(RequantiseFloat(kMost, 1e6f, -128), 127);
  EXPECT_EQ(RequantiseFloat(kLeast, 1e6f, 127), -128);
  EXPECT_EQ(RequantiseFloat(0, std::numeric_limits<float>::infinity(), 5), 5);
  // Exactly 0.5 + 2^-25; single precision holds 2^24 there.
  EXPECT_EQ(RequantiseFloat((1 << 24) + 1, 0x1p-25f, 0), 0);
}

TEST(Requantise, FixedRoundsHalvesUpwardsAndSaturates) {
  const Requantisation halves = {0, 1 << 30, 4};  // acc / 32, the first halving towards -infinity
  const int values[][2] = {{16, 1}, {15, 0}, {-16, 0}, {-17, -1}, {-48, -1}, {48, 2}, {-50, -2}};
  for (const auto& [acc, rounded] : values) EXPECT_EQ(RequantiseFixed(acc, halves), rounded) << acc;
  EXPECT_EQ(RequantiseFixed(kMost, {-128, kMost, 1}), 127);
  EXPECT_EQ(RequantiseFixed(kLeast, {82, kMost, 1}), -128);
  EXPECT_EQ(RequantiseFixed(kLeast, {0, kLeast, 25}), 64) << "2^31 saturates, then rounds";
  // Factors 0.0207705330 and 0.0022462329 of the last two layers.
  EXPECT_EQ(RequantiseFixed(10000, RequantisationOf(17)), 208 - 128);
  EXPECT_EQ(RequantiseFixed(-10000, RequantisationOf(18)), -22 + 82);
}

Tensor RandomTensor(int rows, int channels) {
  Tensor tensor(rows, channels);
  tensor.values = test::Random(7).Fill<int8_t>(tensor.values.size(), -128, 127);
  return tensor;
}

TEST(ReferenceNetwork, ReadsTheTapInputAndColumnThatAWeightNames) {
  PackedModel model(kModelBytes);
  Store<int32_t>(model, FindTable(6)->BiasOffset(13), -5);
  Store<int8_t>(model, FindTable(6)->WeightOffset(2, 7, 13), 3);
  Store<int8_t>(model, FindTable(6)->WeightOffset(0, 59, 13), -127);
  const Tensor in = RandomTensor(9, 60);
  Store<int8_t>(model, FindTable(3)->WeightOffset(1, 0, 59), 11);
  const std::vector<int32_t> sums = Accumulate(model, *FindTable(6), in);
  const std::vector<int32_t> depthwise = Accumulate(model, *FindTable(3), in);
  ASSERT_EQ(sums.size(), 7u * 60);
  ASSERT_EQ(depthwise.size(), 7u * 60);
  for (int row = 0; row < 7; ++row) {
    EXPECT_EQ(sums[size_t(row * 60 + 13)], -5 + 3 * in.Row(row + 2)[7] - 127 * in.Row(row)[59]);
    EXPECT_EQ(sums[size_t(row * 60 + 12)], 0);
    EXPECT_EQ(depthwise[size_t(row * 60 + 59)], 11 * in.Row(row + 1)[59]);
    EXPECT_EQ(depthwise[size_t(row * 60 + 58)], 0);
  }
}

TEST(ReferenceNetwork, AccumulatorsWrap) {
  PackedModel model(kModelBytes);
  Store<int32_t>(model, FindTable(17)->BiasOffset(63), kMost);
  Store<int8_t>(model, FindTable(17)->WeightOffset(0, 0, 63), 1);
  Tensor in(1, 60);
  in.values[0] = 1;
  EXPECT_EQ(Accumulate(model, *FindTable(17), in)[63], kLeast);
}

TEST(ReferenceNetwork, PoolsPairsAndLooksUpTheLogistic) {
  Tensor in(4, 2);
  in.values = {1, -5, -3, 6, -128, 127, -127, -1};
  EXPECT_THAT(RunOperator({}, 2, in).values, ElementsAre(1, 6, -127, 127));
  in.values = {-128, 57, 81, 82, 83, 103, 127, 0};
  EXPECT_THAT(RunOperator({}, 19, in).values, ElementsAre(-128, -128, -16, 0, 16, 127, 127, -128));
}

TEST(ReferenceNetwork, RunsFromZeroPointToZeroPoint) {
  // With all tables zero every operator puts out its zero point, and a logit of 82 scores 0.5.
  const NetworkRun run = RunNetwork(PackedModel(kModelBytes), RandomTensor(382, 48));
  const int rows[] = {380, 380, 190, 188, 188, 94, 92, 46, 44, 22, 20, 10, 8, 6, 3, 1, 1, 1, 1, 1};
  for (size_t op = 0; op < run.outputs.size(); ++op) {
    const int channels = op == 0 ? 48 : op < 17 ? 60 : op == 17 ? 64 : 5;
    const int value = op == 0 ? 15 : op == 3 ? 36 : op == 18 ? 82 : op == 19 ? 0 : -128;
    EXPECT_EQ(run.outputs[op].rows, rows[op]) << op;
    EXPECT_EQ(run.outputs[op].channels, channels) << op;
    EXPECT_THAT(run.outputs[op].values, Each(value)) << op;
  }
  EXPECT_THAT(run.scores, Each(0.5f));
  EXPECT_THROW(RunNetwork(PackedModel(kModelBytes - 1), Tensor(382, 48)), std::invalid_argument);
  EXPECT_THROW(RunNetwork(PackedModel(kModelBytes), Tensor(381, 48)), std::invalid_argument);
}

}  // namespace
}  // namespace qz::model
