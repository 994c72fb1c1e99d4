// SPDX-License-Identifier: Apache-2.0
// The command line of qz run.

#include <algorithm>
#include <filesystem>
#include <memory>
#include <string>
#include <vector>

#include "audio/pcm_format.h"
#include "tools/commands.h"
#include "tools/run/report_format.h"
#include "tools/run/run_command.h"

namespace qz::tools {
namespace {

// In the order of chreLogLevel.
const std::vector<std::string> kLogLevels = {"error", "warning", "info", "debug"};

struct RunLine {
  RunOptions options;
  std::string log_level = "warning";
  bool raw = false;
  audio::PcmFormat raw_format;
  std::string raw_encoding = audio::PcmEncodingName({});
};

// The file of another kind that a build places beside its module: qz.model beside qz.so.
std::string BesideModule(const std::string& module_path, const char* extension) {
  return std::filesystem::path(module_path).replace_extension(extension).string();
}

// What is not named is beside the module. Without labels there, a run shows codes alone.
void CompletePaths(RunOptions* options) {
  if (options->module_path.empty()) {
    options->module_path = (OwnBuild() / "lib" / "qz.so").string();
  }
  if (options->model_path.empty()) {
    options->model_path = BesideModule(options->module_path, ".model");
  }
  if (options->labels_path.empty()) {
    const std::string labels = BesideModule(options->module_path, ".labels");
    const bool needed = options->scores || !options->thresholds_path.empty();
    if (needed || std::filesystem::exists(labels)) options->labels_path = labels;
  }
}

base::ExitCode Run(RunLine line) {
  line.options.log_level = static_cast<chreLogLevel>(
      std::find(kLogLevels.begin(), kLogLevels.end(), line.log_level) - kLogLevels.begin());
  if (!line.options.model_path.empty() && !line.options.scores &&
      line.options.thresholds_path.empty()) {
    throw CLI::ValidationError("--model", "is for --scores and --thresholds");
  }
  if (line.raw) {
    audio::SetPcmEncoding(line.raw_encoding, &line.raw_format);
    line.options.raw = line.raw_format;
  }
  CompletePaths(&line.options);
  return RunCommand(line.options);
}

void AddRawOptions(CLI::App* run, RunLine* line) {
  CLI::Option* raw = run->add_flag("--raw", line->raw, "FILE is headerless samples");
  run->add_option("--format", line->raw_encoding, "What a sample of --raw is")
      ->check(CLI::IsMember(audio::PcmEncodingNames()))
      ->capture_default_str()
      ->needs(raw);
  run->add_option("--rate", line->raw_format.rate_hz, "The sample rate of --raw, in Hz")
      ->check(CLI::Range(audio::kMinRateHz, audio::kMaxRateHz))
      ->capture_default_str()
      ->needs(raw);
  run->add_option("--channels", line->raw_format.channels, "The channels of --raw, interleaved")
      ->check(CLI::Range(1, audio::kMaxChannels))
      ->capture_default_str()
      ->needs(raw);
}

}  // namespace

void AddRun(CLI::App* app, base::ExitCode* exit_code) {
  CLI::App* run =
      app->add_subcommand("run", "Play a sound file to the detector, print its reports");
  const auto line = std::make_shared<RunLine>();
  RunOptions& options = line->options;
  run->add_option(
         "FILE", options.file,
         "WAV, FLAC, Ogg, MP3, ...; - is standard input, where WAV, AU and --raw play as they come")
      ->required();
  AddClientOptions(run, &options.host_clients, &options.client_nanoapps, /*min_nanoapps=*/0);
  AddRawOptions(run, line.get());
  run->add_option("--log-level", line->log_level, "What to show of the detector's log")
      ->check(CLI::IsMember(kLogLevels))
      ->capture_default_str();
  for (const NamedFormat& format : kNamedFormats) {
    run->add_flag_callback(
        format.option, [&options, &format] { options.format = &format; }, format.help);
  }
  run->add_flag("--realtime", options.real_time, "Play at the pace of the wall clock");
  run->add_option("--module", options.module_path, "The module to load (default: ../lib/qz.so)");
  run->add_flag("--scores", options.scores,
                "Show all five scores after every pass: the tool's own view, computed beside the "
                "module, no messages of the module");
  run->add_option("--thresholds", options.thresholds_path,
                  "Say what a table of thresholds and cooling times would detect: the tool's own "
                  "view too, no events of the module. Text with tabs between: a line class, "
                  "threshold, cooling_s, then one for each class of the labels");
  run->add_option("--model", options.model_path,
                  "The model of the tool's view, which must be the module's (default: beside the "
                  "module, ../lib/qz.model)");
  run->add_option("--labels", options.labels_path,
                  "What the outputs answer to (default: beside the module, ../lib/qz.labels)");
  run->callback([line, exit_code] { *exit_code = Run(*line); });
}

}  // namespace qz::tools
