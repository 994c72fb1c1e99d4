// SPDX-License-Identifier: Apache-2.0
// Between a model's plain arrays, as a trainer holds them, and its packed tables.
#pragma once

#include <array>
#include <cstdint>
#include <string>
#include <vector>

#include "base/error.h"
#include "model/weight_layout.h"

namespace qz::model {

// One table without padding. With x the operator's int8 inputs and z their zero point, the
// accumulator of output n is bias[n] + the sum of weight[tap][input][n] * (x - z).
struct LayerArrays {
  std::vector<int8_t> weight;  // [taps][inputs][outputs], row-major; depthwise: [taps][channels]
  std::vector<int32_t> bias;   // [outputs], in steps of the accumulator
  std::vector<float> scale;    // [outputs], output steps an accumulator step; empty: none
};

// In the order of kTables.
using ModelArrays = std::array<LayerArrays, kTableCount>;

// The number of values in a table's `weight`.
constexpr size_t WeightCount(const TableLayout& table) {
  return static_cast<size_t>(table.taps) * static_cast<size_t>(table.inputs) *
         static_cast<size_t>(table.outputs);
}

// Arrays that make no valid model. Every finding is one sentence that names the array, the index,
// the value and what was expected, in the order of the tables; there is at least one.
class PackingError : public base::ModelError {
 public:
  explicit PackingError(std::vector<std::string> findings);
  const std::vector<std::string>& findings() const { return findings_; }

 private:
  std::vector<std::string> findings_;
};

// A packed model that CheckWeights passes: the zero points folded into the biases, padding zero.
// Throws PackingError: an array of a wrong size; a weight of -128; a scale that is negative or not
// finite; a folded bias beyond int32; in the depthwise tables a bias that is not 0 or a scale that
// is not the table's own.
PackedModel Pack(const ModelArrays& arrays);

// The inverse, of a model that CheckWeights passes. Throws PackingError where a bias without its
// zero point is beyond int32.
ModelArrays Unpack(const PackedModel& model);

}  // namespace qz::model
