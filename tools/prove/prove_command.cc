// SPDX-License-Identifier: Apache-2.0
#include "tools/prove/prove_command.h"

#include <cstdio>
#include <filesystem>

#include "audio/audio_input.h"
#include "audio/temporary_file.h"
#include "base/error.h"
#include "base/interrupt.h"
#include "tools/console.h"
#include "tools/prove/traced_build.h"
#include "tools/run/chunker.h"
#include "trace/comparison.h"

namespace qz::tools {
namespace {

using trace::Comparison;
using trace::Kind;

// The audio of a file as the builds get it: whole buffers, the last one filled up with silence.
struct RawAudio {
  audio::NamedTemporaryFile file;
  uint64_t buffers = 0;
};

void Decode(audio::AudioInput* input, RawAudio* audio) {
  Chunker chunker([audio](const int16_t* buffer) {
    audio::WriteToTemporaryFile(audio->file.descriptor(), buffer, kBufferSamples * sizeof(int16_t));
    ++audio->buffers;
  });
  while (const size_t got = input->Read(chunker.space(), chunker.space_samples())) {
    if (base::Interrupted()) throw base::LaunchError("interrupted");
    chunker.Commit(got);
  }
  chunker.Finish();
}

std::string Grouped(uint64_t number) {
  std::string text = std::to_string(number);
  for (size_t location = text.size(); location > 3;) text.insert(location -= 3, ",");
  return text;
}

std::string Line(const std::string& what, const trace::Tally& tally) {
  char text[128];
  std::snprintf(text, sizeof(text), "%-46s digest %016llx", what.c_str(),
                static_cast<unsigned long long>(tally.digest));
  return text;
}

void PrintTallies(const Comparison& comparison, Console* console) {
  const auto print = [&](Kind kind, uint32_t nanoapp, const std::string& before,
                         const std::string& after, uint64_t parts) {
    const trace::Tally& tally = comparison.tally(nanoapp, kind);
    console->Data(Line(before + Grouped(tally.records / parts) + after, tally));
  };
  print(Kind::kFeatures, trace::kLinkedNanoapp, "features of ", " frames", 1);
  print(Kind::kOperatorOutput, trace::kLinkedNanoapp,
        "outputs of " + std::to_string(trace::kOperatorsPerRun) + " operators in ", " network runs",
        trace::kOperatorsPerRun);
  const uint64_t buffers = comparison.buffers_played() / 2;
  print(Kind::kMemory, trace::kLoadedModule, "",
        " objects in memory after " + Grouped(buffers) + " buffers", buffers);
  print(Kind::kHostMessage, trace::kLoadedModule, "", " messages to hosts", 1);
  print(Kind::kClientEvent, trace::kLoadedModule, "", " reports", 1);
  print(Kind::kLogLine, trace::kLoadedModule, "", " log lines", 1);
}

// Reads both traces in step up to their ends or the first difference, which is returned.
std::string FirstDifference(TracedBuild* first, TracedBuild* second, uint64_t buffers,
                            Comparison* comparison, Console* console) {
  trace::Record first_record;
  trace::Record second_record;
  do {
    first->Next(&first_record);
    second->Next(&second_record);
    std::string difference = comparison->Compare(first_record, second_record);
    if (!difference.empty()) return difference;
    // The audio is played to two nanoapps, one after the other.
    console->Progress(comparison->buffers_played() * kBufferSamples / 2, buffers * kBufferSamples);
  } while (first_record.kind != Kind::kEnd);
  return {};
}

// Of two traces that are equal.
base::ExitCode Conclude(const Comparison& comparison, const ProveOptions& options, uint64_t buffers,
                        Console* console) {
  if (comparison.buffers_played() != 2 * buffers) {
    console->Message("qz: the builds played " + Grouped(comparison.buffers_played()) +
                     " buffers of audio each, should be " + Grouped(2 * buffers) +
                     ": all of the file's, once to each nanoapp");
    return base::kNotRunnable;
  }
  const std::string apart = comparison.NanoappsDiffer();
  if (!apart.empty()) {
    console->Data("the builds give the same, but what was loaded and what was observed do not: " +
                  apart);
    return base::kFaultFound;
  }
  if (comparison.tally(trace::kLinkedNanoapp, Kind::kFeatures).records == 0) {
    console->Message("qz: nothing was computed: the detectors took none of " + Grouped(buffers) +
                     " buffers of audio");
    return base::kFaultFound;
  }
  if (comparison.tally(trace::kLinkedNanoapp, Kind::kOperatorOutput).records == 0) {
    console->Message("qz: the network did not run in " + Grouped(buffers) +
                     " buffers of 2 s of audio, should be from the second one on");
    return base::kFaultFound;
  }
  PrintTallies(comparison, console);
  console->Data(options.builds[0] + " and " + options.builds[1] + " give the same");
  return base::kSuccess;
}

base::ExitCode Compare(const ProveOptions& options, const RawAudio& audio, Console* console) {
  const std::string& path = audio.file.path();
  TracedBuild first(options.builds[0], path, options.host_clients, options.client_nanoapps);
  TracedBuild second(options.builds[1], path, options.host_clients, options.client_nanoapps);
  Comparison comparison(options.builds[0], options.builds[1]);
  const std::string difference =
      FirstDifference(&first, &second, audio.buffers, &comparison, console);
  if (difference.empty()) return Conclude(comparison, options, audio.buffers, console);
  console->Data("first difference: " + difference);
  return base::kFaultFound;
}

}  // namespace

base::ExitCode ProveCommand(const ProveOptions& options) {
  base::CatchInterrupt();
  Console console;
  std::error_code missing;  // is reported later
  if (std::filesystem::equivalent(options.builds[0], options.builds[1], missing)) {
    console.Message("qz: " + options.builds[0] + " and " + options.builds[1] +
                    " are one folder, should be two builds (see qz prove --help)");
    return base::kUsage;
  }
  try {
    const std::unique_ptr<audio::AudioInput> input = audio::OpenAudio(options.file);
    console.Message(input->Description());
    RawAudio audio;
    Decode(input.get(), &audio);
    const base::ExitCode result = Compare(options, audio, &console);
    const std::string output_fault = console.OutputFault();
    if (!output_fault.empty()) throw base::OutputError(output_fault);
    return result;
  } catch (const base::LaunchError&) {
    if (!base::Interrupted()) throw;
    throw base::LaunchError("interrupted before both traces were compared");
  }
}

}  // namespace qz::tools
