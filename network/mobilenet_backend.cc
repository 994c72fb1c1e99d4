// SPDX-License-Identifier: Apache-2.0
#include "network/mobilenet_backend.h"

#include "network/network.h"

// constexpr: complete when the module is loaded, with no code run for it.
constexpr int8_t* mobilenet_backend_input_ptr = qz::network::InputOf(qz::network::arena);
constexpr const float* mobilenet_backend_output_ptr = qz::network::ScoresOf(qz::network::arena);

void mobilenet_backend_invoke(void) {
  qz::network::Run(qz::network::arena, qz::network::module_weights);
}
