// SPDX-License-Identifier: Apache-2.0
#include "model/synthetic_model.h"

#include <algorithm>
#include <cmath>

#include "base/number_generator.h"
#include "model/reference_network.h"
#include "model/synthetic_features.h"

namespace qz::model {
namespace {

constexpr int kWindows = 64;

// Synthetic windows of calibration and of anything else differ in their seeds' upper half.
constexpr uint64_t kCalibrationSeeds = uint64_t{0xCA11} << 32;

struct Spread {
  double mean;
  double deviation;
};

int Round(double value) { return static_cast<int>(std::floor(value + 0.5)); }

int8_t Weight(double value) { return static_cast<int8_t>(std::clamp(Round(value), -127, 127)); }

class SyntheticModelMaker {
 public:
  explicit SyntheticModelMaker(uint64_t seed) : random_(seed), model_(kModelBytes) {
    for (int i = 0; i < kWindows; ++i) {
      tensors_.push_back(SyntheticWindow(kCalibrationSeeds + static_cast<uint64_t>(i)));
    }
  }

  PackedModel Make() {
    for (int op = 0; op + 2 < kOperators; ++op) {
      const TableLayout* table = FindTable(op);
      if (table != nullptr) MakeTable(*table);
      for (Tensor& tensor : tensors_) tensor = RunOperator(model_, op, tensor);
    }
    return model_;
  }

 private:
  void MakeTable(const TableLayout& table) {
    switch (table.kind) {
      case OperatorKind::kDepthwise:
        return MakeDepthwise(table);
      case OperatorKind::kFullyConnected:
        DrawWeights(table);
        return SetFixedPoint(table);
      default:
        DrawWeights(table);
        return SetScalesAndBiases(table);
    }
  }

  // Mean and deviation of every column's accumulator over all calibration windows and rows.
  std::vector<Spread> Measure(const TableLayout& table) const {
    std::vector<int64_t> sums(static_cast<size_t>(table.outputs));
    std::vector<double> squares(sums.size());
    double count = 0;
    for (const Tensor& tensor : tensors_) {
      const std::vector<int32_t> accumulators = Accumulate(model_, table, tensor);
      for (size_t i = 0; i < accumulators.size(); ++i) {
        const double value = accumulators[i];
        sums[i % sums.size()] += accumulators[i];
        squares[i % sums.size()] += value * value;
      }
      count += static_cast<double>(accumulators.size()) / static_cast<double>(sums.size());
    }
    std::vector<Spread> spreads;
    for (size_t c = 0; c < sums.size(); ++c) {
      const double mean = static_cast<double>(sums[c]) / count;
      const double variance = std::max(squares[c] / count - mean * mean, 1.0);
      spreads.push_back({mean, std::sqrt(variance)});
    }
    return spreads;
  }

  // Bell-shaped weights whose sum over a column is near zero, so that a column answers to what
  // differs between its inputs more than to their common loudness.
  void DrawWeights(const TableLayout& table) {
    const int count = table.taps * table.inputs;
    std::vector<double> draws(static_cast<size_t>(count));
    for (int column = 0; column < table.outputs; ++column) {
      double sum = 0;
      for (double& draw : draws) {
        draw = 105 * random_.Bell();
        sum += draw;
      }
      const double excess = kCommonModeRejection * sum / count;
      for (int i = 0; i < count; ++i) {
        Store(model_, table.WeightOffset(i / table.inputs, i % table.inputs, column),
              Weight(draws[static_cast<size_t>(i)] - excess));
      }
    }
  }

  // The scale is fixed and the bias follows from the weights, so the weights alone place the
  // output: a shape per channel, drawn large and then shrunk until mean and deviation fit above or
  // below the zero point.
  void MakeDepthwise(const TableLayout& table) {
    for (int channel = 0; channel < table.outputs; ++channel) DrawDepthwiseShape(table, channel);
    const std::vector<Spread> spreads = Measure(table);
    const int zero_point = RequantisationOf(table.op).zero_point;
    for (int channel = 0; channel < table.outputs; ++channel) {
      const Spread spread = spreads[static_cast<size_t>(channel)];
      const double up = spread.mean + 2.2 * spread.deviation;
      const double down = 2.2 * spread.deviation - spread.mean;
      const double space_up = (127 - zero_point) / (up * table.fixed_scale);
      const double space_down = (128 + zero_point) / (down * table.fixed_scale);
      double gain = 1.27;  // the shapes' largest weight is 100
      if (up > 0) gain = std::min(gain, space_up);
      if (down > 0) gain = std::min(gain, space_down);
      ScaleColumn(table, channel, gain);
      int sum = 0;
      for (int tap = 0; tap < 3; ++tap) {
        sum += Load<int8_t>(model_, table.WeightOffset(tap, 0, channel));
      }
      Store<int32_t>(model_, table.BiasOffset(channel), 128 * sum);
      Store(model_, table.ScaleOffset(channel), table.fixed_scale);
    }
  }

  // A smoother, a negative smoother, a difference over time or a curvature, with a little chance.
  void DrawDepthwiseShape(const TableLayout& table, int channel) {
    constexpr int kShapes[6][3] = {{60, 90, 60}, {90, 60, 20},  {-50, -85, -50},
                                   {-85, 0, 85}, {80, 10, -80}, {-45, 85, -45}};
    const int* shape = kShapes[random_.Between(0, 5)];
    int sum = 0;
    for (int tap = 0; tap < 3; ++tap) {
      const int weight = shape[tap] + random_.Between(-10, 10);
      sum += weight;
      Store(model_, table.WeightOffset(tap, 0, channel), static_cast<int8_t>(weight));
    }
    Store<int32_t>(model_, table.BiasOffset(channel), 128 * sum);
  }

  void ScaleColumn(const TableLayout& table, int column, double gain) {
    for (int tap = 0; tap < table.taps; ++tap) {
      for (int input = 0; input < table.inputs; ++input) {
        const size_t offset = table.WeightOffset(tap, input, column);
        Store(model_, offset, Weight(gain * Load<int8_t>(model_, offset)));
      }
    }
  }

  // Puts -128 at 0.4 to 1.2 deviations below the mean and +127 at 2.8 above it: a rectified output
  // with a wide upper part.
  void SetScalesAndBiases(const TableLayout& table) {
    const std::vector<Spread> spreads = Measure(table);
    for (int column = 0; column < table.outputs; ++column) {
      const Spread spread = spreads[static_cast<size_t>(column)];
      const double below = random_.Uniform(0.4, 1.2);
      const double scale = 255 / ((below + 2.8) * spread.deviation);
      Store(model_, table.ScaleOffset(column), static_cast<float>(scale));
      Store<int32_t>(model_, table.BiasOffset(column),
                     Round(below * spread.deviation - spread.mean));
    }
  }

  // The factor is fixed: the weights' size makes the deviation, the bias the mean.
  void SetFixedPoint(const TableLayout& table) {
    const Requantisation requantisation = RequantisationOf(table.op);
    const double factor = static_cast<double>(requantisation.multiplier) /
                          static_cast<double>(int64_t{1} << (31 + requantisation.shift));
    const bool logits = &table == &kTables.back();
    std::vector<Spread> spreads = Measure(table);
    for (int column = 0; column < table.outputs; ++column) {
      const double deviation = logits ? kLogitDeviation : 80;
      ScaleColumn(table, column,
                  deviation / (factor * spreads[static_cast<size_t>(column)].deviation));
    }
    spreads = Measure(table);
    for (int column = 0; column < table.outputs; ++column) {
      const Spread spread = spreads[static_cast<size_t>(column)];
      const double above_zero_point =
          logits ? random_.Uniform(-6, 2) : random_.Uniform(0.4, 1.2) * spread.deviation * factor;
      Store<int32_t>(model_, table.BiasOffset(column),
                     Round(above_zero_point / factor - spread.mean));
    }
  }

  static constexpr double kCommonModeRejection = 0.8;
  // In steps of 0.256: within 21 of them the scores leave 0 and 1.
  static constexpr double kLogitDeviation = 12;

  base::NumberGenerator random_;
  PackedModel model_;
  std::vector<Tensor> tensors_;  // of every calibration window: the next operator's input
};

}  // namespace

PackedModel MakeSyntheticModel(uint64_t seed) { return SyntheticModelMaker(seed).Make(); }

}  // namespace qz::model
