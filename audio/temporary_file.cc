// SPDX-License-Identifier: Apache-2.0
#include "audio/temporary_file.h"

#include <fcntl.h>
#include <unistd.h>

#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <vector>

#include "audio/audio_input.h"
#include "base/interrupt.h"

namespace qz::audio {
namespace {

constexpr size_t kCopyBlockBytes = 65536;

std::string TemporaryFolder() {
  const char* folder = std::getenv("TMPDIR");
  return folder != nullptr && folder[0] != '\0' ? folder : "/tmp";
}

// Fills in the last letters of the path.
base::FileDescriptor MakeFile(std::string* path) {
  *path = TemporaryFolder() + "/qz-XXXXXX";
  base::FileDescriptor file(mkostemp(path->data(), O_CLOEXEC));
  if (file.get() < 0) ThrowSystemError(*path, "can't make a temporary file");
  return file;
}

}  // namespace

base::FileDescriptor OpenTemporaryFile() {
  std::string path;
  base::FileDescriptor file = MakeFile(&path);
  unlink(path.c_str());
  return file;
}

NamedTemporaryFile::NamedTemporaryFile() : descriptor_(MakeFile(&path_)) {}

NamedTemporaryFile::~NamedTemporaryFile() { unlink(path_.c_str()); }

void WriteToTemporaryFile(const base::FileDescriptor& file, const void* bytes, size_t count) {
  const auto* rest = static_cast<const char*>(bytes);
  while (count > 0) {
    const ssize_t written = write(file.get(), rest, count);
    if (written < 0 && errno == EINTR) continue;
    if (written < 0) ThrowSystemError(TemporaryFolder(), "can't write a temporary file");
    rest += written;
    count -= static_cast<size_t>(written);
  }
}

base::FileDescriptor CopyToTemporaryFile(const std::string& name,
                                         const base::FileDescriptor& source,
                                         const std::string& head, uint64_t max_bytes) {
  base::FileDescriptor copy = OpenTemporaryFile();
  WriteToTemporaryFile(copy, head.data(), head.size());
  uint64_t copied = head.size();
  std::vector<char> block(kCopyBlockBytes);
  while (base::WaitReadable(source.get())) {
    const ssize_t got = read(source.get(), block.data(), block.size());
    if (got < 0 && (errno == EINTR || errno == EAGAIN)) continue;
    if (got < 0) ThrowSystemError(name, "can't be read");
    if (got == 0) {
      if (lseek(copy.get(), 0, SEEK_SET) != 0) ThrowSystemError(name, "can't rewind the copy");
      return copy;
    }
    copied += static_cast<uint64_t>(got);
    if (copied > max_bytes) {
      throw AudioError(name + ": exceeds the " + std::to_string(max_bytes) +
                       " bytes (1 GiB) that are copied of a stream of its kind; save it as a file");
    }
    WriteToTemporaryFile(copy, block.data(), static_cast<size_t>(got));
  }
  throw AudioError(name + ": interrupted before its end");
}

void ThrowSystemError(const std::string& name, const char* what) {
  const int error = errno;
  throw AudioError(name + ": " + what + ": " + std::strerror(error));
}

}  // namespace qz::audio
