// SPDX-License-Identifier: Apache-2.0
// Temporary files, in the folder $TMPDIR or else /tmp.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>

#include "base/file_descriptor.h"

namespace qz::audio {

// All throw AudioError.

// A file without a name: nothing of it stays, however the program ends.
base::FileDescriptor OpenTemporaryFile();

// A file with a name, for other programs; removed with the object.
class NamedTemporaryFile {
 public:
  NamedTemporaryFile();
  NamedTemporaryFile(const NamedTemporaryFile&) = delete;
  NamedTemporaryFile& operator=(const NamedTemporaryFile&) = delete;
  ~NamedTemporaryFile();

  const std::string& path() const { return path_; }
  const base::FileDescriptor& descriptor() const { return descriptor_; }

 private:
  std::string path_;
  base::FileDescriptor descriptor_;
};

void WriteToTemporaryFile(const base::FileDescriptor& file, const void* bytes, size_t count);

// A file without a name, at its beginning, with the bytes `head` and all that can still be read
// from `source`, whose name in messages is `name`: `max_bytes` at most.
base::FileDescriptor CopyToTemporaryFile(const std::string& name,
                                         const base::FileDescriptor& source,
                                         const std::string& head, uint64_t max_bytes);

// Throws AudioError with the meaning of errno: "NAME: WHAT: Reason".
[[noreturn]] void ThrowSystemError(const std::string& name, const char* what);

}  // namespace qz::audio
