#pragma once

namespace qz::base {

enum ExitCode {
  kSuccess = 0,
  kFaultFound = 1,  // or a difference, or output that can't be written
  kUsage = 2,
  kUnreadableInput = 3,  // or input that was skipped
  // A module that can't be loaded; a program that can't be started, broke off or didn't play all;
  // an interrupt of what is worth nothing unless it is whole. A run that is interrupted just ends.
  kNotRunnable = 4,
};

}  // namespace qz::base
