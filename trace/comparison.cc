// SPDX-License-Identifier: Apache-2.0
#include "trace/comparison.h"

#include <algorithm>
#include <cstdio>
#include <cstring>

namespace qz::trace {
namespace {

const char* const kNanoappNames[] = {"the loaded module", "the linked nanoapp"};

// What a record is, and what its number and its type are.
struct KindWords {
  const char* name;
  const char* number;
  const char* type;
};
const KindWords& WordsOf(Kind kind) {
  static const KindWords words[] = {{"audio", "nanoapp", "number of buffers"},
                                    {"log line", "level", "type"},
                                    {"message to hosts", "endpoint", "type"},
                                    {"event to client nanoapps", "receiver", "type"},
                                    {"features", "number", "type"},
                                    {"output of an operator", "operator", "channels"},
                                    {"memory", "object", "channels"},
                                    {"end of the trace", "number", "type"}};
  return words[static_cast<size_t>(kind) - 1];
}

void Digest(uint64_t value, size_t size, Tally* tally) {
  for (size_t i = 0; i < size; ++i) {
    const auto byte = static_cast<uint8_t>(value >> (8 * i));
    tally->digest = base::Digest(&byte, 1, tally->digest);
  }
}

std::string Quoted(const std::vector<uint8_t>& text) {
  return "\"" + std::string(text.begin(), text.end()) + "\"";
}

// The value that starts at a byte, as its readers take it.
std::string ValueAt(const Record& record, size_t location, size_t size) {
  const uint8_t* bytes = record.bytes.data() + location;
  if (size == 1) return std::to_string(static_cast<int8_t>(bytes[0]));
  if (size == 2) return std::to_string(bytes[0] | bytes[1] << 8);
  // Scores are multiples of 1/256.
  uint32_t bits = 0;
  for (size_t i = 4; i-- > 0;) bits = bits << 8 | bytes[i];
  float score = 0;
  std::memcpy(&score, &bits, sizeof score);
  return std::to_string(score);
}

}  // namespace

std::string Comparison::Compare(const Record& first, const Record& second) {
  const KindWords& words = WordsOf(first.kind);
  if (first.kind != second.kind) {
    return Differ(Location(first, ""), words.name, WordsOf(second.kind).name);
  }
  const struct {
    const char* name;
    uint64_t first;
    uint64_t second;
  } fields[] = {{words.number, first.number, second.number},
                {words.type, first.type, second.type},
                {"time in ns", first.time_ns, second.time_ns}};
  for (const auto& field : fields) {
    if (field.first == field.second) continue;
    return Differ(Location(first, std::string(", ") + field.name), std::to_string(field.first),
                  std::to_string(field.second));
  }
  const bool absent = first.kind == Kind::kMemory && first.number < kWholeWindowObjects &&
                      (first.bytes.empty() || second.bytes.empty());
  if (absent) return {};
  if (first.bytes != second.bytes) return BytesDiffer(first, second);
  Count(first);
  return {};
}

void Comparison::Count(const Record& record) {
  if (record.kind == Kind::kEnd) return;
  if (record.kind == Kind::kPlayed) {
    nanoapp_ = std::min(record.number, kLinkedNanoapp);
    if (record.type > 0) ++buffers_played_;
  }
  Tally& tally = tallies_[nanoapp_][static_cast<size_t>(record.kind) - 1];
  ++tally.records;
  Digest(record.number, 4, &tally);
  Digest(record.type, 4, &tally);
  Digest(record.time_ns, 8, &tally);
  Digest(record.bytes.size(), 4, &tally);
  for (const uint8_t byte : record.bytes) Digest(byte, 1, &tally);
}

std::string Comparison::Differ(const std::string& location, const std::string& first,
                               const std::string& second) const {
  return location + ": " + first + " in " + first_name_ + ", " + second + " in " + second_name_;
}

std::string Comparison::BytesDiffer(const Record& first, const Record& second) const {
  if (first.kind == Kind::kLogLine) {
    return Differ(Location(first, ""), Quoted(first.bytes), Quoted(second.bytes));
  }
  if (first.bytes.size() != second.bytes.size()) {
    return Differ(Location(first, ", size"), std::to_string(first.bytes.size()) + " bytes",
                  std::to_string(second.bytes.size()) + " bytes");
  }
  const auto location = static_cast<size_t>(
      std::mismatch(first.bytes.begin(), first.bytes.end(), second.bytes.begin()).first -
      first.bytes.begin());
  std::string detail = ", byte " + std::to_string(location);
  size_t size = 0;
  if (first.kind == Kind::kFeatures) {
    size = 2;
    detail = ", channel " + std::to_string(location / size);
  } else if (first.kind == Kind::kOperatorOutput && first.type > 0) {
    size = first.number == kScoresOperator ? 4 : 1;
    detail = ", row " + std::to_string(location / size / first.type) + ", channel " +
             std::to_string(location / size % first.type);
  } else if (first.kind == Kind::kMemory && first.type > 0) {
    size = 1;
    detail = ", frame " + std::to_string(location / first.type) + ", channel " +
             std::to_string(location % first.type);
  }
  if (size == 0 || first.bytes.size() % size != 0) {
    return Differ(Location(first, detail), std::to_string(first.bytes[location]),
                  std::to_string(second.bytes[location]));
  }
  const size_t start = location / size * size;
  return Differ(Location(first, detail), ValueAt(first, start, size), ValueAt(second, start, size));
}

std::string Comparison::Location(const Record& record, const std::string& detail) const {
  std::string location = WordsOf(record.kind).name;
  if (record.kind == Kind::kFeatures) {
    location += " of frame " + std::to_string(seen(record.kind));
  } else if (record.kind == Kind::kOperatorOutput) {
    location = "network run " + std::to_string(seen(record.kind) / kOperatorsPerRun) +
               ", operator " + std::to_string(record.number);
  } else if (record.kind == Kind::kMemory) {
    // The first record of what was played is that of no buffer.
    location += " after buffer " + std::to_string(seen(Kind::kPlayed) - 2) + ", ";
    location += record.number < kWatchedObjectCount ? kWatchedObjects[record.number].name
                                                    : "object " + std::to_string(record.number);
  } else if (record.kind != Kind::kEnd) {
    location += " " + std::to_string(seen(record.kind));
  }
  char time[32];
  std::snprintf(time, sizeof(time), "%.3f s", static_cast<double>(record.time_ns) * 1e-9);
  return location + detail + " (" + kNanoappNames[nanoapp_] + " at " + time + ")";
}

std::string Comparison::NanoappsDiffer() const {
  for (const Kind kind : {Kind::kLogLine, Kind::kHostMessage, Kind::kClientEvent, Kind::kMemory}) {
    const Tally& loaded = tally(kLoadedModule, kind);
    const Tally& linked = tally(kLinkedNanoapp, kind);
    if (loaded.records == linked.records && loaded.digest == linked.digest) continue;
    return std::string(WordsOf(kind).name) + ": " + std::to_string(loaded.records) + " of " +
           kNanoappNames[kLoadedModule] + " and " + std::to_string(linked.records) + " of " +
           kNanoappNames[kLinkedNanoapp] + " are not the same";
  }
  return {};
}

}  // namespace qz::trace
