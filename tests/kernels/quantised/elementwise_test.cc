// Max pooling, conversion to float, and lookup.

#include <gtest/gtest.h>

#include "layers.h"

namespace qz::test {
namespace {

// Entries are offsets from a base. The entry that an odd pool skips and those of the gap would
// fault.
TEST(MaxPool, EqualsPlainMaximum) {
  Random random(7);
  for (size_t i = 0; i < 4 * 40; ++i) {
    const size_t pool_size = 1 + i % 4, channels = 1 + i / 4, positions = Pick(random, 1, 3);
    SCOPED_TRACE(testing::Message() << "pool " << pool_size << " channels " << channels);
    const size_t gap = Pick(random, 0, 2), stride = channels + Pick(random, 0, 5);
    const auto low = static_cast<int8_t>(random.Between(-128, 0));
    const orra_s8_clamp_params params{low, static_cast<int8_t>(random.Between(low, 127))};
    const auto in = random.Fill<int8_t>(20 * channels + kReadAhead, -128, 127);
    std::vector<uintptr_t> entries;
    std::vector<int8_t> out(positions * stride + 16, kGuard);
    std::vector<int8_t> expected = out;
    for (size_t p = 0; p < positions; ++p) {
      std::fill_n(expected.begin() + static_cast<ptrdiff_t>(p * stride), channels, low);
      for (size_t e = 0; e < pool_size; ++e) {
        entries.push_back(channels * Pick(random, 0, 19));
        for (size_t c = 0; c < channels; ++c) {
          int8_t& largest = expected[p * stride + c];
          largest = std::clamp(in[entries.back() + c], largest, params.output_max);
        }
      }
      entries.insert(entries.end(), pool_size % 2 + gap, UINTPTR_MAX / 2);
    }
    orra_s8_maxpool_minmax_ukernel_2p2x__neon_c16(
        positions, pool_size, channels, reinterpret_cast<const int8_t* const*>(entries.data()),
        reinterpret_cast<uintptr_t>(in.data()), out.data(), gap * sizeof entries[0],
        stride - channels, &params);
    ASSERT_EQ(out, expected);
  }
}

// Lookup in place; both leave what is beyond their count.
TEST(ConversionAndLookup, AreExact) {
  Random random(8);
  const orra_dequant_params params{{128, 128}, 1.0f / 256};
  const auto table = random.Fill<uint8_t>(256, 0, 255);
  for (size_t count = 1; count <= 70; ++count) {
    auto bytes = random.Fill<uint8_t>(count + kReadAhead, 0, 255);
    auto looked_up = bytes;
    std::vector<float> floats(count + 4, -1.0f), converted = floats;
    for (size_t i = 0; i < count; ++i) {
      looked_up[i] = table[bytes[i]];
      converted[i] = static_cast<float>(static_cast<int8_t>(bytes[i]) + 128) / 256;
    }
    orra_qs8_f32_vcvt_ukernel__neon_x32(count, reinterpret_cast<const int8_t*>(bytes.data()),
                                        floats.data(), &params);
    orra_x8_lut_ukernel__scalar_x2(count, bytes.data(), bytes.data(), table.data());
    ASSERT_EQ(floats, converted);
    ASSERT_EQ(bytes, looked_up);
  }
}

}  // namespace
}  // namespace qz::test
