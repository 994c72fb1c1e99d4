// SPDX-License-Identifier: Apache-2.0
#include "frontend/frontend.h"

#include <new>

#include "frontend/audio_frontend_tables.h"
#include "frontend/real_fft.h"
#include "kernels/signal/signal_kernels.h"

namespace qz::frontend {
namespace {

static_assert(kFrameSamples == sizeof(w1) / sizeof(w1[0]), "the window's table is of a frame");
static_assert(kFeatureChannels + 1 == sizeof(w5.widths), "the filterbank has a channel a feature");

constexpr size_t kFirstBin = 4;
constexpr size_t kBins = 237;
constexpr size_t kComplexBytes = 2 * sizeof(int16_t);

// Offset of each intermediate result in the arena. A region is dead once its last reader has run,
// and later ones reuse its bytes.
//                                              bytes  holds
constexpr size_t kInput = kInputOffset;      //   800  input frame, int16
constexpr size_t kWindowed = 816;            //   800  windowed frame, int16
constexpr size_t kShift = 0;                 //     4  normalising shift, uint32
constexpr size_t kNormalised = 16;           //   800  normalised frame, int16
constexpr size_t kSpectrum = 1856;           //  1028  FFT buffer, 257 complex int16
constexpr size_t kPower = 832;               //   948  power of bins 4 to 240, uint32
constexpr size_t kEnergy = 1856;             //   384  channel energies, uint64
constexpr size_t kAmplitude = 16;            //   192  channel amplitudes, uint32
constexpr size_t kSuppressed = 208;          //   192  amplitudes after noise suppression, uint32
constexpr size_t kFeatures = kOutputOffset;  //    96  features, uint16

// The arena is raw storage whose bytes hold different types in turn. A region's array begins its
// life here, right before its only writer, and is reached through the returned pointer until its
// last reader has run, so that no byte is ever read as another type than was written. This costs no
// instruction.
template <typename T, size_t kCount>
T* Begin(Arena& arena, size_t offset) {
  // This form of new, of a reserved name, keeps no count before the elements.
  return ::new (arena.bytes + offset) T[kCount];  // NOLINT(clang-analyzer-cplusplus.PlacementNew)
}

// Left shift that brings a non-zero peak into 16384 to 32767, where it is not there or above
// already; 15 for silence.
uint32_t NormalisingShift(uint16_t peak) {
  const int leading_zeros = peak == 0 ? 32 : __builtin_clz(peak);
  return leading_zeros >= 17 ? static_cast<uint32_t>(leading_zeros - 17) : 0;
}

}  // namespace

void Run(Arena& arena, State& state) {
  constexpr size_t kFrameBytes = kFrameSamples * sizeof(int16_t);
  int16_t* windowed = Begin<int16_t, kFrameSamples>(arena, kWindowed);
  orra_s16_window_shift12_ukernel__neon_x32(1, kFrameBytes, InputOf(arena), w1, windowed, 12);

  uint16_t peak;
  orra_s16_rmaxabs_ukernel__neon_x32(kFrameBytes, windowed, &peak);
  uint32_t* shift = Begin<uint32_t, 1>(arena, kShift);
  *shift = NormalisingShift(peak);

  int16_t* normalised = Begin<int16_t, kFrameSamples>(arena, kNormalised);
  orra_i16_vlshift_ukernel__neon_x32(kFrameSamples, windowed, normalised, *shift);

  int16_t* spectrum = Begin<int16_t, 2 * (kFftEntries + 1)>(arena, kSpectrum);
  RealFft(normalised, spectrum);

  uint32_t* power = Begin<uint32_t, kBins>(arena, kPower);
  orra_cs16_vsquareabs_ukernel__neon_mlal_ld128_x8(kBins * kComplexBytes, spectrum + 2 * kFirstBin,
                                                   power);

  uint64_t* energy = Begin<uint64_t, kFeatureChannels>(arena, kEnergy);
  orra_u32_filterbank_accumulate_ukernel__asm_aarch32_neon_x2(kFeatureChannels, power, w5.widths,
                                                              w5.weights[0], energy);

  // The root of an energy carries the normalising shift once; the kernel takes it out again.
  uint32_t* amplitude = Begin<uint32_t, kFeatureChannels>(arena, kAmplitude);
  orra_u64_u32_vsqrtshift_ukernel__scalar_cvtu32_sqrt_cvtu32f64_x1(
      kFeatureChannels * sizeof(uint64_t), energy, amplitude, *shift);

  // Q14: the estimate follows with a weight of 0.04, and 0.05 of the amplitude always remains.
  constexpr uint32_t kSmoothing = 655;
  constexpr uint32_t kRetain = 16384 - kSmoothing;
  constexpr uint32_t kFloor = 819;
  uint32_t* suppressed = Begin<uint32_t, kFeatureChannels>(arena, kSuppressed);
  orra_u32_filterbank_subtract_ukernel__scalar_x2(kFeatureChannels, amplitude, kSmoothing,
                                                  kSmoothing, kRetain, kRetain, kFloor, 0, 14,
                                                  state.noise, suppressed);

  uint16_t* features = Begin<uint16_t, kFeatureChannels>(arena, kFeatures);
  orra_u32_vlog_ukernel__scalar_x1(kFeatureChannels, suppressed, 3, 16, features);
}

}  // namespace qz::frontend
