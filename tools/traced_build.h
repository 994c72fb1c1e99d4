#pragma once

#include <sys/types.h>

#include <cstdint>
#include <stdexcept>
#include <string>
#include <vector>

#include "file_descriptor.h"
#include "trace_records.h"

namespace qz::tools {

// A build that gives no whole trace: one line that names the program and what is wrong.
class BuildError : public std::runtime_error {
 public:
  using std::runtime_error::runtime_error;
};

// A build's bin/qz-trace at work on its lib/qz.so, as a child process. Words that run its programs
// on this machine stand in the build folder's file `launcher`, one a line; often there are none.
class TracedBuild {
 public:
  // `raw_audio` is a file as qz-trace reads it. Throws BuildError.
  TracedBuild(const std::string& folder, const FileDescriptor& raw_audio, uint32_t host_clients,
              uint32_t client_nanoapps);
  TracedBuild(const TracedBuild&) = delete;
  TracedBuild& operator=(const TracedBuild&) = delete;
  // Kills the program if it still runs.
  ~TracedBuild();

  // The next record; the end record once the program has ended well. Throws BuildError.
  void Next(trace::Record* record);

 private:
  void Start(const std::vector<std::string>& command, const FileDescriptor& raw_audio);
  size_t Read(uint8_t* bytes, size_t size);
  // Waits for the program's end and says how it was; empty when it was exit status 0.
  std::string AwaitEnd();

  std::string program_;
  FileDescriptor pipe_{-1};
  pid_t process_ = -1;
  std::vector<uint8_t> block_;  // bytes read ahead,
  size_t block_read_ = 0;       // and how many of them were handed on
  bool at_end_ = false;
  trace::Reader reader_;
};

}  // namespace qz::tools
