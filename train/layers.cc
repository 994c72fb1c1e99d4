// SPDX-License-Identifier: Apache-2.0
#include "train/layers.h"

namespace qz::train {
namespace {

using Stride = Eigen::OuterStride<>;

// One sequence's windows of `taps` steps, side by side: neighbouring rows overlap in memory.
Eigen::Map<const Matrix, 0, Stride> Windows(const Batch& x, int sequence, int taps) {
  const float* first = x.values.data() + sequence * x.steps() * x.channels();
  return {first, x.steps() - taps + 1, taps * x.channels(), Stride(x.channels())};
}

auto Sequence(const Batch& x, int sequence) {
  return x.values.middleRows(sequence * x.steps(), x.steps());
}

auto Sequence(Batch* x, int sequence) {
  return x->values.middleRows(sequence * x->steps(), x->steps());
}

}  // namespace

void DepthwiseForward(const Batch& x, const ConstMatrixView& w, Batch* y) {
  const Eigen::Index steps = x.steps() - kTaps + 1;
  y->Resize(x.sequences, steps, x.channels());
  for (int s = 0; s < x.sequences; ++s) {
    const auto in = Sequence(x, s);
    auto out = Sequence(y, s);
    for (Eigen::Index j = 0; j < steps; ++j) {
      out.row(j) = in.row(j).cwiseProduct(w.row(0)) + in.row(j + 1).cwiseProduct(w.row(1)) +
                   in.row(j + 2).cwiseProduct(w.row(2));
    }
  }
}

void DepthwiseBackward(const Batch& x, const ConstMatrixView& w, const Batch& dy, MatrixView dw,
                       Batch* dx) {
  const Eigen::Index steps = dy.steps();
  if (dx != nullptr) {
    dx->Resize(x.sequences, x.steps(), x.channels());
    dx->values.setZero();
  }
  for (int s = 0; s < x.sequences; ++s) {
    const auto in = Sequence(x, s);
    const auto dout = Sequence(dy, s);
    for (Eigen::Index j = 0; j < steps; ++j) {
      for (int t = 0; t < kTaps; ++t) dw.row(t) += in.row(j + t).cwiseProduct(dout.row(j));
    }
    if (dx == nullptr) continue;
    auto din = Sequence(dx, s);
    for (int t = 0; t < kTaps; ++t) {
      for (Eigen::Index j = 0; j < steps; ++j) {
        din.row(j + t) += dout.row(j).cwiseProduct(w.row(t));
      }
    }
  }
}

void ConvolutionForward(const Batch& x, const ConstMatrixView& w, int taps, Batch* y) {
  y->Resize(x.sequences, x.steps() - taps + 1, w.cols());
  if (taps == 1) {
    y->values.noalias() = x.values * w;
    return;
  }
  for (int s = 0; s < x.sequences; ++s) Sequence(y, s).noalias() = Windows(x, s, taps) * w;
}

void ConvolutionBackward(const Batch& x, const ConstMatrixView& w, int taps, const Batch& dy,
                         MatrixView dw, Batch* dx) {
  if (dx != nullptr) dx->Resize(x.sequences, x.steps(), x.channels());
  if (taps == 1) {
    dw.noalias() += x.values.transpose() * dy.values;
    if (dx != nullptr) dx->values.noalias() = dy.values * w.transpose();
    return;
  }
  for (int s = 0; s < x.sequences; ++s) {
    dw.noalias() += Windows(x, s, taps).transpose() * Sequence(dy, s);
  }
  if (dx == nullptr) return;
  dx->values.setZero();
  const Eigen::Index inputs = x.channels();
  for (int s = 0; s < x.sequences; ++s) {
    for (int t = 0; t < taps; ++t) {
      Sequence(dx, s).middleRows(t, dy.steps()).noalias() +=
          Sequence(dy, s) * w.middleRows(t * inputs, inputs).transpose();
    }
  }
}

void PoolForward(const Batch& x, Batch* y) {
  const Eigen::Index steps = x.steps() / 2;
  y->Resize(x.sequences, steps, x.channels());
  for (int s = 0; s < x.sequences; ++s) {
    const auto in = Sequence(x, s);
    auto out = Sequence(y, s);
    for (Eigen::Index p = 0; p < steps; ++p) out.row(p) = in.row(2 * p).cwiseMax(in.row(2 * p + 1));
  }
}

void PoolBackward(const Batch& x, const Batch& dy, Batch* dx) {
  dx->Resize(x.sequences, x.steps(), x.channels());
  for (int s = 0; s < x.sequences; ++s) {
    const auto in = Sequence(x, s);
    const auto dout = Sequence(dy, s);
    auto din = Sequence(dx, s);
    if (x.steps() % 2 != 0) din.row(x.steps() - 1).setZero();
    for (Eigen::Index p = 0; p < dy.steps(); ++p) {
      const auto first = (in.row(2 * p).array() >= in.row(2 * p + 1).array()).cast<float>();
      din.row(2 * p) = first * dout.row(p).array();
      din.row(2 * p + 1) = dout.row(p) - din.row(2 * p);
    }
  }
}

void Normalisation::Forward(const Batch& x, const ConstMatrixView& gamma,
                            const ConstMatrixView& beta, Batch* y) {
  const float count = static_cast<float>(x.values.rows());
  mean = x.values.colwise().sum() / count;
  z.Resize(x.sequences, x.steps(), x.channels());
  z.values = x.values.rowwise() - mean;
  variance = z.values.colwise().squaredNorm() / count;
  const RowVector scale = (variance.array() + kNormalisationFloor).sqrt().inverse();
  z.values.array().rowwise() *= scale.array();
  y->Resize(x.sequences, x.steps(), x.channels());
  y->values = (z.values.array().rowwise() * gamma.row(0).array()).rowwise() + beta.row(0).array();
}

// With g = dy gamma / deviation: dx = g - mean(g) - z mean(g z), means over the rows.
void Normalisation::Backward(const Batch& dy, const ConstMatrixView& gamma, MatrixView dgamma,
                             MatrixView dbeta, Batch* dx) const {
  const float count = static_cast<float>(dy.values.rows());
  const RowVector sum = dy.values.colwise().sum();
  const RowVector sum_z = dy.values.cwiseProduct(z.values).colwise().sum();
  dgamma += sum_z;
  dbeta += sum;
  const RowVector scale =
      gamma.row(0).array() * (variance.array() + kNormalisationFloor).sqrt().inverse();
  dx->Resize(dy.sequences, dy.steps(), dy.channels());
  dx->values = dy.values.rowwise() - sum / count;
  dx->values.array() -= z.values.array().rowwise() * (sum_z / count).array();
  dx->values.array().rowwise() *= scale.array();
}

}  // namespace qz::train
