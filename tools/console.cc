#include "tools/console.h"

#include <signal.h>
#include <unistd.h>

#include <cerrno>
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <cstring>

#include "audio/audio_input.h"

namespace qz::tools {
namespace {

constexpr int64_t kProgressIntervalMs = 200;
constexpr uint64_t kLongAudioSamples = uint64_t{120} * audio::kSampleRateHz;

int64_t SteadyMs() {
  return std::chrono::duration_cast<std::chrono::milliseconds>(
             std::chrono::steady_clock::now().time_since_epoch())
      .count();
}

}  // namespace

Console::Console()
    : data_on_terminal_(isatty(STDOUT_FILENO) != 0),
      messages_on_terminal_(isatty(STDERR_FILENO) != 0),
      next_progress_ms_(SteadyMs() + kProgressIntervalMs) {
  // A reader that leaves shows up as a failed write instead.
  signal(SIGPIPE, SIG_IGN);
}

Console::~Console() { EraseProgress(); }

void Console::Data(const std::string& line) {
  if (output_lost()) return;
  EraseProgress();
  if (std::fwrite((line + '\n').data(), 1, line.size() + 1, stdout) != line.size() + 1 ||
      std::fflush(stdout) != 0) {
    lost_error_ = errno;
  }
}

void Console::Message(const std::string& line) {
  EraseProgress();
  std::fprintf(stderr, "%s\n", line.c_str());
}

void Console::Progress(uint64_t done, uint64_t total) {
  if (total < kLongAudioSamples || !ProgressDue()) return;
  std::fprintf(stderr, "\r%.0f of %.0f s, %.0f%%\x1b[K",
               static_cast<double>(done) / audio::kSampleRateHz,
               static_cast<double>(total) / audio::kSampleRateHz,
               100.0 * static_cast<double>(done) / static_cast<double>(total));
}

void Console::ClipProgress(uint64_t done, uint64_t total) {
  if (!ProgressDue()) return;
  std::fprintf(stderr, "\r%llu of %llu clips, %.0f%%\x1b[K", static_cast<unsigned long long>(done),
               static_cast<unsigned long long>(total),
               100.0 * static_cast<double>(done) / static_cast<double>(total));
}

std::string Console::OutputFault() const {
  if (lost_error_ == 0 || lost_error_ == EPIPE) return {};
  return std::string("standard output: can't be written: ") + std::strerror(lost_error_);
}

// If so, the caller writes the line.
bool Console::ProgressDue() {
  if (!messages_on_terminal_ || SteadyMs() < next_progress_ms_) return false;
  next_progress_ms_ = SteadyMs() + kProgressIntervalMs;
  progress_shown_ = true;
  return true;
}

bool Console::data_in_colour() const {
  const char* const no_colour = std::getenv("NO_COLOR");
  return data_on_terminal_ && (no_colour == nullptr || no_colour[0] == '\0');
}

void Console::EraseProgress() {
  if (progress_shown_) std::fputs("\r\x1b[K", stderr);
  progress_shown_ = false;
}

}  // namespace qz::tools
