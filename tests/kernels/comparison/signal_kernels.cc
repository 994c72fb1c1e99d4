// SPDX-License-Identifier: Apache-2.0
#include "kernels/signal/signal_kernels.h"

#include <array>

#include "tests/kernels/comparison/comparison.h"

namespace qz::test {
namespace {

QZ_IMPLEMENTATIONS(kWindow, Signal, orra_s16_window_shift12_ukernel__neon_x32);
QZ_IMPLEMENTATIONS(kDigitReverse, Signal, orra_cs16_digitreverse_ukernel__neon_x16);
QZ_IMPLEMENTATIONS(kFirstStage, Signal, orra_cs16_bfly4_samples1_ukernel__asm_aarch32_neon_x4);
QZ_IMPLEMENTATIONS(kSecondStage, Signal, orra_cs16_bfly4_samples4_ukernel__neon);
QZ_IMPLEMENTATIONS(kLaterStage, Signal, orra_cs16_bfly4_ukernel__neon_x4);
QZ_IMPLEMENTATIONS(kSplit, Signal, orra_cs16_fftr_ukernel__asm_aarch32_neon_x4);
QZ_IMPLEMENTATIONS(kPower, Signal, orra_cs16_vsquareabs_ukernel__neon_mlal_ld128_x8);
QZ_IMPLEMENTATIONS(kFilterbank, Signal,
                   orra_u32_filterbank_accumulate_ukernel__asm_aarch32_neon_x2);
QZ_IMPLEMENTATIONS(kSquareRoot, Signal,
                   orra_u64_u32_vsqrtshift_ukernel__scalar_cvtu32_sqrt_cvtu32f64_x1);
QZ_IMPLEMENTATIONS(kNoiseSubtraction, Signal, orra_u32_filterbank_subtract_ukernel__scalar_x2);
QZ_IMPLEMENTATIONS(kLogarithm, Signal, orra_u32_vlog_ukernel__scalar_x1);

// A shaped fill, or values most of which are at either extreme, in no order.
std::vector<int16_t> Samples(Random& random, size_t count) {
  if (random.Next() % 2) return ShapedFill<int16_t>(random, count);
  std::vector<int16_t> samples = RandomValues<int16_t>(random, count);
  for (int16_t& x : samples) {
    if (random.Next() % 4) x = random.Next() % 2 ? 32767 : -32768;
  }
  return samples;
}

std::string CompareWindow(CaseRandom& random) {
  const size_t rows = random.Pick("rows", 1, 3), count = random.Pick("count", 1, 70);
  const int16_t* in = Location(random, Samples(random, rows * count));
  const int16_t* weights = Location(random, Samples(random, count));
  const auto shift = static_cast<uint32_t>(random.Pick("shift", 0, 39));
  const auto out_contents = RandomValues<int16_t>(random, rows * count);
  return Difference(random, kWindow, out_contents, [&](auto window, int16_t* out) {
    window(rows, 2 * count, in, weights, out, shift);
  });
}

std::string CompareDigitReverse(CaseRandom& random) {
  const size_t count = 4 * random.Pick("count / 4", 48, 64);
  const int16_t* in = Location(random, Samples(random, 2 * count));
  return Difference(random, kDigitReverse, RandomValues<int16_t>(random, 512),
                    [&](auto load, int16_t* out) { load(count, in, out); });
}

std::string CompareFirstStage(CaseRandom& random) {
  const size_t butterflies = random.Pick("butterflies", 1, 20);
  return Difference(random, kFirstStage, Samples(random, 8 * butterflies),
                    [&](auto stage, int16_t* data) { stage(butterflies, 0, data, nullptr, 0); });
}

std::string CompareSecondStage(CaseRandom& random) {
  const size_t groups = random.Pick("groups", 1, 6);
  return Difference(random, kSecondStage, Samples(random, 32 * groups),
                    [&](auto stage, int16_t* data) { stage(groups, 16, data, nullptr, 0); });
}

std::string CompareLaterStage(CaseRandom& random) {
  const size_t groups = random.Pick("groups", 1, 5), quarter = 4 * random.Pick("quarter / 4", 1, 8);
  const size_t stride = random.Pick("stride", 1, 5);
  const int16_t* twiddles = Location(random, Samples(random, 2 * (3 * (quarter - 1) * stride + 1)));
  return Difference(
      random, kLaterStage, Samples(random, 8 * groups * quarter),
      [&](auto stage, int16_t* data) { stage(groups, 4 * quarter, data, twiddles, 4 * stride); });
}

std::string CompareSplit(CaseRandom& random) {
  const size_t count = 8 * random.Pick("count / 8", 1, 12);
  const int16_t* twiddles = Location(random, Samples(random, count));
  return Difference(random, kSplit, Samples(random, 2 * (count + 1)),
                    [&](auto split, int16_t* data) { split(count, data, twiddles); });
}

std::string ComparePower(CaseRandom& random) {
  const size_t count = random.Pick("count", 1, 40);
  const int16_t* in = Location(random, Samples(random, 2 * count));
  return Difference(random, kPower, RandomValues<uint32_t>(random, count),
                    [&](auto power, uint32_t* out) { power(4 * count, in, out); });
}

std::string CompareFilterbank(CaseRandom& random) {
  const size_t rows = random.Pick("rows", 1, 8);
  const auto width_values =
      random.Fill<uint8_t>(rows + 1, 1, random.Next() % 8 ? random.Between(1, 9) : 255);
  size_t bins = 0;
  for (const uint8_t width : width_values) bins += width;
  const uint8_t* widths = Location(random, width_values);
  const uint32_t* in = Location(random, ShapedFill<uint32_t>(random, bins));
  const uint16_t* weights = Location(random, ShapedFill<uint16_t>(random, 2 * bins));
  return Difference(
      random, kFilterbank, RandomValues<uint64_t>(random, rows),
      [&](auto filterbank, uint64_t* out) { filterbank(rows, in, widths, weights, out); });
}

// Values of all sizes: many beside a square or where the root steps up, halfway to the next, and
// some from where the root of a 32-bit value would take 17 bits.
std::vector<uint64_t> Radicands(Random& random, size_t count) {
  std::vector<uint64_t> values(count);
  for (uint64_t& v : values) {
    v = random.Next() >> (random.Next() % 64);
    const uint64_t shape = random.Next() % 8;
    if (shape < 4) {
      const uint64_t root = random.Next() >> (32 + random.Next() % 32);
      v = root * root + (shape < 2 ? root : 0) + static_cast<uint64_t>(random.Between(-1, 1));
    } else if (shape == 4) {
      v = (uint64_t{1} << 32) + static_cast<uint64_t>(random.Between(-70000, 70000));
    }
  }
  return values;
}

std::string CompareSquareRoot(CaseRandom& random) {
  const size_t count = random.Pick("count", 1, 21);
  const uint64_t* in = Location(
      random, random.Next() % 4 ? Radicands(random, count) : RandomValues<uint64_t>(random, count));
  const auto shift = static_cast<uint32_t>(random.Next() % 2 ? 0 : random.Pick("shift", 0, 70));
  return Difference(random, kSquareRoot, RandomValues<uint32_t>(random, count),
                    [&](auto root, uint32_t* out) { root(8 * count, in, out, shift); });
}

std::string CompareNoiseSubtraction(CaseRandom& random) {
  const size_t count = 2 * random.Pick("count / 2", 1, 20);
  const uint32_t* in = Location(random, ShapedFill<uint32_t>(random, count));
  const auto factors = ShapedFill<uint32_t>(random, 5);
  const auto scale = static_cast<uint32_t>(random.Pick("scale_bits", 0, 31));
  const auto fraction = static_cast<uint32_t>(random.Pick("fraction_bits", 0, 63));
  // The estimates, then the output.
  std::vector<uint32_t> contents = ShapedFill<uint32_t>(random, count);
  contents.resize(2 * count);
  return Difference(random, kNoiseSubtraction, contents, [&](auto subtract, uint32_t* noise) {
    subtract(count, in, factors[0], factors[1], factors[2], factors[3], factors[4], scale, fraction,
             noise, noise + count);
  });
}

std::string CompareLogarithm(CaseRandom& random) {
  const size_t count = random.Pick("count", 0, 40);
  std::vector<uint32_t> values = ShapedFill<uint32_t>(random, count);
  if (random.Next() % 2) {
    for (uint32_t& x : values)
      x = static_cast<uint32_t>(random.Next() >> (32 + random.Next() % 32));
  }
  const uint32_t* in = Location(random, values);
  const auto shift = static_cast<uint32_t>(random.Pick("input_shift", 0, 35));
  const auto scale = static_cast<uint32_t>(random.Next() >> (32 + random.Next() % 32));
  return Difference(random, kLogarithm, RandomValues<uint16_t>(random, count),
                    [&](auto log, uint16_t* out) { log(count, in, shift, scale, out); });
}

// Values of `bits` bits at most, in no order.
template <typename T>
constexpr std::array<T, 48> Scattered(int bits) {
  std::array<T, 48> values{};
  for (size_t i = 0; i < values.size(); ++i) {
    values[i] = static_cast<T>((i + 1) * 0x9E3779B97F4A7C15u >> (64 - bits));
  }
  return values;
}

// The front end's data. What they hold changes nothing that is counted or timed, but for the
// widths, which are the front end's, and for channels of 0, for which the references have less
// to do.
int16_t samples[514];
int16_t spectrum[2 * 256];
int16_t table[2 * 256];
uint16_t weights[2 * 237];
uint32_t levels[237], noise[48], roots[48];
uint64_t energies[48];
uint16_t features[48];
constexpr auto kEnergies = Scattered<uint64_t>(47);
constexpr auto kAmplitudes = Scattered<uint32_t>(23);
constexpr uint8_t kWidths[49] = {1, 1, 2, 1, 2, 1, 2, 2, 1, 2,  2,  2,  3,  2,  2, 3, 2,
                                 3, 3, 3, 4, 3, 3, 4, 4, 4, 4,  5,  5,  5,  5,  5, 6, 6,
                                 6, 7, 7, 7, 7, 8, 9, 8, 9, 10, 10, 11, 11, 11, 13};

}  // namespace

std::vector<Kernel> SignalKernels() {
  return {
      {kWindow.name, CompareWindow,
       [](Side side) { kWindow.of[side](1, 800, samples, table, samples, 12); }},
      {"orra_s16_rmaxabs_ukernel__neon_x32"},
      {"orra_i16_vlshift_ukernel__neon_x32"},
      {kDigitReverse.name, CompareDigitReverse,
       [](Side side) { kDigitReverse.of[side](200, samples, spectrum); }},
      {kFirstStage.name, CompareFirstStage,
       [](Side side) { kFirstStage.of[side](64, 0, samples, nullptr, 0); }},
      {kSecondStage.name, CompareSecondStage,
       [](Side side) { kSecondStage.of[side](16, 16, samples, nullptr, 0); }},
      {kLaterStage.name, CompareLaterStage,
       [](Side side) {
         kLaterStage.of[side](4, 64, samples, table, 16);
         kLaterStage.of[side](1, 256, samples, table, 4);
       }},
      {kSplit.name, CompareSplit, [](Side side) { kSplit.of[side](256, samples, table); }},
      {kPower.name, ComparePower, [](Side side) { kPower.of[side](948, samples, levels); }},
      {kFilterbank.name, CompareFilterbank,
       [](Side side) { kFilterbank.of[side](48, levels, kWidths, weights, energies); }},
      {kSquareRoot.name, CompareSquareRoot,
       [](Side side) { kSquareRoot.of[side](384, kEnergies.data(), roots, 1); }},
      {kNoiseSubtraction.name, CompareNoiseSubtraction,
       [](Side side) {
         kNoiseSubtraction.of[side](48, kAmplitudes.data(), 655, 655, 15729, 15729, 819, 0, 14,
                                    noise, levels);
       }},
      {kLogarithm.name, CompareLogarithm,
       [](Side side) { kLogarithm.of[side](48, kAmplitudes.data(), 3, 16, features); }},
  };
}

}  // namespace qz::test
