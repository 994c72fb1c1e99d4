// SPDX-License-Identifier: Apache-2.0
// The command line of qz prove.

#include <filesystem>
#include <memory>

#include "tools/commands.h"
#include "tools/prove/prove_command.h"

namespace qz::tools {
namespace {

// This build and the one for the hub's own processor beside it, as seen from here.
std::vector<std::string> DefaultBuilds() {
  const std::filesystem::path own = std::filesystem::proximate(OwnBuild());
  const std::filesystem::path target =
      std::filesystem::proximate(OwnBuild().parent_path() / "target");
  return {own.string(), target.string()};
}

}  // namespace

void AddProve(CLI::App* app, base::ExitCode* exit_code) {
  CLI::App* prove = app->add_subcommand(
      "prove",
      "Play a sound file to the detector of two builds, compare all that they send and compute");
  const auto options = std::make_shared<ProveOptions>();
  prove->add_option("FILE", options->file, "WAV, FLAC, OGG, ...; - is standard input")->required();
  // Without any the detector takes no audio, and nothing is computed.
  AddClientOptions(prove, &options->host_clients, &options->client_nanoapps, /*min_nanoapps=*/1);
  prove
      ->add_option("BUILDS", options->builds,
                   "Two build folders, or modules in them such as build/host/lib/qz-stream.so "
                   "(default: this "
                   "program's own folder, and target beside it)")
      ->expected(2);
  prove->callback([options, exit_code] {
    if (options->builds.empty()) options->builds = DefaultBuilds();
    *exit_code = ProveCommand(*options);
  });
}

}  // namespace qz::tools
