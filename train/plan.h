// SPDX-License-Identifier: Apache-2.0
// The network as the trainer sees it: the description's operators with weights, in their order, and
// the real units that the fixed factors of the device's arithmetic leave.
//
// A real value is scale x integer, where the integer is the device's int8 less its zero point. The
// features count in steps of 1/64; rectified tensors range from 0 to 6. The fixed scale of the
// depthwise layers, and the fixed factors of the fully connected ones, then tie the scale of the
// output to that of the weights: out = in x weight / factor.
#pragma once

#include <array>
#include <cstddef>

#include "model/weight_layout.h"

namespace qz::train {

constexpr double kFeatureScale = 1.0 / 64;
constexpr double kRectifiedScale = 6.0 / 255;
// Of the last layer's output, as the logistic function reads it.
constexpr double kLogitScale = config::kLogisticOperator.scale;

constexpr size_t kLayers = config::kTableCount;
// Layers whose inputs are dropped at random in training: the last ones, which see most of a window.
constexpr size_t kLayersWithDropout = 4;

struct LayerPlan {
  size_t table = 0;         // index in config::kTables
  bool pooled = false;      // a max pool follows
  bool normalised = false;  // trained with batch normalisation, which is folded into the weights
  bool dropout = false;
  double in_scale = 0;
  double out_scale = 0;
  double weight_scale = 0;  // of its weights; 0: a scale per output, set by the largest weight

  constexpr const config::TableLayout& layout() const { return config::kTables[table]; }
  constexpr size_t op() const { return static_cast<size_t>(layout().op); }
  constexpr const config::Operator& Description() const { return config::kOperators[op()]; }
  constexpr bool depthwise() const { return layout().IsDepthwise(); }
  constexpr bool fixed_point() const { return !layout().HasScales(); }
  constexpr int taps() const { return layout().taps; }
  constexpr int weight_rows() const { return layout().taps * layout().inputs; }
  constexpr int outputs() const { return layout().outputs; }
  constexpr int zero_point() const { return Description().zero_point; }  // of the output
  // What the output, less its zero point, is clamped to.
  constexpr int min() const { return -128 - zero_point(); }
  constexpr int max() const { return 127 - zero_point(); }
  // Output steps an accumulator step, of fixed-point layers.
  constexpr double Factor() const {
    return Description().multiplier / static_cast<double>(int64_t{1} << (31 + Description().shift));
  }
};

constexpr LayerPlan MakeLayer(size_t index, double in_scale) {
  constexpr double kUnit = 1.0 / 127;  // weights from -1 to 1
  LayerPlan layer;
  layer.table = index;
  layer.pooled = config::kOperators[layer.op() + 1].kind == config::OperatorKind::kMaxPool;
  layer.normalised = !layer.depthwise() && !layer.fixed_point();
  layer.dropout = index + kLayersWithDropout >= kLayers;
  layer.in_scale = in_scale;
  layer.out_scale = kRectifiedScale;
  if (layer.depthwise()) {
    layer.weight_scale = kUnit;
    layer.out_scale = in_scale * kUnit / layer.Description().scale;
  } else if (layer.fixed_point() && index + 1 < kLayers) {
    layer.weight_scale = kUnit;
    layer.out_scale = in_scale * kUnit / layer.Factor();
  } else if (layer.fixed_point()) {
    layer.out_scale = kLogitScale;
    layer.weight_scale = kLogitScale * layer.Factor() / in_scale;
  }
  return layer;
}

constexpr std::array<LayerPlan, kLayers> MakePlan() {
  std::array<LayerPlan, kLayers> plan{};
  double scale = kFeatureScale;
  for (size_t i = 0; i < kLayers; ++i) {
    plan[i] = MakeLayer(i, scale);
    scale = plan[i].out_scale;
  }
  return plan;
}

constexpr std::array<LayerPlan, kLayers> kPlan = MakePlan();

}  // namespace qz::train
