// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <string>
#include <vector>

namespace qz::dataset {

// A whole sound file as 16-bit samples, mono at 16 kHz, full scale +-32768: what the microphone of
// the hub would deliver. Throws base::InputError.
std::vector<int16_t> ReadClip(const std::string& path);

}  // namespace qz::dataset
