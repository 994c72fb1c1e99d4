// SPDX-License-Identifier: Apache-2.0
// Arrays without padding, packed and unpacked; and what they mean to the module's network.

#include <gmock/gmock.h>

#include <algorithm>
#include <cmath>

#include "arrays/npz_file.h"
#include "base/error.h"
#include "model/array_files.h"
#include "model/check_weights.h"
#include "model/reference_network.h"
#include "model/synthetic_model.h"
#include "network/network.h"
#include "tests/support/random.h"
#include "tests/support/temporary_folder.h"

namespace qz::model {
namespace {

using testing::ElementsAre;
using testing::StartsWith;

const PackedModel& Synthetic() {
  static const PackedModel model = MakeSyntheticModel(1);
  return model;
}

// Random arrays under which every operator's output varies.
ModelArrays RandomArrays(uint64_t seed) {
  test::Random random(seed);
  ModelArrays all;
  for (size_t i = 0; i < kTableCount; ++i) {
    const TableLayout& table = kTables[i];
    const auto outputs = static_cast<size_t>(table.outputs);
    // The factor of operator 17 is larger than that of 18, and both are fixed.
    const int widest = table.op == 17 ? 3 : table.op == 18 ? 30 : 127;
    all[i].weight = random.Fill<int8_t>(WeightCount(table), -widest, widest);
    const bool free_bias = !table.IsDepthwise();
    all[i].bias =
        free_bias ? random.Fill<int32_t>(outputs, -5000, 5000) : std::vector<int32_t>(outputs);
    if (!table.HasScales()) continue;
    const float scale = 0.005f / std::sqrt(static_cast<float>(table.taps * table.inputs));
    for (size_t output = 0; output < outputs; ++output) {
      all[i].scale.push_back(table.fixed_scale != 0
                                 ? table.fixed_scale
                                 : scale * static_cast<float>(random.Between(50, 150)) / 100);
    }
  }
  return all;
}

// The accumulators of a table's operator, from its arrays.
std::vector<int32_t> SumsOf(const TableLayout& table, const LayerArrays& arrays,
                            const std::vector<int8_t>& in) {
  const bool depthwise = table.IsDepthwise();
  const int channels = depthwise ? table.outputs : table.inputs;
  const int rows = static_cast<int>(in.size()) / channels - table.taps + 1;
  const int zero_point = config::kOperators[static_cast<size_t>(table.op)].input.zero_point;
  std::vector<int32_t> sums;
  for (int row = 0; row < rows; ++row) {
    for (int out = 0; out < table.outputs; ++out) {
      int32_t sum = arrays.bias[out];
      for (int tap = 0; tap < table.taps; ++tap) {
        for (int input = 0; input < table.inputs; ++input) {
          const int x = in[(row + tap) * channels + (depthwise ? out : input)];
          const int weight = arrays.weight[(tap * table.inputs + input) * table.outputs + out];
          sum += weight * (x - zero_point);
        }
      }
      sums.push_back(sum);
    }
  }
  return sums;
}

TEST(Packing, PutsEveryValueWhereTheNetworkLooksForIt) {
  const ModelArrays arrays = RandomArrays(1);
  const PackedModel packed = Pack(arrays);
  EXPECT_THAT(CheckWeights(packed), ElementsAre());
  static network::Arena arena;
  test::Random random(2);
  for (size_t i = 0; i < kTableCount; ++i) {
    const TableLayout& table = kTables[i];
    const config::Operator& op = config::kOperators[static_cast<size_t>(table.op)];
    const std::vector<int8_t> in = random.Fill<int8_t>(op.input.Bytes(), -128, 127);
    std::copy(in.begin(), in.end(), network::BytesOf(arena, op.input));
    network::RunOperator(static_cast<size_t>(table.op), arena, network::WeightsOf(packed.data()));
    const int8_t* const written = network::BytesOf(arena, op.output);
    const std::vector<int8_t> out(written, written + op.output.Bytes());
    std::vector<int8_t> expected;
    for (const int32_t sum : SumsOf(table, arrays[i], in)) {
      const size_t output = expected.size() % static_cast<size_t>(table.outputs);
      const Requantisation requantisation = RequantisationOf(table.op);
      expected.push_back(table.HasScales() ? RequantiseFloat(sum, arrays[i].scale[output],
                                                             requantisation.zero_point)
                                           : RequantiseFixed(sum, requantisation));
    }
    EXPECT_TRUE(out == expected) << table.name;
    const auto [min, max] = std::minmax_element(out.begin(), out.end());
    EXPECT_GT(*max - *min, 50) << table.name;
  }
}

TEST(Packing, IsUndoneByUnpacking) {
  for (const PackedModel& model : {Synthetic(), Pack(RandomArrays(3))}) {
    EXPECT_TRUE(Pack(Unpack(model)) == model);
  }
  // A bias that fits only with its zero point of -128 folded in.
  PackedModel model = Synthetic();
  const TableLayout& w6 = *FindTable(6);
  Store<int32_t>(model, w6.BiasOffset(9), INT32_MIN);
  for (int input = 0; input < 60; ++input) Store<int8_t>(model, w6.WeightOffset(1, input, 9), 127);
  try {
    Unpack(model);
    ADD_FAILURE();
  } catch (const PackingError& error) {
    EXPECT_THAT(error.findings(), ElementsAre(StartsWith("w6.bias[9] would be -21")));
  }
}

// Indices of tables in ModelArrays.
constexpr size_t kW0 = 0, kW1 = 1, kW3 = 2, kW6 = 4, kW17 = 10, kW18 = 11;

template <typename Change>
std::vector<std::string> FindingsAfter(Change change) {
  ModelArrays arrays = RandomArrays(1);
  change(arrays);
  try {
    Pack(arrays);
  } catch (const PackingError& error) {
    EXPECT_THAT(error.what(), StartsWith(error.findings().front()));
    return error.findings();
  }
  return {};
}

TEST(Packing, NamesEveryKindOfDefect) {
  const std::pair<std::vector<std::string>, const char*> cases[] = {
      {FindingsAfter([](auto& a) { a[kW6].weight[(2 * 60 + 14) * 60 + 7] = -128; }),
       "w6.weight[2,14,7] is -128; expected -127 to 127."},
      {FindingsAfter([](auto& a) { a[kW3].weight[60 + 5] = -128; }), "w3.weight[1,5] is -128; e"},
      {FindingsAfter([](auto& a) { a[kW0].bias[47] = 1; }),
       "w0.bias[47] is 1; operator 0 has no biases: expected 0."},
      {FindingsAfter([](auto& a) { a[kW3].scale[2] = 0.5f; }),
       "w3.scale[2] is 0.5; expected 0.00582244154."},
      {FindingsAfter([](auto& a) { a[kW1].scale[59] = -0.25f; }),
       "w1.scale[59] is -0.25; expected finite and not negative."},
      {FindingsAfter([](auto& a) { a[kW6].scale[0] = NAN; }), "w6.scale[0] is nan; expected"},
      {FindingsAfter([](auto& a) {
         std::fill(a[kW18].weight.begin(), a[kW18].weight.end(), 1);
         a[kW18].bias[4] = INT32_MAX;
       }),
       "w18.bias[4] is 2147483647, with the input's zero point folded in 2147491839; that must"},
      {FindingsAfter([](auto& a) { a[kW17].scale.push_back(1); }),
       "w17.scale has 1 values; expected 0."},
      {FindingsAfter([](auto& a) { a[kW0].weight.pop_back(); }),
       "w0.weight has 143 values; expected 144."}};
  for (const auto& [findings, start] : cases) {
    EXPECT_THAT(findings, ElementsAre(StartsWith(start)));
  }
  EXPECT_THAT(FindingsAfter([](auto& a) { a[kW6].scale[0] = 0; }), ElementsAre());
}

class ArrayFiles : public testing::Test {
 protected:
  static constexpr arrays::NpzLimits kLimits = {34, 1 << 18};
  using Named = std::map<std::string, arrays::NpyArray>;

  ArrayFiles() { WriteModelArrays(path_, Unpack(Synthetic())); }

  // Of the good archive with a change.
  template <typename Change>
  std::vector<std::string> FindingsAfter(Change change) const {
    Named arrays = arrays::ReadNpz(path_, kLimits);
    change(arrays);
    try {
      ReadModelArrays(
          folder_.WriteBytes("changed.npz", arrays::NpzBytes({arrays.begin(), arrays.end()})));
    } catch (const PackingError& error) {
      return error.findings();
    }
    return {};
  }

  const test::TemporaryFolder folder_;
  const std::string path_ = folder_.Path("arrays.npz");
};

TEST_F(ArrayFiles, HoldAModelToTheByte) {
  EXPECT_TRUE(Pack(ReadModelArrays(path_)) == Synthetic());
  const Named arrays = arrays::ReadNpz(path_, kLimits);
  EXPECT_EQ(arrays.size(), 34u);
  EXPECT_THAT(arrays.at("w0.weight").shape, ElementsAre(3, 48));
  EXPECT_THAT(arrays.at("w4.weight").shape, ElementsAre(60, 60));
  EXPECT_THAT(arrays.at("w15.weight").shape, ElementsAre(kTables[9].taps, 60, 60));
  EXPECT_THAT(arrays.at("w18.bias").shape, ElementsAre(config::kClasses));
}

TEST_F(ArrayFiles, WithWrongArraysAreRefused) {
  EXPECT_THAT(FindingsAfter([](Named&) {}), ElementsAre());
  EXPECT_THAT(FindingsAfter([](Named& arrays) {
                arrays.erase("w6.scale");
                arrays["w8.bias"] = arrays::MakeArray<float>({60}, std::vector<float>(60));
                arrays["w10.weight"].shape = {60, 3, 60};
                arrays["w17.scale"] = arrays::MakeArray<float>({}, {1});
              }),
              ElementsAre("w6.scale is missing; expected float32 (60,).",
                          "w8.bias is float32 (60,); expected int32 (60,).",
                          "w10.weight is int8 (60, 3, 60); expected int8 (3, 60, 60).",
                          "w17.scale is none of a model's arrays."));
  EXPECT_THROW(ReadModelArrays(folder_.WriteBytes("x.npz", "x")), base::InputError);
}

}  // namespace
}  // namespace qz::model
