// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <sys/types.h>

#include <cstdint>
#include <string>
#include <vector>

#include "base/file_descriptor.h"
#include "trace/trace_records.h"

namespace qz::tools {

// A build's bin/qz-trace at work on its lib/qz.so, as a child process; or, if a module is named
// instead of the build's folder, on that one: for lib/qz-stream.so bin/qz-trace-stream. The command
// that runs its programs on this machine is in the build folder's file `launcher`, a word a line;
// often it is empty. Where they run the program somewhere else, the paths that follow must be
// reachable there, and its standard output must come back; it has no standard input.
class TracedBuild {
 public:
  // `raw_audio` is the path of a file as qz-trace reads it. Throws base::LaunchError.
  TracedBuild(const std::string& build, const std::string& raw_audio, uint32_t host_clients,
              uint32_t client_nanoapps);
  TracedBuild(const TracedBuild&) = delete;
  TracedBuild& operator=(const TracedBuild&) = delete;
  // Kills the program, and all that it has started, if it still runs.
  ~TracedBuild();

  // The next record; the end record once the program has ended well. Throws base::LaunchError.
  void Next(trace::Record* record);

 private:
  void Start(const std::vector<std::string>& command);
  size_t Read(uint8_t* bytes, size_t size);
  // Waits for the program's end, or ends it at an interrupt, and all that it has left behind.
  // Returns how it ended; empty when it was with exit status 0.
  std::string AwaitEnd();

  std::string program_;
  base::FileDescriptor pipe_{-1};
  pid_t process_ = -1;
  std::vector<uint8_t> block_;  // bytes read ahead,
  size_t block_read_ = 0;       // and how many of them were handed on
  bool at_end_ = false;
  trace::Reader reader_;
};

}  // namespace qz::tools
