// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "base/digest.h"
#include "trace/trace_records.h"

namespace qz::trace {

// How many records of one kind there were, and a 64-bit FNV-1a digest of all that they hold.
struct Tally {
  uint64_t records = 0;
  uint64_t digest = base::kEmptyDigest;
};

// Compares two traces record by record, up to the first difference. Memory is compared as far as
// both nanoapps have it. Counts from 0: frames, network runs, rows, channels, bytes and buffers;
// lines, messages and events for each nanoapp.
class Comparison {
 public:
  // The names of the two builds in messages.
  Comparison(std::string first_name, std::string second_name)
      : first_name_(std::move(first_name)), second_name_(std::move(second_name)) {}

  // The next records of both. Empty when they are equal, else a message that names the location and
  // both values; nothing may be compared afterwards.
  std::string Compare(const Record& first, const Record& second);

  // Empty when the module that was loaded and the nanoapp that was linked logged and sent the same
  // and left the same in memory after each buffer, so that what was observed in the second holds
  // for the first; else a message. At the end.
  std::string NanoappsDiffer() const;

  // Of the kind's records so far, in both traces.
  const Tally& tally(uint32_t nanoapp, Kind kind) const {
    return tallies_[nanoapp][static_cast<size_t>(kind) - 1];
  }
  // Audio buffers so far, of both nanoapps together.
  uint64_t buffers_played() const { return buffers_played_; }

 private:
  void Count(const Record& record);
  // "location: `first` in the one, `second` in the other".
  std::string Differ(const std::string& location, const std::string& first,
                     const std::string& second) const;
  std::string BytesDiffer(const Record& first, const Record& second) const;
  // The record that is compared, its nanoapp and the time on the hub's clock.
  std::string Location(const Record& record, const std::string& detail) const;
  uint64_t seen(Kind kind) const { return tally(nanoapp_, kind).records; }

  std::string first_name_;
  std::string second_name_;
  uint32_t nanoapp_ = kLoadedModule;
  uint64_t buffers_played_ = 0;
  Tally tallies_[2][kKindsBeforeEnd];
};

}  // namespace qz::trace
