// SPDX-License-Identifier: Apache-2.0
#include <cstring>

#include "kernels/precondition.h"
#include "kernels/quantised/indirection.h"
#include "kernels/quantised/quantised_kernels.h"
#include "kernels/quantised/requantisation.h"
#include "kernels/variant.h"

namespace {

constexpr size_t kTaps = 3;
constexpr size_t kGroup = 16;

struct Group {
  int32_t bias[kGroup];
  int8_t weight[kTaps][kGroup];
  float scale[kGroup];
};
static_assert(sizeof(Group) == 176, "the packed layout has no gaps");

// One position's output of 16 channels.
void ConvolveGroup(const int8_t* const (&rows)[kTaps], const uint8_t* packed, qz::OutputRange range,
                   int8_t* out) {
  Group group;
  std::memcpy(&group, packed, sizeof group);
  uint32_t accumulators[kGroup];  // modulo 2^32
  for (size_t c = 0; c < kGroup; ++c) {
    const int32_t sum = rows[0][c] * group.weight[0][c] + rows[1][c] * group.weight[1][c] +
                        rows[2][c] * group.weight[2][c];
    accumulators[c] = static_cast<uint32_t>(group.bias[c]) + static_cast<uint32_t>(sum);
  }
  qz::RequantiseFp32(accumulators, group.scale, range, out);
}

}  // namespace

QZ_KERNEL(orra_qc8_dwconv_minmax_fp32_ukernel_3p16c__asm_aarch32_neonv8_mla8_cortex_a35)
(size_t channels, size_t width, const int8_t* const* in_ptrs, const void* w, int8_t* out,
 size_t in_ptrs_step, size_t out_gap, size_t in_offset, const int8_t* zero,
 const orra_fp32_requant_params* params) {
  qz::Require(channels > 0 && width > 0);
  const qz::OutputRange range = qz::RangeOf(qz::DepthwiseParams(*params));
  for (size_t position = 0; position < width; ++position) {
    const int8_t* rows[kTaps];
    for (size_t t = 0; t < kTaps; ++t) rows[t] = qz::ListedRow(in_ptrs, t, in_offset, zero);
    int8_t* position_out = out + position * (channels + out_gap);
    const uint8_t* packed = static_cast<const uint8_t*>(w);

    size_t c = 0;
    for (; c + kGroup <= channels; c += kGroup, packed += sizeof(Group)) {
      ConvolveGroup({rows[0] + c, rows[1] + c, rows[2] + c}, packed, range, position_out + c);
    }
    if (c < channels) {
      int8_t tail[kTaps][kGroup] = {};
      int8_t result[kGroup];
      for (size_t t = 0; t < kTaps; ++t) std::memcpy(tail[t], rows[t] + c, channels - c);
      ConvolveGroup({tail[0], tail[1], tail[2]}, packed, range, result);
      std::memcpy(position_out + c, result, channels - c);
    }
    in_ptrs = qz::Advance(in_ptrs, in_ptrs_step);
  }
}
