// SPDX-License-Identifier: Apache-2.0
#include "tools/prove/traced_build.h"

#include <fcntl.h>
#include <signal.h>
#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <filesystem>
#include <fstream>

#include "base/error.h"
#include "base/interrupt.h"

namespace qz::tools {
namespace {

constexpr size_t kBlockBytes = 65536;

std::vector<std::string> LauncherWords(const std::string& folder) {
  std::ifstream file(folder + "/launcher");
  std::vector<std::string> words;
  for (std::string word; std::getline(file, word);) {
    if (!word.empty()) words.push_back(word);
  }
  return words;
}

struct Build {
  std::string folder;
  std::string engine;  // what the names of its program and module end in
};

// Of a build folder, or of a module FOLDER/lib/qzENGINE.so.
Build BuildOf(const std::string& named) {
  const std::filesystem::path module(named);
  const std::string name = module.stem().string();
  if (module.extension() != ".so" || name.compare(0, 2, "qz") != 0) return {named, ""};
  return {module.parent_path().parent_path().string(), name.substr(2)};
}

}  // namespace

TracedBuild::TracedBuild(const std::string& build, const std::string& raw_audio,
                         uint32_t host_clients, uint32_t client_nanoapps)
    : program_(BuildOf(build).folder + "/bin/qz-trace" + BuildOf(build).engine),
      reader_([this](uint8_t* bytes, size_t size) { return Read(bytes, size); }) {
  if (access(program_.c_str(), R_OK) != 0) {
    throw base::LaunchError(program_ + ": " + std::strerror(errno) +
                            ", should be a build's program");
  }
  const auto& [folder, engine] = BuildOf(build);
  const std::string module = folder + std::string("/lib/qz").append(engine).append(".so");
  std::vector<std::string> command = LauncherWords(folder);
  for (const std::string& word : {program_, raw_audio, module, std::to_string(host_clients),
                                  std::to_string(client_nanoapps)}) {
    command.push_back(word);
  }
  Start(command);
}

void TracedBuild::Start(const std::vector<std::string>& command) {
  int ends[2];
  if (pipe2(ends, O_CLOEXEC) != 0) throw base::LaunchError(program_ + ": " + std::strerror(errno));
  pipe_ = base::FileDescriptor(ends[0]);
  const base::FileDescriptor write_end(ends[1]);

  std::vector<char*> words;
  words.reserve(command.size() + 1);
  for (const std::string& word : command) words.push_back(const_cast<char*>(word.c_str()));
  words.push_back(nullptr);
  posix_spawn_file_actions_t files;
  posix_spawn_file_actions_init(&files);
  posix_spawn_file_actions_addopen(&files, STDIN_FILENO, "/dev/null", O_RDONLY, 0);
  posix_spawn_file_actions_adddup2(&files, write_end.get(), STDOUT_FILENO);
  // A reader that leaves ends the program, which this one ignores for itself.
  sigset_t with_default;
  sigemptyset(&with_default);
  sigaddset(&with_default, SIGPIPE);
  posix_spawnattr_t attributes;
  posix_spawnattr_init(&attributes);
  posix_spawnattr_setsigdefault(&attributes, &with_default);
  // A process group of its own, so that what a launcher has started can be killed with it.
  posix_spawnattr_setpgroup(&attributes, 0);
  posix_spawnattr_setflags(&attributes, POSIX_SPAWN_SETSIGDEF | POSIX_SPAWN_SETPGROUP);
  const int error = posix_spawnp(&process_, words[0], &files, &attributes, words.data(), environ);
  posix_spawnattr_destroy(&attributes);
  posix_spawn_file_actions_destroy(&files);
  if (error == 0) {
    // As the program does for itself: whoever comes first, the group is there from now on, also
    // where posix_spawn() returns before the program has begun.
    setpgid(process_, process_);
    return;
  }
  process_ = -1;
  throw base::LaunchError(program_ + ": can't be started by " + command[0] + ": " +
                          std::strerror(error));
}

TracedBuild::~TracedBuild() {
  if (process_ < 0) return;
  kill(-process_, SIGKILL);
  AwaitEnd();
}

void TracedBuild::Next(trace::Record* record) {
  try {
    reader_.Next(record);
  } catch (const trace::TraceError& error) {
    // One that writes nonsense need not end; its exit status would add nothing either.
    const std::string end = at_end_ && process_ >= 0 ? AwaitEnd() : "";
    throw base::LaunchError(program_ + ": " + error.what() + (end.empty() ? "" : "; it " + end));
  }
  if (record->kind != trace::Kind::kEnd) return;
  const std::string end = AwaitEnd();
  if (!end.empty()) throw base::LaunchError(program_ + ": its trace is whole, but it " + end);
}

size_t TracedBuild::Read(uint8_t* bytes, size_t size) {
  while (block_read_ == block_.size()) {
    if (at_end_ || !base::WaitReadable(pipe_.get())) return 0;
    block_.resize(kBlockBytes);
    const ssize_t got = read(pipe_.get(), block_.data(), block_.size());
    if (got < 0 && errno != EINTR) throw base::LaunchError(program_ + ": " + std::strerror(errno));
    block_.resize(got > 0 ? static_cast<size_t>(got) : 0);
    block_read_ = 0;
    at_end_ = got == 0;
  }
  const size_t given = std::min(size, block_.size() - block_read_);
  std::copy_n(block_.data() + block_read_, given, bytes);
  block_read_ += given;
  return given;
}

std::string TracedBuild::AwaitEnd() {
  // Until waitpid() the ended process keeps its number, and with it the group's.
  siginfo_t ended;
  do {
    if (base::Interrupted()) kill(-process_, SIGKILL);
  } while (waitid(P_PID, static_cast<id_t>(process_), &ended, WEXITED | WNOWAIT) < 0 &&
           errno == EINTR);
  kill(-process_, SIGKILL);
  int status = 0;
  while (waitpid(process_, &status, 0) < 0 && errno == EINTR) {
  }
  process_ = -1;
  if (WIFSIGNALED(status)) return "was ended by signal " + std::to_string(WTERMSIG(status));
  const int exit_status = WEXITSTATUS(status);
  return exit_status == 0 ? "" : "ended with exit status " + std::to_string(exit_status);
}

}  // namespace qz::tools
