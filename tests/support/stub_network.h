// SPDX-License-Identifier: Apache-2.0
// A stub of the network: keeps the windows that it was given and returns chosen scores. A suite
// that links it runs it instead of the real one.
#pragma once

#include <array>
#include <cstdint>
#include <functional>
#include <vector>

#include "config/detector.h"

namespace qz::test {

using Scores = std::array<float, config::kClasses>;
using Window = std::vector<int8_t>;  // int8 [kWindowFrames, kFeatureChannels]

struct StubNetwork {
  // Scores of run `run`, counted from 0 over all runs so far; zeros when unset.
  std::function<Scores(int run)> scores;
  int runs = 0;
  std::vector<Window> windows;
};

inline StubNetwork stub_network;

}  // namespace qz::test
