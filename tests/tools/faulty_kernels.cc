// SPDX-License-Identifier: Apache-2.0
// Kernels with a few faults, if the environment's FAULTY_KERNEL names them: a
// logarithm for one input, and a max pool at one position of operator 7, from the third network run
// on, whatever the model. Each prints where its first fault was.

#include <cstdio>
#include <cstdlib>
#include <string_view>

#include "kernels/quantised/quantised_kernels.h"
#include "kernels/signal/signal_kernels.h"

namespace {

bool IsFaulty(std::string_view kernel) {
  const char* const chosen = std::getenv("FAULTY_KERNEL");
  return chosen != nullptr && chosen == kernel;
}

void SayOnce(const char* location, int call, size_t index, int good, int faulty) {
  static bool printed = false;
  if (printed) return;
  std::fprintf(stderr, location, call, index);
  std::fprintf(stderr, ": %d in good, %d in faulty\n", good, faulty);
  printed = true;
}

}  // namespace

extern "C" {

decltype(orra_u32_vlog_ukernel__scalar_x1) __real_orra_u32_vlog_ukernel__scalar_x1,
    __wrap_orra_u32_vlog_ukernel__scalar_x1;
decltype(orra_s8_maxpool_minmax_ukernel_2p2x__neon_c16)
    __real_orra_s8_maxpool_minmax_ukernel_2p2x__neon_c16,
    __wrap_orra_s8_maxpool_minmax_ukernel_2p2x__neon_c16;

void __wrap_orra_u32_vlog_ukernel__scalar_x1(size_t count, const uint32_t* input,
                                             uint32_t input_shift, uint32_t output_scale,
                                             uint16_t* output) {
  __real_orra_u32_vlog_ukernel__scalar_x1(count, input, input_shift, output_scale, output);
  constexpr uint32_t kFaultyInput = 1000;
  static int frame = -1;
  ++frame;
  for (size_t i = 0; i < count && IsFaulty("logarithm"); ++i) {
    if (input[i] != kFaultyInput) continue;
    ++output[i];
    SayOnce("features of frame %d, channel %zu", frame, i, output[i] - 1, output[i]);
  }
}

void __wrap_orra_s8_maxpool_minmax_ukernel_2p2x__neon_c16(size_t positions, size_t pool_size,
                                                          size_t channels,
                                                          const int8_t* const* in_ptrs,
                                                          size_t in_offset, int8_t* out,
                                                          size_t in_ptrs_gap, size_t out_gap,
                                                          const orra_s8_clamp_params* params) {
  __real_orra_s8_maxpool_minmax_ukernel_2p2x__neon_c16(
      positions, pool_size, channels, in_ptrs, in_offset, out, in_ptrs_gap, out_gap, params);
  constexpr size_t kPositionsOfOperator7 = 46;
  constexpr size_t kFaultyRow = 5, kFaultyChannel = 17;
  constexpr int kFirstFaultyRun = 2;
  static int run = -1;
  if (positions != kPositionsOfOperator7 || !IsFaulty("max_pool")) return;
  if (++run < kFirstFaultyRun) return;
  int8_t& value = out[kFaultyRow * channels + kFaultyChannel];
  const int8_t good = value;
  value = static_cast<int8_t>(value ^ 1);
  SayOnce("network run %d, operator 7, row 5, channel %zu", run, kFaultyChannel, good, value);
}
}
