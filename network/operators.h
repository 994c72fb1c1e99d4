// The network's operators one by one, for those who look between them.
#pragma once

#include <cstddef>

#include "network/arena_plan.h"
#include "network/mobilenet_backend.h"

namespace qz {

struct Operator {
  void (*run)();  // reads the output of the operator before, or the input; writes its own
  Tensor output;  // complete after `run`; for how long, the plan tells
};

constexpr size_t kOperatorCount = 21;

// In the order in which a run of the network calls them.
extern const Operator kOperators[kOperatorCount];

// The first byte of a tensor; of int8, but for the scores.
inline int8_t* BytesOf(const Tensor& tensor) {
  return mobilenet_backend_input_ptr - kInput.offset + tensor.offset;
}

}  // namespace qz
