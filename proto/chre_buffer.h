// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>

#include "chre.h"

namespace tarn::contexthub::sound {

// Sole owner of a byte buffer on the runtime's heap; null when the heap gave none.
class ChreBuffer {
 public:
  ChreBuffer() = default;
  static ChreBuffer Allocate(uint32_t bytes) { return ChreBuffer(chreHeapAlloc(bytes)); }

  ChreBuffer(ChreBuffer&& other) noexcept : bytes_(other.release()) {}
  ChreBuffer& operator=(ChreBuffer&& other) noexcept {
    if (this != &other) {
      chreHeapFree(bytes_);
      bytes_ = other.release();
    }
    return *this;
  }
  ~ChreBuffer() { chreHeapFree(bytes_); }

  explicit operator bool() const { return bytes_ != nullptr; }
  uint8_t* get() const { return bytes_; }

  // Hands the buffer over: whoever takes it calls chreHeapFree.
  uint8_t* release() {
    uint8_t* bytes = bytes_;
    bytes_ = nullptr;
    return bytes;
  }

 private:
  explicit ChreBuffer(void* bytes) : bytes_(static_cast<uint8_t*>(bytes)) {}

  uint8_t* bytes_ = nullptr;
};

}  // namespace tarn::contexthub::sound
