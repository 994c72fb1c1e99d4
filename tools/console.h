// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <string>

namespace qz::tools {

// The two outputs: data lines on stdout, messages on stderr and, if that is a terminal, a progress
// line below everything else.
class Console {
 public:
  Console();
  ~Console();

  // A line of data, out at once. After a failed write all further ones are dropped.
  void Data(const std::string& line);
  // A line of message.
  void Message(const std::string& line);

  // Shows `done` of `total` samples in the progress line, at most five times a second and not in
  // the first 0.2 s. Shows nothing of audio of unknown length, whose total is 0.
  void Progress(uint64_t done, uint64_t total);
  // The same of clips.
  void ClipProgress(uint64_t done, uint64_t total);
  // Removes the progress line: what it counted is done.
  void ClearProgress();

  // True once nobody reads stdout any more, or it can't be written.
  bool output_lost() const { return lost_error_ != 0; }
  // One line about output that was lost to anything but a reader that had enough; else empty.
  std::string OutputFault() const;

  bool data_on_terminal() const { return data_on_terminal_; }
  // Whether data may be coloured: on a terminal whose user has not set NO_COLOR.
  bool data_in_colour() const;

 private:
  bool ProgressDue();
  void Draw() const;
  void Erase() const;

  bool data_on_terminal_;
  bool messages_on_terminal_;
  std::string progress_;      // as shown last; empty: none
  int64_t next_progress_ms_;  // on the steady clock
  int lost_error_ = 0;        // errno of the first failed write of data
};

}  // namespace qz::tools
