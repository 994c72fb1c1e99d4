// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstddef>
#include <cstdint>

#include "chre/fixed_size_vector.h"
#include "config/detector.h"

namespace tarn::contexthub::sound {

// One sound category and how sure the classifier is of it.
struct ConfidenceEvent {
  uint8_t category;
  float confidence;  // 0.0 to 1.0
};

// Outputs of the network.
constexpr size_t kSoundCategoryCount = qz::config::kClasses;

// The detections of a pass, or its periodic report.
using ConfidenceEvents = chre::FixedSizeVector<ConfidenceEvent, kSoundCategoryCount>;

// Category code of each network output. What the codes mean is the host's.
static constexpr auto& kSoundCategoryIndexMap = qz::config::kCategories;

}  // namespace tarn::contexthub::sound
