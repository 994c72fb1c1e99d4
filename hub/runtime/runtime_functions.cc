// SPDX-License-Identifier: Apache-2.0
// The runtime's functions except audio: C linkage, looked up by the module at load.

#include <cstdarg>
#include <cstdio>

#include "chre.h"
#include "chrex.h"
#include "hub/runtime/runtime.h"

namespace qz::hub {
namespace {

Runtime* installed = nullptr;

}  // namespace

bool InstallRuntime(Runtime* runtime) {
  if (installed != nullptr) return false;
  installed = runtime;
  return true;
}
void RemoveRuntime() { installed = nullptr; }
Runtime* InstalledRuntime() { return installed; }

}  // namespace qz::hub

using qz::hub::InstalledRuntime;

void chreLog(chreLogLevel level, const char* format, ...) {
  if (InstalledRuntime() == nullptr) return;
  // Long enough for every line of a nanoapp; a longer one is truncated, as on a device.
  char line[512];
  va_list arguments;
  va_start(arguments, format);
  // NOLINTNEXTLINE(clang-analyzer-valist.Uninitialized): initialised one line above.
  std::vsnprintf(line, sizeof(line), format, arguments);
  va_end(arguments);
  InstalledRuntime()->Log(level, line);
}

void* chreHeapAlloc(uint32_t bytes) {
  return InstalledRuntime() != nullptr ? InstalledRuntime()->HeapAlloc(bytes) : nullptr;
}

void chreHeapFree(void* pointer) {
  if (InstalledRuntime() != nullptr) InstalledRuntime()->HeapFree(pointer);
}

uint64_t chreGetTime() { return InstalledRuntime() != nullptr ? InstalledRuntime()->TimeNs() : 0; }

int64_t chreGetEstimatedHostTimeOffset() {
  return InstalledRuntime() != nullptr ? InstalledRuntime()->HostTimeOffsetNs() : 0;
}

bool chreSendEvent(uint16_t eventType, void* eventData, chreEventCompleteFunction* freeCallback,
                   uint32_t targetInstanceId) {
  return InstalledRuntime() != nullptr &&
         InstalledRuntime()->SendEvent(eventType, eventData, freeCallback, targetInstanceId);
}

bool chreSendMessageToHostEndpoint(void* message, size_t messageSize, uint32_t messageType,
                                   uint16_t hostEndpoint, chreMessageFreeFunction* freeCallback) {
  return InstalledRuntime() != nullptr &&
         InstalledRuntime()->SendMessageToHost(message, messageSize, messageType, hostEndpoint,
                                               freeCallback);
}

bool chrexClockRateChangeRequest(uint32_t request) {
  return InstalledRuntime() != nullptr && InstalledRuntime()->RequestClockRate(request);
}
