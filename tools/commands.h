// SPDX-License-Identifier: Apache-2.0
// The subcommands of qz. Each adds itself to the program: its name, its options, and what runs once
// the command line is understood, whose exit code is then in *exit_code.
#pragma once

#include <CLI/CLI.hpp>
#include <filesystem>

#include "base/exit_code.h"

namespace qz::tools {

void AddRun(CLI::App* app, base::ExitCode* exit_code);
void AddProve(CLI::App* app, base::ExitCode* exit_code);
void AddEval(CLI::App* app, base::ExitCode* exit_code);
void AddFeatures(CLI::App* app, base::ExitCode* exit_code);
void AddModel(CLI::App* app, base::ExitCode* exit_code);

// Clients of a detector: --host-clients up to 64, --client-nanoapps from `min_nanoapps` to 64.
void AddClientOptions(CLI::App* command, uint32_t* host_clients, uint32_t* client_nanoapps,
                      int min_nanoapps);

// The build folder that this program, bin/qz, lies in.
std::filesystem::path OwnBuild();

}  // namespace qz::tools
