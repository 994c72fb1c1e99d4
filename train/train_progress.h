#pragma once

#include <chrono>
#include <string>

#include "train/validation.h"

namespace qz::train {

// Tells how far a run is, on stderr: on a terminal a bar that is drawn over, elsewhere a line now
// and then.
class TrainProgress {
 public:
  // `done` epochs were there before.
  explicit TrainProgress(int done);
  ~TrainProgress();

  // `figures` may be null: nothing is held out.
  void Show(const std::string& phase, int done, int left, double loss, const Metrics* metrics);

 private:
  std::string TimeLeft(int done, int left) const;

  bool terminal_;
  bool drawn_ = false;
  int begun_at_;
  std::chrono::steady_clock::time_point start_ = std::chrono::steady_clock::now();
};

}  // namespace qz::train
