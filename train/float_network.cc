// SPDX-License-Identifier: Apache-2.0
#include "train/float_network.h"

#include "base/number_generator.h"

namespace qz::train {
namespace {

float MinOf(const LayerPlan& plan) { return static_cast<float>(plan.min() * plan.out_scale); }
float MaxOf(const LayerPlan& plan) { return static_cast<float>(plan.max() * plan.out_scale); }

// Dropout: sets a share of the values to 0 and scales the others up; *mask holds the factors.
void DropOut(float share, uint64_t seed, Batch* x, Batch* mask) {
  base::NumberGenerator random(seed);
  mask->Resize(x->sequences, x->steps(), x->channels());
  const float kept = 1 / (1 - share);
  for (Eigen::Index i = 0; i < mask->values.size(); ++i) {
    mask->values.data()[i] = random.Unit() < static_cast<double>(share) ? 0 : kept;
  }
  x->values.array() *= mask->values.array();
}

}  // namespace

void MaskClamped(const Batch& out, float min, float max, Batch* gradient) {
  const float* const values = out.values.data();
  float* const g = gradient->values.data();
  for (Eigen::Index i = 0; i < out.values.size(); ++i) {
    const bool inside = (values[i] > min) & (values[i] < max);
    g[i] = inside ? g[i] : 0.0f;
  }
}

const Batch& FloatNetwork::Forward(const Values& parameters, const Batch& features,
                                   const TrainingNoise* noise) {
  normalised_ = noise != nullptr;
  for (size_t i = 0; i < kLayers; ++i) {
    const LayerPlan& plan = kPlan[i];
    LayerTrace& trace = traces_[i];
    trace.in = i == 0 ? features : traces_[i - 1].Result(kPlan[i - 1]);
    if (i == 0) trace.in.values *= static_cast<float>(kFeatureScale);
    trace.dropout = Batch();
    if (noise != nullptr && plan.dropout && noise->dropout > 0) {
      DropOut(noise->dropout, noise->seed + i, &trace.in, &trace.dropout);
    }
    if (plan.depthwise()) {
      DepthwiseForward(trace.in, WeightOf(parameters, i), &trace.out);
    } else {
      ConvolutionForward(trace.in, WeightOf(parameters, i), plan.taps(), &trace.out);
      const ConstMatrixView bias = RowAt(parameters, i, kParameters.layers[i].bias);
      if (normalised_ && plan.normalised) {
        const ConstMatrixView gamma = RowAt(parameters, i, kParameters.layers[i].gamma);
        trace.normalisation.Forward(trace.out, gamma, bias, &trace.out);
      } else {
        trace.out.values.rowwise() += bias.row(0);
      }
    }
    trace.out.values = trace.out.values.cwiseMax(MinOf(plan)).cwiseMin(MaxOf(plan));
    if (plan.pooled) PoolForward(trace.out, &trace.pooled);
  }
  return traces_.back().out;
}

void FloatNetwork::Backward(const Values& parameters, const Batch& dlogits, Values* gradient) {
  Batch dy = dlogits;
  Batch dx;
  for (size_t i = kLayers; i-- > 0;) {
    const LayerPlan& plan = kPlan[i];
    LayerTrace& trace = traces_[i];
    if (plan.pooled) {
      PoolBackward(trace.out, dy, &dx);
      std::swap(dy, dx);
    }
    MaskClamped(trace.out, MinOf(plan), MaxOf(plan), &dy);
    Batch* const input_gradient = i == 0 ? nullptr : &dx;
    if (plan.depthwise()) {
      DepthwiseBackward(trace.in, WeightOf(parameters, i), dy, WeightOf(*gradient, i),
                        input_gradient);
    } else {
      MatrixView dbias = RowAt(*gradient, i, kParameters.layers[i].bias);
      if (normalised_ && plan.normalised) {
        const size_t gamma = kParameters.layers[i].gamma;
        trace.normalisation.Backward(dy, RowAt(parameters, i, gamma), RowAt(*gradient, i, gamma),
                                     dbias, &dx);
        std::swap(dy, dx);
      } else {
        dbias += dy.values.colwise().sum();
      }
      ConvolutionBackward(trace.in, WeightOf(parameters, i), plan.taps(), dy,
                          WeightOf(*gradient, i), input_gradient);
    }
    if (i > 0 && trace.dropout.sequences > 0) dx.values.array() *= trace.dropout.values.array();
    std::swap(dy, dx);
  }
}

void FloatNetwork::MoveRunning(float rate, Values* values) const {
  for (size_t i = 0; i < kLayers; ++i) {
    if (!kPlan[i].normalised) continue;
    const Normalisation& normalisation = traces_[i].normalisation;
    MatrixView mean = RowAt(*values, i, kParameters.layers[i].mean);
    MatrixView variance = RowAt(*values, i, kParameters.layers[i].variance);
    mean += rate * (normalisation.mean - mean);
    variance += rate * (normalisation.variance - variance);
  }
}

}  // namespace qz::train
