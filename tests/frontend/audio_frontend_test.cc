// SPDX-License-Identifier: Apache-2.0
// The front end's features against the same analysis in double precision and against recorded ones,
// its steps against a reference, and its noise estimates.

#include "frontend/audio_frontend.h"

#include <gmock/gmock.h>

#include <algorithm>
#include <cmath>
#include <complex>
#include <cstring>
#include <vector>

#include "tests/frontend/reference_front_end.h"
#include "tests/support/random.h"

namespace {

using namespace qz::frontend;
using testing::Each;
using Samples = std::vector<int16_t>;
using Features = std::vector<uint16_t>;

constexpr double kPi = 3.14159265358979323846;

Features RunFrame(const Samples& frame) {
  std::copy(frame.begin(), frame.end(), audio_frontend_input_ptr);
  audio_frontend_invoke();
  return {audio_frontend_output_ptr, audio_frontend_output_ptr + kFeatureChannels};
}

double Mel(double hertz) { return 1127 * std::log(1 + hertz / 700); }

// Power of the windowed frame's DFT / 512.
double Power(const Samples& frame, int bin) {
  std::complex<double> sum;
  for (int n = 0; n < 400; ++n) {
    const double window = 0.5 - 0.5 * std::cos(2 * kPi * (n + 0.5) / 400);
    sum += std::polar(window * frame[n] / 512, -2 * kPi * (bin * n % 512) / 512);
  }
  return std::norm(sum);
}

TEST(AudioFrontend, StaysCloseToItsMathematics) {
  const double spacing = (Mel(7500) - Mel(100)) / 49;
  for (int level : {1000, 5000, 32767}) {  // noise: power in every channel
    const Samples frame = qz::test::Random(level).Fill<int16_t>(kFrameSamples, -level, level);
    double energies[48] = {};
    for (int bin = 4; bin <= 240; ++bin) {
      const double power = Power(frame, bin),
                   location = (Mel(31.25 * bin) - Mel(100)) / spacing - 1;
      for (int c = 0; c < 48; ++c) energies[c] += power * std::max(0.0, 1 - std::abs(location - c));
    }
    audio_frontend_reset();
    const Features features = RunFrame(frame);
    for (int c = 0; c < 48; ++c) {
      // Q12 weights give the root a factor 64, and the first frame after a reset keeps 1 -
      // 655/16384 of the amplitude.
      const double exact = 16 * std::log(8 * 64 * std::sqrt(energies[c]) * (1 - 655.0 / 16384));
      // Rounding to whole features, the logarithm's 0.04, and a few units of rounding before it.
      EXPECT_NEAR(features[c], exact, 0.75) << c;
    }
  }
}

// Frame n of an endless series: noise, near-silence, one sample around every power of two, square
// waves, a constant at the minimum, silence, sawteeth, and noise of every level.
Samples Frame(uint32_t n) {
  qz::test::Random random(n);
  Samples frame(kFrameSamples);
  const int level = 1 << n / 8 % 16;
  for (uint32_t i = 0; i < kFrameSamples; ++i) {
    const int values[] = {static_cast<int>(random.Between(-32768, 32767)),
                          static_cast<int>(random.Between(-3, 3)),
                          i == 200 ? -level + static_cast<int>(n / 128 % 2) : 0,
                          i / (1 + n % 50) % 2 ? 32767 : -32768,
                          -32768,
                          0,
                          static_cast<int16_t>(i * n * 37),
                          static_cast<int>(random.Between(-level, level - 1))};
    frame[i] = static_cast<int16_t>(values[n % 8]);
  }
  return frame;
}

TEST(AudioFrontend, KeepsEveryBitOfItsFeatures) {
  audio_frontend_reset();
  uint64_t digest = 0xCBF29CE484222325u;
  for (uint32_t n = 0; n < 320; ++n) {
    for (uint16_t feature : RunFrame(Frame(n))) digest = (digest ^ feature) * 0x100000001B3u;
  }
  // 64-bit FNV-1a of the values; recorded from a separate computation of the same steps.
  EXPECT_EQ(digest, 0xF8AB0AC2F017634Fu);
}

// Values [first, end) of a region of the arena.
template <typename T>
std::vector<T> Region(const Arena& arena, size_t offset, size_t first, size_t end) {
  std::vector<T> values(end - first);
  std::memcpy(values.data(), arena.bytes + offset + first * sizeof(T), values.size() * sizeof(T));
  return values;
}

template <typename T>
std::vector<T> Part(const std::vector<T>& values, size_t first, size_t end) {
  return {values.begin() + static_cast<long>(first), values.begin() + static_cast<long>(end)};
}

// Of every step what later ones leave of it in the arena: enough that the first to differ names
// itself.
TEST(AudioFrontend, EveryStepIsThatOfTheReference) {
  Arena arena{};
  State state{};
  std::vector<uint32_t> noise(kFeatureChannels);
  for (uint32_t n = 0; n < 160; ++n) {
    SCOPED_TRACE(n);
    const Samples frame = Frame(n);
    const qz::test::FrontEndSteps steps = qz::test::ReferenceFrontEnd(frame, &noise);
    std::copy(frame.begin(), frame.end(), InputOf(arena));
    qz::frontend::Run(arena, state);
    ASSERT_EQ(Region<int16_t>(arena, 816, 0, 8), Part(steps.windowed, 0, 8)) << "window";
    ASSERT_EQ(Region<uint32_t>(arena, 0, 0, 1)[0], steps.shift) << "normalising shift";
    ASSERT_EQ(Region<int16_t>(arena, 16, 240, 400), Part(steps.normalised, 240, 400))
        << "normalised frame";
    ASSERT_EQ(Region<int16_t>(arena, 1856, 192, 514), Part(steps.spectrum, 192, 514))
        << "FFT, bins 96 to 256";
    ASSERT_EQ(Region<uint32_t>(arena, 832, 0, 237), steps.power) << "power";
    ASSERT_EQ(Region<uint64_t>(arena, 1856, 0, 48), steps.energy) << "filterbank";
    ASSERT_EQ(Region<uint32_t>(arena, 16, 0, 48), steps.amplitude) << "square root";
    ASSERT_EQ(std::vector<uint32_t>(state.noise, state.noise + 48), noise) << "noise estimate";
    ASSERT_EQ(Region<uint32_t>(arena, 208, 0, 48), steps.suppressed) << "noise subtraction";
    ASSERT_EQ(Region<uint16_t>(arena, 400, 0, 48), steps.features) << "logarithm";
  }
}

TEST(AudioFrontend, FadesSteadySoundToItsFloorAndForgetsItWhenReset) {
  audio_frontend_reset();
  const Features first = RunFrame(Frame(0));
  for (int i = 0; i < 400; ++i) RunFrame(Frame(0));
  const Features last = RunFrame(Frame(0));
  // From 0.96 of the amplitude to 0.05 of it: 16 ln(0.96 / 0.05) = 47.3 less.
  for (size_t c = 0; c < kFeatureChannels; ++c) EXPECT_NEAR(first[c] - last[c], 47.3, 1.5) << c;
  EXPECT_THAT(RunFrame(Samples(kFrameSamples)), Each(0));
  audio_frontend_reset();
  EXPECT_EQ(RunFrame(Frame(0)), first);
}

TEST(AudioFrontend, WritesOnlyItsRegions) {
  unsigned char* arena = reinterpret_cast<unsigned char*>(audio_frontend_input_ptr) - 1856;
  ASSERT_EQ(reinterpret_cast<const unsigned char*>(audio_frontend_output_ptr), arena + 400);
  // Every byte of the arena that no step writes.
  for (const auto& [begin, end] : {std::pair{4, 16}, {1780, 1856}, {2884, 2896}}) {
    std::fill(arena + begin, arena + end, 0xA5);
    RunFrame(Frame(0));
    EXPECT_THAT(std::vector<int>(arena + begin, arena + end), Each(0xA5)) << begin;
  }
}

}  // namespace
