// SPDX-License-Identifier: Apache-2.0
#include "network/mobilenet_backend.h"

#include <iterator>

#include "model_weights.h"
#include "network/network.h"

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

// constexpr: complete when the module is loaded, with no code run for it.
constexpr int8_t* mobilenet_backend_input_ptr = qz::network::InputOf(qz::network::arena);
constexpr const float* mobilenet_backend_output_ptr = qz::network::ScoresOf(qz::network::arena);

void mobilenet_backend_invoke(void) {
  qz::network::Run(qz::network::arena, qz::network::module_weights);
}
