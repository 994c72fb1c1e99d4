// The subcommands of qz-model-tool.
#pragma once

#include <string>
#include <vector>

namespace qz::model {

enum ModelCommandResult {
  kSuccess = 0,
  kFindings = 1,     // the packed model is not valid; the findings are on stderr
  kWrongUsage = 2,   // the command line was not understood
  kFileTrouble = 3,  // a file cannot be read or written; a file to be written stays as it was
};

// Runs the subcommand words[0] with its arguments and returns the exit code. Every failure puts at
// least one line on stderr.
//   synthetic --seed N -o FILE  writes the synthetic model of a seed
//   check FILE                  checks a packed model
//   labels FILE                 reads the labels of a model's outputs
//   embed FILE -o HEADER        checks a packed model and writes it as a C++ header
//   describe -o FILE            writes the detector's description as JSON
int RunModelCommand(const std::vector<std::string>& words);

}  // namespace qz::model
