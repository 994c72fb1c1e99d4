// SPDX-License-Identifier: Apache-2.0
// The network against its reference evaluation from the packed model, operator by operator.

#include "network/mobilenet_backend.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <cstring>
#include <memory>
#include <set>
#include <vector>

#include "logistic_table.h"
#include "model/model_files.h"
#include "model/reference_network.h"
#include "model/synthetic_features.h"
#include "network/network.h"
#include "tests/support/random.h"

namespace qz::test {
namespace {

using config::kArenaBytes;
using config::kOperators;
using config::kWindow;

// The module's own.
int8_t* Arena() { return network::arena.bytes; }

// All of the arena is compared, so that a byte written beside its tensor shows as well.
size_t FirstUnexpectedByte(const std::vector<int8_t>& expected) {
  return static_cast<size_t>(std::mismatch(expected.begin(), expected.end(), Arena()).first -
                             expected.begin());
}

TEST(Network, EqualsTheReferenceWhateverTheArenaHeld) {
  const model::PackedModel packed = model::ReadModelFile(QZ_PACKED_MODEL);
  Random random(1);
  std::set<std::array<float, config::kClasses>> different;
  const auto other = std::make_unique<network::Arena>();
  for (uint64_t i = 0; i < 40; ++i) {
    model::Tensor input = model::SyntheticWindow(i);
    if (i % 8 == 0) input.values = random.Fill<int8_t>(kWindow.Bytes(), -128, 127);
    std::vector<int8_t> expected = random.Fill<int8_t>(kArenaBytes, -128, 127);
    std::copy(input.values.begin(), input.values.end(), &expected[kWindow.offset]);
    const std::vector<int8_t> before = expected;
    std::copy(before.begin(), before.end(), Arena());
    const model::NetworkRun run = model::RunNetwork(packed, input);
    for (size_t op = 0; op < kOperators.size(); ++op) {
      const config::Tensor& output = kOperators[op].output;
      const bool scores = op == run.outputs.size();
      ASSERT_EQ(output.Bytes(), scores ? sizeof run.scores : run.outputs[op].values.size());
      const void* values =
          scores ? static_cast<const void*>(run.scores.data()) : run.outputs[op].values.data();
      std::memcpy(&expected[output.offset], values, output.Bytes());
      network::RunOperator(op, network::arena, network::module_weights);
      ASSERT_EQ(FirstUnexpectedByte(expected), kArenaBytes)
          << "of window " << i << ", operator " << op;
    }
    std::copy(before.begin(), before.end(), Arena());
    mobilenet_backend_invoke();
    ASSERT_EQ(FirstUnexpectedByte(expected), kArenaBytes) << "of window " << i;
    std::copy(before.begin(), before.end(), other->bytes);
    network::Run(*other, network::WeightsOf(packed.data()));
    ASSERT_TRUE(std::equal(expected.begin(), expected.end(), other->bytes))
        << "of window " << i << ", in an arena of its own";
    ASSERT_EQ(FirstUnexpectedByte(expected), kArenaBytes)
        << "a run elsewhere wrote to the module's";
    different.insert(run.scores);
  }
  EXPECT_GT(different.size(), 2u) << "a model whose scores do not vary tests nothing";
}

TEST(Network, KeepsItsPointers) {
  EXPECT_EQ(static_cast<const void*>(mobilenet_backend_output_ptr), mobilenet_backend_input_ptr);
  EXPECT_EQ(mobilenet_backend_input_ptr, Arena() + kWindow.offset);
}

TEST(Network, LogisticTableIsTheRoundedFunction) {
  model::Tensor bytes(1, 256);
  for (size_t i = 0; i < 256; ++i) bytes.values[i] = static_cast<int8_t>(i);
  EXPECT_EQ(std::vector<int8_t>(w19, w19 + 256),
            model::RunOperator({}, static_cast<int>(kOperators.size()) - 2, bytes).values);
}

}  // namespace
}  // namespace qz::test
