// SPDX-License-Identifier: Apache-2.0
// One frame of the audio front end, from samples to features.

#include <benchmark/benchmark.h>

#include <array>
#include <cstring>
#include <random>

#include "frontend/audio_frontend.h"

namespace {

void FrontEndFrame(benchmark::State& state) {
  using qz::frontend::kFrameSamples;
  std::array<int16_t, kFrameSamples> frame;
  std::mt19937 random;
  for (int16_t& sample : frame) sample = static_cast<int16_t>(random());
  for (auto _ : state) {
    std::memcpy(audio_frontend_input_ptr, frame.data(), sizeof(frame));
    audio_frontend_invoke();
    benchmark::ClobberMemory();
  }
}
BENCHMARK(FrontEndFrame);

}  // namespace
