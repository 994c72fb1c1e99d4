// SPDX-License-Identifier: Apache-2.0
// How features become scores: over whole windows (window_engine.cc) or a stream of frames
// (stream_engine.cc), which give the same scores after the same frames. The build links one of them
// (QZ_NETWORK). Both are static: there is one classifier.
#pragma once

#include <cstdint>

namespace tarn::contexthub::sound {

// Takes the features of the next frame, kFeatureChannels of them. True if NetworkScores() are new.
bool TakeFrame(const uint16_t* features);

// Of the newest run, by output.
const float* NetworkScores();

}  // namespace tarn::contexthub::sound
