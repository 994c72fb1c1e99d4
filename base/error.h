// SPDX-License-Identifier: Apache-2.0
// The errors that end a command. Each holds one line for the user, which names the file or value,
// the location and what is expected; its type decides the exit code.
#pragma once

#include <exception>
#include <stdexcept>
#include <string>

#include "base/exit_code.h"

namespace qz::base {

class Error : public std::runtime_error {
 public:
  ExitCode exit_code() const { return exit_code_; }

 protected:
  Error(const std::string& message, ExitCode exit_code)
      : std::runtime_error(message), exit_code_(exit_code) {}

 private:
  ExitCode exit_code_;
};

// A file, stream or value that can't be read or used.
class InputError : public Error {
 public:
  explicit InputError(const std::string& message) : Error(message, kUnreadableInput) {}
};

class OutputError : public Error {
 public:
  explicit OutputError(const std::string& message) : Error(message, kUnwritableOutput) {}
};

// A model that was read but is not valid.
class ModelError : public Error {
 public:
  explicit ModelError(const std::string& message) : Error(message, kFaultFound) {}
};

// A module or program that can't be started, or that breaks off.
class LaunchError : public Error {
 public:
  explicit LaunchError(const std::string& message) : Error(message, kNotRunnable) {}
};

inline ExitCode ExitCodeOf(const std::exception& error) {
  const auto* const own = dynamic_cast<const Error*>(&error);
  return own != nullptr ? own->exit_code() : kFaultFound;
}

}  // namespace qz::base
