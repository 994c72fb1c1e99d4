// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstddef>
#include <type_traits>

namespace chre {

// A vector of at most `kCapacity` elements that lie in the object itself. Elements are
// trivially copyable, so that nothing runs when they are moved or dropped. Indices must be
// below size().
template <typename T, size_t kCapacity>
class FixedSizeVector {
  static_assert(std::is_trivially_copyable_v<T> && std::is_trivially_destructible_v<T>);

 public:
  size_t size() const { return size_; }
  bool empty() const { return size_ == 0; }
  bool full() const { return size_ == kCapacity; }

  T* data() { return elements_; }
  const T* data() const { return elements_; }
  T& operator[](size_t index) { return elements_[index]; }
  const T& operator[](size_t index) const { return elements_[index]; }
  T* begin() { return elements_; }
  const T* begin() const { return elements_; }
  T* end() { return elements_ + size_; }
  const T* end() const { return elements_ + size_; }

  // The vector must not be full.
  void push_back(const T& element) { elements_[size_++] = element; }

  // Removes one element; the later ones move down by one index.
  void erase(size_t index) {
    for (size_t i = index + 1; i < size_; ++i) elements_[i - 1] = elements_[i];
    --size_;
  }

 private:
  T elements_[kCapacity] = {};
  size_t size_ = 0;
};

}  // namespace chre
