// SPDX-License-Identifier: Apache-2.0
// The one static instance of the audio front end (frontend/frontend.h), as the module uses it.
// Single-threaded.
#pragma once

#include <cstdint>

#include "frontend/frontend.h"

extern "C" {

// The frame and its features, as frontend.h describes them.
extern int16_t* const audio_frontend_input_ptr;
extern const uint16_t* const audio_frontend_output_ptr;

// One frame from input to output.
void audio_frontend_invoke(void);

// Sets all noise estimates to 0, as they are at load.
void audio_frontend_reset(void);

}  // extern "C"
