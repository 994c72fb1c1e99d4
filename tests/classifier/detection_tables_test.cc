// The tables that the module ships with, under which nothing is ever detected.

#include "detection_tables.h"

#include <gtest/gtest.h>

namespace tarn::contexthub::sound {
namespace {

TEST(DetectionTables, DetectNothing) {
  for (size_t i = 0; i < kSoundCategoryCount; ++i) {
    EXPECT_EQ(kSoundThresholds[i], 1.0f);
    EXPECT_EQ(kSoundDetectionCoolingTimeNs[i], 0u);
  }
}

}  // namespace
}  // namespace tarn::contexthub::sound
