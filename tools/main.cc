// qz: runs the sound event detector on a PC.

#include <fcntl.h>

#include <CLI/CLI.hpp>
#include <cstdio>
#include <exception>
#include <string>

#include "commands.h"
#include "kernel_versions.h"

namespace {

// A standard stream that is closed stays an error: nothing opened later may take its number.
void OccupyStandardStreams() {
  for (int fd = 0; fd <= 2; ++fd) {
    if (fcntl(fd, F_GETFD) == -1) open("/dev/null", fd == 0 ? O_WRONLY : O_RDONLY);
  }
}

int NoCommand(const CLI::App& app) {
  std::string names;
  for (const CLI::App* command : app.get_subcommands([](const CLI::App*) { return true; })) {
    names += (names.empty() ? "" : ", ") + command->get_name();
  }
  std::fprintf(stderr, "qz: no command, should be one of %s (see qz --help)\n", names.c_str());
  return qz::tools::kUsage;
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
  qz::tools::ExitCode exit_code = qz::tools::kFine;
  qz::tools::AddRun(&app, &exit_code);
  qz::tools::AddProve(&app, &exit_code);
  qz::tools::AddEval(&app, &exit_code);
  qz::tools::AddFeatures(&app, &exit_code);
  qz::tools::AddModel(&app, &exit_code);
  try {
    app.parse(argc, argv);
  } catch (const CLI::ParseError& error) {
    return app.exit(error) == 0 ? qz::tools::kFine : qz::tools::kUsage;
  }
  return app.get_subcommands().empty() ? NoCommand(app) : exit_code;
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
