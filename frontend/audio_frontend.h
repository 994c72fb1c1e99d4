// Audio front end: turns a frame of 25 ms (400 samples at 16 kHz) into 48 log mel-filterbank
// features with running noise suppression. One static instance, single-threaded, no allocation, no
// failure.
#pragma once

#include <cstddef>
#include <cstdint>

namespace qz::frontend {

constexpr size_t kFrameSamples = 400;
constexpr size_t kFeatureChannels = 48;

}  // namespace qz::frontend

extern "C" {

// 400 samples of the frame in time order, full scale +-32768. The caller writes all of them before
// every run: a run overwrites them.
extern int16_t* const audio_frontend_input_ptr;

// 48 features, channel 0 lowest in frequency, valid until the next run. A feature is 0 or about
// 16 ln(8 a), where a is the channel's amplitude after noise suppression: 33 to 299.
extern const uint16_t* const audio_frontend_output_ptr;

// One frame from input to output. Moves the noise estimate of every channel by 655/16384 of its
// distance from the frame's amplitude.
void audio_frontend_invoke(void);

// Forgets the noise: all estimates become 0, as they are at load.
void audio_frontend_reset(void);

}  // extern "C"
