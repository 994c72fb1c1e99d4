// A max pool that is wrong in one channel of operator 7 alone, and for large values only. Says
// where it first was.

#include <cstdio>

#include "quantised_kernels.h"

extern "C" {

decltype(orra_s8_maxpool_minmax_ukernel_2p2x__neon_c16)
    __real_orra_s8_maxpool_minmax_ukernel_2p2x__neon_c16,
    __wrap_orra_s8_maxpool_minmax_ukernel_2p2x__neon_c16;

void __wrap_orra_s8_maxpool_minmax_ukernel_2p2x__neon_c16(size_t positions, size_t pool_size,
                                                          size_t channels,
                                                          const int8_t* const* in_ptrs,
                                                          size_t in_offset, int8_t* out,
                                                          size_t in_ptrs_gap, size_t out_gap,
                                                          const orra_s8_clamp_params* params) {
  __real_orra_s8_maxpool_minmax_ukernel_2p2x__neon_c16(
      positions, pool_size, channels, in_ptrs, in_offset, out, in_ptrs_gap, out_gap, params);
  constexpr size_t kPositionsOfOperator7 = 46;
  constexpr size_t kFaultyChannel = 17;
  constexpr int8_t kLarge = -100;
  static int run = -1;
  static bool said = false;
  if (positions != kPositionsOfOperator7) return;
  ++run;
  for (size_t row = 0; row < positions; ++row) {
    int8_t& value = out[row * channels + kFaultyChannel];
    if (value < kLarge) continue;
    if (!said) {
      std::fprintf(stderr, "network run %d, operator 7, row %zu, channel 17\n", run, row);
    }
    said = true;
    --value;
  }
}
}
