// The largest magnitude of a frame.

#include <algorithm>

#include "signal_kernels.h"

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
