// SPDX-License-Identifier: Apache-2.0
// Constant tables of the audio front end, generated from their rules by
// make_audio_frontend_tables.py. They are named by the step of the graph that reads them.
#pragma once

#include <cstddef>
#include <cstdint>

namespace qz::frontend {

// Hann window over the frame, Q12 (4096 = 1.0), sampled at half-sample offsets: symmetric.
extern const int16_t w1[400];

// Complex values as (real, imaginary), Q15 with 32767 for 1.0.
struct FftTwiddles {
  int16_t fft[256][2];    // entry k: e^(-2 pi j k / 256)
  int16_t split[128][2];  // entry k - 1: -j e^(-j pi k / 256)
};
extern const FftTwiddles w3;
static_assert(sizeof(FftTwiddles) == 1536, "the two tables follow each other without a gap");

// Triangular filters of 48 channels, equally wide in mel(f) = 1127 ln(1 + f / 700 Hz) from 100 Hz
// to 7500 Hz, over bins 4 to 240 of 31.25 Hz each. The bins fall into 49 segments: channel c rises
// over segment c (weights w1) and falls over segment c + 1 (weights w0).
struct Filterbank {
  uint16_t weights[237][2];  // (w0, w1) of bins 4 to 240, Q12
  uint8_t widths[49];        // number of bins of each segment
};
extern const Filterbank w5;
static_assert(offsetof(Filterbank, widths) == 948, "the widths follow the weights without a gap");

}  // namespace qz::frontend
