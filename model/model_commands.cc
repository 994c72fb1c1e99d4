// SPDX-License-Identifier: Apache-2.0
#include "model/model_commands.h"

#include <cstdint>
#include <cstdio>
#include <string>

#include "base/output_file.h"
#include "base/program.h"
#include "model/check_weights.h"
#include "model/describe.h"
#include "model/labels.h"
#include "model/model_files.h"
#include "model/synthetic_model.h"

namespace qz::model {
namespace {

constexpr char kHelp[] =
    "usage: qz-model-tool synthetic --seed N -o FILE  write a synthetic model\n"
    "       qz-model-tool check FILE                 check a packed model\n"
    "       qz-model-tool labels FILE                check the labels of a model's outputs\n"
    "       qz-model-tool embed FILE -o HEADER       write a packed model as a C++ header\n"
    "       qz-model-tool describe -o FILE           write the detector's description as JSON\n"
    "       qz-model-tool --help | --version\n"
    "exit codes: 0 fine, 1 not valid, 2 usage, 3 unreadable input, 5 unwritable output\n";

base::ExitCode UsageError(const std::string& message) {
  std::fprintf(stderr, "qz-model-tool: %s\n%s", message.c_str(), kHelp);
  return base::kUsage;
}

struct Arguments {
  std::string error;  // empty when the command line is understood
  std::string file;
  std::string output;
  std::string seed;
};

// Everything behind the subcommand: at most one file, and each option once with its value.
Arguments Parse(const std::vector<std::string>& words) {
  Arguments arguments;
  for (size_t i = 1; i < words.size(); ++i) {
    const std::string& word = words[i];
    std::string* value = &arguments.file;
    if (word == "-o" || word == "--seed") {
      value = word == "-o" ? &arguments.output : &arguments.seed;
      if (++i == words.size()) {
        arguments.error = word + " needs a value";
        return arguments;
      }
    } else if (!word.empty() && word[0] == '-') {
      arguments.error = "unknown option " + word;
      return arguments;
    }
    if (!value->empty() || words[i].empty()) {
      arguments.error = "unexpected argument '" + words[i] + "'";
      return arguments;
    }
    *value = words[i];
  }
  return arguments;
}

// Decimal digits only, below 2^64.
bool ParseSeed(const std::string& text, uint64_t& seed) {
  seed = 0;
  for (const char c : text) {
    if (c < '0' || c > '9') return false;
    const uint64_t digit = static_cast<uint64_t>(c - '0');
    if (seed > (UINT64_MAX - digit) / 10) return false;
    seed = seed * 10 + digit;
  }
  return !text.empty();
}

base::ExitCode Synthetic(const Arguments& arguments) {
  uint64_t seed;
  if (arguments.output.empty() || !arguments.file.empty()) {
    return UsageError("synthetic needs --seed N and -o FILE");
  }
  if (!ParseSeed(arguments.seed, seed)) {
    return UsageError("--seed needs an integer from 0 to 18446744073709551615, not '" +
                      arguments.seed + "'");
  }
  const PackedModel model = MakeSyntheticModel(seed);
  base::WriteOutputFile(arguments.output, std::string(model.begin(), model.end()));
  return base::kSuccess;
}

// Reads and checks; prints the findings.
base::ExitCode LoadValidModel(const std::string& file, PackedModel& model) {
  model = ReadModelFile(file);
  const std::vector<std::string> findings = CheckWeights(model);
  std::fputs(FormatFindings(file, findings).c_str(), stderr);
  return findings.empty() ? base::kSuccess : base::kFaultFound;
}

bool IsOneFile(const Arguments& arguments) {
  return !arguments.file.empty() && arguments.output.empty() && arguments.seed.empty();
}

base::ExitCode CheckLabels(const Arguments& arguments) {
  if (!IsOneFile(arguments)) return UsageError("labels needs one FILE");
  ReadLabels(arguments.file);
  return base::kSuccess;
}

base::ExitCode Check(const Arguments& arguments) {
  if (!IsOneFile(arguments)) return UsageError("check needs one FILE");
  PackedModel model;
  return LoadValidModel(arguments.file, model);
}

base::ExitCode Embed(const Arguments& arguments) {
  if (arguments.file.empty() || arguments.output.empty() || !arguments.seed.empty()) {
    return UsageError("embed needs one FILE and -o HEADER");
  }
  base::CheckOutputFile(arguments.output, {arguments.file});
  PackedModel model;
  const base::ExitCode result = LoadValidModel(arguments.file, model);
  if (result != base::kSuccess) return result;
  base::WriteOutputFile(arguments.output, TablesHeader(model));
  return base::kSuccess;
}

base::ExitCode Describe(const Arguments& arguments) {
  if (arguments.output.empty() || !arguments.file.empty() || !arguments.seed.empty()) {
    return UsageError("describe needs -o FILE");
  }
  base::WriteOutputFile(arguments.output, DescriptionJson());
  return base::kSuccess;
}

}  // namespace

base::ExitCode RunModelCommand(const std::vector<std::string>& words) {
  const std::string command = words.empty() ? "" : words[0];
  if (command == "--help" || command == "--version") {
    std::printf("%s\n%s", base::VersionLine("qz-model-tool").c_str(),
                command == "--help" ? kHelp : "");
    return base::kSuccess;
  }
  const Arguments arguments = Parse(words);
  if (!arguments.error.empty()) return UsageError(arguments.error);
  if (command == "synthetic") return Synthetic(arguments);
  if (command == "check") return Check(arguments);
  if (command == "labels") return CheckLabels(arguments);
  if (command == "embed") return Embed(arguments);
  if (command == "describe") return Describe(arguments);
  return UsageError(command.empty() ? "no subcommand" : "unknown subcommand '" + command + "'");
}

}  // namespace qz::model
