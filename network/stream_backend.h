// SPDX-License-Identifier: Apache-2.0
// The network over the module's one static stream and the weights that were built in: a shell with
// C linkage over network/stream_network.h. Not reentrant.
#pragma once

#include <cstdint>

#include "network/stream_network.h"

extern "C" {

// Takes the next frame, int8 [kFeatureChannels] of config/detector.h: features minus 128, saturated
// (zero point -128). True if the scores are new.
bool stream_backend_push(const int8_t* frame);

// Output: float [kClasses], the scores, each k / 256 with k from 0 to 255.
extern const float* const stream_backend_output_ptr;

}  // extern "C"

namespace qz::network {

// Zero when the module is loaded, and never reset.
extern Stream<kDeviceTileRows> module_stream;

}  // namespace qz::network
