// SPDX-License-Identifier: Apache-2.0
// The real FFT of the audio front end.
#pragma once

#include <cstddef>
#include <cstdint>

namespace qz::frontend {

constexpr size_t kFftEntries = 256;  // complex; twice as many real samples

// Spectrum of a frame that is padded with zeros to 512 samples: bins 0 to 256 as (real, imaginary),
// scaled by about 1/512. spectrum holds kFftEntries + 1 complex values.
void RealFft(const int16_t* frame, int16_t* spectrum);

}  // namespace qz::frontend
