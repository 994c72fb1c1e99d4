// SPDX-License-Identifier: Apache-2.0
// The implementation of the runtime's C functions on a PC. The functions are in a shared library,
// as the module's loader expects, and forward to the one installed Runtime.
#pragma once

#include <cstddef>
#include <cstdint>

#include "chre.h"

namespace qz::hub {

class Runtime {
 public:
  virtual ~Runtime() = default;

  virtual void Log(chreLogLevel level, const char* line) = 0;
  virtual void* HeapAlloc(uint32_t bytes) = 0;
  virtual void HeapFree(void* block) = 0;
  virtual uint64_t TimeNs() = 0;
  virtual int64_t HostTimeOffsetNs() = 0;
  virtual bool SendEvent(uint16_t type, void* data, chreEventCompleteFunction* free_callback,
                         uint32_t target_instance_id) = 0;
  virtual bool SendMessageToHost(void* message, size_t size, uint32_t type, uint16_t endpoint,
                                 chreMessageFreeFunction* free_callback) = 0;
  virtual bool GetAudioSource(uint32_t handle, chreAudioSource* source) = 0;
  virtual bool ConfigureAudioSource(uint32_t handle, bool enable, uint64_t buffer_duration_ns,
                                    uint64_t delivery_interval_ns) = 0;
  virtual bool RequestClockRate(uint32_t request) = 0;
};

// Makes the functions forward to `runtime`, which must not be null; false, and nothing changes,
// when one is installed already.
bool InstallRuntime(Runtime* runtime);
// Removes the installed one. Without one no nanoapp runs: allocations and sends fail, no callback
// is called, and the time is 0.
void RemoveRuntime();
// The installed one, or null.
Runtime* InstalledRuntime();

}  // namespace qz::hub
