// SPDX-License-Identifier: Apache-2.0
// The runtime's two audio functions: a runtime may lack either.

#include "chre.h"
#include "hub/runtime/runtime.h"

using qz::hub::InstalledRuntime;

bool chreAudioGetSource(uint32_t handle, chreAudioSource* audioSource) {
  return InstalledRuntime() != nullptr && InstalledRuntime()->GetAudioSource(handle, audioSource);
}

#ifndef QZ_WITHOUT_CONFIGURE_SOURCE
bool chreAudioConfigureSource(uint32_t handle, bool enable, uint64_t bufferDuration,
                              uint64_t deliveryInterval) {
  return InstalledRuntime() != nullptr &&
         InstalledRuntime()->ConfigureAudioSource(handle, enable, bufferDuration, deliveryInterval);
}
#endif
