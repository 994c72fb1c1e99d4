// SPDX-License-Identifier: Apache-2.0
#include "hub/heap.h"

#include <cstdio>
#include <cstdlib>

namespace qz::hub {

Heap::~Heap() {
  for (const auto& block : live_) std::free(const_cast<void*>(block.first));
}

void* Heap::Allocate(uint32_t bytes) {
  if (refuse_in_ > 0 && --refuse_in_ == 0) {
    refused_ = true;
    return nullptr;
  }
  void* block = std::malloc(bytes > 0 ? bytes : 1);
  if (block == nullptr) return nullptr;
  freed_.erase(block);
  live_[block] = bytes;
  ++allocations_;
  return block;
}

void Heap::Free(void* block) {
  if (block == nullptr) return;
  if (live_.erase(block) == 0) {
    char message[96];
    std::snprintf(message, sizeof(message), "chreHeapFree of %p, %s", block,
                  freed_.count(block) != 0 ? "which was freed before" : "which is no block");
    faults_.emplace_back(message);
    return;
  }
  freed_.insert(block);
  std::free(block);
}

size_t Heap::SizeOf(const void* block) const {
  const auto found = live_.find(block);
  return found != live_.end() ? found->second : 0;
}

}  // namespace qz::hub
