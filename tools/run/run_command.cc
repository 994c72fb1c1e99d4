// SPDX-License-Identifier: Apache-2.0
#include "tools/run/run_command.h"

#include <chrono>
#include <cstdio>
#include <memory>
#include <optional>
#include <stdexcept>
#include <vector>

#include "audio/audio_input.h"
#include "base/interrupt.h"
#include "detector/framing.h"
#include "hub/hub.h"
#include "tools/console.h"
#include "tools/run/chunker.h"
#include "tools/run/client_printer.h"
#include "tools/run/host_scores.h"
#include "tools/run/report_format.h"

namespace qz::tools {
namespace {

using config::kWindowFrames;
using detector::FramesOf;

std::string LogLine(chreLogLevel level, uint64_t time_ns, const std::string& line) {
  const char* const names[] = {"error", "warning", "info", "debug"};
  char head[64];
  std::snprintf(head, sizeof(head), "[%8.3f s] %s: ", static_cast<double>(time_ns) * 1e-9,
                names[level]);
  return head + line;
}

Names ReadNames(const std::string& path) {
  return path.empty() ? Names() : Names(model::ReadLabels(path));
}

// One run from its first message to its exit code.
class Run {
 public:
  // Throws std::runtime_error, one line, when the labels, the table or the model are unusable.
  explicit Run(const RunOptions& options);
  // Whatever the module still sends at its end needs the clients.
  ~Run() { hub_.End(); }

  base::ExitCode Execute();

 private:
  bool StartModule(base::ExitCode* exit_code);
  // Plays the input, of which the chunker already holds `first_samples`. Gives the error that ended
  // it early; empty if none did.
  std::string Stream(audio::AudioInput* input, size_t first_samples);
  void Play(const int16_t* buffer);
  void ReportShortAudio();
  RunSummary Summarise() const;
  std::string WrongLabels() const;
  base::ExitCode Conclude();

  const RunOptions& options_;
  Console console_;
  const Names names_;
  std::unique_ptr<ReportFormat> format_;
  hub::Hub hub_;
  ClientPrinter printer_;
  hub::Clients clients_{&hub_, &printer_};
  std::optional<HostScores> view_;
  Chunker chunker_{[this](const int16_t* buffer) { Play(buffer); }};
  uint64_t delivered_samples_ = 0;
  uint64_t silent_samples_ = 0;
  double wall_seconds_ = 0;
};

Run::Run(const RunOptions& options)
    : options_(options),
      names_(ReadNames(options.labels_path)),
      format_(
          options.format != nullptr
              ? options.format->make(names_)
              : MakeTextFormat({console_.data_on_terminal(), console_.data_in_colour()}, names_)),
      printer_(format_.get(), &console_) {
  std::optional<DetectionTable> rules;
  if (!options.thresholds_path.empty()) {
    rules = ReadDetectionTable(options.thresholds_path, names_.value());
  }
  if (options.scores || rules) {
    view_.emplace(options.model_path, options.scores, rules, format_.get(), &console_);
  }
}

base::ExitCode Run::Execute() {
  base::CatchInterrupt();
  std::unique_ptr<audio::AudioInput> input;
  size_t first_samples = 0;
  try {
    input = audio::OpenAudio(options_.file, options_.raw,
                             [this](const std::string& line) { console_.Message(line); });
    // Before anything starts: audio that is bad from its beginning costs one line.
    first_samples = input->Read(chunker_.space(), chunker_.space_samples());
  } catch (const audio::AudioError& error) {
    console_.Message(std::string("qz: ") + error.what());
    return base::kUnreadableInput;
  }

  base::ExitCode exit_code = base::kSuccess;
  if (!StartModule(&exit_code)) return exit_code;
  console_.Message(input->Description());
  if (view_) {
    console_.Message(
        "tool's view: what qz itself hears beside the module, by " + options_.model_path +
        "; no messages of the module" +
        (options_.client_nanoapps > 0 ? "" : ", and for want of reports not compared"));
  }
  clients_.Connect(options_.host_clients, options_.client_nanoapps);
  const bool audio_taken = hub_.audio_enabled();
  if (!audio_taken) console_.Message("no audio source was taken: the nanoapp hears nothing");

  const std::string input_error = Stream(input.get(), first_samples);
  if (audio_taken && !console_.output_lost()) ReportShortAudio();
  clients_.Leave();
  hub_.End();
  exit_code = Conclude();
  if (input_error.empty()) return exit_code;
  console_.Message("qz: " + input_error);
  return base::kUnreadableInput;
}

bool Run::StartModule(base::ExitCode* exit_code) {
  hub_.SetLogHandler([this](chreLogLevel level, uint64_t time_ns, const std::string& line) {
    if (level <= options_.log_level) console_.Message(LogLine(level, time_ns, line));
  });
  hub_.sources().emplace_back();
  hub::LoadFailure failure;
  if (hub_.Start(options_.module_path, &failure)) return true;
  console_.Message("qz: " + failure.message);
  *exit_code =
      failure.kind == hub::LoadFailure::Kind::kRefused ? base::kFaultFound : base::kNotRunnable;
  return false;
}

void Run::Play(const int16_t* buffer) {
  hub_.PlayAudio(buffer, kBufferSamples);
  delivered_samples_ += kBufferSamples;
  if (view_ && hub_.audio_enabled()) {
    view_->Pass(buffer, kBufferSamples, hub_.TimeNs(), printer_.TakeReport());
  }
}

std::string Run::Stream(audio::AudioInput* input, size_t first_samples) {
  if (options_.real_time) hub_.RunInRealTime();
  const auto start = std::chrono::steady_clock::now();
  std::string input_error;
  try {
    for (size_t got = first_samples; got > 0 && !console_.output_lost();) {
      chunker_.Commit(got);
      console_.Progress(delivered_samples_, input->ExpectedSamples());
      got = base::Interrupted() ? 0 : input->Read(chunker_.space(), chunker_.space_samples());
    }
  } catch (const audio::AudioError& error) {
    input_error = error.what();
  }
  console_.ClearProgress();
  if (console_.output_lost()) return input_error;
  // What was read before an error is played to its end, too.
  silent_samples_ = chunker_.Finish();
  wall_seconds_ = std::chrono::duration<double>(std::chrono::steady_clock::now() - start).count();
  if (base::Interrupted()) console_.Message("interrupted");
  if (silent_samples_ > 0) {
    char text[96];
    std::snprintf(text, sizeof(text), "padded the last buffer with %.3f s of silence",
                  static_cast<double>(silent_samples_) / audio::kSampleRateHz);
    console_.Message(text);
  }
  return input_error;
}

void Run::ReportShortAudio() {
  if (FramesOf(delivered_samples_) >= kWindowFrames) return;
  console_.Message("no network run happened yet: the audio gave " +
                   std::to_string(FramesOf(delivered_samples_ - silent_samples_)) + " of the " +
                   std::to_string(kWindowFrames) + " frames that the network looks at");
}

RunSummary Run::Summarise() const {
  const hub::HubCounts& counts = hub_.counts();
  RunSummary summary;
  summary.audio_samples = delivered_samples_;
  summary.silent_samples = silent_samples_;
  summary.passes = counts.audio_buffers;
  summary.feature_frames = FramesOf(counts.audio_buffers * kBufferSamples);
  summary.reports = printer_.reports();
  summary.detections = printer_.detections();
  summary.host_clients_accepted = clients_.accepted_hosts();
  summary.host_clients = options_.host_clients;
  summary.client_nanoapps = options_.client_nanoapps;
  summary.messages_from_host = counts.messages_from_host;
  summary.messages_to_host = counts.messages_to_host;
  summary.events_to_clients = counts.client_events;
  return summary;
}

// The labels' codes must be those that the module reports, output by output.
std::string Run::WrongLabels() const {
  const std::vector<uint32_t>& reported = printer_.categories();
  for (size_t i = 0; names_ && i < reported.size() && i < names_->size(); ++i) {
    const auto category = static_cast<uint32_t>((*names_)[i].category);
    if (category == reported[i]) continue;
    return options_.labels_path + ": gives output " + std::to_string(i) + " the category " +
           std::to_string(category) + ", the module " + std::to_string(reported[i]);
  }
  return "";
}

base::ExitCode Run::Conclude() {
  std::vector<std::string> faults = printer_.faults();
  const std::string wrong_labels = WrongLabels();
  if (!wrong_labels.empty()) faults.push_back(wrong_labels);
  for (const std::string& fault : hub_.Faults()) faults.push_back(fault);
  if (view_) faults.insert(faults.end(), view_->faults().begin(), view_->faults().end());

  RunSummary summary = Summarise();
  summary.heap_blocks_held = hub_.heap().live_blocks();
  summary.faults = faults.size();
  // In real time, the wall clock decides the speed.
  if (!options_.real_time && wall_seconds_ > 0) {
    summary.speed = static_cast<double>(delivered_samples_) / audio::kSampleRateHz / wall_seconds_;
  }
  console_.Data(format_->Summary(summary));

  for (const std::string& fault : faults) console_.Message("qz: fault: " + fault);
  const std::string output_fault = console_.OutputFault();
  if (!output_fault.empty()) {
    console_.Message("qz: " + output_fault);
    return base::kUnwritableOutput;
  }
  return faults.empty() ? base::kSuccess : base::kFaultFound;
}

}  // namespace

base::ExitCode RunCommand(const RunOptions& options) { return Run(options).Execute(); }

}  // namespace qz::tools
