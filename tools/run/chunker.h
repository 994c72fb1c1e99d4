// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <functional>
#include <utility>
#include <vector>

namespace qz::tools {

// Samples of one buffer of the microphone: 2 s at 16 kHz.
constexpr size_t kBufferSamples = 32000;

// Cuts a stream of samples into whole buffers, each handed on as soon as it is full.
class Chunker {
 public:
  // Gets kBufferSamples samples, valid during the call.
  using Sink = std::function<void(const int16_t* buffer)>;

  explicit Chunker(Sink sink) : sink_(std::move(sink)), buffer_(kBufferSamples) {}

  // Room for the next samples: at least one, up to the end of the buffer. Commit hands them on.
  int16_t* space() { return buffer_.data() + held_; }
  size_t space_samples() const { return kBufferSamples - held_; }
  // `count` samples were written to the room.
  void Commit(size_t count) {
    held_ += count;
    if (held_ < kBufferSamples) return;
    held_ = 0;
    sink_(buffer_.data());
  }

  // Fills the last, partial buffer up with silence and hands it on; gives the number of silent
  // samples, 0 if there was no partial buffer.
  size_t Finish() {
    if (held_ == 0) return 0;
    const size_t silent = space_samples();
    std::fill_n(space(), silent, int16_t{0});
    Commit(silent);
    return silent;
  }

 private:
  Sink sink_;
  std::vector<int16_t> buffer_;
  size_t held_ = 0;
};

}  // namespace qz::tools
