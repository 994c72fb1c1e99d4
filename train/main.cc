// qz-train: makes models for the sound event detector out of labelled recordings.

#include <malloc.h>

#include <CLI/CLI.hpp>
#include <Eigen/Core>
#include <cstdio>
#include <exception>
#include <filesystem>

#include "train/prove_model_command.h"
#include "train/train_command.h"

namespace {

using qz::train::TrainOptions;

// Where a build keeps the names of the outputs, beside its module.
std::string DefaultLabels() {
  const std::filesystem::path own = std::filesystem::read_symlink("/proc/self/exe");
  return (own.parent_path().parent_path() / "lib" / "qz.labels").string();
}

// Results depend on neither the caches of this machine nor its memory's habits.
void SettleArithmetic() {
  Eigen::setCpuCacheSizes(32 << 10, 512 << 10, 8 << 20);
  // Blocks of some MB come and go all the time; from the system each time they cost page faults.
  mallopt(M_MMAP_THRESHOLD, 1 << 30);
  mallopt(M_TRIM_THRESHOLD, 1 << 30);
}

CLI::App* AddTrain(CLI::App* app, TrainOptions* options) {
  CLI::App* train = app->add_subcommand("fit", "Learn from a list of recordings, write a model");
  train->add_option("MANIFEST", options->manifest, "List of recordings: file, class, fold")
      ->required();
  train->add_option("-o,--output", options->output, "The packed model to write")->required();
  train->add_option("--recipe", options->recipe_file, "What to do (default: what is built in)");
  train->add_option("--labels", options->labels_file, "Classes of the outputs")
      ->capture_default_str();
  train->add_option("--state", options->state_file,
                    "Kept while running, so that the same command goes on after a stop");
  train->add_option("--seed", options->seed, "Of everything random")->capture_default_str();
  train->add_option("--hold-out", options->hold_out, "Fold to judge by and not to learn from")
      ->check(CLI::Range(1, 99));
  train
      ->add_option("--patience", options->patience,
                   "Epochs without a better figure on the held-out fold that end the float part")
      ->check(CLI::Range(1, 100000))
      ->needs("--hold-out");
  train->add_option("--threads", options->threads, "1 or 2; the model is the same")
      ->check(CLI::Range(1, 2))
      ->capture_default_str();
  return train;
}

int Main(int argc, char** argv) {
  CLI::App app("Trains the sound event detector", "qz-train");
  app.require_subcommand(1);
  TrainOptions options;
  options.labels_file = DefaultLabels();
  const CLI::App* fit = AddTrain(&app, &options);
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
  SettleArithmetic();
  return fit->parsed() ? qz::train::TrainCommand(options)
                       : qz::train::ProveModelCommand(model, manifest);
}

}  // namespace

int main(int argc, char** argv) {
#if defined(__x86_64__)
  if (!__builtin_cpu_supports("avx2") || !__builtin_cpu_supports("fma")) {
    std::fprintf(stderr, "qz-train: this processor lacks AVX2 or FMA, which it needs\n");
    return qz::base::kNotRunnable;
  }
#endif
  try {
    return Main(argc, argv);
  } catch (const std::exception& error) {
    std::fprintf(stderr, "qz-train: %s\n", error.what());
    return qz::base::kUnreadableInput;
  }
}
