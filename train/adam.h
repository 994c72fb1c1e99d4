// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>

#include "train/parameters.h"

namespace qz::train {

// Adam with decoupled weight decay, over the trained numbers.
struct Adam {
  Values mean = Values(kParameters.trained);
  Values square = Values(kParameters.trained);
  uint64_t steps = 0;

  // Weights decay by rate x decay; biases and normalisations do not.
  void Step(const Values& gradient, float rate, float decay, Values* values);
};

}  // namespace qz::train
