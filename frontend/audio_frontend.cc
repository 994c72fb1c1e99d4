#include "frontend/audio_frontend.h"

#include <cstring>

#include "frontend/frontend.h"

namespace {

alignas(qz::frontend::kArenaAlignment) unsigned char arena[qz::frontend::kArenaBytes];
uint32_t state[qz::frontend::kFeatureChannels];
uint8_t state_initialized;

}  // namespace

int16_t* const audio_frontend_input_ptr =
    reinterpret_cast<int16_t*>(arena + qz::frontend::kInputOffset);
const uint16_t* const audio_frontend_output_ptr =
    reinterpret_cast<const uint16_t*>(arena + qz::frontend::kOutputOffset);

void audio_frontend_reset(void) { std::memset(state, 0, sizeof(state)); }

void audio_frontend_invoke(void) {
  if (!state_initialized) {
    audio_frontend_reset();
    state_initialized = 1;
  }
  qz::frontend::Run(arena, state);
}
