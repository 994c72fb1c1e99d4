// SPDX-License-Identifier: Apache-2.0
// The network on a stream of frames: the scores that network.h computes from whole windows, byte
// for byte, in a fraction of its memory and instructions (stream_stages.h: why, and what is kept).
//
// State and weights are the caller's: any number of streams may be in use, on threads of their own.
// Nothing is allocated and nothing can fail.
#pragma once

#include <cstddef>
#include <cstdint>

#include "config/network.h"
#include "network/stream_stages.h"
#include "network/weights.h"

namespace qz::network {

// Rows that a stage computes at a time: few on the device, so that little is kept; as many as there
// are between two runs where frames come by the chunk.
constexpr size_t kDeviceTileRows = 4;
constexpr size_t kChunkTileRows = config::kFramesBetweenRuns;

// A stream's state, from its first frame when all of it is zero.
template <size_t kTileRows>
struct Stream {
  static constexpr std::array<Stage, kStageCount> kStages = MakeStages(kTileRows);
  static constexpr size_t kRowBytes = kStages.back().offset + kStages.back().Bytes();
  static constexpr size_t kTensorBytes = TensorBytes(kStages);
  static_assert(StagesHold(kStages),
                "a run when a window's last frame comes, as all stages are full");
  static_assert(kStages[0].Rows() <= UINT8_MAX);

  float scores[config::kClasses];
  uint8_t held[kStageCount];     // rows in each stage's buffer
  uint8_t started[kStageCount];  // 1 once a stage has computed a tile
  int8_t bytes[kRowBytes + kTensorBytes + config::kReadAheadBytes];
};

// Takes the next frame, int8 [kFeatureChannels]: features less 128, saturated. True if
// `stream->scores` are new: with frame kWindowFrames, and then with every kFramesBetweenRuns'th.
template <size_t kTileRows>
bool Push(const int8_t* frame, const Weights& weights, Stream<kTileRows>* stream);

// Takes the next frames, at most `count`, up to one with which the scores are new.
struct Pushed {
  size_t frames = 0;
  bool scores = false;
};
template <size_t kTileRows>
Pushed PushFrames(const int8_t* frames, size_t count, const Weights& weights,
                  Stream<kTileRows>* stream);

}  // namespace qz::network
