#pragma once

namespace qz::tools {

enum ExitCode {
  kFine = 0,
  kFaultFound = 1,  // or a difference
  kUsage = 2,
  kUnreadableInput = 3,
  kNotRunnable = 4,  // a module that can't be loaded, a program that can't be started or broke off
};

}  // namespace qz::tools
