// The one description of this detector: timing, classes and versions. All else follows from it
// (config/detector.h). A build of another detector puts another file of this name in its place
// (QZ_DESCRIPTION_DIR).
#pragma once

#include <cstddef>
#include <cstdint>

namespace qz::config {

// Sound.
constexpr uint32_t kSampleRateHz = 16000;
constexpr uint32_t kBufferSamples = 32000;  // of an audio event: a pass, 2 s
constexpr int kGain = 4;                    // of every sample before the front end, saturating

// Frames of the front end.
constexpr size_t kFrameSamples = 400;  // 25 ms
constexpr size_t kHopSamples = 160;    // 10 ms from one frame to the next
constexpr size_t kFeatureChannels = 48;

// The network's input and its cadence.
constexpr size_t kWindowFrames = 382;      // 3.82 s
constexpr size_t kFramesBetweenRuns = 64;  // 0.64 s

// The network's outputs and their sound category codes, whose meaning is the host's.
constexpr size_t kClasses = 5;
constexpr uint8_t kCategories[kClasses] = {0, 6, 17, 15, 18};

// The two outputs that are smoothed: means over the newest runs, reported after every pass.
constexpr size_t kShortSmoothedOutput = 1;
constexpr size_t kShortSmoothingRuns = 5;
constexpr size_t kLongSmoothedOutput = 3;
constexpr size_t kLongSmoothingRuns = 16;

// Version codes of what the detector sends.
constexpr uint32_t kReportVersion = 202208270;     // the report to client nanoapps
constexpr uint32_t kDetectionVersion = 202208271;  // detection events to host endpoints

}  // namespace qz::config
