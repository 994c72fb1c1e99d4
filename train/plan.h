// The network as the trainer sees it: layers with weights, in their order, and the real units that
// the fixed factors of the device's arithmetic leave.
//
// A real value is scale x integer, where the integer is the device's int8 less its zero point. The
// features count in steps of 1/64; rectified tensors reach from 0 to 6. The fixed scale of the
// depthwise layers, and the fixed factors of the two fully connected ones, then tie the scale of
// the output to that of the weights: out = in x weight / factor.
#pragma once

#include <array>
#include <cstddef>

#include "model/weight_layout.h"

namespace qz::train {

constexpr double kFeatureScale = 1.0 / 64;
constexpr double kRectifiedScale = 6.0 / 255;
constexpr double kLogitScale = 0.256;                     // of operator 18, as operator 19 reads it
constexpr double kFactor17 = 1427340160.0 / (1LL << 36);  // multiplier / 2^(31 + shift)
constexpr double kFactor18 = 1234879616.0 / (1LL << 39);

struct LayerPlan {
  int table;            // its place in model::kTables
  bool pooled;          // a max pool follows
  bool normalised;      // trained with batch normalisation, which is folded into the weights
  bool dropout;         // in training some of its inputs are put out
  double in_scale;      // of its input
  double out_scale;     // of its output
  double weight_scale;  // of its weights; 0: a scale per output, set by the largest weight
  int zero_point;       // of its output

  constexpr const model::TableLayout& layout() const {
    return model::kTables[static_cast<size_t>(table)];
  }
  constexpr bool depthwise() const { return layout().IsDepthwise(); }
  constexpr int taps() const { return layout().taps; }
  constexpr int weight_rows() const { return layout().taps * layout().inputs; }
  constexpr int outputs() const { return layout().outputs; }
  // What the output, less its zero point, is clamped to.
  constexpr int min() const { return -128 - zero_point; }
  constexpr int max() const { return 127 - zero_point; }
};

constexpr size_t kLayers = model::kTableCount;

constexpr std::array<LayerPlan, kLayers> MakePlan() {
  constexpr double kUnit = 1.0 / 127;  // weights from -1 to 1
  constexpr double kOut0 = kFeatureScale * kUnit / 0.0076417988;
  constexpr double kOut3 = kRectifiedScale * kUnit / 0.0058224415;
  constexpr double kOut17 = kRectifiedScale * kUnit / kFactor17;
  constexpr double kIn = kRectifiedScale;
  return {{{0, false, false, false, kFeatureScale, kOut0, kUnit, 15},
           {1, true, true, false, kOut0, kIn, 0, -128},
           {2, false, false, false, kIn, kOut3, kUnit, 36},
           {3, true, true, false, kOut3, kIn, 0, -128},
           {4, true, true, false, kIn, kIn, 0, -128},
           {5, true, true, false, kIn, kIn, 0, -128},
           {6, true, true, false, kIn, kIn, 0, -128},
           {7, false, true, false, kIn, kIn, 0, -128},
           {8, true, true, true, kIn, kIn, 0, -128},
           {9, false, true, true, kIn, kIn, 0, -128},
           {10, false, false, true, kIn, kOut17, kUnit, -128},
           {11, false, false, true, kOut17, kLogitScale, kLogitScale * kFactor18 / kOut17, 82}}};
}

constexpr std::array<LayerPlan, kLayers> kPlan = MakePlan();

}  // namespace qz::train
