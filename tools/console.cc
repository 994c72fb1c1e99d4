// SPDX-License-Identifier: Apache-2.0
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

Console::~Console() { ClearProgress(); }

void Console::Data(const std::string& line) {
  if (output_lost()) return;
  // On a terminal, which is taken to be that of stderr, the line takes the place of the progress.
  if (data_on_terminal_) Erase();
  if (std::fwrite((line + '\n').data(), 1, line.size() + 1, stdout) != line.size() + 1 ||
      std::fflush(stdout) != 0) {
    lost_error_ = errno;
  }
  if (data_on_terminal_) Draw();
}

void Console::Message(const std::string& line) {
  Erase();
  std::fprintf(stderr, "%s\n", line.c_str());
  Draw();
}

void Console::Progress(uint64_t done, uint64_t total) {
  if (total == 0 || !ProgressDue()) return;
  char text[96];
  std::snprintf(text, sizeof(text), "%.0f of %.0f s, %.0f%%",
                static_cast<double>(done) / audio::kSampleRateHz,
                static_cast<double>(total) / audio::kSampleRateHz,
                100.0 * static_cast<double>(done) / static_cast<double>(total));
  progress_ = text;
  Draw();
}

void Console::ClipProgress(uint64_t done, uint64_t total) {
  if (!ProgressDue()) return;
  char text[96];
  std::snprintf(text, sizeof(text), "%llu of %llu clips, %.0f%%",
                static_cast<unsigned long long>(done), static_cast<unsigned long long>(total),
                100.0 * static_cast<double>(done) / static_cast<double>(total));
  progress_ = text;
  Draw();
}

void Console::ClearProgress() {
  Erase();
  progress_.clear();
}

std::string Console::OutputFault() const {
  if (lost_error_ == 0 || lost_error_ == EPIPE) return {};
  return std::string("standard output: can't be written: ") + std::strerror(lost_error_);
}

// If so, the caller draws it.
bool Console::ProgressDue() {
  if (!messages_on_terminal_ || SteadyMs() < next_progress_ms_) return false;
  next_progress_ms_ = SteadyMs() + kProgressIntervalMs;
  return true;
}

bool Console::data_in_colour() const {
  const char* const no_colour = std::getenv("NO_COLOR");
  return data_on_terminal_ && (no_colour == nullptr || no_colour[0] == '\0');
}

void Console::Draw() const {
  if (!progress_.empty()) std::fprintf(stderr, "\r%s\x1b[K", progress_.c_str());
}

void Console::Erase() const {
  if (!progress_.empty()) std::fputs("\r\x1b[K", stderr);
}

}  // namespace qz::tools
