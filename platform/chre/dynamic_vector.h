// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <limits>
#include <type_traits>

#include "chre.h"

namespace chre {

// The untyped core of DynamicVector: a block from the runtime's heap, counted in elements. One copy
// of this code serves every element type. Nothing here fails but an allocation, and then nothing
// changes.
class DynamicVectorBase {
 public:
  DynamicVectorBase() = default;
  DynamicVectorBase(const DynamicVectorBase&) = delete;
  DynamicVectorBase& operator=(const DynamicVectorBase&) = delete;
  ~DynamicVectorBase() {
    size_ = 0;
    chreHeapFree(data_);
  }

  size_t size() const { return size_; }
  size_t capacity() const { return capacity_; }
  bool empty() const { return size_ == 0; }

 protected:
  // Makes space for `capacity` elements; false when the heap gives no block.
  bool doReserve(size_t capacity, size_t element_size) {
    if (capacity <= capacity_) return true;
    if (capacity > std::numeric_limits<uint32_t>::max() / element_size) return false;
    void* block = chreHeapAlloc(static_cast<uint32_t>(capacity * element_size));
    if (block == nullptr) return false;
    if (size_ > 0) memcpy(block, data_, size_ * element_size);
    chreHeapFree(data_);
    data_ = block;
    capacity_ = capacity;
    return true;
  }

  // Appends a copy of the element, doubling the capacity (1 at first) when it is used up.
  bool doPushBack(const void* element, size_t element_size) {
    size_t wanted = capacity_;
    if (capacity_ == 0) {
      wanted = 1;
    } else if (size_ == capacity_) {
      wanted = capacity_ * 2;
    }
    if (!doReserve(wanted, element_size)) return false;
    memcpy(static_cast<unsigned char*>(data_) + size_ * element_size, element, element_size);
    ++size_;
    return true;
  }

  // Removes the element at `index`, which must exist; the storage keeps its size.
  void doErase(size_t index, size_t element_size) {
    --size_;
    unsigned char* hole = static_cast<unsigned char*>(data_) + index * element_size;
    memmove(hole, hole + element_size, (size_ - index) * element_size);
  }

  void* data_ = nullptr;

 private:
  size_t size_ = 0;
  size_t capacity_ = 0;
};

// A growing array of trivially copyable values on the runtime's heap. Storage never shrinks
// before destruction.
template <typename T>
class DynamicVector : public DynamicVectorBase {
  static_assert(std::is_trivially_copyable_v<T> && std::is_trivially_destructible_v<T>);

 public:
  bool push_back(const T& element) { return doPushBack(&element, sizeof(T)); }
  bool reserve(size_t capacity) { return doReserve(capacity, sizeof(T)); }
  void erase(size_t index) { doErase(index, sizeof(T)); }

  // Index of the first element equal to `value`, or size().
  size_t find(const T& value) const {
    size_t index = 0;
    while (index < size() && !((*this)[index] == value)) ++index;
    return index;
  }

  const T& operator[](size_t index) const { return begin()[index]; }
  const T* begin() const { return static_cast<const T*>(data_); }
  const T* end() const { return begin() + size(); }
};

}  // namespace chre
