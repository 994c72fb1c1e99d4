// SPDX-License-Identifier: Apache-2.0
// qz: runs the sound event detector on a PC.

#include <CLI/CLI.hpp>
#include <cstdio>
#include <string>
#include <vector>

#include "base/program.h"
#include "tools/commands.h"
#include "tools/kernel_versions.h"

namespace {

std::vector<const CLI::App*> CommandsOf(const CLI::App& app) {
  return app.get_subcommands([](const CLI::App*) { return true; });
}

qz::base::ExitCode NoCommand(const CLI::App& app) {
  std::string names;
  for (const CLI::App* command : CommandsOf(app)) {
    names += (names.empty() ? "" : ", ") + command->get_name();
  }
  const std::string line = app.get_parent() == nullptr ? "qz" : "qz " + app.get_name();
  std::fprintf(stderr, "%s: no command, should be one of %s (see %s --help)\n", line.c_str(),
               names.c_str(), line.c_str());
  return qz::base::kUsage;
}

qz::base::ExitCode Main(int argc, char** argv) {
  CLI::App app(qz::base::VersionLine("qz") + ": runs the sound event detector on a PC", "qz");
  bool verbose = false;
  app.add_flag("--verbose", verbose, "with --version: the kernels' symbols too");
  app.set_version_flag("--version", [&verbose] {
    return qz::base::VersionLine("qz") + "\n" + qz::tools::KernelVersions(verbose);
  });
  app.failure_message([](const CLI::App* parsed, const CLI::Error& error) {
    const auto commands = parsed->get_subcommands();
    const std::string command = commands.empty() ? "" : commands[0]->get_name() + " ";
    return std::string("qz: ") + error.what() + " (see qz " + command + "--help)\n";
  });
  qz::base::ExitCode exit_code = qz::base::kSuccess;
  qz::tools::AddRun(&app, &exit_code);
  qz::tools::AddProve(&app, &exit_code);
  qz::tools::AddEval(&app, &exit_code);
  qz::tools::AddFeatures(&app, &exit_code);
  qz::tools::AddModel(&app, &exit_code);
  try {
    app.parse(argc, argv);
  } catch (const CLI::ParseError& error) {
    return app.exit(error) == 0 ? qz::base::kSuccess : qz::base::kUsage;
  }
  const CLI::App* last = &app;
  while (!last->get_subcommands().empty()) last = last->get_subcommands()[0];
  return CommandsOf(*last).empty() ? exit_code : NoCommand(*last);
}

}  // namespace

int main(int argc, char** argv) {
  return qz::base::RunProgram("qz", [argc, argv] { return Main(argc, argv); });
}
