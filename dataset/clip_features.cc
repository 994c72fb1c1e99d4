#include "dataset/clip_features.h"

#include <algorithm>
#include <mutex>

#include "frontend/audio_frontend.h"

namespace qz::dataset {
namespace {

static_assert(kFrameSamples == frontend::kFrameSamples);
static_assert(kFeatureChannels == frontend::kFeatureChannels);

int16_t Amplified(int16_t sample) {
  return static_cast<int16_t>(std::clamp(4 * sample, -32768, 32767));
}

}  // namespace

FeatureStream::FeatureStream() { audio_frontend_reset(); }

void FeatureStream::Push(const int16_t* samples, size_t count, const Sink& sink) {
  const int16_t* const end = samples + count;
  while (samples < end) {
    const size_t taken = std::min(kFrameSamples - held_, static_cast<size_t>(end - samples));
    std::transform(samples, samples + taken, frame_.begin() + held_, Amplified);
    samples += taken;
    held_ += taken;
    if (held_ < kFrameSamples) return;
    std::copy(frame_.begin(), frame_.end(), audio_frontend_input_ptr);
    audio_frontend_invoke();
    sink(audio_frontend_output_ptr);
    std::copy(frame_.begin() + kHopSamples, frame_.end(), frame_.begin());
    held_ -= kHopSamples;
  }
}

std::vector<uint16_t> FeaturesOf(const int16_t* samples, size_t count) {
  static std::mutex front_end;
  const std::lock_guard<std::mutex> lock(front_end);
  std::vector<uint16_t> features;
  features.reserve(FramesOf(count) * kFeatureChannels);
  FeatureStream().Push(samples, count, [&](const uint16_t* frame) {
    features.insert(features.end(), frame, frame + kFeatureChannels);
  });
  return features;
}

}  // namespace qz::dataset
