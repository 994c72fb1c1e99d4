// SPDX-License-Identifier: Apache-2.0
// The network over the module's one static arena and the weights that were built in: a shell with C
// linkage over network/network.h. Not reentrant.
#pragma once

#include <cstdint>

extern "C" {

// Input: int8 [kWindowFrames][kFeatureChannels] of config/detector.h, feature frames 10 ms apart,
// oldest first; values are front-end features minus 128, saturated (zero point -128). A run
// overwrites it: write all of it before each.
extern int8_t* const mobilenet_backend_input_ptr;

// Output: float [kClasses], the scores, each k / 256 with k from 0 to 255. It begins where the
// input does.
extern const float* const mobilenet_backend_output_ptr;

void mobilenet_backend_invoke(void);

}  // extern "C"
