// SPDX-License-Identifier: Apache-2.0
#include "train/quantised_network.h"

#include <algorithm>
#include <cmath>
#include <string>

#include "base/error.h"

namespace qz::train {
namespace {

// With the largest products, 180 x 255 x 127, and this every sum stays below 2^24.
constexpr float kMaxBias = 8'000'000;

// The device's rounding: floor of the high product, then a right shift with halves upwards.
float RequantiseFixed(float accumulator, const config::OperatorDescription& factor) {
  const int64_t high = (static_cast<int64_t>(accumulator) * int64_t{factor.multiplier}) >> 31;
  return static_cast<float>((high + (int64_t{1} << (factor.shift - 1))) >> factor.shift);
}

void Requantise(const QuantisedParameters& parameters, size_t layer, Batch* x) {
  const LayerPlan& plan = kPlan[layer];
  if (plan.fixed_point()) {
    const config::OperatorDescription& factor = plan.Description();
    x->values = x->values.unaryExpr([&](float sum) { return RequantiseFixed(sum, factor); });
  } else {
    // In single precision and to the nearest, halves to even, as the device.
    x->values.array().rowwise() *= parameters.scale[layer].array();
    x->values = x->values.array().rint();
  }
  x->values =
      x->values.cwiseMax(static_cast<float>(plan.min())).cwiseMin(static_cast<float>(plan.max()));
}

// The step of each output's weights: fixed, or so that the largest becomes 127.
RowVector WeightSteps(const ConstMatrixView& weight, const LayerPlan& plan) {
  if (plan.weight_scale != 0) {
    return RowVector::Constant(weight.cols(), static_cast<float>(plan.weight_scale));
  }
  return (weight.cwiseAbs().colwise().maxCoeff() / 127.0f).cwiseMax(1e-9f);
}

// The layer that holds the operator, or that the operator pools.
size_t LayerOf(int op) {
  size_t layer = kLayers - 1;
  while (config::kTables[layer].op > op) --layer;
  return layer;
}

}  // namespace

QuantisedParameters::QuantisedParameters(const Values& folded) : integers(kParameters.all) {
  for (size_t i = 0; i < kLayers; ++i) {
    const LayerPlan& plan = kPlan[i];
    const ConstMatrixView weight = WeightOf(folded, i);
    weight_step[i] = WeightSteps(weight, plan);
    MatrixView whole = WeightOf(integers, i);
    whole = (weight.array().rowwise() / weight_step[i].array()).rint();
    whole = whole.cwiseMax(-127.0f).cwiseMin(127.0f);
    if (plan.depthwise()) {
      scale[i] = RowVector::Constant(weight.cols(), plan.layout().fixed_scale);
      continue;
    }
    const RowVector step = weight_step[i] * static_cast<float>(plan.in_scale);
    const size_t bias = kParameters.layers[i].bias;
    RowAt(integers, i, bias) =
        (RowAt(folded, i, bias).array() / step.array()).rint().max(-kMaxBias).min(kMaxBias);
    scale[i] = plan.fixed_point()
                   ? RowVector::Constant(weight.cols(), static_cast<float>(plan.Factor()))
                   : RowVector(step / static_cast<float>(plan.out_scale));
  }
}

model::ModelArrays ArraysOf(const QuantisedParameters& parameters) {
  model::ModelArrays arrays;
  for (size_t i = 0; i < kLayers; ++i) {
    const ConstMatrixView weight = WeightOf(parameters.integers, i);
    model::LayerArrays& layer = arrays[i];
    layer.weight.assign(weight.data(), weight.data() + weight.size());
    layer.bias.assign(static_cast<size_t>(weight.cols()), 0);
    if (!kPlan[i].depthwise()) {
      const ConstMatrixView bias = RowAt(parameters.integers, i, kParameters.layers[i].bias);
      std::copy(bias.data(), bias.data() + bias.size(), layer.bias.begin());
    }
    if (kPlan[i].fixed_point()) continue;
    layer.scale.assign(parameters.scale[i].data(),
                       parameters.scale[i].data() + parameters.scale[i].size());
  }
  return arrays;
}

QuantisedParameters ParametersOf(const model::ModelArrays& arrays) {
  QuantisedParameters parameters{Values(kParameters.all)};
  for (size_t i = 0; i < kLayers; ++i) {
    const model::LayerArrays& layer = arrays[i];
    std::copy(layer.weight.begin(), layer.weight.end(), WeightOf(parameters.integers, i).data());
    parameters.weight_step[i].setOnes();
    if (kPlan[i].depthwise()) continue;
    for (const int32_t bias : layer.bias) {
      if (std::abs(static_cast<float>(bias)) > kMaxBias) {
        throw base::InputError(std::string(kPlan[i].layout().name) + ": a bias is " +
                               std::to_string(bias) +
                               ", expected at most 8,000,000: beyond, the trainer's sums are "
                               "not exact");
      }
    }
    std::copy(layer.bias.begin(), layer.bias.end(),
              RowAt(parameters.integers, i, kParameters.layers[i].bias).data());
    std::copy(layer.scale.begin(), layer.scale.end(), parameters.scale[i].data());
  }
  return parameters;
}

const Batch& QuantisedNetwork::Forward(const QuantisedParameters& parameters,
                                       const Batch& features) {
  for (size_t i = 0; i < kLayers; ++i) {
    const LayerPlan& plan = kPlan[i];
    LayerTrace& trace = traces_[i];
    trace.in = i == 0 ? features : traces_[i - 1].Result(kPlan[i - 1]);
    if (plan.depthwise()) {
      DepthwiseForward(trace.in, WeightOf(parameters.integers, i), &trace.out);
    } else {
      ConvolutionForward(trace.in, WeightOf(parameters.integers, i), plan.taps(), &trace.out);
      trace.out.values.rowwise() +=
          RowAt(parameters.integers, i, kParameters.layers[i].bias).row(0);
    }
    Requantise(parameters, i, &trace.out);
    if (plan.pooled) PoolForward(trace.out, &trace.pooled);
  }
  return traces_.back().out;
}

void QuantisedNetwork::Backward(const QuantisedParameters& parameters, const Batch& dlogits,
                                Values* gradient) {
  Values by_integer(kParameters.trained);
  Batch dy = dlogits;
  dy.values *= static_cast<float>(kLogitScale);
  Batch dx;
  for (size_t i = kLayers; i-- > 0;) {
    const LayerPlan& plan = kPlan[i];
    const LayerTrace& trace = traces_[i];
    if (plan.pooled) {
      PoolBackward(trace.out, dy, &dx);
      std::swap(dy, dx);
    }
    MaskClamped(trace.out, static_cast<float>(plan.min()), static_cast<float>(plan.max()), &dy);
    dy.values.array().rowwise() *= parameters.scale[i].array();
    Batch* const input_gradient = i == 0 ? nullptr : &dx;
    MatrixView dweight = WeightOf(by_integer, i);
    if (plan.depthwise()) {
      DepthwiseBackward(trace.in, WeightOf(parameters.integers, i), dy, dweight, input_gradient);
    } else {
      const RowVector step = parameters.weight_step[i] * static_cast<float>(plan.in_scale);
      RowAt(*gradient, i, kParameters.layers[i].bias).array() +=
          dy.values.colwise().sum().array() / step.array();
      ConvolutionBackward(trace.in, WeightOf(parameters.integers, i), plan.taps(), dy, dweight,
                          input_gradient);
    }
    WeightOf(*gradient, i).array() += dweight.array().rowwise() / parameters.weight_step[i].array();
    std::swap(dy, dx);
  }
}

const Batch& QuantisedNetwork::OutputOf(int op) const {
  const size_t layer = LayerOf(op);
  return config::kTables[layer].op == op ? traces_[layer].out : traces_[layer].pooled;
}

int QuantisedNetwork::ZeroPointOf(int op) { return kPlan[LayerOf(op)].zero_point(); }

}  // namespace qz::train
