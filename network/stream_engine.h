// SPDX-License-Identifier: Apache-2.0
// The stages of a stream as calls of kernels. For the sources that instantiate it, and for those
// who look between the operators.
//
// An observer is called as observe(op, rows, count) with the rows that operator `op` has computed:
// [count][channels of op], int8, or the scores as float.
#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <cstring>

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

template <size_t kTileRows, typename Observe>
class StreamEngine {
 public:
  StreamEngine(const Weights& weights, Stream<kTileRows>* stream, Observe observe)
      : weights_(weights), stream_(*stream), observe_(observe) {}

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
    constexpr bool kLast = kOp + 1 == kStages[kStage].end_op;
    int8_t* out = Tensor<kOp>();
    if constexpr (kLast && kStage + 1 < kStageCount) out = Append<kStage + 1>(rows);
    RunOperator<kOp>(rows, in, out);
    observe_(kOp, out, rows);
    if constexpr (!kLast) RunOperators<kStage, kOp + 1>(rows / kOperators[kOp + 1].stride, out);
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
    observe_(kFlatten, Tensor<kFlatten - 1>(), 1);
    FullyConnected<kFlatten + 1>(Tensor<kFlatten - 1>(), TableOf<kFlatten + 1>(),
                                 Tensor<kFlatten>());
    observe_(kFlatten + 1, Tensor<kFlatten>(), 1);
    int8_t* const logits = Tensor<kFlatten + 1>();
    FullyConnected<kFlatten + 2>(Tensor<kFlatten>(), TableOf<kFlatten + 2>(), logits);
    observe_(kFlatten + 2, logits, 1);
    Logistic<kFlatten + 3>(logits);
    observe_(kFlatten + 3, logits, 1);
    Dequantise<kFlatten + 4>(logits, stream_.scores);
    observe_(kFlatten + 4, stream_.scores, 1);
  }

  // Where an operator writes what does not go to the next stage: operators take turns.
  template <size_t kOp>
  int8_t* Tensor() {
    return stream_.bytes + Stream<kTileRows>::kRowBytes + kOp % 2 * Stream<kTileRows>::kTensorBytes;
  }

  template <size_t kOp>
  const void* TableOf() const {
    return weights_.tables[config::TableIndex(kOp)];
  }

  const Weights& weights_;
  Stream<kTileRows>& stream_;
  Observe observe_;
};

struct Unobserved {
  template <typename Value>
  void operator()(size_t, const Value*, size_t) const {}
};

template <size_t kTileRows>
bool Push(const int8_t* frame, const Weights& weights, Stream<kTileRows>* stream) {
  return PushFrames(frame, 1, weights, stream).scores;
}

template <size_t kTileRows>
Pushed PushFrames(const int8_t* frames, size_t count, const Weights& weights,
                  Stream<kTileRows>* stream) {
  return StreamEngine(weights, stream, Unobserved()).PushFrames(frames, count);
}

}  // namespace qz::network
