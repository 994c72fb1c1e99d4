// SPDX-License-Identifier: Apache-2.0
#include "model/reference_network.h"

#include <algorithm>
#include <cmath>
#include <limits>
#include <stdexcept>
#include <string>

namespace qz::model {
namespace {

constexpr int kMaxBlockColumns = 16;

int8_t Clamp(int64_t value) { return static_cast<int8_t>(std::clamp<int64_t>(value, -128, 127)); }

// Nearest integer, halves to even, whatever the rounding mode; saturated to int32.
int32_t RoundToEven(float value) {
  if (std::isnan(value)) return 0;
  if (value >= 2147483648.0f) return std::numeric_limits<int32_t>::max();
  if (value < -2147483648.0f) return std::numeric_limits<int32_t>::min();
  const float below = std::floor(value);
  const float rest = value - below;  // exact
  int64_t rounded = static_cast<int64_t>(below);
  if (rest > 0.5f || (rest == 0.5f && rounded % 2 != 0)) ++rounded;
  return static_cast<int32_t>(rounded);
}

Tensor MaxPool(const Tensor& in) {
  Tensor out(in.rows / 2, in.channels);
  for (int row = 0; row < out.rows; ++row) {
    for (int c = 0; c < out.channels; ++c) {
      out.Row(row)[c] = std::max(in.Row(2 * row)[c], in.Row(2 * row + 1)[c]);
    }
  }
  return out;
}

// The score's byte for a logit: round(256 x logistic) - 128.
int8_t Logistic(int8_t logit, double scale, int zero_point) {
  return Clamp(std::llround(256.0 / (1.0 + std::exp(-scale * (logit - zero_point)))) - 128);
}

}  // namespace

Requantisation RequantisationOf(int op) {
  const config::Operator& each = config::kOperators[static_cast<size_t>(op)];
  return {each.zero_point, each.multiplier, each.shift};
}

int8_t RequantiseFloat(int32_t acc, float scale, int zero_point) {
  const float product = static_cast<float>(acc) * scale;
  return Clamp(int64_t{RoundToEven(product)} + zero_point);
}

int8_t RequantiseFixed(int32_t acc, const Requantisation& requantisation) {
  int64_t high = (int64_t{acc} * requantisation.multiplier) >> 31;
  high = std::min<int64_t>(high, std::numeric_limits<int32_t>::max());
  const int64_t half = (int64_t{1} << requantisation.shift) / 2;
  return Clamp(((high + half) >> requantisation.shift) + requantisation.zero_point);
}

std::vector<int32_t> Accumulate(const PackedModel& model, const TableLayout& table,
                                const Tensor& in) {
  const bool depthwise = table.IsDepthwise();
  const int columns = table.BlockColumns();
  const int rows = in.rows - table.taps + 1;
  std::vector<int32_t> out(static_cast<size_t>(rows * table.outputs));
  for (int row = 0; row < rows; ++row) {
    for (int first = 0; first < table.PaddedColumns(); first += columns) {
      const int real = std::min(columns, table.outputs - first);
      uint32_t sums[kMaxBlockColumns];
      for (int c = 0; c < columns; ++c) {
        sums[c] = Load<uint32_t>(model, table.BiasOffset(first + c));
      }
      for (int tap = 0; tap < table.taps; ++tap) {
        for (int input = 0; input < table.inputs; ++input) {
          const uint8_t* weights = model.data() + table.WeightOffset(tap, input, first);
          const int8_t* x = in.Row(row + tap) + (depthwise ? first : input);
          for (int c = 0; c < real; ++c) {
            const int32_t weight = static_cast<int8_t>(weights[c]);
            sums[c] += static_cast<uint32_t>(weight * x[depthwise ? c : 0]);
          }
        }
      }
      for (int c = 0; c < real; ++c) {
        out[static_cast<size_t>(row) * table.outputs + first + c] = static_cast<int32_t>(sums[c]);
      }
    }
  }
  return out;
}

Tensor RunOperator(const PackedModel& model, int op, const Tensor& in) {
  const config::Operator& each = config::kOperators[static_cast<size_t>(op)];
  if (each.kind == OperatorKind::kFlatten) return in;
  if (each.kind == OperatorKind::kLogistic) {
    Tensor out = in;
    for (int8_t& value : out.values) value = Logistic(value, each.scale, each.input.zero_point);
    return out;
  }
  const TableLayout* table = FindTable(op);
  if (table == nullptr) return MaxPool(in);

  const Requantisation requantisation = RequantisationOf(op);
  const std::vector<int32_t> sums = Accumulate(model, *table, in);
  std::vector<float> scales(static_cast<size_t>(table->outputs));
  for (int c = 0; c < table->outputs && table->HasScales(); ++c) {
    scales[static_cast<size_t>(c)] = Load<float>(model, table->ScaleOffset(c));
  }
  Tensor out(in.rows - table->taps + 1, table->outputs);
  for (size_t i = 0; i < sums.size(); ++i) {
    out.values[i] = table->HasScales() ? RequantiseFloat(sums[i], scales[i % scales.size()],
                                                         requantisation.zero_point)
                                       : RequantiseFixed(sums[i], requantisation);
  }
  return out;
}

NetworkRun RunNetwork(const PackedModel& model, const Tensor& input) {
  if (model.size() != kModelBytes || input.rows != kInputRows || input.channels != kInputChannels) {
    throw std::invalid_argument("RunNetwork needs a model of " + std::to_string(kModelBytes) +
                                " bytes and a window of " + std::to_string(kInputRows) + " x " +
                                std::to_string(kInputChannels));
  }
  NetworkRun run;
  const Tensor* in = &input;
  for (size_t op = 0; op < run.outputs.size(); ++op) {
    run.outputs[op] = RunOperator(model, static_cast<int>(op), *in);
    in = &run.outputs[op];
  }
  for (size_t i = 0; i < run.scores.size(); ++i) {
    run.scores[i] = static_cast<float>(in->values[i] + 128) / 256;
  }
  return run;
}

}  // namespace qz::model
