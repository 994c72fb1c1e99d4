#include "audio/temporary_file.h"

#include <fcntl.h>
#include <unistd.h>

#include <cerrno>
#include <cstdlib>
#include <cstring>

#include "audio/audio_input.h"

namespace qz::audio {
namespace {

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
  const char* rest = static_cast<const char*>(bytes);
  while (count > 0) {
    const ssize_t written = write(file.get(), rest, count);
    if (written < 0 && errno == EINTR) continue;
    if (written < 0) ThrowSystemError(TemporaryFolder(), "can't write a temporary file");
    rest += written;
    count -= static_cast<size_t>(written);
  }
}

void ThrowSystemError(const std::string& name, const char* what) {
  const int error = errno;
  throw AudioError(name + ": " + what + ": " + std::strerror(error));
}

}  // namespace qz::audio
