// SPDX-License-Identifier: Apache-2.0
#include "dataset/clip_features.h"

#include "detector/feature_stream.h"

namespace qz::dataset {

std::vector<uint16_t> FeaturesOf(const int16_t* samples, size_t count) {
  std::vector<uint16_t> features;
  features.reserve(detector::FramesOf(count) * config::kFeatureChannels);
  detector::FeatureStream stream{};
  detector::PushSamples(samples, count, &stream, [&](const uint16_t* frame) {
    features.insert(features.end(), frame, frame + config::kFeatureChannels);
  });
  return features;
}

}  // namespace qz::dataset
