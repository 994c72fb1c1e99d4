// Samples into features, by the module's own front end and cut as its classifier cuts them: frames
// of 400 samples, one every 160, each sample four times as loud and saturated to 16 bits.
#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <functional>
#include <vector>

namespace qz::dataset {

constexpr size_t kFeatureChannels = 48;
constexpr size_t kFrameSamples = 400;
constexpr size_t kHopSamples = 160;

// The frames that `samples` fill.
constexpr size_t FramesOf(size_t samples) {
  return samples < kFrameSamples ? 0 : 1 + (samples - kFrameSamples) / kHopSamples;
}
// The samples that fill `frames`, at least 1.
constexpr size_t SamplesOf(size_t frames) { return kFrameSamples + (frames - 1) * kHopSamples; }

// A stream of sound that begins with a fresh start: no noise known yet. The front end has one noise
// memory for the whole program, so there is one stream at a time.
class FeatureStream {
 public:
  // Gets the 48 features of a frame, 0 or 33 to 299, lowest frequency first.
  using Sink = std::function<void(const uint16_t* features)>;

  FeatureStream();
  // Hands every frame that is full now to `sink`.
  void Push(const int16_t* samples, size_t count, const Sink& sink);

 private:
  std::array<int16_t, kFrameSamples> frame_{};
  size_t held_ = 0;
};

// Features of all frames of a sound from a fresh start, FramesOf(count) x 48, row-major. May be
// called on several threads, which then wait for each other.
std::vector<uint16_t> FeaturesOf(const int16_t* samples, size_t count);

// A feature as the network takes it: minus 128, saturated to int8.
constexpr int8_t NetworkInput(uint16_t feature) {
  return static_cast<int8_t>(feature > 255 ? 127 : feature - 128);
}

}  // namespace qz::dataset
