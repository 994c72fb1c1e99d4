// SPDX-License-Identifier: Apache-2.0
// 64-bit FNV-1a, by which outputs are compared over builds and machines.
#pragma once

#include <cstddef>
#include <cstdint>

namespace qz::base {

constexpr uint64_t kEmptyDigest = 0xCBF29CE484222325u;

// Continues the digest of earlier bytes, if any.
inline uint64_t Digest(const void* bytes, size_t count, uint64_t digest = kEmptyDigest) {
  const auto* const values = static_cast<const uint8_t*>(bytes);
  for (size_t i = 0; i < count; ++i) digest = (digest ^ values[i]) * 0x100000001B3u;
  return digest;
}

}  // namespace qz::base
