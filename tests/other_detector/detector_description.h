// SPDX-License-Identifier: Apache-2.0
// Another detector, for tests: six classes over a shorter window. What the build takes in place of
// config/detector_description.h (preset other-detector) shows that nothing else states these facts.
#pragma once

#include <cstddef>
#include <cstdint>

#include "config/operator_description.h"

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
constexpr size_t kWindowFrames = 318;      // 3.18 s
constexpr size_t kFramesBetweenRuns = 64;  // 0.64 s

// The network's outputs and their sound category codes, whose meaning is the host's.
constexpr size_t kClasses = 6;
constexpr uint8_t kCategories[kClasses] = {0, 6, 17, 15, 18, 20};

// The two outputs that are smoothed: means over the newest runs, reported after every pass.
constexpr size_t kShortSmoothedOutput = 1;
constexpr size_t kShortSmoothingRuns = 5;
constexpr size_t kLongSmoothedOutput = 3;
constexpr size_t kLongSmoothingRuns = 16;

// The network, a row an operator, in the order in which they run. Channels of the last ones are the
// outputs.
constexpr OperatorDescription kNetwork[] = {
    // kind, taps, stride, channels, table, zero point, scale, multiplier, shift, placement
    {OperatorKind::kDepthwise, 3, 1, 48, "w0", 15, 0.0076417988, 0, 0, Placement::kStart},
    {OperatorKind::kPointwise, 1, 1, 60, "w1", -128, 0, 0, 0, Placement::kBehindInput},
    {OperatorKind::kMaxPool, 2, 2, 60, "", -128, 0, 0, 0, Placement::kStart},
    {OperatorKind::kDepthwise, 3, 1, 60, "w3", 36, 0.0058224415, 0, 0, Placement::kBehindInput},
    {OperatorKind::kPointwise, 1, 1, 60, "w4", -128, 0, 0, 0, Placement::kBehindInput},
    {OperatorKind::kMaxPool, 2, 2, 60, "", -128, 0, 0, 0, Placement::kStart},
    {OperatorKind::kConvolution, 3, 1, 60, "w6", -128, 0, 0, 0, Placement::kBehindInput},
    {OperatorKind::kMaxPool, 2, 2, 60, "", -128, 0, 0, 0, Placement::kBehindInput},
    {OperatorKind::kConvolution, 3, 1, 60, "w8", -128, 0, 0, 0, Placement::kBehindInput},
    {OperatorKind::kMaxPool, 2, 2, 60, "", -128, 0, 0, 0, Placement::kBehindInput},
    {OperatorKind::kConvolution, 3, 1, 60, "w10", -128, 0, 0, 0, Placement::kBehindInput},
    {OperatorKind::kMaxPool, 2, 2, 60, "", -128, 0, 0, 0, Placement::kBehindInput},
    {OperatorKind::kConvolution, 3, 1, 60, "w12", -128, 0, 0, 0, Placement::kBehindInput},
    {OperatorKind::kConvolution, 3, 1, 60, "w13", -128, 0, 0, 0, Placement::kBehindInput},
    {OperatorKind::kMaxPool, 2, 2, 60, "", -128, 0, 0, 0, Placement::kBehindInput},
    {OperatorKind::kConvolution, 2, 1, 60, "w15", -128, 0, 0, 0, Placement::kStart},
    {OperatorKind::kFlatten, 1, 1, 60, "", -128, 0, 0, 0, Placement::kInPlace},
    {OperatorKind::kFullyConnected, 1, 1, 64, "w17", -128, 0, 1427340160, 5,
     Placement::kBehindInput},
    {OperatorKind::kFullyConnected, 1, 1, kClasses, "w18", 82, 0, 1234879616, 8,
     Placement::kBehindScores},
    {OperatorKind::kLogistic, 1, 1, kClasses, "", -128, 0.256, 0, 0, Placement::kInPlace},
    {OperatorKind::kDequantise, 1, 1, kClasses, "", 0, 1.0 / 256, 0, 0, Placement::kAtWindow},
};

// Version codes of what the detector sends.
constexpr uint32_t kReportVersion = 202208270;     // the report to client nanoapps
constexpr uint32_t kDetectionVersion = 202208271;  // detection events to host endpoints

}  // namespace qz::config
