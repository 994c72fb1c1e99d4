// SPDX-License-Identifier: Apache-2.0
// All parameters of a network in one vector, so that steps, averages and files treat them alike,
// and views of a layer's share.
#pragma once

#include <array>
#include <vector>

#include "train/matrix.h"
#include "train/plan.h"

namespace qz::train {

// Aligned, since the order in which sums are taken follows from where a row begins.
using Values = std::vector<float, Eigen::aligned_allocator<float>>;

// Where a layer's numbers begin. `bias` holds the normalisation's beta where there is one, and
// nothing in depthwise layers, which have no bias.
struct LayerOffsets {
  size_t weight = 0;    // weight_rows x outputs
  size_t bias = 0;      // outputs
  size_t gamma = 0;     // outputs, of normalised layers, as are the next two
  size_t mean = 0;      // running
  size_t variance = 0;  // running
};

struct ParameterPlan {
  std::array<LayerOffsets, kLayers> layers;
  size_t trained = 0;  // numbers that gradients change; the running ones follow
  size_t all = 0;
};

constexpr ParameterPlan MakeParameterPlan() {
  ParameterPlan plan;
  size_t next = 0;
  for (size_t i = 0; i < kLayers; ++i) {
    const size_t outputs = static_cast<size_t>(kPlan[i].outputs());
    plan.layers[i].weight = next;
    next += static_cast<size_t>(kPlan[i].weight_rows()) * outputs;
    plan.layers[i].bias = next;
    if (!kPlan[i].depthwise()) next += outputs;
    plan.layers[i].gamma = next;
    if (kPlan[i].normalised) next += outputs;
  }
  plan.trained = next;
  for (size_t i = 0; i < kLayers; ++i) {
    if (!kPlan[i].normalised) continue;
    const size_t outputs = static_cast<size_t>(kPlan[i].outputs());
    plan.layers[i].mean = next;
    plan.layers[i].variance = next + outputs;
    next += 2 * outputs;
  }
  plan.all = next;
  return plan;
}

constexpr ParameterPlan kParameters = MakeParameterPlan();

// Views of a layer in a vector of kParameters.trained or .all numbers.
inline MatrixView WeightOf(Values& values, size_t layer) {
  return {values.data() + kParameters.layers[layer].weight, kPlan[layer].weight_rows(),
          kPlan[layer].outputs()};
}
inline ConstMatrixView WeightOf(const Values& values, size_t layer) {
  return {values.data() + kParameters.layers[layer].weight, kPlan[layer].weight_rows(),
          kPlan[layer].outputs()};
}
// `begin` is one of the layer's offsets: a row of its outputs.
inline MatrixView RowAt(Values& values, size_t layer, size_t begin) {
  return {values.data() + begin, 1, kPlan[layer].outputs()};
}
inline ConstMatrixView RowAt(const Values& values, size_t layer, size_t begin) {
  return {values.data() + begin, 1, kPlan[layer].outputs()};
}

// The numbers to begin with. Random, by the seed alone.
Values InitialParameters(uint64_t seed);

// Folds the normalisations into weights and biases: afterwards gamma and the running numbers are
// unused.
void FoldNormalisations(Values* values);

// Keeps weights of fixed scale within what int8 reaches.
void ClampWeights(Values* values);

}  // namespace qz::train
