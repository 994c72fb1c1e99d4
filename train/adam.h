#pragma once

#include <cstdint>

#include "parameters.h"

namespace qz::train {

// Adam with decoupled weight decay, over the learnt numbers.
struct Adam {
  Values mean = Values(kParameters.learnt);
  Values square = Values(kParameters.learnt);
  uint64_t steps = 0;

  // Weights decay by rate x decay; biases and normalisations do not.
  void Step(const Values& gradient, float rate, float decay, Values* values);
};

}  // namespace qz::train
