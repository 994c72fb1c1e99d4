// SPDX-License-Identifier: Apache-2.0
// The other detector's tables: one more class than the usual.

#include "classifier/detection_tables.h"

namespace tarn::contexthub::sound {

const float kSoundThresholds[kSoundCategoryCount] = {1.0f, 1.0f, 1.0f, 1.0f, 1.0f, 1.0f};

const uint64_t kSoundDetectionCoolingTimeNs[kSoundCategoryCount] = {0, 0, 0, 0, 0, 0};

}  // namespace tarn::contexthub::sound
