// SPDX-License-Identifier: Apache-2.0
#include "train/train_progress.h"

#include <unistd.h>

#include <algorithm>
#include <cstdio>

namespace qz::train {
namespace {

constexpr int kBarCells = 24;
constexpr int kEpochsALine = 20;  // where there is no terminal

}  // namespace

TrainProgress::TrainProgress(int done) : terminal_(isatty(STDERR_FILENO) != 0), begun_at_(done) {}

TrainProgress::~TrainProgress() {
  if (drawn_) std::fputs("\n", stderr);
}

void TrainProgress::Show(const std::string& phase, int done, int left, double loss,
                         const Metrics* metrics) {
  if (!terminal_ && done % kEpochsALine != 0 && left != 0) return;
  char validated[64] = "";
  if (metrics != nullptr) {
    std::snprintf(validated, sizeof(validated), "  mean AP %.3f, ROC AUC %.3f",
                  metrics->average_precision, metrics->roc_auc);
  }
  std::string bar;
  if (terminal_) {
    const int filled = kBarCells * done / (done + left);
    bar = "\r[" + std::string(static_cast<size_t>(filled), '#') +
          std::string(static_cast<size_t>(kBarCells - filled), '.') + "] ";
  }
  std::fprintf(stderr, "%s%s, epoch %d/%d  loss %.3f%s  %s left%s", bar.c_str(), phase.c_str(),
               done, done + left, loss, validated, TimeLeft(done, left).c_str(),
               terminal_ ? "\033[K" : "\n");
  std::fflush(stderr);
  drawn_ = terminal_;
}

std::string TrainProgress::TimeLeft(int done, int left) const {
  const double seconds =
      std::chrono::duration<double>(std::chrono::steady_clock::now() - start_).count();
  const int to_go = static_cast<int>(seconds / std::max(done - begun_at_, 1) * left);
  char text[32];
  std::snprintf(text, sizeof(text), "%d:%02d", to_go / 60, to_go % 60);
  return text;
}

}  // namespace qz::train
