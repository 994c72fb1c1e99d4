// SPDX-License-Identifier: Apache-2.0
// Apart from the run of all operators, which is all that the module needs.

#include <cassert>
#include <utility>

#include "network/operator_calls.h"

namespace qz::network {
namespace {

using Call = void (*)(Arena& own, const Weights& weights);

template <size_t... kOps>
constexpr std::array<Call, sizeof...(kOps)> MakeCalls(std::index_sequence<kOps...>) {
  return {RunOne<kOps>...};
}
constexpr auto kCalls = MakeCalls(std::make_index_sequence<config::kOperatorCount>());

}  // namespace

void RunOperator(size_t op, Arena& own, const Weights& weights) {
  assert(op < kCalls.size());
  kCalls[op](own, weights);
}

}  // namespace qz::network
