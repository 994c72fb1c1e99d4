// SPDX-License-Identifier: Apache-2.0
#include <iterator>

#include "model_weights.h"
#include "network/weights.h"

namespace qz::network {
namespace {

constexpr Weights MakeWeights() {
  static_assert(std::size(embedded_tables) == config::kTableCount);
  Weights weights;
  for (size_t i = 0; i < config::kTableCount; ++i) weights.tables[i] = embedded_tables[i];
  return weights;
}

}  // namespace

constexpr Weights module_weights = MakeWeights();

}  // namespace qz::network
