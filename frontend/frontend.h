// The audio front end: turns a frame of 25 ms (400 samples at 16 kHz) into 48 log mel-filterbank
// features with running noise suppression. A pure function over memory that the caller owns: any
// number of streams, each with noise estimates and an arena of its own, on any threads. No
// allocation, no failure.
#pragma once

#include <cstddef>
#include <cstdint>

#include "config/detector.h"

namespace qz::frontend {

using config::kFeatureChannels;
using config::kFrameSamples;

// The memory of a run. Nothing in it carries over to the next.
constexpr size_t kArenaBytes = 2896;
constexpr size_t kArenaAlignment = 16;
// The frame: 400 int16 in time order, full scale +-32768. The caller writes all of them before
// every run: a run overwrites them.
constexpr size_t kInputOffset = 1856;
// 48 uint16 features, the lowest frequency first, valid until the next run. A feature is 0 or about
// 16 ln(8 a), where a is the channel's amplitude after noise suppression: 33 to 299.
constexpr size_t kOutputOffset = 400;

// One frame from input to output. `noise` are the noise estimates of the 48 channels, in the unit
// of the amplitudes, zero at the start of a stream; each moves by 655/16384 of its distance from
// the frame's amplitude. `arena` has kArenaBytes, aligned to kArenaAlignment.
void Run(unsigned char* arena, uint32_t* noise);

}  // namespace qz::frontend
