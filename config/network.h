// SPDX-License-Identifier: Apache-2.0
// What follows from the description's rows of operators: shapes, offsets in the arena, receptive
// fields, tiles of the matrix kernels.
//
// Tensors are row-major without gaps: rows are time steps. A tensor's memory is free again as soon
// as its one reader has run.
#pragma once

#include <array>
#include <cstddef>
#include <iterator>

#include "config/detector.h"

namespace qz::config {

struct Tensor {
  size_t offset = 0;  // in the arena
  size_t rows = 0;
  size_t channels = 0;
  int zero_point = 0;
  size_t value_bytes = 1;  // int8, but for the scores, which are float

  constexpr size_t Values() const { return rows * channels; }
  constexpr size_t Bytes() const { return Values() * value_bytes; }
  constexpr size_t End() const { return offset + Bytes(); }
};

// Output rows that the matrix kernels compute together.
constexpr size_t kRowsPerTile = 4;

struct Operator : OperatorDescription {
  Tensor input;
  Tensor output;
  size_t frames_seen = 0;  // of the window, by an output row
  size_t frame_step = 0;   // frames from one output row to the next

  constexpr bool HasTable() const { return !table.empty(); }
  // Calls of the device's matrix kernel, and the entries of a tile in the list of input rows.
  constexpr size_t Tiles() const { return (output.rows + kRowsPerTile - 1) / kRowsPerTile; }
  constexpr size_t TileEntries() const { return taps * kRowsPerTile; }
  constexpr size_t Products() const {
    if (!HasTable()) return 0;
    return output.Values() * taps * (kind == OperatorKind::kDepthwise ? 1 : input.channels);
  }
  // Entries of the list through which the kernel finds its input rows; 0 where it needs none.
  constexpr size_t ListEntries() const {
    if (kind == OperatorKind::kConvolution) return Tiles() * TileEntries();
    const bool listed = kind == OperatorKind::kDepthwise || kind == OperatorKind::kMaxPool;
    return listed ? input.rows : 0;
  }
};

constexpr size_t kOperatorCount = std::size(kNetwork);
constexpr size_t kTensorAlignment = 16;

constexpr size_t Aligned(size_t offset) {
  return (offset + kTensorAlignment - 1) / kTensorAlignment * kTensorAlignment;
}

// The network's input lies behind what the first operator writes to the arena's start.
constexpr Tensor MakeWindow() {
  const OperatorDescription& first = kNetwork[0];
  const size_t first_bytes = (kWindowFrames - first.taps + 1) * first.channels;
  return {Aligned(first_bytes), kWindowFrames, kFeatureChannels, -kFeatureZeroPoint};
}
constexpr Tensor kWindow = MakeWindow();

constexpr std::array<Operator, kOperatorCount> MakeOperators() {
  std::array<Operator, kOperatorCount> all{};
  Tensor input = kWindow;
  size_t seen = 1, step = 1;
  const size_t behind_scores = Aligned(kWindow.offset + kClasses * sizeof(float));
  for (size_t i = 0; i < kOperatorCount; ++i) {
    Operator& op = all[i];
    static_cast<OperatorDescription&>(op) = kNetwork[i];
    seen += (op.taps - 1) * step;
    step *= op.stride;
    op.frames_seen = seen;
    op.frame_step = step;
    op.input = input;
    op.output = {0, (input.rows - op.taps) / op.stride + 1, op.channels, op.zero_point};
    if (op.kind == OperatorKind::kDequantise) op.output.value_bytes = sizeof(float);
    if (op.placement == Placement::kBehindInput) op.output.offset = Aligned(input.End());
    if (op.placement == Placement::kInPlace) op.output.offset = input.offset;
    if (op.placement == Placement::kAtWindow) op.output.offset = kWindow.offset;
    if (op.placement == Placement::kBehindScores) op.output.offset = behind_scores;
    input = op.output;
  }
  return all;
}
inline constexpr std::array<Operator, kOperatorCount> kOperators = MakeOperators();
inline constexpr Tensor kScores = kOperators.back().output;
inline constexpr Operator kLogisticOperator = kOperators[kOperatorCount - 2];
constexpr size_t kLogitOperator =
    kOperatorCount - 3;  // its output is the logistic function's input

constexpr size_t MakeArenaBytes() {
  size_t bytes = kWindow.End();
  for (const Operator& op : kOperators) bytes = op.output.End() > bytes ? op.output.End() : bytes;
  return bytes;
}
constexpr size_t kArenaBytes = MakeArenaBytes();

// Bytes kept readable behind the arena: kernels for some processors load 16 bytes at a time, and a
// pooled tensor may end where the arena does. The reference kernels read none of them.
constexpr size_t kReadAheadBytes = 16;

constexpr bool IsDense(OperatorKind kind) {
  return kind == OperatorKind::kPointwise || kind == OperatorKind::kConvolution ||
         kind == OperatorKind::kFullyConnected;
}

// Every row's values are those that its kind allows.
constexpr bool RowHolds(const Operator& op) {
  const bool depthwise = op.kind == OperatorKind::kDepthwise;
  const bool fixed_point = op.kind == OperatorKind::kFullyConnected;
  const bool pool = op.kind == OperatorKind::kMaxPool;
  const bool scaled =
      depthwise || op.kind == OperatorKind::kLogistic || op.kind == OperatorKind::kDequantise;
  const bool many_taps = depthwise || pool || op.kind == OperatorKind::kConvolution;
  return op.input.rows >= op.taps && (op.input.rows - op.taps) % op.stride == 0 &&
         (IsDense(op.kind) || op.channels == op.input.channels) &&
         op.HasTable() == (depthwise || IsDense(op.kind)) && (op.scale > 0) == scaled &&
         (op.multiplier > 0) == fixed_point && (op.shift > 0) == fixed_point &&
         (many_taps || op.taps == 1) && op.stride == (pool ? 2u : 1u) &&
         (!depthwise || op.taps == 3) && (!pool || op.taps == 2) &&
         (!pool || op.zero_point == op.input.zero_point) && op.zero_point >= -128 &&
         op.zero_point <= 127;
}

constexpr bool ArenaHolds(const Operator& op) {
  const bool apart = op.input.End() <= op.output.offset || op.output.End() <= op.input.offset;
  return op.output.offset % kTensorAlignment == 0 && op.output.End() <= kArenaBytes &&
         (apart || op.placement == Placement::kInPlace);
}

constexpr bool NetworkHolds() {
  for (const Operator& op : kOperators) {
    if (!RowHolds(op) || !ArenaHolds(op)) return false;
  }
  return true;
}
static_assert(NetworkHolds(),
              "no row lost to a stride, values that the operator's kind allows, and every tensor "
              "aligned, inside the arena and apart from its operator's input");
static_assert(kNetwork[0].placement == Placement::kStart, "the window lies behind its output");
static_assert(kScores.rows == 1 && kScores.channels == kClasses &&
                  kOperators.back().kind == OperatorKind::kDequantise &&
                  kLogisticOperator.kind == OperatorKind::kLogistic &&
                  kOperators[kLogitOperator].kind == OperatorKind::kFullyConnected,
              "a score a class, by the logistic function");
static_assert(kOperators.back().frames_seen == kWindowFrames &&
                  kOperators.back().frame_step == kFramesBetweenRuns,
              "the outputs see the whole window, and a run follows when they would move by a row");

}  // namespace qz::config
