// SPDX-License-Identifier: Apache-2.0
#include "network/network.h"

#include <utility>

#include "network/operator_calls.h"

namespace qz::network {
namespace {

template <size_t... kOps>
void RunAll(Arena& own, const Weights& weights, std::index_sequence<kOps...>) {
  (RunOne<kOps>(own, weights), ...);
}

}  // namespace

Arena arena;

void Run(Arena& own, const Weights& weights) {
  RunAll(own, weights, std::make_index_sequence<config::kOperatorCount>());
}

}  // namespace qz::network
