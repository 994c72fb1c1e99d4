// SPDX-License-Identifier: Apache-2.0
#include "detector/detector.h"

namespace qz::detector {

bool TakeFrame(const uint16_t* features, const network::Weights& weights, Detector* detector) {
  int8_t frame[config::kFeatureChannels];
  MakeNetworkInput(features, frame);
  return network::Push(frame, weights, &detector->network);
}

Pass Classify(const int16_t* samples, size_t count, const network::Weights& weights,
              Detector* detector) {
  Pass pass;
  PushSamples(samples, count, &detector->stream, [&](const uint16_t* features) {
    if (!TakeFrame(features, weights, detector)) return;
    ++pass.runs;
    const float* scores = detector->network.scores;
    for (size_t i = 0; i < config::kClasses; ++i) {
      if (pass.single[i] < scores[i]) pass.single[i] = scores[i];
    }
    if (!FoldScores(scores, &detector->newest_short, &detector->newest_long,
                    pass.confidences.data())) {
      pass.valid = false;
    }
  });
  if (!pass.valid) {
    pass.confidences = {};
    detector->newest_short.clear();
    detector->newest_long.clear();
  }
  return pass;
}

}  // namespace qz::detector
