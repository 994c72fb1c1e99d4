// SPDX-License-Identifier: Apache-2.0
#include "detector/scores.h"

namespace qz::detector {
namespace {

// The mean over the capacity. Summed in single precision, oldest first: the order decides the last
// bit.
template <uint16_t kRuns>
float Smooth(tarn::circular_buffer_lite<kRuns, float>* newest, float score) {
  newest->push_back(score);
  float sum = 0.0f;
  for (uint16_t i = 0; i < newest->size(); ++i) sum += (*newest)[i];
  return sum / static_cast<float>(kRuns);
}

}  // namespace

bool FoldScores(const float* scores, ShortScores* newest_short, LongScores* newest_long,
                float* confidences) {
  for (size_t i = 0; i < config::kClasses; ++i) {
    float value = scores[i];
    if (value > 1.0f) return false;
    if (i == config::kShortSmoothedOutput) value = Smooth(newest_short, value);
    if (i == config::kLongSmoothedOutput) value = Smooth(newest_long, value);
    // This way round a NaN never gets in.
    if (confidences[i] < value) confidences[i] = value;
  }
  return true;
}

bool Detect(float confidence, float threshold, uint64_t cooling_ns, uint64_t now_ns,
            uint64_t* last_ns) {
  if (!(confidence > threshold)) return false;
  if (*last_ns != 0 && *last_ns + cooling_ns >= now_ns) return false;
  *last_ns = now_ns;
  return true;
}

}  // namespace qz::detector
