// SPDX-License-Identifier: Apache-2.0
#include "model/synthetic_features.h"

#include <algorithm>
#include <array>

#include "base/number_generator.h"

namespace qz::model {
namespace {

constexpr double kMinFeature = 33;  // of amplitude 1
constexpr double kMaxFeature = 251;
constexpr double kSubtractionDepth = 48;  // -16 x ln(0.05): the subtraction's floor

double Distance(double a, double b) { return a < b ? b - a : a - b; }

// Features in the making; an event shows where it is louder than what is there.
class Scene {
 public:
  explicit Scene(uint64_t seed) : random_(seed) {}

  Tensor Paint() {
    Background();
    for (int events = random_.Between(0, 7); events > 0; --events) Event();
    if (random_.Between(0, 5) == 0) Silence();
    Tensor window(kInputRows, kInputChannels);
    for (int row = 0; row < kInputRows; ++row) {
      for (int c = 0; c < kInputChannels; ++c) {
        const double cell = std::min(At(row, c), kMaxFeature);
        const int feature = cell < kMinFeature ? 0 : static_cast<int>(cell);
        window.Row(row)[c] = static_cast<int8_t>(std::min(feature - 128, 127));
      }
    }
    return window;
  }

 private:
  double& At(int row, int channel) {
    return cells_[static_cast<size_t>(row) * kInputChannels + static_cast<size_t>(channel)];
  }

  void Raise(int row, int channel, double level) {
    if (row < 0 || row >= kInputRows || channel < 0 || channel >= kInputChannels) return;
    At(row, channel) = std::max(At(row, channel), level + 18 * random_.Bell());
  }

  // A noise floor varies after its mean was subtracted: most cells lie well below it.
  void Background() {
    const double level = random_.Uniform(30, 150);
    const double tilt = random_.Uniform(-1.2, 0.4);
    const double restlessness = random_.Uniform(0.3, 1);
    double ripple = 0;
    for (int c = 0; c < kInputChannels; ++c) {
      ripple = 0.9 * ripple + 12 * random_.Bell();
      for (int row = 0; row < kInputRows; ++row) {
        const double gap = random_.Unit() < restlessness ? random_.Unit() * kSubtractionDepth : 0;
        At(row, c) = level + tilt * (c - 12) + ripple + 20 * random_.Bell() - gap;
      }
    }
  }

  void Event() {
    const int start = random_.Between(-60, kInputRows - 20);
    const double level = random_.Uniform(110, 225);
    switch (random_.Between(0, 4)) {
      case 0:
        return Voice(start, level);
      case 1:
        return Tone(start, level);
      case 2:
        return Strokes(start, level);
      case 3:
        return Sweep(start, level);
      default:
        return Roar(start, level);
    }
  }

  // Syllables of 60 to 250 ms: harmonics in the low bands under two wandering formants.
  void Voice(int start, double level) {
    double pitch = random_.Uniform(2.5, 6);  // bands between harmonics
    double formants[2] = {random_.Uniform(6, 18), random_.Uniform(18, 38)};
    for (int syllables = random_.Between(1, 10); syllables > 0; --syllables) {
      const int length = random_.Between(6, 25);
      const double bend = random_.Uniform(-0.04, 0.04);
      for (int row = start; row < start + length; ++row) {
        pitch = std::clamp(pitch + bend, 2.0, 8.0);
        for (int c = 0; c < kInputChannels; ++c) {
          const double nearest = std::min(Distance(c, formants[0]), Distance(c, formants[1]));
          double harmonic = c;
          while (harmonic >= pitch) harmonic -= pitch;
          const double comb = c < 24 ? 9 * std::min(harmonic, pitch - harmonic) : 6;
          Raise(row, c, level - 3.5 * nearest - comb);
        }
      }
      for (double& formant : formants) formant += 12 * random_.Bell();
      start += length + random_.Between(2, 20);
    }
  }

  // One to four narrow partials; held tones sink towards the subtraction's floor in 25 frames.
  void Tone(int start, double level) {
    const int length = random_.Between(10, 250);
    const double fading = random_.Uniform(0.9, 0.98);
    for (int partials = random_.Between(1, 4); partials > 0; --partials) {
      const int channel = random_.Between(0, kInputChannels - 1);
      double fade = 1;
      for (int row = start; row < start + length; ++row, fade *= fading) {
        const double now = level - kSubtractionDepth * (1 - fade);
        for (int side = -3; side <= 3; ++side) {
          Raise(row, channel + side, now - 22 * Distance(side, 0));
        }
      }
    }
  }

  // Wide-band onsets that die away, one or a train: knocks, barks, rain.
  void Strokes(int start, double level) {
    const double decay = random_.Uniform(1, 12);
    const double tilt = random_.Uniform(-1.5, 1.5);
    const int period = random_.Between(12, 120);
    for (int strokes = random_.Between(1, 12); strokes > 0; --strokes, start += period) {
      const double strength = level - random_.Uniform(0, 25);
      for (int age = 0; age * decay < 90; ++age) {
        for (int c = 0; c < kInputChannels; ++c) {
          Raise(start + age, c, strength - decay * age + tilt * (c - 24));
        }
      }
    }
  }

  void Sweep(int start, double level) {
    const int length = random_.Between(15, 150);
    const double width = random_.Uniform(1, 5);
    double centre = random_.Uniform(4, 44);
    const double speed = random_.Uniform(-0.5, 0.5);
    for (int row = start; row < start + length; ++row, centre += speed) {
      for (int c = 0; c < kInputChannels; ++c) {
        Raise(row, c, level - 15 * Distance(c, centre) / width);
      }
    }
  }

  // A long noise of some bands that swells and ebbs.
  void Roar(int start, double level) {
    const int length = random_.Between(60, kInputRows + 60);
    const double centre = random_.Uniform(0, 48);
    const double slope = random_.Uniform(0.5, 4);
    double swell = 0;
    for (int row = start; row < start + length; ++row) {
      swell = 0.95 * swell + 12 * random_.Bell();
      for (int c = 0; c < kInputChannels; ++c) {
        Raise(row, c, level - 40 + swell - slope * Distance(c, centre));
      }
    }
  }

  void Silence() {
    const int start = random_.Between(0, kInputRows - 1);
    const int end = std::min(kInputRows, start + random_.Between(20, 300));
    for (int row = start; row < end; ++row) {
      for (int c = 0; c < kInputChannels; ++c) At(row, c) = 0;
    }
  }

  base::NumberGenerator random_;
  std::array<double, static_cast<size_t>(kInputRows* kInputChannels)> cells_{};
};

}  // namespace

Tensor SyntheticWindow(uint64_t seed) { return Scene(seed).Paint(); }

}  // namespace qz::model
