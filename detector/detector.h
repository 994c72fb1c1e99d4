// SPDX-License-Identifier: Apache-2.0
// A whole detector, as in the module: any number of them run in one program, on threads of their
// own.
#pragma once

#include <cstddef>
#include <cstdint>

#include "detector/feature_stream.h"
#include "detector/scores.h"
#include "detector/window.h"
#include "network/stream_network.h"

namespace qz::detector {

// From a fresh start when it is value-initialised.
struct Detector {
  FeatureStream stream;
  network::Stream<network::kChunkTileRows> network;
  ShortScores newest_short;
  LongScores newest_long;
};

// The maxima over the network runs of a pass (two seconds: three or four runs); 0 without any.
struct Pass {
  int runs = 0;
  bool valid = true;     // no score was above 1
  Scores single{};       // as the network gave them
  Scores confidences{};  // compared with thresholds: two smoothed over runs; all 0 if not valid
};

// Takes the features of the next frame. True if `detector->network.scores` are new.
bool TakeFrame(const uint16_t* features, const network::Weights& weights, Detector* detector);

// A pass over the samples that come next. One that is not valid also forgets the newest scores.
Pass Classify(const int16_t* samples, size_t count, const network::Weights& weights,
              Detector* detector);

}  // namespace qz::detector
