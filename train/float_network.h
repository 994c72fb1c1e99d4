// SPDX-License-Identifier: Apache-2.0
// The network over float, in real units: what training begins with.
#pragma once

#include <array>
#include <cstdint>

#include "train/layers.h"
#include "train/parameters.h"

namespace qz::train {

// What a layer keeps of a forward pass for the backward pass.
struct LayerTrace {
  Batch in;       // after dropout
  Batch out;      // clamped, before the pool
  Batch pooled;   // of pooled layers
  Batch dropout;  // what the input was multiplied with; empty where nothing was dropped
  Normalisation normalisation;

  const Batch& Result(const LayerPlan& plan) const { return plan.pooled ? pooled : out; }
};

// What is done in training only.
struct TrainingNoise {
  float dropout = 0;  // share of the inputs of the plan's layers that are set to 0
  uint64_t seed = 0;  // of their choice
};

class FloatNetwork {
 public:
  // Features (0 to 255, sequences of FramesFor(windows)) into logits, one for each window. With
  // `noise` normalises by the batch, else the parameters must be folded.
  const Batch& Forward(const Values& parameters, const Batch& features, const TrainingNoise* noise);
  // After Forward with the same parameters: adds the gradient of the loss to *gradient, of
  // kParameters.trained numbers.
  void Backward(const Values& parameters, const Batch& dlogits, Values* gradient);
  // Moves the running numbers of *values to the last batch's by `rate`.
  void MoveRunning(float rate, Values* values) const;

 private:
  std::array<LayerTrace, kLayers> traces_;
  bool normalised_ = false;
};

// Clears the gradient where the output is at a limit.
void MaskClamped(const Batch& out, float min, float max, Batch* gradient);

}  // namespace qz::train
