// SPDX-License-Identifier: Apache-2.0
// qz-trace: plays a recording to the module and then to the same nanoapp linked into this program,
// and writes a trace of both to standard output. Of both it shows what they log and send, and their
// memory after each buffer; only of the linked one each frame and each operator.

#include <cerrno>
#include <cstdio>
#include <cstring>
#include <memory>
#include <string>
#include <vector>

#include "base/error.h"
#include "base/program.h"
#include "chre_nanoapp_info.h"
#include "trace/recorder.h"

extern "C" const chreNslNanoappInfo _chreNslDsoNanoappInfo;

namespace qz::trace {
namespace {

constexpr size_t kBufferSamples = 32000;

// That of the linked nanoapp, which the module's has to be.
enum Engine { kTraced_window, kTraced_stream };
constexpr Engine kTracedEngine = QZ_TRACED_ENGINE;

struct Options {
  std::string raw_file;
  std::string module;
  unsigned host_clients = 0;
  unsigned client_nanoapps = 0;
};

constexpr char kHelp[] =
    "usage: qz-trace RAW_FILE MODULE HOST_CLIENTS CLIENT_NANOAPPS\n"
    "Plays headerless 16-bit mono audio at 16 kHz, in whole buffers of 32000 samples, to a module "
    "and\n"
    "to the same nanoapp linked into this program, and writes a trace of both to standard "
    "output.\n";

void PrintError(const std::string& message) {
  std::fprintf(stderr, "qz-trace: %s\n", message.c_str());
}

// Gives `hub` the whole file while the trace can be written.
void PlayFile(const std::string& path, hub::Hub* hub, Recorder* recorder) {
  const std::unique_ptr<std::FILE, int (*)(std::FILE*)> file(std::fopen(path.c_str(), "rb"),
                                                             std::fclose);
  if (file == nullptr) throw base::InputError(path + ": can't be opened: " + std::strerror(errno));
  std::vector<int16_t> buffer(kBufferSamples);
  uint32_t buffers = 0;
  while (std::ferror(stdout) == 0) {
    const size_t got = std::fread(buffer.data(), sizeof(int16_t), kBufferSamples, file.get());
    if (got == 0 && std::ferror(file.get()) == 0) return;
    if (got != kBufferSamples) {
      throw base::InputError(
          path + ": can't be read, or does not end with a whole buffer of 32000 samples");
    }
    hub->PlayAudio(buffer.data(), kBufferSamples);
    recorder->Played(++buffers);
  }
}

base::ExitCode Trace(uint32_t nanoapp, const Options& options, Recorder* recorder) {
  hub::Hub hub;
  recorder->Begin(nanoapp, &hub);
  hub.sources().emplace_back();
  hub::Clients clients(&hub, recorder);
  hub::LoadFailure failure;
  if (nanoapp == kLoadedModule ? !hub.Start(options.module, &failure)
                               : !hub.StartLinked(_chreNslDsoNanoappInfo, &failure)) {
    throw base::LaunchError(failure.message);
  }
  std::string error;
  if (!recorder->WatchMemory(kTracedEngine == kTraced_window, &error)) {
    // So that the trace breaks off here: its further lines would be taken for a difference.
    hub.SetLogHandler(nullptr);
    throw base::LaunchError(error);
  }
  clients.Connect(options.host_clients, options.client_nanoapps);
  base::ExitCode result = base::kSuccess;
  try {
    PlayFile(options.raw_file, &hub, recorder);
  } catch (const base::InputError& input_error) {
    PrintError(input_error.what());
    result = input_error.exit_code();
  }
  clients.Leave();
  hub.End();
  for (const std::string& fault : hub.Faults()) {
    PrintError("fault: " + fault);
    result = base::kFaultFound;
  }
  return result;
}

base::ExitCode Main(int argc, char** argv) {
  const std::string word = argc == 2 ? argv[1] : "";
  if (word == "--help" || word == "--version") {
    std::printf("%s\n%s", base::VersionLine("qz-trace").c_str(), word == "--help" ? kHelp : "");
    return base::kSuccess;
  }
  Options options;
  if (argc != 5 || std::sscanf(argv[3], "%u", &options.host_clients) != 1 ||
      std::sscanf(argv[4], "%u", &options.client_nanoapps) != 1) {
    PrintError("arguments should be RAW_FILE MODULE HOST_CLIENTS CLIENT_NANOAPPS");
    return base::kUsage;
  }
  options.raw_file = argv[1];
  options.module = argv[2];
  Writer writer(stdout);
  Recorder recorder(&writer);
  ObserveLinkedNanoapp(&recorder);
  for (const uint32_t nanoapp : {kLoadedModule, kLinkedNanoapp}) {
    const base::ExitCode result = Trace(nanoapp, options, &recorder);
    if (result != base::kSuccess || std::ferror(stdout) != 0) return result;
  }
  writer.End();
  return base::kSuccess;
}

}  // namespace
}  // namespace qz::trace

int main(int argc, char** argv) {
  return qz::base::RunProgram("qz-trace", [argc, argv] { return qz::trace::Main(argc, argv); });
}
