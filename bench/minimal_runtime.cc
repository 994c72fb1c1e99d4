// SPDX-License-Identifier: Apache-2.0
#include "bench/minimal_runtime.h"

#include <cstddef>

#include "chre.h"
#include "chrex.h"

namespace {

// Enough at a time: a message and a copy of it, and the list of clients before and after it grows.
alignas(8) unsigned char heap[4][1024];
bool taken[4];
uint64_t now;

}  // namespace

qz::bench::Sent qz::bench::sent;

extern "C" {

void chreLog(chreLogLevel, const char*, ...) {}
void* chreHeapAlloc(uint32_t bytes) {
  for (size_t i = 0; i < 4; ++i) {
    if (taken[i] || bytes > sizeof heap[i]) continue;
    taken[i] = true;
    return heap[i];
  }
  return nullptr;
}
void chreHeapFree(void* block) {
  for (size_t i = 0; i < 4; ++i) {
    if (block == heap[i]) taken[i] = false;
  }
}
uint64_t chreGetTime(void) { return ++now; }
int64_t chreGetEstimatedHostTimeOffset(void) { return 0; }
bool chreSendEvent(uint16_t type, void* data, chreEventCompleteFunction* free_callback, uint32_t) {
  ++qz::bench::sent.events;
  free_callback(type, data);
  return true;
}
bool chreSendMessageToHostEndpoint(void* message, size_t size, uint32_t, uint16_t,
                                   chreMessageFreeFunction* free_callback) {
  ++qz::bench::sent.messages;
  if (free_callback != nullptr) free_callback(message, size);
  return true;
}
bool chreAudioGetSource(uint32_t handle, chreAudioSource* source) {
  if (handle != 0) return false;
  *source = {"microphone", 16000, 0, UINT64_MAX, CHRE_AUDIO_DATA_FORMAT_16_BIT_SIGNED_PCM};
  return true;
}
bool chreAudioConfigureSource(uint32_t, bool, uint64_t, uint64_t) { return true; }
bool chrexClockRateChangeRequest(uint32_t) { return true; }
}
