// SPDX-License-Identifier: Apache-2.0
// A synthetic model in place of a trained one: valid, and with scores that follow the features, but
// trained for nothing.
#pragma once

#include <cstdint>

#include "model/weight_layout.h"

namespace qz::model {

// A packed model that CheckWeights passes. Weights are random; scales and biases are set operator
// by operator from the accumulators over synthetic windows, so that every tensor uses a wide part
// of int8 on ordinary audio and all five scores move with it. The bytes depend on the seed alone,
// not on machine or compiler: integers, and double arithmetic of + - x / and square roots.
PackedModel MakeSyntheticModel(uint64_t seed);

}  // namespace qz::model
