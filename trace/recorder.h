// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "hub/clients.h"
#include "hub/hub.h"
#include "trace/trace_records.h"

namespace qz::trace {

// Writes down what a nanoapp on a hub logs and sends, and what it is seen to compute.
class Recorder final : public hub::ClientListener {
 public:
  explicit Recorder(Writer* writer) : writer_(*writer) {}

  // What comes from now on is of this nanoapp, kLoadedModule or kLinkedNanoapp. `hub` stays alive
  // until the next call.
  void Begin(uint32_t nanoapp, hub::Hub* hub);
  // Finds the watched objects of the nanoapp that runs, those of whole windows only if it has them;
  // false with a message in `*error` if one isn't there.
  bool WatchMemory(bool whole_windows, std::string* error);
  // So many buffers were played since WatchMemory.
  void Played(uint32_t buffers);

  void OnHostMessage(uint16_t endpoint, uint32_t type, const uint8_t* bytes, size_t size) override;
  void OnEvent(uint32_t nanoapp, uint16_t type, const void* data, size_t size) override;
  void OnFeatures(const uint16_t* features, size_t channels);
  // The values of one operator, row by row.
  void OnOutput(uint32_t op, uint32_t channels, std::vector<uint8_t> values);

 private:
  void OnLogLine(chreLogLevel level, const std::string& line);
  void Write(Kind kind, uint32_t number, uint32_t type, std::vector<uint8_t> bytes);

  Writer& writer_;
  hub::Hub* hub_ = nullptr;
  uint32_t nanoapp_ = kLoadedModule;
  const uint8_t* objects_[kWatchedObjectCount] = {};
};

// Reports to `recorder` every frame and every network run of the nanoapp that is linked into this
// program.
void ObserveLinkedNanoapp(Recorder* recorder);

}  // namespace qz::trace
