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
  int8_t* const arena = mobilenet_backend_input_ptr - kInput.offset;
  std::set<std::array<float, 5>> different;
  for (uint64_t i = 0; i < 40; ++i) {
    model::Tensor input = model::SyntheticWindow(i);
    if (i % 8 == 0) input.values = random.Fill<int8_t>(kInput.Bytes(), -128, 127);
    std::vector<int8_t> expected = random.Fill<int8_t>(kArenaBytes, -128, 127);
    std::copy(input.values.begin(), input.values.end(), &expected[kInput.offset]);
    std::copy(expected.begin(), expected.end(), arena);
    mobilenet_backend_invoke();

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

TEST(Network, KeepsItsPlaces) {
  EXPECT_EQ(static_cast<const void*>(mobilenet_backend_output_ptr), mobilenet_backend_input_ptr);
  // Row 3 of a tile with two real rows meets the same row as the last of these, at every tap.
  const int8_t* const arena = mobilenet_backend_input_ptr - kInput.offset;
  EXPECT_EQ(TileList<2>(arena, kOut12)[12 + 2 * 4 + 3], arena + kOut12.offset + 7 * 60);
}

TEST(Network, LogisticTableIsTheRoundedFunction) {
  model::Tensor bytes(1, 256);
  for (size_t i = 0; i < 256; ++i) bytes.values[i] = static_cast<int8_t>(i);
  EXPECT_EQ(std::vector<int8_t>(w19, w19 + 256), model::RunOperator({}, 19, bytes).values);
}

}  // namespace
}  // namespace qz::test
