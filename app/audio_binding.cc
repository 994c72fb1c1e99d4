// SPDX-License-Identifier: Apache-2.0
// The module's own definitions of the two audio functions: bound to the runtime's at first use, so
// that the module loads, and merely gets no audio, where the runtime has none.

#include <dlfcn.h>

#include <cstdint>

#include "chre.h"

namespace {

// The loader's handle for the runtime's functions. The two definitions here are not exported, so
// that the lookup can't find them.
template <typename Function>
Function* FindInRuntime(const char* name) {
  void* const runtime = reinterpret_cast<void*>(static_cast<intptr_t>(-1));
  return reinterpret_cast<Function*>(dlsym(runtime, name));
}

}  // namespace

bool chreAudioGetSource(uint32_t handle, chreAudioSource* audioSource) {
  static bool lookupPerformed = false;
  static decltype(chreAudioGetSource)* funcPtr = nullptr;
  if (!lookupPerformed) {
    funcPtr = FindInRuntime<decltype(chreAudioGetSource)>("chreAudioGetSource");
    lookupPerformed = true;
  }
  return funcPtr != nullptr && funcPtr(handle, audioSource);
}

bool chreAudioConfigureSource(uint32_t handle, bool enable, uint64_t bufferDuration,
                              uint64_t deliveryInterval) {
  static bool lookupPerformed = false;
  static decltype(chreAudioConfigureSource)* funcPtr = nullptr;
  if (!lookupPerformed) {
    funcPtr = FindInRuntime<decltype(chreAudioConfigureSource)>("chreAudioConfigureSource");
    lookupPerformed = true;
  }
  return funcPtr != nullptr && funcPtr(handle, enable, bufferDuration, deliveryInterval);
}
