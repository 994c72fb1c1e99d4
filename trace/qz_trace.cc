// qz-trace: plays a recording to the module and then to the same nanoapp linked into this program,
// and writes a trace of both to standard output. Of both it shows what they log and send, and their
// memory after each buffer; only of the linked one each frame and each operator.
// Usage: qz-trace RAW_FILE MODULE HOST_CLIENTS CLIENT_NANOAPPS
// RAW_FILE is headerless 16-bit mono at 16 kHz, in whole buffers of 32000 samples.

#include <cstdio>
#include <memory>
#include <string>
#include <vector>

#include "chre_nanoapp_info.h"
#include "trace/recorder.h"

extern "C" const chreNslNanoappInfo _chreNslDsoNanoappInfo;

namespace qz::trace {
namespace {

constexpr size_t kBufferSamples = 32000;

struct Options {
  std::string raw_file;
  std::string module;
  unsigned host_clients = 0;
  unsigned client_nanoapps = 0;
};

bool Complain(const std::string& message) {
  std::fprintf(stderr, "qz-trace: %s\n", message.c_str());
  return false;
}

// Gives `hub` the whole file while the trace can be written.
bool PlayFile(const std::string& path, hub::Hub* hub, Recorder* recorder) {
  const std::unique_ptr<std::FILE, int (*)(std::FILE*)> file(std::fopen(path.c_str(), "rb"),
                                                             std::fclose);
  if (file == nullptr) return Complain(path + ": can't be opened");
  std::vector<int16_t> buffer(kBufferSamples);
  uint32_t buffers = 0;
  while (std::ferror(stdout) == 0) {
    const size_t got = std::fread(buffer.data(), sizeof(int16_t), kBufferSamples, file.get());
    if (got == kBufferSamples) {
      hub->PlayAudio(buffer.data(), kBufferSamples);
      recorder->Played(++buffers);
    } else if (got == 0 && std::ferror(file.get()) == 0) {
      return true;
    } else {
      return Complain(path +
                      ": can't be read, or does not end with a whole buffer of 32000 samples");
    }
  }
  return Complain("standard output: can't be written");
}

bool Trace(uint32_t nanoapp, const Options& options, Recorder* recorder) {
  hub::Hub hub;
  recorder->Begin(nanoapp, &hub);
  hub.sources().emplace_back();
  hub::Clients clients(&hub, recorder);
  hub::LoadFailure failure;
  if (nanoapp == kLoadedModule ? !hub.Start(options.module, &failure)
                               : !hub.StartLinked(_chreNslDsoNanoappInfo, &failure)) {
    return Complain(failure.message);
  }
  std::string wrong;
  if (!recorder->WatchMemory(&wrong)) {
    // So that the trace breaks off here: its further lines would be taken for a difference.
    hub.SetLogHandler(nullptr);
    return Complain(wrong);
  }
  clients.Connect(options.host_clients, options.client_nanoapps);
  bool success = PlayFile(options.raw_file, &hub, recorder);
  clients.Leave();
  hub.End();
  for (const std::string& fault : hub.Faults()) success = Complain("fault: " + fault);
  return success;
}

int Main(int argc, char** argv) {
  Options options;
  if (argc != 5 || std::sscanf(argv[3], "%u", &options.host_clients) != 1 ||
      std::sscanf(argv[4], "%u", &options.client_nanoapps) != 1) {
    Complain("arguments should be RAW_FILE MODULE HOST_CLIENTS CLIENT_NANOAPPS");
    return 2;
  }
  options.raw_file = argv[1];
  options.module = argv[2];
  Writer writer(stdout);
  Recorder recorder(&writer);
  ObserveLinkedNanoapp(&recorder);
  for (const uint32_t nanoapp : {kLoadedModule, kLinkedNanoapp}) {
    if (!Trace(nanoapp, options, &recorder)) return 1;
  }
  writer.End();
  return std::ferror(stdout) == 0 || Complain("standard output: can't be written") ? 0 : 1;
}

}  // namespace
}  // namespace qz::trace

int main(int argc, char** argv) { return qz::trace::Main(argc, argv); }
