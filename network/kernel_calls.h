// SPDX-License-Identifier: Apache-2.0
// The network's operators as calls of their kernels, wherever their rows lie: what an operator's
// description fixes is filled in here, the number of output rows and all addresses are the
// caller's.
#pragma once

#include <cstddef>
#include <cstdint>

#include "config/network.h"
#include "kernels/quantised/quantised_kernels.h"
#include "logistic_table.h"

namespace qz::network {

using config::kOperators;
using config::Operator;
using config::OperatorKind;

constexpr int8_t kMin = -128;
constexpr int8_t kMax = 127;
constexpr size_t kBlockStride = 8;

// `list` has `rows` + 2 entries, to each of which `list_offset` is added but for `zero`.
template <size_t kOp>
void Depthwise(size_t rows, const int8_t* const* list, size_t list_offset, const int8_t* zero,
               const void* w, int8_t* out) {
  constexpr const Operator& kEach = kOperators[kOp];
  const orra_fp32_requant_params params{kEach.zero_point, kMin, kMax};
  orra_qc8_dwconv_minmax_fp32_ukernel_3p16c__asm_aarch32_neonv8_mla8_cortex_a35(
      kEach.channels, rows, list, w, out, sizeof(const int8_t*), 0, list_offset, zero, &params);
}

// A convolution of any number of taps over rows without gaps, as a matrix product: an output row's
// input is `taps` rows one after another, and so is its weights'.
template <size_t kOp>
void Multiply(size_t rows, const int8_t* in, const void* w, int8_t* out) {
  constexpr const Operator& kEach = kOperators[kOp];
  constexpr size_t kInputs = kEach.input.channels;
  const orra_fp32_requant_params params{kEach.zero_point, kMin, kMax};
  orra_qc8_gemm_minmax_fp32_ukernel_4x8__asm_aarch32_neonv8_mlal_lane_cortex_a35(
      rows, kEach.channels, kEach.taps * kInputs, in, kInputs, w, out, kEach.channels, kBlockStride,
      &params);
}

// The same and the max pool behind it, operator kOp + 1: `rows` rows of the pool's output.
template <size_t kOp>
void MultiplyAndPool(size_t rows, const int8_t* in, const void* w, int8_t* out) {
  constexpr const Operator& kEach = kOperators[kOp];
  static_assert(kOperators[kOp + 1].kind == OperatorKind::kMaxPool &&
                kOperators[kOp + 1].taps == 2);
  constexpr size_t kInputs = kEach.input.channels;
  const orra_fp32_requant_params params{kEach.zero_point, kMin, kMax};
  orra_qc8_gemm_maxpool_minmax_fp32_ukernel_4x8__neon(rows, kEach.channels, kEach.taps * kInputs,
                                                      in, kInputs, w, out, kEach.channels,
                                                      kBlockStride, &params);
}

// `list`: offsets from `in`.
template <size_t kOp>
void MaxPool(size_t rows, const uintptr_t* list, const int8_t* in, int8_t* out) {
  constexpr const Operator& kEach = kOperators[kOp];
  const orra_s8_clamp_params params{kMin, kMax};
  orra_s8_maxpool_minmax_ukernel_2p2x__neon_c16(
      rows, kEach.taps, kEach.channels, reinterpret_cast<const int8_t* const*>(list),
      reinterpret_cast<uintptr_t>(in), out, 0, 0, &params);
}

template <size_t kOp>
void FullyConnected(const int8_t* in, const void* w, int8_t* out) {
  constexpr const Operator& kEach = kOperators[kOp];
  const orra_rndnu_requant_params params{
      0, kEach.multiplier, -kEach.shift, kEach.zero_point, kMin, kMax};
  orra_qs8_gemm_minmax_rndnu_ukernel_1x8__asm_aarch32_neon_mlal_lane_cortex_a7(
      1, kEach.channels, kEach.input.channels, in, kEach.input.channels, w, out, kEach.channels,
      kBlockStride, &params);
}

// In place.
template <size_t kOp>
void Logistic(int8_t* values) {
  uint8_t* const bytes = reinterpret_cast<uint8_t*>(values);
  orra_x8_lut_ukernel__scalar_x2(kOperators[kOp].channels, bytes, bytes,
                                 reinterpret_cast<const uint8_t*>(w19));
}

template <size_t kOp>
void Dequantise(const int8_t* in, float* out) {
  constexpr const Operator& kEach = kOperators[kOp];
  constexpr int16_t kNegated = -kEach.input.zero_point;
  const orra_dequant_params params{{kNegated, kNegated}, static_cast<float>(kEach.scale)};
  orra_qs8_f32_vcvt_ukernel__neon_x32(kEach.channels, in, out, &params);
}

}  // namespace qz::network
