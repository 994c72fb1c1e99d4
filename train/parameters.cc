// SPDX-License-Identifier: Apache-2.0
#include "train/parameters.h"

#include <cmath>

#include "base/number_generator.h"
#include "train/layers.h"

namespace qz::train {
namespace {

// A depthwise channel passes its middle step on, with a little of its neighbours.
void DrawDepthwise(MatrixView w, base::NumberGenerator* random) {
  for (Eigen::Index t = 0; t < w.rows(); ++t) {
    for (Eigen::Index c = 0; c < w.cols(); ++c) {
      w(t, c) = static_cast<float>((t == 1 ? 0.5 : 0.0) + 0.3 * random->Bell());
    }
  }
}

// Deviation sqrt(2 / inputs) keeps the spread of rectified values from layer to layer.
void DrawDense(MatrixView w, double gain, base::NumberGenerator* random) {
  const double deviation = gain * std::sqrt(2.0 / static_cast<double>(w.rows()));
  for (Eigen::Index i = 0; i < w.size(); ++i) {
    w.data()[i] = static_cast<float>(3 * deviation * random->Bell());
  }
}

}  // namespace

Values InitialParameters(uint64_t seed) {
  base::NumberGenerator random(seed);
  Values values(kParameters.all);
  for (size_t i = 0; i < kLayers; ++i) {
    const LayerOffsets& location = kParameters.layers[i];
    if (kPlan[i].depthwise()) {
      DrawDepthwise(WeightOf(values, i), &random);
    } else {
      DrawDense(WeightOf(values, i), kPlan[i].normalised ? 1 : 0.5, &random);
    }
    if (!kPlan[i].normalised) continue;
    RowAt(values, i, location.gamma).setOnes();
    RowAt(values, i, location.variance).setOnes();
  }
  return values;
}

void FoldNormalisations(Values* values) {
  for (size_t i = 0; i < kLayers; ++i) {
    if (!kPlan[i].normalised) continue;
    const LayerOffsets& location = kParameters.layers[i];
    const RowVector scale =
        RowAt(*values, i, location.gamma).array() *
        (RowAt(*values, i, location.variance).array() + kNormalisationFloor).sqrt().inverse();
    WeightOf(*values, i).array().rowwise() *= scale.array();
    RowAt(*values, i, location.bias) -= RowAt(*values, i, location.mean).cwiseProduct(scale);
  }
}

void ClampWeights(Values* values) {
  for (size_t i = 0; i < kLayers; ++i) {
    if (kPlan[i].weight_scale == 0) continue;
    const float max = static_cast<float>(127 * kPlan[i].weight_scale);
    MatrixView w = WeightOf(*values, i);
    w = w.cwiseMin(max).cwiseMax(-max);
  }
}

}  // namespace qz::train
