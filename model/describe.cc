// SPDX-License-Identifier: Apache-2.0
#include "model/describe.h"

#include <cstdio>
#include <initializer_list>
#include <utility>

#include "config/weight_tables.h"

namespace qz::model {
namespace {

using config::Operator;
using config::OperatorKind;

const char* KindName(OperatorKind kind) {
  switch (kind) {
    case OperatorKind::kDepthwise:
      return "depthwise";
    case OperatorKind::kPointwise:
      return "pointwise";
    case OperatorKind::kConvolution:
      return "convolution";
    case OperatorKind::kMaxPool:
      return "max pool";
    case OperatorKind::kFlatten:
      return "flatten";
    case OperatorKind::kFullyConnected:
      return "fully connected";
    case OperatorKind::kLogistic:
      return "logistic";
    case OperatorKind::kDequantise:
      return "dequantise";
  }
  return "";
}

using Numbers = std::initializer_list<std::pair<const char*, size_t>>;

std::string Members(Numbers numbers) {
  std::string text;
  for (const auto& [name, value] : numbers) {
    text += ", \"" + std::string(name) + "\": " + std::to_string(value);
  }
  return text;
}

std::string OperatorJson(size_t index) {
  const Operator& op = config::kOperators[index];
  const size_t table = config::TableIndex(index);
  const size_t table_bytes = op.HasTable() ? config::kTables[table].Bytes() : 0;
  char scale[40];
  std::snprintf(scale, sizeof scale, "%.17g", op.scale);
  return "    {\"kind\": \"" + std::string(KindName(op.kind)) + "\", \"table\": \"" +
         std::string(op.table) + "\", \"zero_point\": " + std::to_string(op.zero_point) +
         ", \"scale\": " + scale +
         Members({{"taps", op.taps},
                  {"stride", op.stride},
                  {"rows", op.output.rows},
                  {"channels", op.output.channels},
                  {"offset", op.output.offset},
                  {"bytes", op.output.Bytes()},
                  {"table_bytes", table_bytes},
                  {"list_entries", op.ListEntries()},
                  {"products", op.Products()},
                  {"frames_seen", op.frames_seen},
                  {"frame_step", op.frame_step}}) +
         "}";
}

}  // namespace

std::string DescriptionJson() {
  std::string text = "{" + Members({{"sample_rate_hz", config::kSampleRateHz},
                                    {"buffer_samples", config::kBufferSamples},
                                    {"frame_samples", config::kFrameSamples},
                                    {"hop_samples", config::kHopSamples},
                                    {"feature_channels", config::kFeatureChannels},
                                    {"window_frames", config::kWindowFrames},
                                    {"window_bytes", config::kWindow.Bytes()},
                                    {"frames_between_runs", config::kFramesBetweenRuns},
                                    {"classes", config::kClasses},
                                    {"short_smoothing_runs", config::kShortSmoothingRuns},
                                    {"long_smoothing_runs", config::kLongSmoothingRuns},
                                    {"arena_bytes", config::kArenaBytes},
                                    {"model_bytes", config::kModelBytes}})
                               .substr(2);
  text += ", \"operators\": [\n";
  for (size_t i = 0; i < config::kOperatorCount; ++i) {
    text += OperatorJson(i) + (i + 1 < config::kOperatorCount ? ",\n" : "\n");
  }
  return text + "]}\n";
}

}  // namespace qz::model
