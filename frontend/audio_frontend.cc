// SPDX-License-Identifier: Apache-2.0
#include "frontend/audio_frontend.h"

#include <cstring>

namespace {

qz::frontend::Arena arena;
qz::frontend::State state;
uint8_t state_initialized;

}  // namespace

// Written out here: what InputOf() and FeaturesOf() give would be computed by code at load.
int16_t* const audio_frontend_input_ptr =
    reinterpret_cast<int16_t*>(arena.bytes + qz::frontend::kInputOffset);
const uint16_t* const audio_frontend_output_ptr =
    reinterpret_cast<const uint16_t*>(arena.bytes + qz::frontend::kOutputOffset);

void audio_frontend_reset(void) { std::memset(&state, 0, sizeof(state)); }

void audio_frontend_invoke(void) {
  if (!state_initialized) {
    audio_frontend_reset();
    state_initialized = 1;
  }
  qz::frontend::Run(arena, state);
}
