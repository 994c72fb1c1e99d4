// SPDX-License-Identifier: Apache-2.0
// The header of a stream that can't seek.
#pragma once

#include <cstdint>
#include <optional>
#include <string>

#include "audio/pcm_format.h"
#include "base/file_descriptor.h"

namespace qz::audio {

// From this size on, a header means "until the end": programs that write to a pipe state a size
// near 2^31 or 2^32.
constexpr uint32_t kUntilTheEnd = 0x7FFF0000;

// The first bytes of a stream, read no further than asked for.
class StreamHead {
 public:
  // `name` is the stream's name in messages.
  StreamHead(std::string name, const base::FileDescriptor* file)
      : name_(std::move(name)), file_(*file) {}

  // Reads until there are `count` bytes; false if the stream ends before. Throws AudioError, after
  // an interrupt, too.
  bool Need(size_t count);

  // All that was read.
  const std::string& bytes() const { return bytes_; }

 private:
  std::string name_;
  const base::FileDescriptor& file_;
  std::string bytes_;
};

// Samples without compression, behind a header.
struct PcmStream {
  PcmFormat format;
  std::optional<uint64_t> bytes;  // of the samples; nothing if they go on until the end
  bool unfinished = false;        // a size of 0 where one was to be filled in
};

// Reads the header of a WAV or AU stream up to its first sample. Nothing if it is another kind, its
// samples are compressed, or the header is not as usual: then the stream is not read beyond what
// `head` holds. Throws AudioError.
std::optional<PcmStream> ReadPcmHeader(StreamHead* head);

}  // namespace qz::audio
