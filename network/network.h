// SPDX-License-Identifier: Apache-2.0
// The classifier's network: feature frames in, a score a class out. One-dimensional convolutions
// over time shrink the window to one row; two fully connected layers and a logistic function make
// scores of it. Its operators are those of the detector's description (config/network.h).
//
// State and weights are the caller's: any number of arenas may be in use, on threads of their own.
// A run keeps nothing for the next, allocates nothing, checks nothing and cannot fail.
#pragma once

#include <cstddef>
#include <cstdint>

#include "config/network.h"
#include "network/weights.h"

namespace qz::network {

// All activations of a run. The window and every tensor between operators are int8, the scores
// float; which bytes are whose follows from config::kOperators.
union alignas(16) Arena {
  int8_t bytes[config::kArenaBytes + config::kReadAheadBytes];
  float floats[(config::kArenaBytes + config::kReadAheadBytes) / sizeof(float)];
};

// The first byte of a tensor.
constexpr int8_t* BytesOf(Arena& arena, const config::Tensor& tensor) {
  return arena.bytes + tensor.offset;
}

// Input: int8 [kWindowFrames][kFeatureChannels], oldest frame first, features less 128, saturated.
// A run overwrites it: write all of it before each.
constexpr int8_t* InputOf(Arena& arena) { return BytesOf(arena, config::kWindow); }

// Output: float [kClasses], each k / 256 with k from 0 to 255. It begins where the input does.
constexpr const float* ScoresOf(const Arena& arena) {
  return arena.floats + config::kScores.offset / sizeof(float);
}

// All operators in order.
void Run(Arena& arena, const Weights& weights);

// One of config::kOperators, for those who look between them. Its output is complete afterwards,
// until a later operator's output covers it.
void RunOperator(size_t op, Arena& arena, const Weights& weights);

// The module's one instance, behind the functions and pointers of mobilenet_backend.h.
extern Arena arena;

}  // namespace qz::network
