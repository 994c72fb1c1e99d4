// SPDX-License-Identifier: Apache-2.0
#include "trace/trace_records.h"

#include <string>

namespace qz::trace {
namespace {

constexpr size_t kHeadBytes = 21;

size_t IndexOf(Kind kind) { return static_cast<size_t>(kind) - 1; }

uint64_t LittleEndian(const std::vector<uint8_t>& bytes, size_t location, size_t size) {
  uint64_t value = 0;
  for (size_t i = size; i-- > 0;) value = value << 8 | bytes[location + i];
  return value;
}

}  // namespace

void AppendLittleEndian(uint64_t value, size_t size, std::vector<uint8_t>* bytes) {
  for (size_t i = 0; i < size; ++i) bytes->push_back(static_cast<uint8_t>(value >> (8 * i)));
}

void Writer::Write(const Record& record) {
  if (record.kind != Kind::kEnd) ++counts_[IndexOf(record.kind)];
  std::vector<uint8_t> written;
  AppendLittleEndian(static_cast<uint8_t>(record.kind), 1, &written);
  AppendLittleEndian(record.number, 4, &written);
  AppendLittleEndian(record.type, 4, &written);
  AppendLittleEndian(record.time_ns, 8, &written);
  AppendLittleEndian(record.bytes.size(), 4, &written);
  written.insert(written.end(), record.bytes.begin(), record.bytes.end());
  if (std::ferror(file_) != 0) return;
  std::fwrite(written.data(), 1, written.size(), file_);
}

void Writer::End() {
  Record end;
  for (const uint64_t count : counts_) AppendLittleEndian(count, 8, &end.bytes);
  Write(end);
  std::fflush(file_);
}

void Reader::Next(Record* record) {
  std::vector<uint8_t> head;
  Fill(&head, kHeadBytes);
  if (head[0] < 1 || head[0] > static_cast<uint8_t>(Kind::kEnd)) {
    Fail("its kind is " + std::to_string(head[0]) + ", should be 1 to " +
         std::to_string(static_cast<int>(Kind::kEnd)));
  }
  record->kind = static_cast<Kind>(head[0]);
  record->number = static_cast<uint32_t>(LittleEndian(head, 1, 4));
  record->type = static_cast<uint32_t>(LittleEndian(head, 5, 4));
  record->time_ns = LittleEndian(head, 9, 8);
  const size_t size = LittleEndian(head, 17, 4);
  if (size > kMaxRecordBytes) {
    Fail("it has " + std::to_string(size) + " bytes, should be at most " +
         std::to_string(kMaxRecordBytes));
  }
  Fill(&record->bytes, size);
  if (record->kind == Kind::kEnd) {
    CheckEnd(*record);
  } else {
    ++counts_[IndexOf(record->kind)];
    ++records_;
  }
}

void Reader::Fill(std::vector<uint8_t>* bytes, size_t size) {
  bytes->resize(size);
  for (size_t held = 0; held < size;) {
    const size_t got = source_(bytes->data() + held, size - held);
    if (got == 0) Fail("cut off, should be a whole trace with an end record");
    held += got;
  }
}

void Reader::CheckEnd(const Record& end) {
  if (end.bytes.size() != sizeof counts_) Fail("the end record has a wrong size");
  for (size_t i = 0; i < kKindsBeforeEnd; ++i) {
    const uint64_t promised = LittleEndian(end.bytes, 8 * i, 8);
    if (promised == counts_[i]) continue;
    Fail("the end record counts " + std::to_string(promised) + " records of kind " +
         std::to_string(i + 1) + ", there were " + std::to_string(counts_[i]));
  }
  uint8_t behind = 0;
  if (source_(&behind, 1) != 0) Fail("bytes behind the end record, should be none");
}

void Reader::Fail(const std::string& what) const {
  throw TraceError("record " + std::to_string(records_) + " of the trace: " + what);
}

}  // namespace qz::trace
