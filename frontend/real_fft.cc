#include "frontend/real_fft.h"

#include <cstring>

#include "frontend/audio_frontend.h"
#include "frontend/audio_frontend_tables.h"
#include "kernels/signal/signal_kernels.h"

namespace qz::frontend {
namespace {

constexpr size_t kComplexBytes = 2 * sizeof(int16_t);

// Four complex values side by side, moved as they lie in memory.
using Four = uint32_t __attribute__((vector_size(4 * kComplexBytes)));

Four Load(const int16_t* values) {
  Four four;
  std::memcpy(&four, values, sizeof(four));
  return four;
}

void Store(int16_t* entries, Four four) { std::memcpy(entries, &four, sizeof(four)); }

// FFT entry i receives complex value r of the frame, the four base-4 digits of i in reverse order,
// and 0 where r lies past the frame's 200 values. The middle digits select the values; then
// the outer ones make a transposition of 4 x 4: r = 64 d + low + a goes to i = 64 a + middle + d.
void LoadDigitReversed(const int16_t* frame, int16_t* entries) {
  constexpr size_t kValues = kFrameSamples / 2;
  static_assert(kValues >= 192 && kValues % 4 == 0,
                "four values lie inside together or not at all");
  for (size_t low = 0; low < 64; low += 4) {
    const int16_t* from = frame + 2 * low;
    const Four d0 = Load(from);
    const Four d1 = Load(from + 2 * 64);
    const Four d2 = Load(from + 2 * 128);
    const Four d3 = 192 + low < kValues ? Load(from + 2 * 192) : Four{};
    const Four even_a01 = __builtin_shufflevector(d0, d2, 0, 4, 1, 5);
    const Four even_a23 = __builtin_shufflevector(d0, d2, 2, 6, 3, 7);
    const Four odd_a01 = __builtin_shufflevector(d1, d3, 0, 4, 1, 5);
    const Four odd_a23 = __builtin_shufflevector(d1, d3, 2, 6, 3, 7);
    const size_t middle = 16 * (low / 4 % 4) + 4 * (low / 16);
    int16_t* to = entries + 2 * middle;
    Store(to, __builtin_shufflevector(even_a01, odd_a01, 0, 4, 1, 5));
    Store(to + 2 * 64, __builtin_shufflevector(even_a01, odd_a01, 2, 6, 3, 7));
    Store(to + 2 * 128, __builtin_shufflevector(even_a23, odd_a23, 0, 4, 1, 5));
    Store(to + 2 * 192, __builtin_shufflevector(even_a23, odd_a23, 2, 6, 3, 7));
  }
}

}  // namespace

void RealFft(const int16_t* frame, int16_t* spectrum) {
  LoadDigitReversed(frame, spectrum);
  orra_cs16_bfly4_samples1_ukernel__asm_aarch32_neon_x4(kFftEntries / 4, 0, spectrum, nullptr, 0);
  orra_cs16_bfly4_samples4_ukernel__neon(kFftEntries / 16, 4 * kComplexBytes, spectrum, nullptr, 0);
  orra_cs16_bfly4_ukernel__neon_x4(4, 16 * kComplexBytes, spectrum, w3.fft[0], 4 * kComplexBytes);
  orra_cs16_bfly4_ukernel__neon_x4(1, 64 * kComplexBytes, spectrum, w3.fft[0], kComplexBytes);
  orra_cs16_fftr_ukernel__asm_aarch32_neon_x4(kFftEntries, spectrum, w3.split[0]);
}

}  // namespace qz::frontend
