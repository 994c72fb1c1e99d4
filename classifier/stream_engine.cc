// SPDX-License-Identifier: Apache-2.0
#include "classifier/network_engine.h"
#include "detector/window.h"
#include "network/stream_backend.h"

namespace tarn::contexthub::sound {

bool TakeFrame(const uint16_t* features) {
  int8_t frame[qz::config::kFeatureChannels];
  qz::detector::MakeNetworkInput(features, frame);
  return stream_backend_push(frame);
}

const float* NetworkScores() { return stream_backend_output_ptr; }

}  // namespace tarn::contexthub::sound
