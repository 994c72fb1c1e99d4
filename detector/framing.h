// SPDX-License-Identifier: Apache-2.0
// Frames out of samples.
#pragma once

#include <cstddef>
#include <cstdint>
#include <cstring>

#include "config/detector.h"

namespace qz::detector {

// A precondition: checked in every build but the device's.
inline void Require([[maybe_unused]] bool holds) {
#ifndef QZ_WITHOUT_CHECKS
  if (!holds) __builtin_trap();
#endif
}

// The frames that `samples` fill.
constexpr size_t FramesOf(size_t samples) {
  if (samples < config::kFrameSamples) return 0;
  return 1 + (samples - config::kFrameSamples) / config::kHopSamples;
}

// The samples that fill `frames`, at least 1.
constexpr size_t SamplesOf(size_t frames) {
  return config::kFrameSamples + (frames - 1) * config::kHopSamples;
}

// A sample times the gain, saturated. Compared before it is multiplied, so that 16 bits do for all
// of it.
constexpr int16_t Amplified(int16_t sample) {
  if (sample < INT16_MIN / config::kGain) return INT16_MIN;
  if (sample > INT16_MAX / config::kGain) return INT16_MAX;
  return static_cast<int16_t>(sample * config::kGain);
}

// Appends amplified samples to `frame`, which holds the first `*held` of its kFrameSamples, and
// calls on_frame() whenever it is full; its newest samples then begin the next.
template <typename SampleCount, typename OnFrame>
void PushSamples(const int16_t* samples, size_t count, int16_t* frame, SampleCount* held,
                 OnFrame&& on_frame) {
  Require(*held < config::kFrameSamples && (samples != nullptr || count == 0));
  const int16_t* const end = samples + count;
  while (samples != end) {
    const size_t space = config::kFrameSamples - *held;
    const auto left = static_cast<size_t>(end - samples);
    const size_t taken = left < space ? left : space;
    int16_t* const appended = frame + *held;
    for (size_t i = 0; i < taken; ++i) appended[i] = Amplified(samples[i]);
    samples += taken;
    *held = static_cast<SampleCount>(*held + taken);
    if (*held < config::kFrameSamples) return;
    on_frame();
    std::memmove(frame, frame + config::kHopSamples, config::kCarriedSamples * sizeof(int16_t));
    *held = config::kCarriedSamples;
  }
}

}  // namespace qz::detector
