// SPDX-License-Identifier: Apache-2.0
// Each signal kernel with the arguments of the audio front end.

#include <benchmark/benchmark.h>

#include <random>
#include <vector>

#include "frontend/audio_frontend_tables.h"
#include "kernels/signal/signal_kernels.h"

namespace {

using qz::frontend::w1;
using qz::frontend::w3;
using qz::frontend::w5;

// Reproducible values below `limit`, as a loud frame gives them.
template <typename T>
std::vector<T> Fill(size_t count, uint64_t limit) {
  static std::mt19937_64 random;
  std::vector<T> values(count);
  for (T& value : values) value = static_cast<T>(random() % limit);
  return values;
}

struct Buffers {
  std::vector<int16_t> samples = Fill<int16_t>(514, 16384);
  std::vector<int16_t> shorts = std::vector<int16_t>(514);
  std::vector<uint32_t> words = Fill<uint32_t>(237, 1 << 28);
  std::vector<uint32_t> powers = std::vector<uint32_t>(237);
  std::vector<uint64_t> energies = Fill<uint64_t>(48, uint64_t{1} << 47);
  std::vector<uint32_t> noise = std::vector<uint32_t>(48);
  std::vector<uint16_t> features = std::vector<uint16_t>(48);
};

template <typename Call>
void Run(benchmark::State& state, Call call) {
  Buffers buffers;
  for (auto _ : state) {
    call(buffers);
    benchmark::ClobberMemory();
  }
}

void Window(benchmark::State& state) {
  Run(state, [](Buffers& b) {
    orra_s16_window_shift12_ukernel__neon_x32(1, 800, b.samples.data(), w1, b.shorts.data(), 12);
  });
}
BENCHMARK(Window);

void Peak(benchmark::State& state) {
  Run(state, [](Buffers& b) {
    orra_s16_rmaxabs_ukernel__neon_x32(800, b.samples.data(), b.features.data());
  });
}
BENCHMARK(Peak);

void LeftShift(benchmark::State& state) {
  Run(state, [](Buffers& b) {
    orra_i16_vlshift_ukernel__neon_x32(400, b.samples.data(), b.shorts.data(), 1);
  });
}
BENCHMARK(LeftShift);

void Load(benchmark::State& state) {
  Run(state, [](Buffers& b) {
    orra_cs16_digitreverse_ukernel__neon_x16(256, b.samples.data(), b.shorts.data());
  });
}
BENCHMARK(Load);

// The in-place kernels run on their own results, which fade to zero: their time does not depend on
// the data.
void ButterfliesOfFirstStage(benchmark::State& state) {
  Run(state, [](Buffers& b) {
    orra_cs16_bfly4_samples1_ukernel__asm_aarch32_neon_x4(64, 0, b.samples.data(), nullptr, 0);
  });
}
BENCHMARK(ButterfliesOfFirstStage);

void ButterfliesOfSecondStage(benchmark::State& state) {
  Run(state, [](Buffers& b) {
    orra_cs16_bfly4_samples4_ukernel__neon(16, 16, b.samples.data(), nullptr, 0);
  });
}
BENCHMARK(ButterfliesOfSecondStage);

void ButterfliesOfThirdStage(benchmark::State& state) {
  Run(state,
      [](Buffers& b) { orra_cs16_bfly4_ukernel__neon_x4(4, 64, b.samples.data(), w3.fft[0], 16); });
}
BENCHMARK(ButterfliesOfThirdStage);

void ButterfliesOfFourthStage(benchmark::State& state) {
  Run(state,
      [](Buffers& b) { orra_cs16_bfly4_ukernel__neon_x4(1, 256, b.samples.data(), w3.fft[0], 4); });
}
BENCHMARK(ButterfliesOfFourthStage);

void RealSplit(benchmark::State& state) {
  Run(state, [](Buffers& b) {
    orra_cs16_fftr_ukernel__asm_aarch32_neon_x4(256, b.samples.data(), w3.split[0]);
  });
}
BENCHMARK(RealSplit);

void Power(benchmark::State& state) {
  Run(state, [](Buffers& b) {
    orra_cs16_vsquareabs_ukernel__neon_mlal_ld128_x8(948, b.samples.data(), b.powers.data());
  });
}
BENCHMARK(Power);

void Filterbank(benchmark::State& state) {
  Run(state, [](Buffers& b) {
    orra_u32_filterbank_accumulate_ukernel__asm_aarch32_neon_x2(48, b.words.data(), w5.widths,
                                                                w5.weights[0], b.energies.data());
  });
}
BENCHMARK(Filterbank);

void SquareRoot(benchmark::State& state) {
  Run(state, [](Buffers& b) {
    orra_u64_u32_vsqrtshift_ukernel__scalar_cvtu32_sqrt_cvtu32f64_x1(384, b.energies.data(),
                                                                     b.powers.data(), 1);
  });
}
BENCHMARK(SquareRoot);

void NoiseSubtraction(benchmark::State& state) {
  Run(state, [](Buffers& b) {
    orra_u32_filterbank_subtract_ukernel__scalar_x2(48, b.words.data(), 655, 655, 15729, 15729, 819,
                                                    0, 14, b.noise.data(), b.powers.data());
  });
}
BENCHMARK(NoiseSubtraction);

void Logarithm(benchmark::State& state) {
  Run(state, [](Buffers& b) {
    orra_u32_vlog_ukernel__scalar_x1(48, b.words.data(), 3, 16, b.features.data());
  });
}
BENCHMARK(Logarithm);

}  // namespace
