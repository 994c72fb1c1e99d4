// SPDX-License-Identifier: Apache-2.0
// The network in the device's own arithmetic, bit for bit: all values are integers, held in floats
// that are exact below 2^24, so that the same matrix products serve training and the equivalence
// check.
//
// Training: the forward pass rounds as the device does; the backward pass treats rounding as the
// identity, and clamping as what it is.
#pragma once

#include <array>
#include <cstdint>

#include "model/packing.h"
#include "train/float_network.h"

namespace qz::train {

// Integers of the device for folded parameters.
struct QuantisedParameters {
  Values integers;                             // weights and biases, at their offsets
  std::array<RowVector, kLayers> scale;        // output steps an accumulator step: what is packed
  std::array<RowVector, kLayers> weight_step;  // real weight = step x integer, an output each

  explicit QuantisedParameters(const Values& folded);
};

// For model::Pack.
model::ModelArrays ArraysOf(const QuantisedParameters& parameters);
// The inverse, but for the steps, which no device knows: they stay at 1. Throws std::runtime_error
// where a bias lies beyond what keeps sums exact; what the trainer makes never does.
QuantisedParameters ParametersOf(const model::ModelArrays& arrays);

class QuantisedNetwork {
 public:
  // Features into the logits: the last layer's output less its zero point, in steps of
  // kLogitScale.
  const Batch& Forward(const QuantisedParameters& parameters, const Batch& features);
  // `dlogits`: the loss's gradient by the real logits. Adds that by the real weights and biases to
  // *gradient.
  void Backward(const QuantisedParameters& parameters, const Batch& dlogits, Values* gradient);

  // The tensor that an operator with a table or a pool wrote, less its zero point.
  const Batch& OutputOf(int op) const;
  // What the device adds to it.
  static int ZeroPointOf(int op);

 private:
  std::array<LayerTrace, kLayers> traces_;
};

}  // namespace qz::train
