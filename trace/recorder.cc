// SPDX-License-Identifier: Apache-2.0
#include "trace/recorder.h"

#include <utility>

#include "trace/object_in_memory.h"

namespace qz::trace {
namespace {

// The address at which the hub keeps a host's message is not the nanoapp's doing and differs each
// time.
std::string WithoutAddress(const std::string& line) {
  const std::string mark = "@ 0x";
  const size_t start = line.find(mark);
  if (start == std::string::npos) return line;
  const size_t end = line.find_first_not_of("0123456789abcdef", start + mark.size());
  return line.substr(0, start) + "@ (address)" + (end == std::string::npos ? "" : line.substr(end));
}

}  // namespace

void Recorder::Begin(uint32_t nanoapp, hub::Hub* hub) {
  nanoapp_ = nanoapp;
  hub_ = hub;
  hub->SetLogHandler(
      [this](chreLogLevel level, uint64_t, const std::string& line) { OnLogLine(level, line); });
  Write(Kind::kPlayed, nanoapp_, 0, {});
}

bool Recorder::WatchMemory(bool whole_windows, std::string* error) {
  for (uint32_t i = whole_windows ? 0 : kWholeWindowObjects; i < kWatchedObjectCount; ++i) {
    const WatchedObject& object = kWatchedObjects[i];
    objects_[i] = FindObject(hub_->nanoapp(), object.name, object.bytes, error);
    if (objects_[i] == nullptr) return false;
  }
  return true;
}

void Recorder::Played(uint32_t buffers) {
  Write(Kind::kPlayed, nanoapp_, buffers, {});
  for (uint32_t i = 0; i < kWatchedObjectCount; ++i) {
    const WatchedObject& object = kWatchedObjects[i];
    const uint32_t size = objects_[i] == nullptr ? 0 : object.bytes;
    Write(Kind::kMemory, i, object.channels, {objects_[i], objects_[i] + size});
  }
}

void Recorder::OnHostMessage(uint16_t endpoint, uint32_t type, const uint8_t* bytes, size_t size) {
  Write(Kind::kHostMessage, endpoint, type, {bytes, bytes + size});
}

void Recorder::OnEvent(uint32_t nanoapp, uint16_t type, const void* data, size_t size) {
  const auto* bytes = static_cast<const uint8_t*>(data);
  Write(Kind::kClientEvent, nanoapp, type, {bytes, bytes + size});
}

void Recorder::OnFeatures(const uint16_t* features, size_t channels) {
  std::vector<uint8_t> bytes;
  for (size_t i = 0; i < channels; ++i) AppendLittleEndian(features[i], 2, &bytes);
  Write(Kind::kFeatures, 0, 0, std::move(bytes));
}

void Recorder::OnOutput(uint32_t op, uint32_t channels, std::vector<uint8_t> values) {
  Write(Kind::kOperatorOutput, op, channels, std::move(values));
}

void Recorder::OnLogLine(chreLogLevel level, const std::string& line) {
  const std::string text = WithoutAddress(line);
  Write(Kind::kLogLine, level, 0, {text.begin(), text.end()});
}

void Recorder::Write(Kind kind, uint32_t number, uint32_t type, std::vector<uint8_t> bytes) {
  writer_.Write({kind, number, type, hub_->TimeNs(), std::move(bytes)});
}

}  // namespace qz::trace
