// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

namespace qz::base {

// A whole file. Throws InputError, also when it has more than `max_bytes`.
std::vector<uint8_t> ReadWholeFile(const std::string& path, size_t max_bytes);

}  // namespace qz::base
