#pragma once

namespace qz::tools {

enum ExitCode {
  kFine = 0,
  kFaultFound = 1,  // or a difference
  kUsage = 2,
  kUnreadableInput = 3,
  // A module that can't be loaded; a program that can't be started, broke off or didn't play all;
  // an interrupt before `qz prove` was through.
  kNotRunnable = 4,
};

}  // namespace qz::tools
