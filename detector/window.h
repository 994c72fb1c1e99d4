// SPDX-License-Identifier: Apache-2.0
// The network's window out of frames of features, and its cadence.
#pragma once

#include <cstddef>
#include <cstdint>
#include <cstring>

#include "config/detector.h"
#include "detector/framing.h"

namespace qz::detector {

constexpr size_t kWindowBytes = config::kWindowFrames * config::kFeatureChannels;

// A feature as the network takes it: less its zero point, saturated to int8.
constexpr int8_t NetworkInput(uint16_t feature) {
  constexpr int kMax = INT8_MAX + config::kFeatureZeroPoint;
  const int value = feature < kMax ? feature : kMax;
  return static_cast<int8_t>(value - config::kFeatureZeroPoint);
}

// A frame of features as the network takes it.
inline void MakeNetworkInput(const uint16_t* features, int8_t* frame) {
  for (size_t i = 0; i < config::kFeatureChannels; ++i) frame[i] = NetworkInput(features[i]);
}

// Appends a frame of features to `window` (kWindowBytes, oldest frame first), which holds
// `*held` frames. Whenever it is full, calls run(), which scores it, drops the oldest frames up to
// the next run, and returns true: the scores are new.
template <typename FrameCount, typename RunNetwork>
bool TakeFrame(const uint16_t* features, int8_t* window, FrameCount* held, RunNetwork&& run) {
  Require(*held < config::kWindowFrames);
  MakeNetworkInput(features, window + *held * config::kFeatureChannels);
  ++*held;
  if (*held < config::kWindowFrames) return false;
  run();
  std::memmove(window, window + config::kFramesBetweenRuns * config::kFeatureChannels,
               config::kCarriedFrames * config::kFeatureChannels);
  *held = config::kCarriedFrames;
  return true;
}

}  // namespace qz::detector
