// SPDX-License-Identifier: Apache-2.0
// qz-model-tool: makes, checks and embeds packed models.

#include "base/program.h"
#include "model/model_commands.h"

int main(int argc, char** argv) {
  return qz::base::RunProgram("qz-model-tool", [argc, argv] {
    return qz::model::RunModelCommand({argv + (argc > 0 ? 1 : 0), argv + argc});
  });
}
