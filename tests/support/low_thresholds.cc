// SPDX-License-Identifier: Apache-2.0
// Detection tables with which things are detected; a suite that links them uses them instead of
// the default.

#include "classifier/detection_tables.h"

namespace tarn::contexthub::sound {

const float kSoundThresholds[kSoundCategoryCount] = {0.5f, 0.25f, 0.5f, 0.0625f, 0.5f};

const uint64_t kSoundDetectionCoolingTimeNs[kSoundCategoryCount] = {0, 0, 5'000'000'000, 0, 0};

}  // namespace tarn::contexthub::sound
