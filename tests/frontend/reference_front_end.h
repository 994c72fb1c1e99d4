// SPDX-License-Identifier: Apache-2.0
// The front end evaluated step by step, each written from its definition in scalar arithmetic.
#pragma once

#include <cstdint>
#include <vector>

namespace qz::test {

// What each step of a frame puts out.
struct FrontEndSteps {
  std::vector<int16_t> windowed;
  uint32_t shift = 0;
  std::vector<int16_t> normalised;
  std::vector<int16_t> spectrum;  // bins 0 to 256, (real, imaginary)
  std::vector<uint32_t> power;    // bins 4 to 240
  std::vector<uint64_t> energy;
  std::vector<uint32_t> amplitude;
  std::vector<uint32_t> suppressed;
  std::vector<uint16_t> features;
};

// Of 400 samples; updates the 48 noise estimates.
FrontEndSteps ReferenceFrontEnd(const std::vector<int16_t>& frame, std::vector<uint32_t>* noise);

}  // namespace qz::test
