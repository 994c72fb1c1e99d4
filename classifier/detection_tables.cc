// SPDX-License-Identifier: Apache-2.0
#include "classifier/detection_tables.h"

namespace tarn::contexthub::sound {

// No valid confidence is above 1.0: with these nothing is ever detected, and the periodic report is
// the only result of a pass.
const float kSoundThresholds[kSoundCategoryCount] = {1.0f, 1.0f, 1.0f, 1.0f, 1.0f};

const uint64_t kSoundDetectionCoolingTimeNs[kSoundCategoryCount] = {0, 0, 0, 0, 0};

}  // namespace tarn::contexthub::sound
