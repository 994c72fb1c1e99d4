// SPDX-License-Identifier: Apache-2.0
// What the description of a detector says of each operator of its network.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string_view>

namespace qz::config {

enum class OperatorKind {
  kDepthwise,       // each channel by itself, over `taps` rows; a scale for all channels
  kPointwise,       // matrix product of each row; a scale per output channel
  kConvolution,     // matrix product over `taps` rows; a scale per output channel
  kMaxPool,         // maximum of `taps` rows
  kFlatten,         // nothing to compute: the single row is read as a vector
  kFullyConnected,  // matrix product of a vector; one fixed-point factor for all outputs
  kLogistic,        // 1 / (1 + e^-x), by a table of 256 entries
  kDequantise,      // int8 to float
};

// Where an operator writes its output in the arena; every offset is a multiple of 16 bytes.
enum class Placement {
  kStart,         // at the arena's first byte
  kBehindInput,   // behind the tensor that the operator reads
  kInPlace,       // where its input is
  kAtWindow,      // where the network's input was
  kBehindScores,  // behind what kAtWindow will write
};

struct OperatorDescription {
  OperatorKind kind;
  size_t taps;    // input rows of an output row
  size_t stride;  // input rows from one output row to the next
  size_t channels;
  std::string_view table;  // of its weights; empty: none
  int zero_point;          // of the output
  // kDepthwise: the scale of every channel, output steps an accumulator step.
  // kLogistic: the scale of the input. kDequantise: the scale of the scores. Else 0.
  double scale;
  // kFullyConnected: the factor is multiplier / 2^(31 + shift).
  int32_t multiplier;
  int shift;
  Placement placement;
};

}  // namespace qz::config
