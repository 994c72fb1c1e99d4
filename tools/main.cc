// qz: runs the sound event detector on a PC.

#include <fcntl.h>

#include <CLI/CLI.hpp>
#include <algorithm>
#include <cstdio>
#include <exception>
#include <filesystem>
#include <string>
#include <vector>

#include "kernel_versions.h"
#include "prove_command.h"
#include "run_command.h"

namespace {

using qz::tools::ProveOptions;
using qz::tools::RunOptions;

constexpr int kMostClients = 64;

// In the order of chreLogLevel.
const std::vector<std::string> kLogLevels = {"error", "warning", "info", "debug"};

// A standard stream that is closed stays an error: nothing opened later may take its number.
void OccupyStandardStreams() {
  for (int fd = 0; fd <= 2; ++fd) {
    if (fcntl(fd, F_GETFD) == -1) open("/dev/null", fd == 0 ? O_WRONLY : O_RDONLY);
  }
}

// The build folder that this program, bin/qz, lies in.
std::filesystem::path OwnBuild() {
  return std::filesystem::read_symlink("/proc/self/exe").parent_path().parent_path();
}

// This build and the one for the hub's own processor beside it, as seen from here.
std::vector<std::string> DefaultBuilds() {
  const std::filesystem::path own = std::filesystem::proximate(OwnBuild());
  const std::filesystem::path target =
      std::filesystem::proximate(OwnBuild().parent_path() / "target");
  return {own.string(), target.string()};
}

template <typename Options>
void AddFileAndClients(CLI::App* command, Options* options, const std::string& about_file,
                       int least_client_nanoapps) {
  command->add_option("FILE", options->file, about_file)->required();
  command->add_option("--host-clients", options->host_clients, "Host clients to connect")
      ->check(CLI::Range(0, kMostClients))
      ->capture_default_str();
  command->add_option("--client-nanoapps", options->client_nanoapps, "Client nanoapps to register")
      ->check(CLI::Range(least_client_nanoapps, kMostClients))
      ->capture_default_str();
}

CLI::App* AddRun(CLI::App* app, RunOptions* options, std::string* log_level) {
  CLI::App* run =
      app->add_subcommand("run", "Play a sound file to the detector, print its reports");
  AddFileAndClients(run, options,
                    "WAV, FLAC, OGG, ...; - is standard input, read to its end first unless --raw",
                    /*least_client_nanoapps=*/0);
  run->add_flag("--raw", options->raw, "FILE is headerless 16-bit little-endian mono at 16 kHz");
  run->add_option("--log-level", *log_level, "What to show of the detector's log")
      ->check(CLI::IsMember(kLogLevels))
      ->capture_default_str();
  run->add_flag("--json", options->json, "One JSON object a line on standard output");
  run->add_flag("--realtime", options->real_time, "Play at the pace of the clock on the wall");
  run->add_option("--module", options->module_path, "The module to load (default: ../lib/qz.so)");
  return run;
}

CLI::App* AddProve(CLI::App* app, ProveOptions* options) {
  CLI::App* prove = app->add_subcommand(
      "prove",
      "Play a sound file to the detector of two builds, compare all that they say and compute");
  // Without any the detector takes no audio, and nothing is computed.
  AddFileAndClients(prove, options, "WAV, FLAC, OGG, ...; - is standard input",
                    /*least_client_nanoapps=*/1);
  prove
      ->add_option("BUILDS", options->builds,
                   "Two build folders (default: this program's own, and target beside it)")
      ->expected(2);
  return prove;
}

int Main(int argc, char** argv) {
  CLI::App app("Sound event detector, run on a PC", "qz");
  app.set_version_flag("--version",
                       [] { return "qz " QZ_VERSION "\n" + qz::tools::KernelVersions(); });
  app.failure_message([](const CLI::App* parsed, const CLI::Error& error) {
    const auto commands = parsed->get_subcommands();
    const std::string command = commands.empty() ? "" : commands[0]->get_name() + " ";
    return std::string("qz: ") + error.what() + " (see qz " + command + "--help)\n";
  });
  RunOptions options;
  std::string log_level = "warning";
  const CLI::App* run = AddRun(&app, &options, &log_level);
  ProveOptions prove_options;
  const CLI::App* prove = AddProve(&app, &prove_options);
  try {
    app.parse(argc, argv);
  } catch (const CLI::ParseError& error) {
    return app.exit(error) == 0 ? qz::tools::kFine : qz::tools::kUsage;
  }
  if (prove->parsed()) {
    if (prove_options.builds.empty()) prove_options.builds = DefaultBuilds();
    return qz::tools::ProveCommand(prove_options);
  }
  if (!run->parsed()) {
    std::fprintf(stderr, "qz: no command, should be run or prove (see qz --help)\n");
    return qz::tools::kUsage;
  }
  options.log_level = static_cast<chreLogLevel>(
      std::find(kLogLevels.begin(), kLogLevels.end(), log_level) - kLogLevels.begin());
  if (options.module_path.empty()) options.module_path = (OwnBuild() / "lib" / "qz.so").string();
  return qz::tools::RunCommand(options);
}

}  // namespace

int main(int argc, char** argv) {
  OccupyStandardStreams();
  try {
    return Main(argc, argv);
  } catch (const std::exception& error) {
    std::fprintf(stderr, "qz: %s\n", error.what());
    return qz::tools::kFaultFound;
  }
}
