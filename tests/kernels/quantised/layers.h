// Random layers, their packing, and the textbook sums and roundings that the kernels are held
// against.
#pragma once

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <cstring>
#include <vector>

#include "quantised_kernels.h"
#include "random.h"

namespace qz::test {

// What versions for some processors may read, and none may use, behind a row.
constexpr size_t kReadAhead = 16;
constexpr int8_t kGuard = 0x5A;

inline size_t Pick(Random& random, size_t low, size_t high) {
  return low + random.Next() % (high - low + 1);
}

inline int64_t Saturate(int64_t value, int bits) {
  const int64_t limit = int64_t{1} << (bits - 1);
  return std::clamp(value, -limit, limit - 1);
}

template <typename Params>
int8_t AddZeroPointAndClamp(int64_t value, const Params& params) {
  value = Saturate(Saturate(Saturate(value, 16) + params.output_zero_point, 16), 8);
  return static_cast<int8_t>(std::clamp<int64_t>(value, params.output_min, params.output_max));
}

// In doubles: a product of two floats is exact there, and is rounded once, to a float.
inline int8_t Requantise(int32_t sum, float scale, const orra_fp32_requant_params& params) {
  const float product = static_cast<float>(double{static_cast<float>(sum)} * double{scale});
  const double rounded = std::nearbyint(std::clamp(double{product}, -0x1p31, 0x1p31 - 1));
  return AddZeroPointAndClamp(static_cast<int64_t>(rounded), params);
}

inline int64_t FloorDivide(int64_t value, int64_t divisor) {
  return value / divisor - (value % divisor < 0);
}

inline int8_t Requantise(int32_t sum, const orra_rndnu_requant_params& params) {
  const auto power = [](int32_t exponent) { return int64_t{1} << std::max(exponent, 0); };
  int64_t value = Saturate(sum * power(params.pre_shift), 32);
  value = FloorDivide(value, power(-params.pre_shift));
  value = Saturate(FloorDivide(value * params.multiplier, power(31)), 32);
  value = FloorDivide(value + power(-params.post_shift - 1), power(-params.post_shift));
  return AddZeroPointAndClamp(value, params);
}

inline orra_fp32_requant_params RandomParams(Random& random) {
  const auto low = static_cast<int8_t>(random.Between(-128, 0));
  return {static_cast<int16_t>(random.Between(-128, 127)), low,
          static_cast<int8_t>(random.Between(low, 127))};
}

// weights[tap][input][column]; `inputs` is 1 for a depthwise layer.
struct Layer {
  Layer(Random& random, size_t tap_count, size_t input_count, size_t column_count)
      : taps(tap_count),
        inputs(input_count),
        columns(column_count),
        weights(random.Fill<int8_t>(taps * inputs * columns, -127, 127)) {
    // Biases of any magnitude, with scales that bring them near int8, some beyond, some to halves.
    for (size_t c = 0; c < columns; ++c) {
      const int bits = static_cast<int>(random.Between(12, 31));
      biases.push_back(static_cast<int32_t>(random.Between(INT32_MIN, INT32_MAX) >> (31 - bits)));
      scales.push_back(std::ldexp(static_cast<float>(random.Between(1, 255)), -bits));
    }
  }

  int32_t Sum(size_t column, const std::vector<const int8_t*>& tap_rows, bool depthwise) const {
    int64_t sum = biases[column];
    for (size_t i = 0; i < taps * inputs; ++i) {
      sum += tap_rows[i / inputs][depthwise ? column : i % inputs] * weights[i * columns + column];
    }
    return static_cast<int32_t>(sum);
  }

  std::vector<uint8_t> Pack(size_t block, bool with_scales) const {
    std::vector<uint8_t> packed;
    const auto append = [&](const auto* row, size_t first) {
      const size_t size = sizeof *row;
      packed.resize(packed.size() + block * size);  // zeros beyond the last column
      std::memcpy(&packed[packed.size() - block * size], row + first,
                  std::min(block, columns - first) * size);
    };
    for (size_t first = 0; first < columns; first += block) {
      append(biases.data(), first);
      for (size_t i = 0; i < taps * inputs; ++i) append(&weights[i * columns], first);
      if (with_scales) append(scales.data(), first);
    }
    return packed;
  }

  size_t taps, inputs, columns;
  std::vector<int32_t> biases;
  std::vector<int8_t> weights;
  std::vector<float> scales;
};

}  // namespace qz::test
