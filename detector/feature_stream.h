// SPDX-License-Identifier: Apache-2.0
// Features out of samples.
#pragma once

#include <cstddef>
#include <cstdint>
#include <cstring>

#include "detector/framing.h"
#include "frontend/frontend.h"

namespace qz::detector {

// A stream of sound, from a fresh start when it is value-initialised: no noise known yet.
struct FeatureStream {
  int16_t frame[config::kFrameSamples];
  size_t samples;  // held in `frame`
  frontend::State state;
  frontend::Arena arena;
};

// Calls on_features(const uint16_t*) with the 48 features of every frame that is full now.
template <typename OnFeatures>
void PushSamples(const int16_t* samples, size_t count, FeatureStream* stream,
                 OnFeatures&& on_features) {
  PushSamples(samples, count, stream->frame, &stream->samples, [&] {
    std::memcpy(frontend::InputOf(stream->arena), stream->frame, sizeof(stream->frame));
    frontend::Run(stream->arena, stream->state);
    on_features(frontend::FeaturesOf(stream->arena));
  });
}

}  // namespace qz::detector
