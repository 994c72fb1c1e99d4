// SPDX-License-Identifier: Apache-2.0
#include "tools/model/model_info.h"

#include <algorithm>
#include <cstdio>
#include <memory>

#include "detector/window.h"
#include "network/network.h"

namespace qz::tools {
namespace {

using config::kOperators;
using config::kWindow;
using config::Tensor;
using model::OperatorKind;
using model::TableLayout;

std::string OperatorName(const config::Operator& op) {
  switch (op.kind) {
    case OperatorKind::kDepthwise:
      return "depthwise";
    case OperatorKind::kPointwise:
      return "pointwise";
    case OperatorKind::kConvolution:
      return std::to_string(op.taps) + "-tap";
    case OperatorKind::kMaxPool:
      return "max pool";
    case OperatorKind::kFlatten:
      return "as vector";
    case OperatorKind::kFullyConnected:
      return "connected";
    case OperatorKind::kLogistic:
      return "logistic";
    case OperatorKind::kDequantise:
      return "dequantise";
  }
  return "";
}

void Add(const int8_t* values, const Tensor& tensor, TensorSummary* summary) {
  summary->values += tensor.Bytes();
  for (size_t i = 0; i < tensor.Bytes(); ++i) {
    const int value = values[i];
    summary->min = std::min(summary->min, value);
    summary->max = std::max(summary->max, value);
    summary->at_min_int8 += value == -128;
    summary->at_max_int8 += value == 127;
  }
  summary->digest = base::Digest(values, tensor.Bytes(), summary->digest);
}

double Percent(uint64_t part, uint64_t whole) {
  return whole == 0 ? 0 : 100.0 * static_cast<double>(part) / static_cast<double>(whole);
}

template <typename... Values>
std::string Line(const char* format, Values... values) {
  char text[192];
  std::snprintf(text, sizeof text, format, values...);
  return text;
}

std::string WeightShape(const TableLayout& table) {
  std::string shape = std::to_string(table.outputs);
  if (!table.IsDepthwise()) shape = std::to_string(table.inputs) + " x " + shape;
  return (table.taps > 1 ? std::to_string(table.taps) + " x " : "") + shape;
}

template <typename T>
std::string Range(const std::vector<T>& values) {
  const auto [min, max] = std::minmax_element(values.begin(), values.end());
  return std::to_string(*min) + " to " + std::to_string(*max);
}

std::string ScaleRange(const std::vector<float>& scales) {
  if (scales.empty()) return "none";
  const auto [min, max] = std::minmax_element(scales.begin(), scales.end());
  if (*min == *max) return Line("%.4g", static_cast<double>(*min));
  return Line("%.4g to %.4g", static_cast<double>(*min), static_cast<double>(*max));
}

std::string TableLine(const TableLayout& table, const model::LayerArrays& arrays) {
  const auto at_the_end =
      std::count_if(arrays.weight.begin(), arrays.weight.end(),
                    [](int8_t weight) { return weight == 127 || weight == -127; });
  return Line("%-5s  %2d %-9s  %-11s  %6zu  %-12s  %5.1f %%  %-18s  %s\n",
              std::string(table.name).c_str(), table.op,
              OperatorName(kOperators[static_cast<size_t>(table.op)]).c_str(),
              WeightShape(table).c_str(), table.Bytes(), Range(arrays.weight).c_str(),
              Percent(static_cast<uint64_t>(at_the_end), arrays.weight.size()),
              Range(arrays.bias).c_str(), ScaleRange(arrays.scale).c_str());
}

std::string TensorLine(const std::string& name, const Tensor& shape, int zero_point,
                       const TensorSummary& summary) {
  return Line("%-12s  %3zu x %-2zu  %6d  %7d  %10d  %6.2f %%  %6.2f %%  %016llx\n", name.c_str(),
              shape.rows, shape.channels, summary.min, summary.max, zero_point,
              Percent(summary.at_min_int8, summary.values),
              Percent(summary.at_max_int8, summary.values),
              static_cast<unsigned long long>(summary.digest));
}

}  // namespace

TensorSummaries TensorsOf(const model::PackedModel& packed, const std::vector<uint16_t>& features) {
  const auto arena = std::make_unique<network::Arena>();
  const network::Weights weights = network::WeightsOf(packed.data());
  TensorSummaries tensors;
  tensors.frames = features.size() / kWindow.channels;
  std::vector<int8_t> window(detector::kWindowBytes);
  size_t held = 0;
  const auto run = [&] {
    std::copy(window.begin(), window.end(), network::InputOf(*arena));
    Add(window.data(), kWindow, &tensors.input);
    for (size_t op = 0; op < kOperators.size(); ++op) {
      network::RunOperator(op, *arena, weights);
      if (op >= tensors.outputs.size()) continue;
      const Tensor& output = kOperators[op].output;
      Add(network::BytesOf(*arena, output), output, &tensors.outputs[op]);
    }
    for (size_t i = 0; i < tensors.max_scores.size(); ++i) {
      float& max = tensors.max_scores[i];
      max = std::max(max, network::ScoresOf(*arena)[i]);
    }
    ++tensors.runs;
  };
  for (size_t frame = 0; frame < tensors.frames; ++frame) {
    detector::TakeFrame(features.data() + frame * kWindow.channels, window.data(), &held, run);
  }
  return tensors;
}

std::string TablesText(const model::PackedModel& packed, const model::ModelArrays& arrays) {
  const uint64_t digest = base::Digest(packed.data(), packed.size());
  std::string text = Line("packed model of %zu bytes, digest %016llx\n", packed.size(),
                          static_cast<unsigned long long>(digest));
  text += Line("%-5s  %-12s  %-11s  %6s  %-12s  %7s  %-18s  %s\n", "table", "operator", "weights",
               "bytes", "from, to", "at ±127", "biases", "scales");
  for (size_t i = 0; i < model::kTableCount; ++i) text += TableLine(model::kTables[i], arrays[i]);
  return text;
}

std::string TensorsText(const TensorSummaries& tensors) {
  std::string text = Line("%zu frames with the silence behind it, %zu network runs\n",
                          tensors.frames, tensors.runs);
  text += Line("%-12s  %-8s  %6s  %7s  %10s  %8s  %8s  %s\n", "tensor", "values", "lowest",
               "highest", "zero point", "at -128", "at 127", "digest");
  text += TensorLine("   input", kWindow, -128, tensors.input);
  for (size_t op = 0; op < tensors.outputs.size(); ++op) {
    const config::Operator& each = kOperators[op];
    text += TensorLine(Line("%2zu %s", op, OperatorName(each).c_str()), each.output,
                       each.zero_point, tensors.outputs[op]);
  }
  text += "highest scores:";
  for (const float score : tensors.max_scores) {
    text += Line(" %.4f", static_cast<double>(score));
  }
  return text + "\n";
}

}  // namespace qz::tools
