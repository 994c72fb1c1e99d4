// SPDX-License-Identifier: Apache-2.0
#include "tools/model/model_command.h"

#include <cstdio>
#include <vector>

#include "base/output_file.h"
#include "dataset/clip.h"
#include "evaluation/clip_scores.h"
#include "model/array_files.h"
#include "model/check_weights.h"
#include "model/model_files.h"
#include "model/packing.h"
#include "tools/console.h"
#include "tools/model/model_info.h"

namespace qz::tools {
namespace {

using model::PackedModel;

// A line end goes behind what Console puts out.
std::string WithoutLastLineEnd(std::string text) {
  if (!text.empty() && text.back() == '\n') text.pop_back();
  return text;
}

void PrintFindings(const std::string& file, const std::vector<std::string>& findings,
                   Console* console) {
  console->Message(WithoutLastLineEnd(model::FormatFindings(file, findings)));
}

base::ExitCode OutputResult(base::ExitCode result, Console* console) {
  const std::string fault = console->OutputFault();
  if (fault.empty()) return result;
  console->Message("qz: " + fault);
  return base::kUnwritableOutput;
}

// Prints the findings about a model that is not valid.
base::ExitCode ReadValidModel(const std::string& file, PackedModel* packed, Console* console) {
  *packed = model::ReadModelFile(file);
  const std::vector<std::string> findings = model::CheckWeights(*packed);
  if (findings.empty()) return base::kSuccess;
  PrintFindings(file, findings, console);
  return base::kFaultFound;
}

std::string Counted(size_t count, const char* what) {
  return std::to_string(count) + " " + what + (count == 1 ? "" : "s");
}

// Prints a line for a table and one for each of its findings, of which it returns the number.
size_t CheckOneTable(const std::string& file, const PackedModel& packed,
                     const model::TableLayout& table, Console* console) {
  const std::vector<std::string> findings = model::CheckTable(packed, table);
  char line[96];
  std::snprintf(line, sizeof line, "%-4s %6zu bytes  %s", std::string(table.name).c_str(),
                table.Bytes(),
                findings.empty() ? "valid" : Counted(findings.size(), "finding").c_str());
  console->Data(line);
  if (!findings.empty()) {
    console->Data(WithoutLastLineEnd(model::FormatFindings(file, findings)));
  }
  return findings.size();
}

}  // namespace

base::ExitCode ModelCheckCommand(const std::string& file) {
  Console console;
  const PackedModel packed = model::ReadModelFile(file);
  if (packed.size() != model::kModelBytes) {
    console.Data(WithoutLastLineEnd(model::FormatFindings(file, model::CheckWeights(packed))));
    return OutputResult(base::kFaultFound, &console);
  }
  size_t findings = 0;
  for (const model::TableLayout& table : model::kTables) {
    findings += CheckOneTable(file, packed, table, &console);
  }
  console.Data(file + (findings == 0 ? ": valid" : ": not valid: " + Counted(findings, "finding")));
  return OutputResult(findings == 0 ? base::kSuccess : base::kFaultFound, &console);
}

base::ExitCode ModelInfoCommand(const std::string& file, const std::string& clip) {
  Console console;
  PackedModel packed;
  const base::ExitCode result = ReadValidModel(file, &packed, &console);
  if (result != base::kSuccess) return result;
  try {
    std::string text = file + ": " + TablesText(packed, model::Unpack(packed));
    if (!clip.empty()) {
      text += "\n" + clip + ": " +
              TensorsText(TensorsOf(packed, evaluation::FeaturesToPlay(dataset::ReadClip(clip))));
    }
    console.Data(WithoutLastLineEnd(text));
    return OutputResult(base::kSuccess, &console);
  } catch (const model::PackingError& error) {
    PrintFindings(file, error.findings(), &console);
    return error.exit_code();
  }
}

base::ExitCode ModelImportCommand(const std::string& arrays, const std::string& output) {
  Console console;
  base::CheckOutputFile(output, {arrays});
  try {
    const PackedModel packed = model::Pack(model::ReadModelArrays(arrays));
    base::WriteOutputFile(output, std::string(packed.begin(), packed.end()));
    return base::kSuccess;
  } catch (const model::PackingError& error) {
    PrintFindings(arrays, error.findings(), &console);
    return error.exit_code();
  }
}

base::ExitCode ModelExportCommand(const std::string& file, const std::string& output) {
  Console console;
  base::CheckOutputFile(output, {file});
  PackedModel packed;
  const base::ExitCode result = ReadValidModel(file, &packed, &console);
  if (result != base::kSuccess) return result;
  try {
    model::WriteModelArrays(output, model::Unpack(packed));
    return base::kSuccess;
  } catch (const model::PackingError& error) {
    PrintFindings(file, error.findings(), &console);
    return error.exit_code();
  }
}

}  // namespace qz::tools
