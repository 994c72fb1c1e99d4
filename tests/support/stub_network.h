// Stands in for the network: keeps the windows it was given and answers with chosen scores. Linked
// into a suite, it takes the place of the real one.
#pragma once

#include <array>
#include <cstdint>
#include <functional>
#include <vector>

namespace qz::test {

using Scores = std::array<float, 5>;
using Window = std::vector<int8_t>;  // 382 frames of 48

struct StubNetwork {
  // Scores of run `run`, counted from 0 over all runs so far; zeros when unset.
  std::function<Scores(int run)> scores;
  int runs = 0;
  std::vector<Window> windows;
};

inline StubNetwork stub_network;

}  // namespace qz::test
