// SPDX-License-Identifier: Apache-2.0
// Every quantised kernel with the network's shapes. One iteration is one call as the network makes
// it; the rate counts multiply-adds, or outputs where a kernel has none.

#include <benchmark/benchmark.h>

#include <cstdint>
#include <cstring>
#include <vector>

#include "kernels/quantised/quantised_kernels.h"
#include "tests/support/random.h"

namespace {

constexpr size_t kChannels = 60;
constexpr orra_fp32_requant_params kFp32Params{-128, -128, 127};
constexpr orra_rndnu_requant_params kRndnuParams{0, 1 << 30, -5, -128, -128, 127};

// Random rows, with room for read-ahead, and weights in blocks of `block_bytes` with scales at the
// end.
struct Operands {
  Operands(size_t in_bytes, size_t out_bytes, size_t blocks, size_t block_bytes, size_t scales)
      : in(qz::test::Random(1).Fill<int8_t>(in_bytes + 16, -128, 127)),
        out(out_bytes + 16),
        weights(qz::test::Random(2).Fill<int8_t>(blocks * block_bytes, -127, 127)) {
    for (size_t block = 1; block <= blocks; ++block) {
      for (size_t scale = 1; scale <= scales; ++scale) {
        const float value = 0.003f;
        std::memcpy(weights.data() + block * block_bytes - scale * sizeof value, &value,
                    sizeof value);
      }
    }
  }

  std::vector<const int8_t*> Rows(size_t count, size_t row_bytes) const {
    std::vector<const int8_t*> rows(count);
    for (size_t i = 0; i < count; ++i) rows[i] = in.data() + i * row_bytes;
    return rows;
  }

  std::vector<int8_t> in;
  std::vector<int8_t> out;
  std::vector<int8_t> weights;
};

void SetRate(benchmark::State& state, size_t per_call) {
  state.SetItemsProcessed(state.iterations() * static_cast<int64_t>(per_call));
}

void Gemm(benchmark::State& state) {
  const size_t k = static_cast<size_t>(state.range(0));
  Operands data(4 * k, 4 * kChannels, 8, 64 + 8 * k, 8);
  for (auto _ : state) {
    orra_qc8_gemm_minmax_fp32_ukernel_4x8__asm_aarch32_neonv8_mlal_lane_cortex_a35(
        4, kChannels, k, data.in.data(), k, data.weights.data(), data.out.data(), kChannels, 8,
        &kFp32Params);
    benchmark::ClobberMemory();
  }
  SetRate(state, 4 * kChannels * k);
}
BENCHMARK(Gemm)->ArgName("k")->Arg(48)->Arg(60);

void IndirectGemm(benchmark::State& state) {
  Operands data(6 * kChannels, 4 * kChannels, 8, 64 + 8 * 3 * kChannels, 8);
  std::vector<const int8_t*> rows;
  for (size_t entry = 0; entry < 12; ++entry) {
    rows.push_back(data.in.data() + (entry / 4 + entry % 4) * kChannels);
  }
  for (auto _ : state) {
    orra_qc8_igemm_minmax_fp32_ukernel_4x8__asm_aarch32_neonv8_mlal_lane_cortex_a35(
        4, kChannels, kChannels, rows.size() * sizeof rows[0], rows.data(), data.weights.data(),
        data.out.data(), kChannels, 8, 0, nullptr, &kFp32Params);
    benchmark::ClobberMemory();
  }
  SetRate(state, 4 * kChannels * 3 * kChannels);
}
BENCHMARK(IndirectGemm);

void FixedPointGemm(benchmark::State& state) {
  const size_t n = static_cast<size_t>(state.range(0));
  const size_t k = static_cast<size_t>(state.range(1));
  Operands data(k, n, (n + 7) / 8, 32 + 8 * k, 0);
  for (auto _ : state) {
    orra_qs8_gemm_minmax_rndnu_ukernel_1x8__asm_aarch32_neon_mlal_lane_cortex_a7(
        1, n, k, data.in.data(), k, data.weights.data(), data.out.data(), n, 8, &kRndnuParams);
    benchmark::ClobberMemory();
  }
  SetRate(state, n * k);
}
BENCHMARK(FixedPointGemm)->ArgNames({"n", "k"})->Args({64, 60})->Args({5, 64});

void Depthwise(benchmark::State& state) {
  const size_t channels = static_cast<size_t>(state.range(0));
  const size_t width = static_cast<size_t>(state.range(1));
  Operands data((width + 2) * channels, width * channels, (channels + 15) / 16, 176, 16);
  const std::vector<const int8_t*> rows = data.Rows(width + 2, channels);
  for (auto _ : state) {
    orra_qc8_dwconv_minmax_fp32_ukernel_3p16c__asm_aarch32_neonv8_mla8_cortex_a35(
        channels, width, rows.data(), data.weights.data(), data.out.data(), sizeof rows[0], 0, 0,
        nullptr, &kFp32Params);
    benchmark::ClobberMemory();
  }
  SetRate(state, 3 * width * channels);
}
BENCHMARK(Depthwise)->ArgNames({"channels", "width"})->Args({48, 380})->Args({60, 188});

void MaxPool(benchmark::State& state) {
  const size_t positions = static_cast<size_t>(state.range(0));
  Operands data(2 * positions * kChannels, positions * kChannels, 0, 0, 0);
  const std::vector<const int8_t*> rows = data.Rows(2 * positions, kChannels);
  const orra_s8_clamp_params params{-128, 127};
  for (auto _ : state) {
    orra_s8_maxpool_minmax_ukernel_2p2x__neon_c16(positions, 2, kChannels, rows.data(), 0,
                                                  data.out.data(), 0, 0, &params);
    benchmark::ClobberMemory();
  }
  SetRate(state, positions * kChannels);
}
BENCHMARK(MaxPool)->ArgName("positions")->Arg(190)->Arg(94)->Arg(3);

void Conversion(benchmark::State& state) {
  const std::vector<int8_t> in(5 + 16, 1);
  float out[5];
  const orra_dequant_params params{{128, 128}, 1.0f / 256};
  for (auto _ : state) {
    orra_qs8_f32_vcvt_ukernel__neon_x32(5, in.data(), out, &params);
    benchmark::DoNotOptimize(out);
  }
  SetRate(state, 5);
}
BENCHMARK(Conversion);

void Lookup(benchmark::State& state) {
  const std::vector<uint8_t> table = qz::test::Random(3).Fill<uint8_t>(256, 0, 255);
  uint8_t bytes[5] = {1, 2, 3, 4, 5};
  for (auto _ : state) {
    orra_x8_lut_ukernel__scalar_x2(5, bytes, bytes, table.data());
    benchmark::DoNotOptimize(bytes);
  }
  SetRate(state, 5);
}
BENCHMARK(Lookup);

}  // namespace
