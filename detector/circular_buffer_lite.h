// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>

namespace tarn {

// A ring of the newest N values. One slot of the N + 1 is always free.
template <uint16_t N, typename T>
class circular_buffer_lite {
 public:
  uint16_t size() const { return size_; }

  // Element `index`, 0 the oldest; must be below size().
  const T& operator[](uint16_t index) const { return buffer_[Slot(index)]; }

  // Appends a value; a full buffer drops its oldest.
  void push_back(const T& value) {
    if (size_ == N) {
      head_ = Slot(1);
      --size_;
    }
    buffer_[Slot(size_)] = value;
    ++size_;
  }

  void clear() {
    head_ = 0;
    size_ = 0;
  }

 private:
  uint16_t Slot(uint16_t index) const { return static_cast<uint16_t>((head_ + index) % (N + 1)); }

  uint16_t head_ = 0;
  uint16_t size_ = 0;
  T buffer_[N + 1] = {};
};

}  // namespace tarn
