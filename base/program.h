// SPDX-License-Identifier: Apache-2.0
// What the main functions of all programs have in common.
#pragma once

#include <functional>
#include <string>

#include "base/exit_code.h"

namespace qz::base {

// Runs `command` and returns the program's exit code:
// - an exception ends in one line on standard error, "PROGRAM: message", and its exit code,
// - standard output that can't be written gives kUnwritableOutput, unless its reader has left,
// - an interrupt gives the signal's exit code (see ExitCodeAfterInterrupt).
// Signals of broken pipes and of the limit on file sizes are ignored: the writes fail instead.
int RunProgram(const char* program, const std::function<ExitCode()>& command);

// "PROGRAM VERSION (build NUMBER)".
std::string VersionLine(const std::string& program);

}  // namespace qz::base
