// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>

#include "classifier/types/confidence_event.h"

namespace tarn::contexthub::sound {

// By network output. A product links another detection_tables.cc to detect anything else.

// A category is detected when its confidence is greater.
extern const float kSoundThresholds[kSoundCategoryCount];
// After a detection the category rests for so long, in nanoseconds of the hub's clock.
extern const uint64_t kSoundDetectionCoolingTimeNs[kSoundCategoryCount];

}  // namespace tarn::contexthub::sound
