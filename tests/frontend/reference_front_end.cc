// SPDX-License-Identifier: Apache-2.0
#include "tests/frontend/reference_front_end.h"

#include <algorithm>
#include <cmath>
#include <cstdlib>

namespace qz::test {
namespace {

constexpr double kPi = 3.14159265358979323846;
constexpr int kPoints = 256;  // of the complex FFT
constexpr int kFirstBin = 4, kLastBin = 240, kChannels = 48;

struct Complex {
  int re = 0, im = 0;
};

int Wrapped(int64_t value) { return static_cast<int16_t>(value); }

int Rounded(double value) { return static_cast<int>(std::floor(value + 0.5)); }

// value * factor / 2^15, rounded.
int Scaled(int value, int factor) { return (value * factor + 16384) >> 15; }

// factor * e^(j angle), rounded: Q15 with 32767 for 1.0.
Complex Unit(double angle) {
  return {Rounded(32767 * std::cos(angle)), Rounded(32767 * std::sin(angle))};
}

Complex Product(Complex a, Complex b) {
  return {Wrapped((int64_t{a.re} * b.re - int64_t{a.im} * b.im + 16384) >> 15),
          Wrapped((int64_t{a.re} * b.im + int64_t{a.im} * b.re + 16384) >> 15)};
}

Complex Sum(Complex a, Complex b) { return {Wrapped(a.re + b.re), Wrapped(a.im + b.im)}; }
Complex Difference(Complex a, Complex b) { return {Wrapped(a.re - b.re), Wrapped(a.im - b.im)}; }
Complex TimesMinusJ(Complex a) { return {a.im, Wrapped(-int64_t{a.re})}; }

// Decimation in time, radix 4: the transforms of every fourth entry first, then one stage over
// them. Each stage divides by 4.
std::vector<Complex> Fft(const std::vector<Complex>& input) {
  const size_t quarter = input.size() / 4;
  if (input.size() == 1) return input;
  std::vector<Complex> parts[4], output(input.size());
  for (size_t m = 0; m < 4; ++m) {
    std::vector<Complex> part(quarter);
    for (size_t i = 0; i < quarter; ++i) part[i] = input[4 * i + m];
    parts[m] = Fft(part);
  }
  for (size_t k = 0; k < quarter; ++k) {
    Complex a[4];
    for (size_t m = 0; m < 4; ++m) {
      a[m] = {Scaled(parts[m][k].re, 8191), Scaled(parts[m][k].im, 8191)};
      const double turn = static_cast<double>(m * k) / static_cast<double>(input.size());
      if (m > 0 && quarter > 1) a[m] = Product(a[m], Unit(-2 * kPi * turn));
    }
    const Complex even_sum = Sum(a[0], a[2]), even_difference = Difference(a[0], a[2]);
    const Complex odd_sum = Sum(a[1], a[3]);
    const Complex odd_difference = TimesMinusJ(Difference(a[1], a[3]));
    output[k] = Sum(even_sum, odd_sum);
    output[k + quarter] = Sum(even_difference, odd_difference);
    output[k + 2 * quarter] = Difference(even_sum, odd_sum);
    output[k + 3 * quarter] = Difference(even_difference, odd_difference);
  }
  return output;
}

// Bins 0 to 256 of the real samples that z holds in pairs: the even and odd parts of its transform
// are those of the even and the odd samples.
std::vector<int16_t> RealSpectrum(const std::vector<int16_t>& samples) {
  std::vector<Complex> z(kPoints);
  for (size_t n = 0; n < samples.size() / 2; ++n) z[n] = {samples[2 * n], samples[2 * n + 1]};
  z = Fft(z);
  for (Complex& each : z) each = {Scaled(each.re, 16383), Scaled(each.im, 16383)};
  std::vector<Complex> bins(kPoints + 1);
  bins[0] = {z[0].re + z[0].im, 0};
  bins[kPoints] = {z[0].re - z[0].im, 0};
  for (size_t k = 1; k <= kPoints / 2; ++k) {
    const Complex f = z[k], b = z[kPoints - k];
    const Complex twiddle = Unit(-kPi / 2 - kPi * static_cast<double>(k) / kPoints);
    const int even_re = f.re + b.re, even_im = f.im - b.im;
    const int odd_re = f.re - b.re, odd_im = f.im + b.im;
    const int re = (odd_re * twiddle.re - odd_im * twiddle.im + 16384) >> 15;
    const int im = (odd_re * twiddle.im + odd_im * twiddle.re + 16384) >> 15;
    bins[k] = {(even_re + re) >> 1, (even_im + im) >> 1};
    bins[kPoints - k] = {(even_re - re) >> 1, (im - even_im) >> 1};
  }
  std::vector<int16_t> spectrum;
  spectrum.reserve(2 * bins.size());
  for (const Complex& bin : bins) {
    spectrum.push_back(static_cast<int16_t>(bin.re));
    spectrum.push_back(static_cast<int16_t>(bin.im));
  }
  return spectrum;
}

double Mel(double hertz) { return 1127 * std::log(1 + hertz / 700); }

// Triangles equally wide in mel from 100 to 7500 Hz; weights in Q12, rounded down.
std::vector<uint64_t> ChannelEnergies(const std::vector<uint32_t>& power) {
  const double low = Mel(100), spacing = (Mel(7500) - low) / (kChannels + 1);
  std::vector<uint64_t> energy(kChannels);
  for (int bin = kFirstBin; bin <= kLastBin; ++bin) {
    // The last bin lies exactly on the last edge, whatever is lost in the division.
    const double position = bin == kLastBin ? kChannels + 1 : (Mel(31.25 * bin) - low) / spacing;
    const int segment = static_cast<int>(std::ceil(position)) - 1;
    const double falling = segment + 1 - position;
    const uint64_t p = power[static_cast<size_t>(bin - kFirstBin)];
    if (segment < kChannels) {
      energy[static_cast<size_t>(segment)] +=
          p * static_cast<uint64_t>(std::floor(4096 * (1 - falling)));
    }
    if (segment > 0) {
      energy[static_cast<size_t>(segment - 1)] +=
          p * static_cast<uint64_t>(std::floor(4096 * falling));
    }
  }
  return energy;
}

uint32_t NearestRoot(uint64_t value) {
  auto root = static_cast<uint64_t>(std::sqrt(static_cast<double>(value)));
  while (root * root + root < value) ++root;
  while (root > 0 && root * root - root >= value) --root;
  // The only value of 32 bits whose root has 17.
  return root == 65536 && value >> 32 == 0 ? 65535 : static_cast<uint32_t>(root);
}

// Q16: the logarithm to base 2 as a straight line over the mantissa and a correction, which is
// interpolated between 129 points.
uint16_t Feature(uint32_t value) {
  if (value == 0) return 0;
  const int64_t y = int64_t{value} * 8;
  int octave = 0;
  while (y >> (octave + 1) != 0) ++octave;
  const int64_t mantissa = (((y << 16) >> octave) - 65536);
  const auto correction = [](int64_t i) {
    const double x = static_cast<double>(i) / 128;
    return Rounded(65536 * (std::log2(1 + x) - x));
  };
  const int64_t from = correction(mantissa / 512), to = correction(mantissa / 512 + 1);
  const int64_t log2 =
      octave * int64_t{65536} + mantissa + from + (((to - from) * (mantissa % 512)) >> 16);
  const int64_t ln = (log2 * Rounded(65536 * std::log(2)) + 32768) >> 16;
  return static_cast<uint16_t>((16 * ln + 32768) >> 16);
}

}  // namespace

FrontEndSteps ReferenceFrontEnd(const std::vector<int16_t>& frame, std::vector<uint32_t>* noise) {
  FrontEndSteps steps;
  int peak = 0;
  for (size_t i = 0; i < frame.size(); ++i) {
    const double phase = 2 * kPi * (static_cast<double>(i) + 0.5) / 400;
    const int weight = Rounded(4096 * (0.5 - 0.5 * std::cos(phase)));
    steps.windowed.push_back(static_cast<int16_t>((frame[i] * weight) >> 12));
    peak = std::max(peak, std::abs(int{steps.windowed.back()}));
  }
  while (steps.shift < 15 && (peak << steps.shift) < 16384) ++steps.shift;
  for (const int16_t sample : steps.windowed) {
    steps.normalised.push_back(static_cast<int16_t>(sample * (1 << steps.shift)));
  }
  steps.spectrum = RealSpectrum(steps.normalised);
  for (size_t bin = kFirstBin; bin <= kLastBin; ++bin) {
    const int64_t re = steps.spectrum[2 * bin], im = steps.spectrum[2 * bin + 1];
    steps.power.push_back(static_cast<uint32_t>(re * re + im * im));
  }
  steps.energy = ChannelEnergies(steps.power);
  for (size_t c = 0; c < kChannels; ++c) {
    const uint64_t a = NearestRoot(steps.energy[c]) >> steps.shift;
    const uint64_t estimate = (a * 655 + uint64_t{(*noise)[c]} * 15729) / 16384;
    (*noise)[c] = static_cast<uint32_t>(estimate);
    const uint64_t left = a > estimate ? a - estimate : 0;
    steps.amplitude.push_back(static_cast<uint32_t>(a));
    steps.suppressed.push_back(static_cast<uint32_t>(std::max(left, a * 819 / 16384)));
    steps.features.push_back(Feature(steps.suppressed.back()));
  }
  return steps;
}

}  // namespace qz::test
