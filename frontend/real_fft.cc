// SPDX-License-Identifier: Apache-2.0
#include "frontend/real_fft.h"

#include "frontend/audio_frontend.h"
#include "frontend/audio_frontend_tables.h"
#include "kernels/signal/signal_kernels.h"

namespace qz::frontend {
namespace {

constexpr size_t kComplexBytes = 2 * sizeof(int16_t);

}  // namespace

void RealFft(const int16_t* frame, int16_t* spectrum) {
  orra_cs16_digitreverse_ukernel__neon_x16(kFrameSamples / 2, frame, spectrum);
  orra_cs16_bfly4_samples1_ukernel__asm_aarch32_neon_x4(kFftEntries / 4, 0, spectrum, nullptr, 0);
  orra_cs16_bfly4_samples4_ukernel__neon(kFftEntries / 16, 4 * kComplexBytes, spectrum, nullptr, 0);
  orra_cs16_bfly4_ukernel__neon_x4(4, 16 * kComplexBytes, spectrum, w3.fft[0], 4 * kComplexBytes);
  orra_cs16_bfly4_ukernel__neon_x4(1, 64 * kComplexBytes, spectrum, w3.fft[0], kComplexBytes);
  orra_cs16_fftr_ukernel__asm_aarch32_neon_x4(kFftEntries, spectrum, w3.split[0]);
}

}  // namespace qz::frontend
