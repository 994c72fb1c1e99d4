// A program run by a test, with its streams at hand.
#pragma once

#include <fcntl.h>
#include <signal.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstdlib>
#include <string>
#include <vector>

namespace qz::test {

struct ProgramResult {
  int exit_code = -1;  // 128 + n when signal n ended it
  std::string out;
  std::string err;
};

class Program {
 public:
  // Starts `arguments[0]`, a path.
  explicit Program(std::vector<std::string> arguments) {
    signal(SIGPIPE, SIG_IGN);
    int pipes[3][2];
    for (auto& ends : pipes) {
      if (pipe2(ends, O_CLOEXEC) != 0) std::abort();
    }
    std::vector<char*> pointers(arguments.size() + 1);
    for (size_t i = 0; i < arguments.size(); ++i) pointers[i] = arguments[i].data();
    pid_ = fork();
    if (pid_ == 0) {
      for (int fd = 0; fd < 3; ++fd) dup2(pipes[fd][fd == 0 ? 0 : 1], fd);
      signal(SIGPIPE, SIG_DFL);
      execv(pointers[0], pointers.data());
      _exit(127);
    }
    for (int fd = 0; fd < 3; ++fd) {
      close(pipes[fd][fd == 0 ? 0 : 1]);
      fds_[fd] = pipes[fd][fd == 0 ? 1 : 0];
    }
  }
  Program(const Program&) = delete;
  Program& operator=(const Program&) = delete;
  ~Program() {
    if (pid_ > 0) kill(pid_, SIGKILL);
    Finish();
  }

  void Write(std::string bytes) const {
    for (ssize_t written = 0; !bytes.empty(); bytes.erase(0, static_cast<size_t>(written))) {
      written = write(fds_[0], bytes.data(), bytes.size());
      if (written <= 0) return;
    }
  }
  // Closes its standard input (0) or lets nobody read its output (1) any more.
  void Close(int fd) {
    if (fds_[fd] >= 0) close(fds_[fd]);
    fds_[fd] = -1;
  }
  // Reads its standard output until `text` came; false if it ended before.
  bool ReadUntil(const std::string& text) {
    while (result_.out.find(text) == std::string::npos) {
      if (!ReadSome(1, &result_.out)) return false;
    }
    return true;
  }
  void Signal(int number) const { kill(pid_, number); }
  // Closes its standard input and waits for its end. Standard error must fit a pipe (64 KiB).
  ProgramResult Finish() {
    if (pid_ <= 0) return result_;
    Close(0);
    while (ReadSome(1, &result_.out) || ReadSome(2, &result_.err)) {
    }
    Close(1);
    Close(2);
    int status = 0;
    waitpid(pid_, &status, 0);
    pid_ = -1;
    result_.exit_code = WIFEXITED(status) ? WEXITSTATUS(status) : 128 + WTERMSIG(status);
    return result_;
  }

 private:
  bool ReadSome(int fd, std::string* text) const {
    char block[4096];
    const ssize_t got = read(fds_[fd], block, sizeof(block));
    if (got > 0) text->append(block, static_cast<size_t>(got));
    return got > 0;
  }

  int pid_ = -1;
  int fds_[3] = {-1, -1, -1};
  ProgramResult result_;
};

}  // namespace qz::test
