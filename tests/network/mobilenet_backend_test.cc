// The network against its plain evaluation from the packed model, tensor by tensor.

#include "mobilenet_backend.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <cstring>
#include <set>
#include <vector>

#include "arena_plan.h"
#include "logistic_table.h"
#include "model_files.h"
#include "random.h"
#include "reference_network.h"
#include "synthetic_features.h"

namespace qz::test {
namespace {

// The places of the outputs of operators 0 to 19, but for operator 16, which has none of its own.
const Tensor kPlaces[] = {kOut0,  kOut1,  kOut2,  kOut3,  kOut4,  kOut5,  kOut6,
                          kOut7,  kOut8,  kOut9,  kOut10, kOut11, kOut12, kOut13,
                          kOut14, kOut15, kOut15, kOut17, kOut18, kOut18};

// All of the arena is compared, so that a byte written beside its tensor shows as well.
TEST(Network, EqualsThePlainEvaluationWhateverTheArenaHeld) {
  const model::PackedModel packed = model::ReadModelFile(QZ_PACKED_MODEL);
  Random random(1);
  std::vector<std::vector<int8_t>> inputs;
  for (int value : {-128, 0, 127}) inputs.emplace_back(kInput.Bytes(), static_cast<int8_t>(value));
  for (int i = 0; i < 5; ++i) inputs.push_back(random.Fill<int8_t>(kInput.Bytes(), -128, 127));
  for (uint64_t seed = 1; seed <= 32; ++seed) inputs.push_back(model::SyntheticWindow(seed).values);

  int8_t* const arena = mobilenet_backend_input_ptr - kInput.offset;
  std::set<std::array<float, 5>> different;
  for (const std::vector<int8_t>& values : inputs) {
    std::vector<int8_t> expected = random.Fill<int8_t>(kArenaBytes, -128, 127);
    std::copy(values.begin(), values.end(), &expected[kInput.offset]);
    std::copy(expected.begin(), expected.end(), arena);
    mobilenet_backend_invoke();

    model::Tensor input(382, 48);
    input.values = values;
    const model::NetworkRun run = model::RunNetwork(packed, input);
    for (size_t op = 0; op < run.outputs.size(); ++op) {
      const std::vector<int8_t>& output = run.outputs[op].values;
      std::copy(output.begin(), output.end(), &expected[kPlaces[op].offset]);
    }
    std::memcpy(&expected[kScores.offset], run.scores.data(), sizeof run.scores);
    ASSERT_EQ(std::vector<int8_t>(arena, arena + kArenaBytes), expected);
    different.insert(run.scores);
  }
  EXPECT_GT(different.size(), 2u) << "too dull a model to tell anything";
}

TEST(Network, OutputLiesWhereTheInputBegins) {
  EXPECT_EQ(static_cast<const void*>(mobilenet_backend_output_ptr), mobilenet_backend_input_ptr);
}

// Row 3 of a tile with two real rows meets the same row as the last of these, at every tap.
TEST(Network, TilesRepeatTheirLastRow) {
  const int8_t* const arena = mobilenet_backend_input_ptr - kInput.offset;
  EXPECT_EQ(TileList<2>(arena, kOut12)[12 + 2 * 4 + 3], arena + kOut12.offset + 7 * 60);
}

TEST(Network, LogisticTable) {
  const auto at = [](int q) { return w19[static_cast<uint8_t>(q)]; };
  for (int q = -128; q <= 57; ++q) EXPECT_EQ(at(q), -128) << q;
  for (int q = 103; q <= 127; ++q) EXPECT_EQ(at(q), 127) << q;
  EXPECT_EQ(at(81), -16);
  EXPECT_EQ(at(82), 0);
  EXPECT_EQ(at(83), 16);
}

}  // namespace
}  // namespace qz::test
