// A logarithm that is wrong for one input. Says where it first was.

#include <cstdio>

#include "signal_kernels.h"

extern "C" {

decltype(orra_u32_vlog_ukernel__scalar_x1) __real_orra_u32_vlog_ukernel__scalar_x1,
    __wrap_orra_u32_vlog_ukernel__scalar_x1;

void __wrap_orra_u32_vlog_ukernel__scalar_x1(size_t count, const uint32_t* input,
                                             uint32_t input_shift, uint32_t output_scale,
                                             uint16_t* output) {
  __real_orra_u32_vlog_ukernel__scalar_x1(count, input, input_shift, output_scale, output);
  constexpr uint32_t kFaultyInput = 1000;
  static int frame = -1;
  static bool said = false;
  ++frame;
  for (size_t i = 0; i < count; ++i) {
    if (input[i] != kFaultyInput) continue;
    if (!said) std::fprintf(stderr, "features of frame %d, channel %zu\n", frame, i);
    said = true;
    ++output[i];
  }
}
}
