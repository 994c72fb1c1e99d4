// SPDX-License-Identifier: Apache-2.0
#include <cstring>

#include "classifier/network_engine.h"
#include "detector/window.h"
#include "network/mobilenet_backend.h"

namespace tarn::contexthub::sound {
namespace {

// The network's window, oldest frame first.
uint32_t feature_count = 0;
int8_t inference_input_buffer[qz::detector::kWindowBytes];

}  // namespace

bool TakeFrame(const uint16_t* features) {
  return qz::detector::TakeFrame(features, inference_input_buffer, &feature_count, [] {
    memcpy(mobilenet_backend_input_ptr, inference_input_buffer, sizeof(inference_input_buffer));
    mobilenet_backend_invoke();
  });
}

const float* NetworkScores() { return mobilenet_backend_output_ptr; }

}  // namespace tarn::contexthub::sound
