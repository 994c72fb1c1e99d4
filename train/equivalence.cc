// SPDX-License-Identifier: Apache-2.0
#include "train/equivalence.h"

#include <algorithm>
#include <cstdio>
#include <memory>

#include "base/digest.h"
#include "network/network.h"
#include "train/validation.h"

namespace qz::train {
namespace {

using config::kFramesBetweenRuns;
using config::kOperatorCount;
using config::OperatorKind;

// As many windows at a time as are quick and small.
constexpr int kMaxWindows = 16;

// Some of a clip's windows, as sequences of their own.
Batch WindowsOf(const Batch& features, int first, int count) {
  Batch windows;
  windows.Resize(count, FramesFor(1), features.channels());
  for (int w = 0; w < count; ++w) {
    windows.values.middleRows(w * FramesFor(1), FramesFor(1)) = features.values.middleRows(
        (first + w) * static_cast<int>(kFramesBetweenRuns), FramesFor(1));
  }
  return windows;
}

class Comparison {
 public:
  Comparison(const QuantisedParameters& parameters, const model::PackedModel& model)
      : parameters_(parameters), weights_(network::WeightsOf(model.data())) {}

  void Compare(const Batch& features) {
    const auto count = static_cast<int>(
        (features.steps() - FramesFor(1)) / static_cast<int>(kFramesBetweenRuns) + 1);
    for (int first = 0; first < count; first += kMaxWindows) {
      CompareWindows(WindowsOf(features, first, std::min(kMaxWindows, count - first)));
    }
  }

  const EquivalenceCheck& check() const { return check_; }

 private:
  void CompareWindows(const Batch& windows) {
    network_.Forward(parameters_, windows);
    for (int w = 0; w < windows.sequences; ++w) {
      const auto input = windows.values.middleRows(w * FramesFor(1), FramesFor(1));
      std::transform(input.data(), input.data() + input.size(), network::InputOf(*arena_),
                     [](float feature) { return static_cast<int8_t>(feature - 128); });
      for (size_t op = 0; op < kOperatorCount; ++op) CompareOperator(op, w);
      ++check_.runs;
    }
  }

  void CompareOperator(size_t op, int window) {
    network::RunOperator(op, *arena_, weights_);
    const config::Tensor& tensor = config::kOperators[op].output;
    const int8_t* const theirs = network::BytesOf(*arena_, tensor);
    const std::vector<int8_t> ours = OursOf(op, window);
    check_.trainer_digest = base::Digest(ours.data(), ours.size(), check_.trainer_digest);
    check_.module_digest = base::Digest(theirs, tensor.Bytes(), check_.module_digest);
    check_.bytes += tensor.Bytes();
    if (!check_.difference.empty()) return;
    size_t i = 0;
    while (i < ours.size() && i < tensor.Bytes() && ours[i] == theirs[i]) ++i;
    if (i == ours.size() && i == tensor.Bytes()) return;
    check_.difference = "run " + std::to_string(check_.runs) + ", operator " + std::to_string(op) +
                        ", row " + std::to_string(i / tensor.channels) + ", channel " +
                        std::to_string(i % tensor.channels);
    if (i < ours.size() && i < tensor.Bytes()) {
      check_.difference += ": the trainer's is " + std::to_string(ours[i]) + ", the module's " +
                           std::to_string(theirs[i]);
    }
  }

  // The tensor of a window as bytes.
  std::vector<int8_t> OursOf(size_t op, int window) const {
    const OperatorKind kind = config::kOperators[op].kind;
    if (kind == OperatorKind::kLogistic) return ScoreBytes(window, false);
    if (kind == OperatorKind::kDequantise) return ScoreBytes(window, true);
    const int written = static_cast<int>(op - (kind == OperatorKind::kFlatten ? 1 : 0));
    const Batch& out = network_.OutputOf(written);
    const auto rows = out.values.middleRows(window * out.steps(), out.steps());
    const int zero_point = QuantisedNetwork::ZeroPointOf(written);
    std::vector<int8_t> bytes(static_cast<size_t>(rows.size()));
    std::transform(rows.data(), rows.data() + rows.size(), bytes.begin(), [&](float value) {
      return static_cast<int8_t>(static_cast<int>(value) + zero_point);
    });
    return bytes;
  }

  std::vector<int8_t> ScoreBytes(int window, bool as_floats) const {
    std::vector<int8_t> bytes;
    for (int c = 0; c < model::kClasses; ++c) {
      const float score = DeviceScore(
          network_.OutputOf(static_cast<int>(config::kLogitOperator)).values(window, c));
      if (as_floats) {
        const auto* begin = reinterpret_cast<const int8_t*>(&score);
        bytes.insert(bytes.end(), begin, begin + sizeof(score));
      } else {
        bytes.push_back(static_cast<int8_t>(static_cast<int>(score * 256) - 128));
      }
    }
    return bytes;
  }

  const QuantisedParameters& parameters_;
  const network::Weights weights_;
  const std::unique_ptr<network::Arena> arena_ = std::make_unique<network::Arena>();
  QuantisedNetwork network_;
  EquivalenceCheck check_;
};

}  // namespace

EquivalenceCheck Prove(const QuantisedParameters& parameters, const model::PackedModel& model,
                       const std::vector<Batch>& validated) {
  Comparison comparison(parameters, model);
  for (const Batch& features : validated) comparison.Compare(features);
  return comparison.check();
}

std::string Message(const EquivalenceCheck& check) {
  char text[256];
  std::snprintf(text, sizeof(text),
                "%llu network runs, %llu bytes of %zu operators: trainer %016llx, module %016llx",
                static_cast<unsigned long long>(check.runs),
                static_cast<unsigned long long>(check.bytes), kOperatorCount,
                static_cast<unsigned long long>(check.trainer_digest),
                static_cast<unsigned long long>(check.module_digest));
  return text + std::string(check.difference.empty() ? ", the same" : ", different: ") +
         check.difference;
}

}  // namespace qz::train
