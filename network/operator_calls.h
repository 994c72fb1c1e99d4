// SPDX-License-Identifier: Apache-2.0
// One operator of the network as calls of a kernel, and the lists by which kernels find their rows.
#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <type_traits>

#include "kernels/quantised/quantised_kernels.h"
#include "logistic_table.h"
#include "network/network.h"

namespace qz::network {

using config::kOperators;
using config::Operator;
using config::OperatorKind;

// Depthwise convolution: the address of each input row. Output row j uses entries j, j + 1, j + 2.
template <size_t kOp>
constexpr auto RowList() {
  constexpr const config::Tensor& kIn = kOperators[kOp].input;
  std::array<const int8_t*, kIn.rows> list{};
  for (size_t row = 0; row < kIn.rows; ++row) {
    list[row] = arena.bytes + kIn.offset + row * kIn.channels;
  }
  return list;
}

// Convolution: for each tile of 4 output rows, the addresses of the rows that tap 0 reads, then
// those of tap 1 and so on. In a last tile of fewer rows the missing ones repeat the last.
template <size_t kOp>
constexpr auto TileList() {
  constexpr const Operator& kEach = kOperators[kOp];
  constexpr size_t kTileRows = config::kRowsPerTile;
  std::array<const int8_t*, kEach.ListEntries()> list{};
  for (size_t i = 0; i < list.size(); ++i) {
    const size_t out_row = i / kEach.TileEntries() * kTileRows + i % kTileRows;
    const size_t tap = i % kEach.TileEntries() / kTileRows;
    const size_t last_row = kEach.output.rows - 1;
    const size_t row = (out_row < last_row ? out_row : last_row) + tap;
    list[i] = arena.bytes + kEach.input.offset + row * kEach.input.channels;
  }
  return list;
}

// Max pool of neighbouring rows: offsets from the pooled tensor's first byte. Output row p uses
// entries 2p and 2p + 1.
template <size_t kOp>
constexpr auto OffsetList() {
  constexpr const config::Tensor& kIn = kOperators[kOp].input;
  std::array<uintptr_t, kIn.rows> list{};
  for (size_t row = 0; row < kIn.rows; ++row) list[row] = row * kIn.channels;
  return list;
}

template <size_t kOp>
constexpr auto MakeList() {
  constexpr OperatorKind kKind = kOperators[kOp].kind;
  if constexpr (kKind == OperatorKind::kDepthwise) return RowList<kOp>();
  if constexpr (kKind == OperatorKind::kConvolution) return TileList<kOp>();
  if constexpr (kKind == OperatorKind::kMaxPool) return OffsetList<kOp>();
}

// Constants: complete when the module is loaded, with no code run for it.
template <size_t kOp>
constexpr auto ind = MakeList<kOp>();

constexpr int8_t kMin = -128;
constexpr int8_t kMax = 127;
constexpr size_t kBlockStride = 8;

// The lists hold addresses in the module's arena. The kernels add this to each for another arena.
inline size_t ListOffset(const Arena& own) {
  return reinterpret_cast<uintptr_t>(own.bytes) - reinterpret_cast<uintptr_t>(arena.bytes);
}

template <size_t kOp>
void Depthwise(Arena& own, const void* w) {
  constexpr const Operator& kEach = kOperators[kOp];
  const orra_fp32_requant_params params{kEach.zero_point, kMin, kMax};
  orra_qc8_dwconv_minmax_fp32_ukernel_3p16c__asm_aarch32_neonv8_mla8_cortex_a35(
      kEach.channels, kEach.output.rows, ind<kOp>.data(), w, BytesOf(own, kEach.output),
      sizeof(const int8_t*), 0, ListOffset(own), nullptr, &params);
}

template <size_t kOp>
void Pointwise(Arena& own, const void* w) {
  constexpr const Operator& kEach = kOperators[kOp];
  constexpr size_t kInputs = kEach.input.channels;
  const orra_fp32_requant_params params{kEach.zero_point, kMin, kMax};
  orra_qc8_gemm_minmax_fp32_ukernel_4x8__asm_aarch32_neonv8_mlal_lane_cortex_a35(
      kEach.output.rows, kEach.channels, kInputs, BytesOf(own, kEach.input), kInputs, w,
      BytesOf(own, kEach.output), kEach.channels, kBlockStride, &params);
}

template <size_t kOp>
void Convolution(Arena& own, const void* w) {
  constexpr const Operator& kEach = kOperators[kOp];
  const orra_fp32_requant_params params{kEach.zero_point, kMin, kMax};
  orra_qc8_igemm_minmax_fp32_ukernel_4x8__asm_aarch32_neonv8_mlal_lane_cortex_a35(
      kEach.output.rows, kEach.channels, kEach.input.channels,
      kEach.TileEntries() * sizeof(const int8_t*), ind<kOp>.data(), w, BytesOf(own, kEach.output),
      kEach.channels, kBlockStride, ListOffset(own), nullptr, &params);
}

template <size_t kOp>
void MaxPool(Arena& own) {
  constexpr const Operator& kEach = kOperators[kOp];
  const orra_s8_clamp_params params{kMin, kMax};
  orra_s8_maxpool_minmax_ukernel_2p2x__neon_c16(
      kEach.output.rows, kEach.taps, kEach.channels,
      reinterpret_cast<const int8_t* const*>(ind<kOp>.data()),
      reinterpret_cast<uintptr_t>(BytesOf(own, kEach.input)), BytesOf(own, kEach.output), 0, 0,
      &params);
}

template <size_t kOp>
void FullyConnected(Arena& own, const void* w) {
  constexpr const Operator& kEach = kOperators[kOp];
  const orra_rndnu_requant_params params{
      0, kEach.multiplier, -kEach.shift, kEach.zero_point, kMin, kMax};
  orra_qs8_gemm_minmax_rndnu_ukernel_1x8__asm_aarch32_neon_mlal_lane_cortex_a7(
      1, kEach.channels, kEach.input.channels, BytesOf(own, kEach.input), kEach.input.channels, w,
      BytesOf(own, kEach.output), kEach.channels, kBlockStride, &params);
}

template <size_t kOp>
void Logistic(Arena& own) {
  constexpr const Operator& kEach = kOperators[kOp];
  uint8_t* const bytes = reinterpret_cast<uint8_t*>(BytesOf(own, kEach.output));
  orra_x8_lut_ukernel__scalar_x2(kEach.channels, bytes, bytes,
                                 reinterpret_cast<const uint8_t*>(w19));
}

template <size_t kOp>
void Dequantise(Arena& own) {
  constexpr const Operator& kEach = kOperators[kOp];
  constexpr int16_t kNegated = -kEach.input.zero_point;
  const orra_dequant_params params{{kNegated, kNegated}, static_cast<float>(kEach.scale)};
  orra_qs8_f32_vcvt_ukernel__neon_x32(kEach.channels, BytesOf(own, kEach.input),
                                      own.floats + kEach.output.offset / sizeof(float), &params);
}

template <size_t kOp>
void RunOne(Arena& own, const Weights& weights) {
  constexpr OperatorKind kKind = kOperators[kOp].kind;
  if constexpr (kOperators[kOp].HasTable()) {
    const void* const w = weights.tables[config::TableIndex(kOp)];
    if constexpr (kKind == OperatorKind::kDepthwise) Depthwise<kOp>(own, w);
    if constexpr (kKind == OperatorKind::kPointwise) Pointwise<kOp>(own, w);
    if constexpr (kKind == OperatorKind::kConvolution) Convolution<kOp>(own, w);
    if constexpr (kKind == OperatorKind::kFullyConnected) FullyConnected<kOp>(own, w);
  }
  if constexpr (kKind == OperatorKind::kMaxPool) MaxPool<kOp>(own);
  if constexpr (kKind == OperatorKind::kLogistic) Logistic<kOp>(own);
  if constexpr (kKind == OperatorKind::kDequantise) Dequantise<kOp>(own);
}

}  // namespace qz::network
