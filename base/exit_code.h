// SPDX-License-Identifier: Apache-2.0
#pragma once

namespace qz::base {

// Exit codes of all programs of this project.
enum ExitCode {
  kSuccess = 0,
  kFaultFound = 1,  // the run found a fault, a difference or an invalid model
  kUsage = 2,
  kUnreadableInput = 3,  // or read in part
  kNotRunnable = 4,      // a module that can't be loaded, a program that can't be started
  kUnwritableOutput = 5,
  // 128 and the number of the signal that interrupted the run, as shells count.
  kHungUp = 129,
  kInterrupted = 130,
  kTerminated = 143,
};

}  // namespace qz::base
