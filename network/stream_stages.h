// SPDX-License-Identifier: Apache-2.0
// How the network runs on a stream of frames, as it follows from config::kOperators.
//
// A stage is a convolution over time and the operators behind it up to the next. It keeps rows of
// its input: those that the next rows of its output see as well (taps - 1), and room for the rows
// of a tile. When its buffer is full it computes a tile, hands its rows to the next stage, and
// keeps the newest.
//
// This is exact. No convolution pads, so a row depends on the frames under it alone, wherever a
// window begins. Every pool's pairs begin at even rows in every window, since all steps divide the
// frames between runs. So a row that two windows share is computed once. All stages have their
// buffers full together, when the first window is complete and at every run from then on; what is
// asserted below plays the counts of frames and rows at compile time.
#pragma once

#include <array>
#include <cstddef>

#include "config/network.h"

namespace qz::network {

constexpr bool BeginsStage(const config::Operator& op) {
  return op.kind == config::OperatorKind::kDepthwise ||
         op.kind == config::OperatorKind::kConvolution;
}

constexpr size_t CountStages() {
  size_t count = 0;
  for (const config::Operator& op : config::kOperators) count += BeginsStage(op) ? 1 : 0;
  return count;
}
constexpr size_t kStageCount = CountStages();

// The first operator behind the stages: from it on, a tensor is one row and nothing is kept.
constexpr size_t FirstVectorOperator() {
  size_t op = 0;
  while (op < config::kOperatorCount &&
         config::kOperators[op].kind != config::OperatorKind::kFlatten)
    ++op;
  return op;
}
constexpr size_t kFirstVectorOperator = FirstVectorOperator();

struct Stage {
  size_t first_op = 0;    // its convolution
  size_t end_op = 0;      // the first operator behind it
  size_t channels = 0;    // of its input
  size_t kept_rows = 0;   // of its input, from tile to tile
  size_t tile_rows = 0;   // that its convolution computes at a time,
  size_t first_tile = 0;  // and the first time
  size_t stride = 1;      // rows of the convolution to a row for the next stage
  size_t offset = 0;      // of its buffer in the stream's bytes

  constexpr size_t Rows() const { return kept_rows + tile_rows; }
  constexpr size_t Bytes() const { return Rows() * channels; }
};

// With tiles of at most `max_tile` rows.
constexpr std::array<Stage, kStageCount> MakeStages(size_t max_tile) {
  std::array<Stage, kStageCount> stages{};
  size_t next = 0, offset = 0;
  for (size_t op = 0; op < kFirstVectorOperator; ++op) {
    const config::Operator& each = config::kOperators[op];
    if (BeginsStage(each)) {
      Stage& stage = stages[next++];
      const size_t rows_a_run = config::kFramesBetweenRuns / each.frame_step;
      stage.first_op = op;
      stage.channels = each.input.channels;
      stage.kept_rows = each.taps - 1;
      stage.tile_rows = rows_a_run < max_tile ? rows_a_run : max_tile;
      // What is left of the first window's rows beside whole tiles comes first.
      const size_t rest = stage.tile_rows == 0 ? 0 : each.output.rows % stage.tile_rows;
      stage.first_tile = rest == 0 ? stage.tile_rows : rest;
      stage.offset = offset;
      offset += stage.Bytes();
    }
    if (next == 0) continue;
    stages[next - 1].end_op = op + 1;
    stages[next - 1].stride *= each.stride;
  }
  return stages;
}

// The bytes of the largest tensor between two operators of a stage, and of all those behind the
// stages together.
constexpr size_t TensorBytes(const std::array<Stage, kStageCount>& stages) {
  size_t bytes = 0;
  for (const Stage& stage : stages) {
    size_t rows = stage.tile_rows;
    for (size_t op = stage.first_op; op < stage.end_op; ++op) {
      rows /= config::kOperators[op].stride;
      const size_t own = rows * config::kOperators[op].channels;
      const bool goes_to_next = op + 1 == stage.end_op && &stage != &stages.back();
      if (!goes_to_next && own > bytes) bytes = own;
    }
  }
  size_t vectors = 0;
  for (size_t op = kFirstVectorOperator; op + 2 < config::kOperatorCount; ++op) {
    vectors += config::Aligned(config::kOperators[op].channels);
  }
  return config::Aligned(vectors > bytes ? vectors : bytes);
}

// Plays three runs' frames, one after another: no buffer overflows, the first scores are there when
// the first window is, then after every kFramesBetweenRuns, and then no stage has begun a tile.
constexpr bool StagesHold(const std::array<Stage, kStageCount>& stages) {
  size_t held[kStageCount] = {};
  bool started[kStageCount] = {};
  constexpr size_t kPlayed = config::kWindowFrames + 2 * config::kFramesBetweenRuns;
  for (size_t frame = 1; frame <= kPlayed; ++frame) {
    size_t rows = 1, stage = 0;
    for (; stage < kStageCount; ++stage) {
      const size_t tile = started[stage] ? stages[stage].tile_rows : stages[stage].first_tile;
      held[stage] += rows;
      if (held[stage] > stages[stage].kept_rows + tile) return false;
      if (held[stage] < stages[stage].kept_rows + tile) break;
      if (tile == 0 || tile % stages[stage].stride != 0) return false;
      rows = tile / stages[stage].stride;
      held[stage] = stages[stage].kept_rows;
      started[stage] = true;
    }
    const bool scores = stage == kStageCount;
    const bool due = frame >= config::kWindowFrames &&
                     (frame - config::kWindowFrames) % config::kFramesBetweenRuns == 0;
    if (scores != due || (scores && rows != 1)) return false;
    for (size_t i = 0; scores && i < kStageCount; ++i) {
      if (held[i] != stages[i].kept_rows) return false;
    }
  }
  return true;
}

// Rows of a window and of the next one that are the same are rows of the same frames, in the same
// pairs of a pool.
constexpr bool WindowsShareRows() {
  for (size_t op = 0; op < kFirstVectorOperator; ++op) {
    const config::Operator& each = config::kOperators[op];
    const bool pool = each.kind == config::OperatorKind::kMaxPool;
    if (config::kFramesBetweenRuns % each.frame_step != 0) return false;
    if (pool && each.input.rows % each.taps != 0) return false;
  }
  return true;
}
static_assert(WindowsShareRows(), "steps divide the frames between runs, pools take whole pairs");

// A stage has at most one tensor within: pools are computed with the product before them.
constexpr bool StreamSupports() {
  using Kind = config::OperatorKind;
  Kind before = Kind::kFlatten;
  for (size_t op = 0; op < kFirstVectorOperator; ++op) {
    const config::Operator& each = config::kOperators[op];
    const bool pointwise = each.kind == Kind::kPointwise && before == Kind::kDepthwise;
    const bool pool =
        each.kind == Kind::kMaxPool && (before == Kind::kPointwise || before == Kind::kConvolution);
    if (!BeginsStage(each) && !pointwise && !pool) return false;
    before = each.kind;
  }
  return kFirstVectorOperator + 5 == config::kOperatorCount &&
         config::kOperators[kFirstVectorOperator + 1].kind == config::OperatorKind::kFullyConnected;
}
static_assert(StreamSupports(),
              "a stream supports stages of a convolution over time, a pointwise one behind a "
              "depthwise one, and a pool of 2 rows; then two fully connected operators, the "
              "logistic function and the scores");

}  // namespace qz::network
