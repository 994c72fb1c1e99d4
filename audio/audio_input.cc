#include "audio/audio_input.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <vector>

#include "audio/raw_input.h"
#include "audio/sound_file_input.h"
#include "audio/temporary_file.h"
#include "base/file_descriptor.h"
#include "base/interrupt.h"

namespace qz::audio {
namespace {

constexpr size_t kCopyBlockBytes = 65536;

// Some containers need seeking, which a pipe can't do.
base::FileDescriptor CopyToTemporary(const std::string& name, const base::FileDescriptor& source) {
  base::FileDescriptor copy = OpenTemporaryFile();
  std::vector<char> block(kCopyBlockBytes);
  while (base::WaitReadable(source.get())) {
    const ssize_t got = read(source.get(), block.data(), block.size());
    if (got < 0 && (errno == EINTR || errno == EAGAIN)) continue;
    if (got < 0) ThrowSystemError(name, "can't be read");
    if (got == 0) {
      if (lseek(copy.get(), 0, SEEK_SET) != 0) ThrowSystemError(name, "can't rewind the copy");
      return copy;
    }
    WriteToTemporaryFile(copy, block.data(), static_cast<size_t>(got));
  }
  throw AudioError(name + ": interrupted before its end; live sound needs --raw");
}

}  // namespace

std::unique_ptr<AudioInput> OpenAudio(const std::string& path, bool raw) {
  const bool standard_input = path == "-";
  const std::string name = standard_input ? "standard input" : path;
  base::FileDescriptor file(standard_input ? dup(STDIN_FILENO)
                                           : open(path.c_str(), O_RDONLY | O_CLOEXEC));
  if (file.get() < 0) ThrowSystemError(name, "can't be opened");
  struct stat status = {};
  if (fstat(file.get(), &status) != 0) ThrowSystemError(name, "can't be examined");
  if (S_ISDIR(status.st_mode)) throw AudioError(name + ": is a folder, not a sound file");
  if (raw) return std::make_unique<RawInput>(name, std::move(file));

  // Standard input may be a file that somebody has read from already.
  const bool at_beginning = S_ISREG(status.st_mode) && lseek(file.get(), 0, SEEK_CUR) == 0;
  if (!at_beginning) file = CopyToTemporary(name, file);
  if (fstat(file.get(), &status) == 0 && status.st_size == 0) {
    throw AudioError(name + ": empty: 0 bytes");
  }
  return std::make_unique<SoundFileInput>(name, std::move(file));
}

}  // namespace qz::audio
