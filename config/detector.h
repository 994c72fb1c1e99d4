// SPDX-License-Identifier: Apache-2.0
// What follows from the description of the detector, and what must hold of any.
#pragma once

// In angle brackets: the build's choice, not this folder's file.
#include <detector_description.h>

namespace qz::config {

constexpr uint64_t kNanosecondsPerSecond = 1000000000;
constexpr uint64_t kBufferDurationNs = kBufferSamples * kNanosecondsPerSecond / kSampleRateHz;
constexpr size_t kCarriedSamples = kFrameSamples - kHopSamples;        // from frame to frame
constexpr size_t kCarriedFrames = kWindowFrames - kFramesBetweenRuns;  // from run to run
constexpr size_t kReportSize = 2;                                      // the smoothed outputs
constexpr int kFeatureZeroPoint = 128;  // a feature less this, saturated to int8, is an input

static_assert(kBufferSamples % kHopSamples == 0, "a buffer is whole hops");
static_assert(kHopSamples <= kFrameSamples && kFramesBetweenRuns <= kWindowFrames);
static_assert(kShortSmoothedOutput < kClasses && kLongSmoothedOutput < kClasses &&
              kShortSmoothedOutput != kLongSmoothedOutput);

}  // namespace qz::config
