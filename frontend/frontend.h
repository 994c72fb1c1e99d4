// SPDX-License-Identifier: Apache-2.0
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

// The memory of a run; nothing in it carries over to the next.
struct alignas(16) Arena {
  unsigned char bytes[2896];
};
constexpr size_t kInputOffset = 1856;
constexpr size_t kOutputOffset = 400;

// What a stream remembers from frame to frame: the noise estimate of every channel, in the unit of
// the amplitudes. Zero at the start of a stream.
struct State {
  uint32_t noise[kFeatureChannels];
};

// Input: the frame's 400 samples in time order, full scale +-32768. The caller writes all of them
// before every run: a run overwrites them.
inline int16_t* InputOf(Arena& arena) {
  return reinterpret_cast<int16_t*>(arena.bytes + kInputOffset);
}

// Output: 48 features, the lowest frequency first, valid until the next run. A feature is 0 or
// about 16 ln(8 a), where a is the channel's amplitude after noise suppression: 33 to 299.
inline const uint16_t* FeaturesOf(const Arena& arena) {
  return reinterpret_cast<const uint16_t*>(arena.bytes + kOutputOffset);
}

// One frame from input to output. Moves the noise estimate of every channel by 655/16384 of its
// distance from the frame's amplitude.
void Run(Arena& arena, State& state);

}  // namespace qz::frontend
