// SPDX-License-Identifier: Apache-2.0
#include "network/stream_backend.h"

namespace qz::network {

Stream<kDeviceTileRows> module_stream;

}  // namespace qz::network

const float* const stream_backend_output_ptr = qz::network::module_stream.scores;

bool stream_backend_push(const int8_t* frame) {
  return qz::network::Push(frame, qz::network::module_weights, &qz::network::module_stream);
}
