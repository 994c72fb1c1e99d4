#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <unordered_map>
#include <unordered_set>
#include <vector>

namespace qz::hub {

// The hub's heap for nanoapps: knows every block, remembers every misuse, and refuses on request.
class Heap {
 public:
  Heap() = default;
  Heap(const Heap&) = delete;
  Heap& operator=(const Heap&) = delete;
  ~Heap();

  // A block of `bytes` bytes, or null when the system has none or a refusal is due.
  void* Allocate(uint32_t bytes);
  // Gives a block back. Null is fine; anything but a live block is a fault and is otherwise
  // ignored.
  void Free(void* block);

  // Refuses the n-th allocation from now, counted from 1; 0 takes the order back.
  void RefuseNth(uint64_t n) {
    refuse_in_ = n;
    refused_ = false;
  }
  // True once the refusal last ordered has happened.
  bool refused() const { return refused_; }

  size_t live_blocks() const { return live_.size(); }
  uint64_t allocations() const { return allocations_; }
  // Bytes of a live block, 0 for any other address.
  size_t SizeOf(const void* block) const;
  // One sentence for each double free or free of a stranger.
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
