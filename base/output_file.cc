// SPDX-License-Identifier: Apache-2.0
#include "base/output_file.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstdio>
#include <cstring>
#include <filesystem>
#include <random>

#include "base/error.h"
#include "base/file_descriptor.h"
#include "base/interrupt.h"

namespace qz::base {
namespace {

namespace fs = std::filesystem;

[[noreturn]] void Refuse(const std::string& path, const std::string& reason) {
  throw OutputError(path + ": can't be written: " + reason);
}

[[noreturn]] void FailWithErrno(const std::string& path) { Refuse(path, std::strerror(errno)); }

// Where the bytes of an output go.
struct Target {
  fs::path path;  // no symbolic link, but for a stream
  bool is_stream = false;
  bool exists = false;
  struct stat status = {};
};

// Names of descriptors of this process. They are written through even where they are regular files:
// whoever opened them, for example to redirect a stream, goes on with the same file.
bool IsDescriptor(const fs::path& path) {
  const std::string folder = path.parent_path().string();
  return path == "/dev/stdout" || path == "/dev/stderr" || folder == "/dev/fd" ||
         folder == "/proc/self/fd";
}

// The path that a chain of symbolic links ends in, which need not exist.
fs::path FollowLinks(const std::string& path) {
  constexpr int kMaxLinks = 40;
  fs::path end = path;
  for (int links = 0; fs::is_symlink(fs::symlink_status(end)); ++links) {
    if (IsDescriptor(end)) return end;
    if (links == kMaxLinks) Refuse(path, std::strerror(ELOOP));
    end = end.parent_path() / fs::read_symlink(end);
  }
  return end;
}

Target TargetOf(const std::string& path) {
  Target target;
  try {
    target.path = FollowLinks(path);
  } catch (const fs::filesystem_error& error) {
    Refuse(path, error.code().message());
  }
  target.exists = stat(target.path.c_str(), &target.status) == 0;
  if (!target.exists) {
    if (errno != ENOENT) FailWithErrno(path);
    if (!target.path.has_filename()) Refuse(path, "names no file");
    return target;
  }
  const mode_t mode = target.status.st_mode;
  target.is_stream = S_ISCHR(mode) || S_ISFIFO(mode) || IsDescriptor(target.path);
  if (S_ISDIR(mode)) Refuse(path, "it is a folder, should be a file");
  if (!target.is_stream && !S_ISREG(mode)) {
    Refuse(path, "it is neither a regular file, a pipe nor a character device");
  }
  // Renaming asks the folder only; a file that is read-only stays so.
  if (faccessat(AT_FDCWD, target.path.c_str(), W_OK, AT_EACCESS) != 0) FailWithErrno(path);
  return target;
}

// A file of its own in the folder of the target, removed again unless it takes the target's name.
class TemporaryFile {
 public:
  TemporaryFile(const std::string& output, const Target& target)
      : output_(output), target_(target), path_(target.path.parent_path()), file_(-1) {
    std::random_device random;
    do {
      char name[32];
      std::snprintf(name, sizeof(name), ".qz-%08x%08x", random(), random());
      path_ = target.path.parent_path() / name;
      file_ = FileDescriptor(open(path_.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_CLOEXEC,
                                  target.exists ? 0600 : 0666));
    } while (file_.get() < 0 && errno == EEXIST);
    if (file_.get() < 0) FailWithErrno(output_);
  }
  TemporaryFile(const TemporaryFile&) = delete;
  TemporaryFile& operator=(const TemporaryFile&) = delete;
  ~TemporaryFile() {
    if (!renamed_) unlink(path_.c_str());
  }

  int descriptor() const { return file_.get(); }

  void TakeTargetsName() {
    if (target_.exists) {
      // Only root can give a file away; others keep what they are allowed to.
      [[maybe_unused]] const int kept =
          fchown(file_.get(), target_.status.st_uid, target_.status.st_gid);
      if (fchmod(file_.get(), target_.status.st_mode & 07777) != 0) FailWithErrno(output_);
    }
    if (fsync(file_.get()) != 0 || rename(path_.c_str(), target_.path.c_str()) != 0) {
      FailWithErrno(output_);
    }
    renamed_ = true;
    // So that the new name lasts; file systems that can't do it keep the file all the same.
    const fs::path parent = target_.path.parent_path();
    const FileDescriptor folder(
        open(parent.empty() ? "." : parent.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
    if (folder.get() >= 0) fsync(folder.get());
  }

 private:
  const std::string& output_;
  const Target& target_;
  fs::path path_;
  FileDescriptor file_;
  bool renamed_ = false;
};

void WriteAll(const std::string& path, int fd, std::string_view bytes) {
  while (!bytes.empty()) {
    const ssize_t written = write(fd, bytes.data(), bytes.size());
    if (written < 0 && errno == EINTR && !Interrupted()) continue;
    if (written < 0) FailWithErrno(path);
    bytes.remove_prefix(static_cast<size_t>(written));
  }
}

void WriteThrough(const std::string& path, const Target& target, std::string_view bytes) {
  // Appending: a redirected stream may hold something already.
  FileDescriptor file(-1);
  do {
    file = FileDescriptor(open(target.path.c_str(), O_WRONLY | O_APPEND | O_CLOEXEC | O_NOCTTY));
  } while (file.get() < 0 && errno == EINTR && !Interrupted());
  if (file.get() < 0) FailWithErrno(path);
  WriteAll(path, file.get(), bytes);
}

bool StatusOf(const std::string& path, struct stat* status) {
  return (path == "-" ? fstat(STDIN_FILENO, status) : stat(path.c_str(), status)) == 0;
}

}  // namespace

bool IsSameFile(const std::string& path, const std::string& other) {
  struct stat first = {};
  struct stat second = {};
  const bool exists = StatusOf(path, &first);
  if (exists != StatusOf(other, &second)) return false;
  if (exists) return first.st_dev == second.st_dev && first.st_ino == second.st_ino;
  std::error_code error;
  const fs::path resolved = fs::weakly_canonical(fs::absolute(path), error);
  return !error && resolved == fs::weakly_canonical(fs::absolute(other), error) && !error;
}

void CheckOutputFile(const std::string& path, const std::vector<std::string>& inputs) {
  const Target target = TargetOf(path);
  for (const std::string& input : inputs) {
    // A terminal may be both.
    const bool both = target.exists && !S_ISCHR(target.status.st_mode) && IsSameFile(path, input);
    if (both) Refuse(path, "it is the input " + input + " too, should be another file");
  }
  if (target.is_stream) return;
  const TemporaryFile probe(path, target);
}

void WriteOutputFile(const std::string& path, std::string_view bytes) {
  const Target target = TargetOf(path);
  if (target.is_stream) return WriteThrough(path, target, bytes);
  TemporaryFile temporary(path, target);
  WriteAll(path, temporary.descriptor(), bytes);
  temporary.TakeTargetsName();
}

void MakeOutputFolder(const std::string& path) {
  std::error_code error;
  fs::create_directories(path, error);
  if (!error && !fs::is_directory(path, error) && !error)
    error.assign(ENOTDIR, std::generic_category());
  if (error) throw OutputError(path + ": this folder can't be made: " + error.message());
}

}  // namespace qz::base
