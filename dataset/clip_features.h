// SPDX-License-Identifier: Apache-2.0
// Features of recordings, as the module's front end makes them of its classifier's frames.
#pragma once

#include <cstddef>
#include <cstdint>
#include <vector>

namespace qz::dataset {

// Features of all frames of a recording from a fresh start, FramesOf(count) x 48, row-major; each 0
// or 33 to 299, the lowest frequency first.
std::vector<uint16_t> FeaturesOf(const int16_t* samples, size_t count);

}  // namespace qz::dataset
