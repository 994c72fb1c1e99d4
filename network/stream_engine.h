// SPDX-License-Identifier: Apache-2.0
// The stages of a stream as calls of kernels. For the sources that instantiate it, and for those
// who look between the operators.
//
// An observer is called as observe(op, rows, count) with the rows that operator `op` has computed:
// [count][channels of op], int8, or the scores as float. With one, every operator is computed by
// itself; without, a product and the pool behind it are computed together where tiles are small.
#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <type_traits>

#include "kernels/precondition.h"
#include "network/kernel_calls.h"
#include "network/stream_network.h"

namespace qz::network {

// Offsets of rows without gaps.
template <size_t kChannels, size_t kRows>
constexpr std::array<uintptr_t, kRows> MakeRowOffsets() {
  std::array<uintptr_t, kRows> offsets{};
  for (size_t row = 0; row < kRows; ++row) offsets[row] = row * kChannels;
  return offsets;
}
template <size_t kChannels, size_t kRows>
constexpr auto row_offsets = MakeRowOffsets<kChannels, kRows>();

struct Unobserved {
  template <typename Value>
  void operator()(size_t, const Value*, size_t) const {}
};

template <size_t kTileRows, typename Observe>
class StreamEngine {
 public:
  StreamEngine(const Weights& weights, Stream<kTileRows>* stream, Observe observe)
      : weights_(weights), stream_(*stream), observe_(observe) {}

  bool Push(const int8_t* frame) {
    std::memcpy(Append<0>(1), frame, kStages[0].channels);
    return RunFull<0>();
  }

  Pushed PushFrames(const int8_t* frames, size_t count) {
    Pushed pushed;
    while (pushed.frames < count && !pushed.scores) {
      CheckSpace<0>(1);
      const size_t left = count - pushed.frames;
      const size_t space = RowsOfTile<0>() - stream_.held[0];
      const size_t taken = left < space ? left : space;
      std::memcpy(Append<0>(taken), frames + pushed.frames * kStages[0].channels,
                  taken * kStages[0].channels);
      pushed.frames += taken;
      pushed.scores = RunFull<0>();
    }
    return pushed;
  }

 private:
  static constexpr const auto& kStages = Stream<kTileRows>::kStages;
  static constexpr bool kFused =
      std::is_same_v<Observe, Unobserved> && kTileRows == kDeviceTileRows;

  // The rows with which a stage's buffer is full.
  template <size_t kStage>
  size_t RowsOfTile() const {
    constexpr const Stage& kOwn = kStages[kStage];
    if (kOwn.first_tile == kOwn.tile_rows || stream_.started[kStage] != 0) return kOwn.Rows();
    return kOwn.kept_rows + kOwn.first_tile;
  }

  // Counts of rows that are out of step, which only a fault of the memory can cause, begin anew: no
  // byte outside the buffer is written.
  template <size_t kStage>
  void CheckSpace(size_t rows) {
    const bool fits = stream_.held[kStage] + rows <= RowsOfTile<kStage>();
    Require(fits);
    if (!fits) stream_.held[kStage] = 0;
  }

  // Where the next `rows` rows of a stage's input go.
  template <size_t kStage>
  int8_t* Append(size_t rows) {
    CheckSpace<kStage>(rows);
    uint8_t& held = stream_.held[kStage];
    int8_t* const at = stream_.bytes + kStages[kStage].offset + held * kStages[kStage].channels;
    held = static_cast<uint8_t>(held + rows);
    return at;
  }

  // Computes a tile of the stage if its buffer is full, and so on with the next ones. True if it
  // was full in all stages: the scores are new.
  template <size_t kStage>
  bool RunFull() {
    if constexpr (kStage == kStageCount) {
      RunVectorOperators();
      return true;
    } else {
      constexpr const Stage& kOwn = kStages[kStage];
      const size_t rows = RowsOfTile<kStage>();
      if (stream_.held[kStage] < rows) return false;
      int8_t* const buffer = stream_.bytes + kOwn.offset;
      const size_t tile =
          kOwn.first_tile == kOwn.tile_rows ? kOwn.tile_rows : rows - kOwn.kept_rows;
      RunOperators<kStage, kOwn.first_op>(tile, buffer);
      std::memmove(buffer, buffer + tile * kOwn.channels, kOwn.kept_rows * kOwn.channels);
      stream_.held[kStage] = kOwn.kept_rows;
      stream_.started[kStage] = 1;
      return RunFull<kStage + 1>();
    }
  }

  // The operators of a stage from kOp on: `rows` output rows of kOp out of `in`.
  template <size_t kStage, size_t kOp>
  void RunOperators(size_t rows, const int8_t* in) {
    constexpr bool kPooled = kFused && kOperators[kOp + 1].kind == OperatorKind::kMaxPool;
    constexpr size_t kNext = kOp + (kPooled ? 2 : 1);
    constexpr bool kLast = kNext == kStages[kStage].end_op;
    if constexpr (kPooled) rows /= 2;
    int8_t* out = Within<kOp>();
    if constexpr (kLast && kStage + 1 < kStageCount) out = Append<kStage + 1>(rows);
    if constexpr (kLast && kStage + 1 == kStageCount) out = Vector<0>();
    if constexpr (kPooled) {
      MultiplyAndPool<kOp>(rows, in, TableOf<kOp>(), out);
    } else {
      RunOperator<kOp>(rows, in, out);
    }
    observe_(kNext - 1, out, rows);
    if constexpr (!kLast) RunOperators<kStage, kNext>(rows / kOperators[kNext].stride, out);
  }

  template <size_t kOp>
  void RunOperator(size_t rows, const int8_t* in, int8_t* out) {
    constexpr const Operator& kEach = kOperators[kOp];
    constexpr size_t kInputRows = kTileRows + kEach.taps - 1;
    const auto& offsets = row_offsets<kEach.input.channels, kInputRows>;
    if constexpr (kEach.kind == OperatorKind::kDepthwise) {
      const auto* const no_zero = reinterpret_cast<const int8_t*>(UINTPTR_MAX);
      Depthwise<kOp>(rows, reinterpret_cast<const int8_t* const*>(offsets.data()),
                     reinterpret_cast<uintptr_t>(in), no_zero, TableOf<kOp>(), out);
    } else if constexpr (kEach.kind == OperatorKind::kMaxPool) {
      MaxPool<kOp>(rows, offsets.data(), in, out);
    } else {
      Multiply<kOp>(rows, in, TableOf<kOp>(), out);
    }
  }

  void RunVectorOperators() {
    constexpr size_t kFlatten = kFirstVectorOperator;
    observe_(kFlatten, Vector<0>(), 1);
    FullyConnected<kFlatten + 1>(Vector<0>(), TableOf<kFlatten + 1>(), Vector<1>());
    observe_(kFlatten + 1, Vector<1>(), 1);
    FullyConnected<kFlatten + 2>(Vector<1>(), TableOf<kFlatten + 2>(), Vector<2>());
    observe_(kFlatten + 2, Vector<2>(), 1);
    Logistic<kFlatten + 3>(Vector<2>());
    observe_(kFlatten + 3, Vector<2>(), 1);
    Dequantise<kFlatten + 4>(Vector<2>(), stream_.scores);
    observe_(kFlatten + 4, stream_.scores, 1);
  }

  // The output of operator kFirstVectorOperator + kIndex: all have space beside each other.
  template <size_t kIndex>
  int8_t* Vector() {
    size_t offset = 0;
    for (size_t i = 0; i < kIndex; ++i) {
      offset += config::Aligned(kOperators[kFirstVectorOperator + i].channels);
    }
    return tensor() + offset;
  }

  // Where an operator within a stage writes. What a pool reads by itself is not where the operator
  // before has read.
  template <size_t kOp>
  int8_t* Within() {
    if constexpr (!kFused && kOperators[kOp + 1].kind == OperatorKind::kMaxPool) {
      return not_pooled_.data();
    } else {
      return tensor();
    }
  }
  int8_t* tensor() { return stream_.bytes + Stream<kTileRows>::kRowBytes; }

  template <size_t kOp>
  const void* TableOf() const {
    return weights_.tables[config::TableIndex(kOp)];
  }

  const Weights& weights_;
  Stream<kTileRows>& stream_;
  Observe observe_;
  std::array<int8_t, kFused ? 0 : Stream<kTileRows>::kTensorBytes + config::kReadAheadBytes>
      not_pooled_;
};

template <size_t kTileRows>
bool Push(const int8_t* frame, const Weights& weights, Stream<kTileRows>* stream) {
  return StreamEngine(weights, stream, Unobserved()).Push(frame);
}

template <size_t kTileRows>
Pushed PushFrames(const int8_t* frames, size_t count, const Weights& weights,
                  Stream<kTileRows>* stream) {
  return StreamEngine(weights, stream, Unobserved()).PushFrames(frames, count);
}

}  // namespace qz::network
