// SPDX-License-Identifier: Apache-2.0
#pragma once

namespace tarn::contexthub::sound {

// First argument of every log line of the nanoapp.
constexpr const char* kApplicationLogPrefix = "[SOUND_DETECTION]";

}  // namespace tarn::contexthub::sound
