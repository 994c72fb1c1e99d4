// SPDX-License-Identifier: Apache-2.0
// From the network's scores to confidences and detections.
#pragma once

#include <array>
#include <cstdint>

#include "config/detector.h"
#include "detector/circular_buffer_lite.h"

namespace qz::detector {

// By output of the network.
using Scores = std::array<float, config::kClasses>;

// The newest scores of the two smoothed outputs.
using ShortScores = tarn::circular_buffer_lite<config::kShortSmoothingRuns, float>;
using LongScores = tarn::circular_buffer_lite<config::kLongSmoothingRuns, float>;

// Folds the scores of a run into `confidences`, the maxima of a pass by output: those of the
// smoothed outputs are means over the newest runs, those missing counted as 0. Stops with false at
// a score above 1; the outputs before it are folded. A NaN is no maximum.
bool FoldScores(const float* scores, ShortScores* newest_short, LongScores* newest_long,
                float* confidences);

// Whether an output is detected: its confidence is greater than the threshold (a NaN never is) and
// its last detection is longer ago than the cooling time. Times are nanoseconds of one clock;
// `*last_ns` is 0 for never, and becomes `now_ns` with a detection.
bool Detect(float confidence, float threshold, uint64_t cooling_ns, uint64_t now_ns,
            uint64_t* last_ns);

}  // namespace qz::detector
