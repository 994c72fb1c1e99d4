// SPDX-License-Identifier: Apache-2.0
// The packed tables that a run of the network reads.
#pragma once

#include <array>
#include <cstdint>

#include "config/weight_tables.h"

namespace qz::network {

// In the order of config::kTables. The tables stay the owner's.
struct Weights {
  std::array<const void*, config::kTableCount> tables{};
};

// The tables of a packed model of config::kModelBytes, which stays where it is. What the checker of
// models passes keeps the network within the contracts of its kernels.
constexpr Weights WeightsOf(const uint8_t* packed) {
  Weights weights;
  for (size_t i = 0; i < config::kTableCount; ++i) {
    weights.tables[i] = packed + config::kTables[i].offset;
  }
  return weights;
}

// Those that were built in.
extern const Weights module_weights;

}  // namespace qz::network
