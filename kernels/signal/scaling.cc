// Element-wise 16-bit steps around block normalisation: window, peak search, left shift.

#include <algorithm>

#include "signal_kernels.h"

extern "C" void orra_s16_window_shift12_ukernel__neon_x32(size_t rows, size_t row_bytes,
                                                          const int16_t* input,
                                                          const int16_t* weights, int16_t* output,
                                                          uint32_t /*shift*/) {
  const size_t row_samples = row_bytes / sizeof(int16_t);
  for (size_t row = 0; row < rows; ++row) {
    for (size_t i = 0; i < row_samples; ++i) {
      const int32_t scaled = (input[i] * weights[i]) >> 12;
      output[i] = static_cast<int16_t>(std::clamp(scaled, -32768, 32767));
    }
    input += row_samples;
    output += row_samples;
  }
}

extern "C" void orra_s16_rmaxabs_ukernel__neon_x32(size_t bytes, const int16_t* input,
                                                   uint16_t* output) {
  int16_t highest = 0;
  int16_t lowest = 0;
  for (size_t i = 0; i < bytes / sizeof(int16_t); ++i) {
    highest = std::max(highest, input[i]);
    lowest = std::min(lowest, input[i]);
  }
  *output = static_cast<uint16_t>(std::max<int32_t>(highest, -lowest));
}

extern "C" void orra_i16_vlshift_ukernel__neon_x32(size_t count, const int16_t* input,
                                                   int16_t* output, uint32_t shift) {
  const uint32_t factor = shift < 16 ? 1u << shift : 0;
  for (size_t i = 0; i < count; ++i) {
    output[i] = static_cast<int16_t>(static_cast<uint32_t>(input[i]) * factor);
  }
}
