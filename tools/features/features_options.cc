// SPDX-License-Identifier: Apache-2.0
// The command line of qz features.

#include <memory>

#include "tools/commands.h"
#include "tools/features/features_command.h"

namespace qz::tools {

void AddFeatures(CLI::App* app, base::ExitCode* exit_code) {
  CLI::App* features = app->add_subcommand(
      "features", "Write what the module's front end makes of sound files, as NumPy arrays");
  const auto options = std::make_shared<FeaturesOptions>();
  CLI::Option* files =
      features->add_option("FILES", options->files, "WAV, FLAC, OGG, ...; - is standard input");
  features
      ->add_option("--manifest", options->manifest,
                   "List of recordings: file, class and fold, with tabs between")
      ->excludes(files);
  features
      ->add_option("-o", options->output,
                   "The folder for the arrays, uint16 [frames][48]; for one FILE also NAME.npy")
      ->required();
  features->callback([options, exit_code] {
    if (options->files.empty() && options->manifest.empty()) {
      throw CLI::RequiredError("FILES or --manifest");
    }
    if (options->files.size() != 1 &&
        std::filesystem::path(options->output).extension() == ".npy") {
      throw CLI::ValidationError("-o", options->output + " names one array, should be a folder");
    }
    *exit_code = FeaturesCommand(*options);
  });
}

}  // namespace qz::tools
