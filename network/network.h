// SPDX-License-Identifier: Apache-2.0
// The classifier's network: feature frames in, a score a class out. One-dimensional convolutions
// over time shrink the window to one row; two fully connected layers and a logistic function make
// scores of it. Its operators are those of the detector's description (config/network.h).
//
// State and weights are the caller's: any number of arenas may be in use, on threads of their own.
// A run keeps nothing for the next, allocates nothing, checks nothing and cannot fail.
#pragma once

#include <array>
#include <cstddef>
#include <cstdint>

#include "config/network.h"
#include "config/weight_tables.h"

namespace qz::network {

// All activations of a run. The window and every tensor between operators are int8, the scores
// float; which bytes are whose follows from config::kOperators.
union alignas(16) Arena {
  int8_t bytes[config::kArenaBytes + config::kReadAheadBytes];
  float floats[(config::kArenaBytes + config::kReadAheadBytes) / sizeof(float)];
};

// The packed tables that a run reads, in the order of config::kTables. They stay the owner's.
struct Weights {
  std::array<const void*, config::kTableCount> tables{};
};

// The tables of a packed model of config::kModelBytes, which stays where it is. What the checker of
// models passes keeps the network within the contracts of its kernels.
constexpr Weights WeightsOf(const uint8_t* packed) {
  Weights weights;
  for (size_t i = 0; i < config::kTableCount; ++i) {
    weights.tables[i] = packed + config::kTables[i].offset;
  }
  return weights;
}

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
extern const Weights module_weights;

}  // namespace qz::network
