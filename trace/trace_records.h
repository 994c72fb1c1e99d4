// SPDX-License-Identifier: Apache-2.0
// A trace: what a nanoapp did with a recording, as a stream of records that ends in an end record.
// A record is its kind (1 byte), number (4), type (4), time (8) and count of bytes (4), then the
// bytes; all numbers are little-endian, whichever processor writes them.
#pragma once

#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <functional>
#include <stdexcept>
#include <string>
#include <utility>
#include <vector>

#include "config/network.h"

namespace qz::trace {

enum class Kind : uint8_t {
  kPlayed = 1,       // number: the nanoapp, type: audio buffers that it was given so far
  kLogLine = 2,      // number: level; bytes: the text
  kHostMessage = 3,  // number: host endpoint, type: of the message; bytes: its payload
  kClientEvent = 4,  // number: instance of the client nanoapp, type: of the event; bytes: its data
  kFeatures = 5,     // bytes: the features of a frame, 2 bytes each
  kOperatorOutput = 6,  // number: operator, type: channels; bytes: the rows, one after another
  kMemory = 7,          // number: object of kWatchedObjects, type: its channels; bytes: its values
  kEnd = 8,             // bytes: how many records of each kind before, from 1 on, 8 bytes each
};
constexpr size_t kKindsBeforeEnd = 7;

// Numbers of nanoapps: a kPlayed record with 0 buffers begins each one's run.
constexpr uint32_t kLoadedModule = 0;
constexpr uint32_t kLinkedNanoapp = 1;

// What is shown of a nanoapp's memory after each buffer of audio: the classifier's window, all that
// the last run of the network left, the frame being assembled, and the noise estimates. The first
// two are of networks over whole windows: of a network over a stream their records are empty.
struct WatchedObject {
  const char* name;
  uint32_t bytes;
  uint32_t channels;  // 0: bytes of several tensors
};
constexpr WatchedObject kWatchedObjects[] = {
    {"inference_input_buffer", config::kWindow.Bytes(), config::kFeatureChannels},
    {"arena", config::kArenaBytes, 0},
    {"frontend_input_buffer", config::kFrameSamples * 2, 0},
    {"state", config::kFeatureChannels * 4, 0}};
constexpr uint32_t kWatchedObjectCount = 4;
constexpr uint32_t kWholeWindowObjects = 2;

// Operators of a network run, in order. The values of the last, the scores, are floats of 4 bytes,
// those of all others int8.
constexpr uint32_t kOperatorsPerRun = config::kOperatorCount;
constexpr uint32_t kScoresOperator = kOperatorsPerRun - 1;

struct Record {
  Kind kind = Kind::kEnd;
  uint32_t number = 0;
  uint32_t type = 0;
  uint64_t time_ns = 0;  // on the hub's clock
  std::vector<uint8_t> bytes;
};

// No record has more: the largest object is the arena.
constexpr size_t kMaxRecordBytes = 65536;
static_assert(config::kArenaBytes <= kMaxRecordBytes);

// Appends the `size` low bytes of `value`, least significant first.
void AppendLittleEndian(uint64_t value, size_t size, std::vector<uint8_t>* bytes);

class Writer {
 public:
  explicit Writer(std::FILE* file) : file_(file) {}

  // Once the file can't be written, all further records are dropped; see std::ferror.
  void Write(const Record& record);
  // Writes the end record. Nothing may follow.
  void End();

 private:
  std::FILE* file_;
  uint64_t counts_[kKindsBeforeEnd] = {};
};

// The message names the record and its fault.
class TraceError : public std::runtime_error {
 public:
  using std::runtime_error::runtime_error;
};

class Reader {
 public:
  // Fills in up to `size` bytes and returns how many: at least one, or 0 at the end.
  using Source = std::function<size_t(uint8_t* bytes, size_t size)>;

  explicit Reader(Source source) : source_(std::move(source)) {}

  // The next record, or the end record when the trace is whole: every record counted, nothing
  // behind. Throws TraceError.
  void Next(Record* record);

 private:
  void Fill(std::vector<uint8_t>* bytes, size_t size);
  void CheckEnd(const Record& end);
  [[noreturn]] void Fail(const std::string& what) const;

  Source source_;
  uint64_t records_ = 0;
  uint64_t counts_[kKindsBeforeEnd] = {};
};

}  // namespace qz::trace
