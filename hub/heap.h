// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <unordered_map>
#include <unordered_set>
#include <vector>

namespace qz::hub {

// The hub's heap for nanoapps: tracks every block, records every misuse, and refuses an allocation
// on request.
class Heap {
 public:
  Heap() = default;
  Heap(const Heap&) = delete;
  Heap& operator=(const Heap&) = delete;
  ~Heap();

  // A block of `bytes` bytes, or null when the system has none or this allocation is refused.
  void* Allocate(uint32_t bytes);
  // Frees a block. Null is allowed; anything else that is not a live block is recorded as a fault
  // and otherwise ignored.
  void Free(void* block);

  // Refuses the n-th allocation from now, counted from 1; 0 refuses none.
  void RefuseNth(uint64_t n) {
    refuse_in_ = n;
    refused_ = false;
  }
  // True once the refusal last requested has happened.
  bool refused() const { return refused_; }

  size_t live_blocks() const { return live_.size(); }
  uint64_t allocations() const { return allocations_; }
  // Bytes of a live block, 0 for any other address.
  size_t SizeOf(const void* block) const;
  // A message for each double free or free of an unknown address.
  const std::vector<std::string>& faults() const { return faults_; }

 private:
  std::unordered_map<const void*, uint32_t> live_;
  std::unordered_set<const void*> freed_;
  std::vector<std::string> faults_;
  uint64_t allocations_ = 0;
  uint64_t refuse_in_ = 0;
  bool refused_ = false;
};

}  // namespace qz::hub
