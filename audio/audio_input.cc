// SPDX-License-Identifier: Apache-2.0
#include "audio/audio_input.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <utility>

#include "audio/container.h"
#include "audio/pcm_input.h"
#include "audio/sound_file_input.h"
#include "audio/stream_header.h"
#include "audio/temporary_file.h"
#include "base/file_descriptor.h"

namespace qz::audio {
namespace {

// Of a stream that needs seeking: days of compressed audio.
constexpr uint64_t kMaxCopiedBytes = uint64_t{1} << 30;

// A path as an argument in a shell.
std::string Quoted(const std::string& path) {
  std::string quoted = "'";
  for (const char letter : path) {
    if (letter == '\'') {
      quoted += "'\\''";
    } else {
      quoted += letter;
    }
  }
  return quoted + "'";
}

void RefuseUnreadable(const std::string& path, const std::string& name, const std::string& head) {
  const char* format = UnreadableFormatName(head);
  const char* const mpeg = MpegName(head);
  if (format == nullptr && mpeg != nullptr && std::string(mpeg) == "AAC") format = mpeg;
  if (format == nullptr) return;
  const std::string command = path == "-"
                                  ? "ffmpeg -i - -f wav - | qz run -"
                                  : "ffmpeg -i " + Quoted(path) + " -ac 1 -ar 16000 audio.wav";
  throw AudioError(name + ": is " + format + ", which qz does not read; convert it: " + command);
}

std::unique_ptr<AudioInput> OpenRaw(const std::string& name, base::FileDescriptor file,
                                    const PcmFormat& format) {
  StreamHead head(name, &file);
  head.Need(kMagicBytes);
  const char* container = ContainerName(head.bytes());
  if (container == nullptr) container = UnreadableFormatName(head.bytes());
  if (container != nullptr) {
    throw AudioError(name + ": begins with the header of " + container +
                     ", which would be played as sound; --raw expects headerless samples");
  }
  return std::make_unique<PcmInput>(PcmInput::Source{name, std::move(file), head.bytes()}, format);
}

// What can't seek, or somebody has read from already.
std::unique_ptr<AudioInput> OpenStream(const std::string& path, const std::string& name,
                                       base::FileDescriptor file,
                                       const std::function<void(const std::string&)>& notice) {
  StreamHead head(name, &file);
  head.Need(kMagicBytes);
  if (head.bytes().empty()) throw AudioError(name + ": empty: 0 bytes");
  RefuseUnreadable(path, name, head.bytes());
  const char* container = ContainerName(head.bytes());
  if (container == nullptr) container = MpegName(head.bytes());
  if (container == nullptr) {
    throw AudioError(name +
                     ": begins with no header that is known in a stream; headerless samples "
                     "need --raw");
  }
  if (const auto stream = ReadPcmHeader(&head)) {
    return std::make_unique<PcmInput>(PcmInput::Source{name, std::move(file), ""}, stream->format,
                                      container, stream->bytes);
  }
  if (notice) {
    notice(name + ": is " + container +
           " that needs seeking: it is copied to a temporary file of " +
           "at most 1 GiB and plays after its end; WAV without compression plays as it comes");
  }
  return std::make_unique<SoundFileInput>(
      name, CopyToTemporaryFile(name, file, head.bytes(), kMaxCopiedBytes));
}

// A WAV file whose header states no audio, as what wrote it could not go back to it. Null, and
// `file` as it was, if it is another.
std::unique_ptr<AudioInput> OpenUnfinishedWav(const std::string& name, base::FileDescriptor* file) {
  StreamHead head(name, file);
  const auto stream = ReadPcmHeader(&head);
  if (!stream || !stream->unfinished) {
    if (lseek(file->get(), 0, SEEK_SET) != 0) ThrowSystemError(name, "can't be read again");
    return nullptr;
  }
  return std::make_unique<PcmInput>(PcmInput::Source{name, std::move(*file), ""}, stream->format,
                                    ContainerName(head.bytes()), stream->bytes);
}

}  // namespace

std::unique_ptr<AudioInput> OpenAudio(const std::string& path, const std::optional<PcmFormat>& raw,
                                      const std::function<void(const std::string& line)>& notice) {
  const bool standard_input = path == "-";
  const std::string name = standard_input ? "standard input" : path;
  base::FileDescriptor file(standard_input ? dup(STDIN_FILENO)
                                           : open(path.c_str(), O_RDONLY | O_CLOEXEC));
  if (file.get() < 0) ThrowSystemError(name, "can't be opened");
  struct stat status = {};
  if (fstat(file.get(), &status) != 0) ThrowSystemError(name, "can't be examined");
  if (S_ISDIR(status.st_mode)) throw AudioError(name + ": is a folder, not a sound file");
  if (raw) return OpenRaw(name, std::move(file), *raw);

  // Standard input may be a file that somebody has read from already.
  const bool at_beginning = S_ISREG(status.st_mode) && lseek(file.get(), 0, SEEK_CUR) == 0;
  if (!at_beginning) return OpenStream(path, name, std::move(file), notice);
  if (status.st_size == 0) throw AudioError(name + ": empty: 0 bytes");
  std::string head(kMagicBytes, '\0');
  const ssize_t got = pread(file.get(), head.data(), head.size(), 0);
  head.resize(got > 0 ? static_cast<size_t>(got) : 0);
  RefuseUnreadable(path, name, head);
  if (auto unfinished = OpenUnfinishedWav(name, &file)) return unfinished;
  return std::make_unique<SoundFileInput>(name, std::move(file));
}

}  // namespace qz::audio
