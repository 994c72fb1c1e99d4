// SPDX-License-Identifier: Apache-2.0
// Random layers for the kernels of the network, which bring out their roundings and saturations.
#pragma once

#include <cmath>
#include <tuple>
#include <utility>
#include <vector>

#include "kernels/quantised/quantised_kernels.h"
#include "tests/support/random.h"

namespace qz::test {

// Zero points of int8, and now and then beyond, up to where values beyond int16 would show; the
// clamp often the whole range, and now and then with its minimum above its maximum.
inline orra_fp32_requant_params RandomParams(Random& random) {
  int64_t zero_point = random.Between(-128, 127);
  if (random.Next() % 8 == 0) zero_point = random.Between(INT16_MIN, INT16_MAX);
  if (random.Next() % 8 == 0) zero_point = zero_point < 0 ? INT16_MIN : INT16_MAX;
  const bool open = random.Next() % 2 == 0;
  const int64_t low = open ? -128 : random.Between(-128, 127);
  const int64_t high = open ? 127 : random.Between(random.Next() % 4 ? low : -128, 127);
  return {static_cast<int16_t>(zero_point), static_cast<int8_t>(low), static_cast<int8_t>(high)};
}

// Shift counts beyond the width of every lane too, and the factor whose square overflows.
inline orra_rndnu_requant_params RandomFixedParams(Random& random) {
  const bool far = random.Next() % 8 == 0;
  const int64_t pre_shift = far ? random.Between(-300, 300) : random.Between(-4, 4);
  const int64_t post_shift = far ? random.Between(-300, -1) : random.Between(-12, -1);
  const int64_t factor = random.Next() % 8 == 0 ? INT32_MIN : random.Between(INT32_MIN, INT32_MAX);
  const auto [zero_point, low, high] = RandomParams(random);
  return {static_cast<int32_t>(random.Next() % 2 ? pre_shift : 0),
          static_cast<int32_t>(factor),
          static_cast<int32_t>(post_shift),
          zero_point,
          low,
          high};
}

// weights[input][column]: the inputs are those of all taps, one tap after the other. Columns fill
// up whole blocks, with no zeros, so that a use of those beyond the asked ones would show.
struct Layer {
  Layer(Random& random, size_t input_count, size_t column_count, size_t block_columns)
      : inputs(input_count),
        block(block_columns),
        columns((column_count + block - 1) / block * block),
        weights(ShapedFill<int8_t>(random, inputs * columns, -127, 127)) {
    for (size_t c = 0; c < columns; ++c) {
      const int bits = static_cast<int>(random.Between(1, 31));
      biases.push_back(static_cast<int32_t>(random.Between(INT32_MIN, INT32_MAX) >> (31 - bits)));
      scales.push_back(RandomScale(random, bits < 8 || bits > 14 ? bits : 14));
      if (random.Next() % 4 == 0) MakeTelling(c, random.Next());
    }
  }

  // A scale with which sums of `bits` bits reach int8 and somewhat beyond; a power of two makes
  // ties. Some are 0, not a normal number, or take every sum out of range.
  static float RandomScale(Random& random, int bits) {
    const float extremes[] = {0.0f, 1e30f, 1e-40f};
    const uint64_t kind = random.Next() % 16;
    if (kind < 3) return extremes[kind];
    const auto mantissa = static_cast<float>(kind < 8 ? 256 : random.Between(128, 1023));
    return std::ldexp(mantissa, static_cast<int>(random.Between(-3, 1)) - bits);
  }

  // Ties, a 1 that single precision loses, products beyond int32 and int16, sums that wrap: all
  // but these with weights of 0.
  void MakeTelling(size_t column, uint64_t choice) {
    const std::pair<int32_t, float> kTelling[] = {
        {1, 0.5f},      {3, 0.5f},          {(1 << 24) + 1, 0x1p-25f}, {INT32_MAX, 1e30f},
        {-40000, 1.0f}, {INT32_MIN, 1e30f}, {INT32_MAX, 0x1p-24f},     {INT32_MIN, 0x1p-24f}};
    std::tie(biases[column], scales[column]) = kTelling[choice % 8];
    if (choice % 8 >= 6) return;
    for (size_t i = 0; i < inputs; ++i) weights[i * columns + column] = 0;
  }

  std::vector<uint8_t> Packed(bool with_scales = true) const {
    std::vector<uint8_t> packed;
    const auto append = [&](const auto* first) {
      const auto* bytes = reinterpret_cast<const uint8_t*>(first);
      packed.insert(packed.end(), bytes, bytes + block * sizeof *first);
    };
    for (size_t first = 0; first < columns; first += block) {
      append(&biases[first]);
      for (size_t i = 0; i < inputs; ++i) append(&weights[i * columns + first]);
      if (with_scales) append(&scales[first]);
    }
    return packed;
  }

  size_t inputs, block, columns;
  std::vector<int32_t> biases;
  std::vector<int8_t> weights;
  std::vector<float> scales;
};

// A list names a row `offset` bytes before it, but the zero row as it is.
inline const int8_t* ListEntry(const int8_t* row, const int8_t* zero, size_t offset) {
  const uintptr_t distance = row == zero ? 0 : offset;
  return reinterpret_cast<const int8_t*>(reinterpret_cast<uintptr_t>(row) - distance);
}

}  // namespace qz::test
