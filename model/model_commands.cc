#include "model/model_commands.h"

#include <cstdint>
#include <cstdio>
#include <exception>
#include <string>

#include "model/check_weights.h"
#include "model/describe.h"
#include "model/labels.h"
#include "model/model_files.h"
#include "model/synthetic_model.h"

namespace qz::model {
namespace {

constexpr char kUsage[] =
    "usage: qz-model-tool synthetic --seed N -o FILE  write a synthetic model\n"
    "       qz-model-tool check FILE                check a packed model\n"
    "       qz-model-tool labels FILE               check the labels of a model's outputs\n"
    "       qz-model-tool embed FILE -o HEADER      turn a valid packed model into a C++ header\n"
    "       qz-model-tool describe -o FILE          write the detector's description as JSON\n"
    "exit codes: 0 fine, 1 findings, 2 wrong usage, 3 a file that cannot be read or written\n";

int Usage(const std::string& error) {
  std::fprintf(stderr, "qz-model-tool: %s\n%s", error.c_str(), kUsage);
  return kWrongUsage;
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

int Synthetic(const Arguments& arguments) {
  uint64_t seed;
  if (arguments.output.empty() || !arguments.file.empty()) {
    return Usage("synthetic needs --seed N and -o FILE");
  }
  if (!ParseSeed(arguments.seed, seed)) {
    return Usage("--seed needs an integer from 0 to 18446744073709551615, not '" + arguments.seed +
                 "'");
  }
  const PackedModel model = MakeSyntheticModel(seed);
  WriteWholeFile(arguments.output, std::string(model.begin(), model.end()));
  return kSuccess;
}

// Reads and checks; prints the findings.
int LoadValidModel(const std::string& file, PackedModel& model) {
  model = ReadModelFile(file);
  const std::vector<std::string> findings = CheckWeights(model);
  std::fputs(FormatFindings(file, findings).c_str(), stderr);
  return findings.empty() ? kSuccess : kFindings;
}

bool IsOneFile(const Arguments& arguments) {
  return !arguments.file.empty() && arguments.output.empty() && arguments.seed.empty();
}

int CheckLabels(const Arguments& arguments) {
  if (!IsOneFile(arguments)) return Usage("labels needs one FILE");
  ReadLabels(arguments.file);
  return kSuccess;
}

int Check(const Arguments& arguments) {
  if (!IsOneFile(arguments)) return Usage("check needs one FILE");
  PackedModel model;
  return LoadValidModel(arguments.file, model);
}

int Embed(const Arguments& arguments) {
  if (arguments.file.empty() || arguments.output.empty() || !arguments.seed.empty()) {
    return Usage("embed needs one FILE and -o HEADER");
  }
  PackedModel model;
  const int result = LoadValidModel(arguments.file, model);
  if (result != kSuccess) return result;
  WriteWholeFile(arguments.output, TablesHeader(model));
  return kSuccess;
}

int Describe(const Arguments& arguments) {
  if (arguments.output.empty() || !arguments.file.empty() || !arguments.seed.empty()) {
    return Usage("describe needs -o FILE");
  }
  WriteWholeFile(arguments.output, DescriptionJson());
  return kSuccess;
}

}  // namespace

int RunModelCommand(const std::vector<std::string>& words) {
  const std::string command = words.empty() ? "" : words[0];
  const Arguments arguments = Parse(words);
  try {
    if (!arguments.error.empty()) return Usage(arguments.error);
    if (command == "synthetic") return Synthetic(arguments);
    if (command == "check") return Check(arguments);
    if (command == "labels") return CheckLabels(arguments);
    if (command == "embed") return Embed(arguments);
    if (command == "describe") return Describe(arguments);
    return Usage(command.empty() ? "no subcommand" : "unknown subcommand '" + command + "'");
  } catch (const std::exception& error) {
    std::fprintf(stderr, "qz-model-tool: %s\n", error.what());
    return kFileTrouble;
  }
}

}  // namespace qz::model
