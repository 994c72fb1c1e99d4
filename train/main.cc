// SPDX-License-Identifier: Apache-2.0
// qz-train: trains models for the sound event detector from labelled recordings.
//
// Compiled for any processor, unlike the rest of the trainer: the options and the check of the
// processor come before any of its code.

#include <CLI/CLI.hpp>
#include <cstdio>
#include <filesystem>

#include "base/program.h"
#include "train/arithmetic.h"
#include "train/prove_model_command.h"
#include "train/train_command.h"

namespace {

using qz::train::TrainOptions;

// Where a build keeps the names of the outputs, beside its module.
std::string DefaultLabels() {
  const std::filesystem::path own = std::filesystem::read_symlink("/proc/self/exe");
  return (own.parent_path().parent_path() / "lib" / "qz.labels").string();
}

// The trainer is compiled for these; see CMakeLists.txt.
bool ProcessorSuffices() {
#if defined(__x86_64__)
  return __builtin_cpu_supports("avx2") && __builtin_cpu_supports("fma");
#else
  return true;
#endif
}

CLI::App* AddFit(CLI::App* app, TrainOptions* options) {
  CLI::App* train = app->add_subcommand("fit", "Train on a list of recordings, write a model");
  train->add_option("MANIFEST", options->manifest, "List of recordings: file, class, fold")
      ->required();
  train->add_option("-o,--output", options->output, "The packed model to write")->required();
  train->add_option("--recipe", options->recipe_file,
                    "Settings of the training (default: built in)");
  train->add_option("--labels", options->labels_file, "Classes of the outputs")
      ->capture_default_str();
  train->add_option("--state", options->state_file,
                    "Written while running, so that the same command continues after a stop");
  train->add_option("--seed", options->seed, "Of all random numbers")->capture_default_str();
  train->add_option("--hold-out", options->hold_out, "Fold to validate on and not to train on")
      ->check(CLI::Range(1, 99));
  train
      ->add_option(
          "--patience", options->patience,
          "Epochs without a better metric on the held-out fold that end a float network's training")
      ->check(CLI::Range(1, 100000))
      ->needs("--hold-out");
  train->add_option("--threads", options->threads, "1 or 2; the model is the same")
      ->check(CLI::Range(1, 2))
      ->capture_default_str();
  return train;
}

qz::base::ExitCode Main(int argc, char** argv) {
  CLI::App app(qz::base::VersionLine("qz-train") + ": trains the sound event detector", "qz-train");
  app.set_version_flag("--version", [] { return qz::base::VersionLine("qz-train"); });
  app.require_subcommand(1);
  TrainOptions options;
  options.labels_file = DefaultLabels();
  const CLI::App* fit = AddFit(&app, &options);
  std::string model, manifest;
  CLI::App* prove = app.add_subcommand(
      "prove", "Compare the trainer's integer network with the module's, tensor by tensor");
  prove->add_option("MODEL", model, "A packed model")->required();
  prove->add_option("MANIFEST", manifest, "List of recordings to compare on")->required();
  app.failure_message([](const CLI::App*, const CLI::Error& error) {
    return std::string("qz-train: ") + error.what() + " (see qz-train --help)\n";
  });
  try {
    app.parse(argc, argv);
  } catch (const CLI::ParseError& error) {
    return app.exit(error) == 0 ? qz::base::kSuccess : qz::base::kUsage;
  }
  if (!ProcessorSuffices()) {
    std::fprintf(stderr, "qz-train: this processor lacks AVX2 or FMA, which it needs\n");
    return qz::base::kNotRunnable;
  }
  qz::train::SettleArithmetic();
  return fit->parsed() ? qz::train::TrainCommand(options)
                       : qz::train::ProveModelCommand(model, manifest);
}

}  // namespace

int main(int argc, char** argv) {
  return qz::base::RunProgram("qz-train", [argc, argv] { return Main(argc, argv); });
}
