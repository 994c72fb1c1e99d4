// SPDX-License-Identifier: Apache-2.0
#include "tools/commands.h"

namespace qz::tools {
namespace {

constexpr int kMaxClients = 64;

}  // namespace

void AddClientOptions(CLI::App* command, uint32_t* host_clients, uint32_t* client_nanoapps,
                      int min_nanoapps) {
  command->add_option("--host-clients", *host_clients, "Host clients to connect")
      ->check(CLI::Range(0, kMaxClients))
      ->capture_default_str();
  command->add_option("--client-nanoapps", *client_nanoapps, "Client nanoapps to register")
      ->check(CLI::Range(min_nanoapps, kMaxClients))
      ->capture_default_str();
}

std::filesystem::path OwnBuild() {
  return std::filesystem::read_symlink("/proc/self/exe").parent_path().parent_path();
}

}  // namespace qz::tools
