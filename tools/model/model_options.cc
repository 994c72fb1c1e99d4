// SPDX-License-Identifier: Apache-2.0
// The command lines of qz model.

#include <memory>
#include <string>

#include "tools/commands.h"
#include "tools/model/model_command.h"

namespace qz::tools {
namespace {

struct ModelLine {
  std::string file;
  std::string other;
};

using Command = base::ExitCode (*)(const std::string& file, const std::string& other);

// Adds a subcommand of FILE and one more argument.
void AddModelCommand(CLI::App* model, const char* name, const char* about, const char* about_file,
                     CLI::Option* (*add_other)(CLI::App*, std::string*), Command command,
                     base::ExitCode* exit_code) {
  CLI::App* sub = model->add_subcommand(name, about);
  const auto line = std::make_shared<ModelLine>();
  sub->add_option("FILE", line->file, about_file)->required();
  if (add_other != nullptr) add_other(sub, &line->other);
  sub->callback([line, command, exit_code] { *exit_code = command(line->file, line->other); });
}

}  // namespace

void AddModel(CLI::App* app, base::ExitCode* exit_code) {
  CLI::App* model = app->add_subcommand("model", "Check, show, import and export packed models");
  const auto output = [](CLI::App* sub, std::string* path) {
    return sub->add_option("-o", *path, "The file to write")->required();
  };
  AddModelCommand(
      model, "check", "Check a model table by table", "Packed model", nullptr,
      [](const std::string& file, const std::string&) { return ModelCheckCommand(file); },
      exit_code);
  AddModelCommand(
      model, "info", "Show what is in the tables", "Packed model",
      [](CLI::App* sub, std::string* clip) {
        return sub->add_option("--clip", *clip,
                               "A sound file: also show the values of the tensors over it");
      },
      ModelInfoCommand, exit_code);
  AddModelCommand(model, "import", "Pack a model's arrays",
                  "NumPy archive (.npz) of w0.weight, w0.bias, w0.scale and so on", output,
                  ModelImportCommand, exit_code);
  AddModelCommand(model, "export", "Unpack a model into its arrays", "Packed model", output,
                  ModelExportCommand, exit_code);
}

}  // namespace qz::tools
