// SPDX-License-Identifier: Apache-2.0
// The network's operators over an arena, and the lists by which kernels find their rows there.
#pragma once

#include <array>
#include <cstddef>
#include <cstdint>

#include "network/kernel_calls.h"
#include "network/network.h"

namespace qz::network {

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

// The lists hold addresses in the module's arena. The kernels add this to each for another arena.
inline size_t ListOffset(const Arena& own) {
  return reinterpret_cast<uintptr_t>(own.bytes) - reinterpret_cast<uintptr_t>(arena.bytes);
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
void RunOne(Arena& own, const Weights& weights) {
  constexpr const Operator& kEach = kOperators[kOp];
  constexpr OperatorKind kKind = kEach.kind;
  constexpr size_t kRows = kEach.output.rows;
  const int8_t* const in = BytesOf(own, kEach.input);
  int8_t* const out = BytesOf(own, kEach.output);
  if constexpr (kEach.HasTable()) {
    const void* const w = weights.tables[config::TableIndex(kOp)];
    if constexpr (kKind == OperatorKind::kDepthwise) {
      Depthwise<kOp>(kRows, ind<kOp>.data(), ListOffset(own), nullptr, w, out);
    }
    if constexpr (kKind == OperatorKind::kPointwise) Multiply<kOp>(kRows, in, w, out);
    if constexpr (kKind == OperatorKind::kConvolution) Convolution<kOp>(own, w);
    if constexpr (kKind == OperatorKind::kFullyConnected) FullyConnected<kOp>(in, w, out);
  }
  if constexpr (kKind == OperatorKind::kMaxPool) MaxPool<kOp>(kRows, ind<kOp>.data(), in, out);
  if constexpr (kKind == OperatorKind::kLogistic) Logistic<kOp>(out);
  if constexpr (kKind == OperatorKind::kDequantise) {
    Dequantise<kOp>(in, own.floats + kEach.output.offset / sizeof(float));
  }
}

}  // namespace qz::network
