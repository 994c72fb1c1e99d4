// SPDX-License-Identifier: Apache-2.0
// A reference evaluation of the network from a packed model: bit-exact with the module's graph,
// sharing the description's operators with it but no arithmetic. Clear rather than fast (some
// milliseconds a run).
#pragma once

#include <array>
#include <cstdint>
#include <vector>

#include "model/weight_layout.h"

namespace qz::model {

constexpr int kInputRows = static_cast<int>(config::kWindowFrames);  // oldest first
constexpr int kInputChannels = static_cast<int>(config::kFeatureChannels);
constexpr int kClasses = static_cast<int>(config::kClasses);
constexpr int kOperators = static_cast<int>(config::kOperatorCount);

// An int8 tensor, rows (time steps) x channels, row-major.
struct Tensor {
  int rows = 0;
  int channels = 0;
  std::vector<int8_t> values;

  Tensor() = default;
  Tensor(int row_count, int channel_count)
      : rows(row_count),
        channels(channel_count),
        values(static_cast<size_t>(row_count) * static_cast<size_t>(channel_count)) {}
  const int8_t* Row(int row) const { return values.data() + row * channels; }
  int8_t* Row(int row) { return values.data() + row * channels; }
};

// How an operator with a table turns accumulators into int8.
struct Requantisation {
  int zero_point;      // added after scaling
  int32_t multiplier;  // factor of the fully connected operators: multiplier / 2^(31 + shift)
  int shift;           // right shift with rounding, 1 to 31
};

// The requantisation of operator `op`, which must read a table.
Requantisation RequantisationOf(int op);

// clamp(round(float(acc) x scale) + zero_point, -128, 127): conversion and product in single
// precision, halves to even, the rounded value saturated to int32 first. NaN counts as 0.
int8_t RequantiseFloat(int32_t acc, float scale, int zero_point);

// clamp(floor((floor(acc x multiplier / 2^31) + 2^(shift - 1)) / 2^shift) + zero_point, -128, 127);
// the high product saturates to int32.
int8_t RequantiseFixed(int32_t acc, const Requantisation& requantisation);

// The accumulators [output rows][outputs] of a table's operator: bias + products, modulo 2^32.
// `in` has the table's input channels (depthwise: its outputs) and at least `taps` rows; the output
// has taps - 1 rows fewer.
std::vector<int32_t> Accumulate(const PackedModel& model, const TableLayout& table,
                                const Tensor& in);

// Output of operator `op`, any but the last, for its input.
Tensor RunOperator(const PackedModel& model, int op, const Tensor& in);

struct NetworkRun {
  std::array<Tensor, kOperators - 1> outputs;  // of all but the last
  std::array<float, kClasses> scores;          // k / 256, k from 0 to 255
};

// One run over a kInputRows x kInputChannels window of features minus 128. The model has
// kModelBytes; throws std::invalid_argument if not.
NetworkRun RunNetwork(const PackedModel& model, const Tensor& input);

}  // namespace qz::model
