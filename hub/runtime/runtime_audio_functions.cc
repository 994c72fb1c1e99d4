// The runtime's two audio functions: a runtime may come without them.

#include "chre.h"
#include "hub/runtime/runtime.h"

using qz::hub::InstalledRuntime;

bool chreAudioGetSource(uint32_t handle, chreAudioSource* audioSource) {
  return InstalledRuntime() != nullptr && InstalledRuntime()->GetAudioSource(handle, audioSource);
}

bool chreAudioConfigureSource(uint32_t handle, bool enable, uint64_t bufferDuration,
                              uint64_t deliveryInterval) {
  return InstalledRuntime() != nullptr &&
         InstalledRuntime()->ConfigureAudioSource(handle, enable, bufferDuration, deliveryInterval);
}
