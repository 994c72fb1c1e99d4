// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <chrono>
#include <string>

#include "train/validation.h"

namespace qz::train {

// The progress of a run on stderr: on a terminal a bar that is redrawn, elsewhere a line every 20
// epochs.
class TrainProgress {
 public:
  // `done` epochs were completed before.
  explicit TrainProgress(int done);
  ~TrainProgress();

  // `metrics` may be null: nothing is held out.
  void Show(const std::string& phase, int done, int left, double loss, const Metrics* metrics);

 private:
  std::string TimeLeft(int done, int left) const;

  bool terminal_;
  bool drawn_ = false;
  int begun_at_;
  std::chrono::steady_clock::time_point start_ = std::chrono::steady_clock::now();
};

}  // namespace qz::train
