// SPDX-License-Identifier: Apache-2.0
// The network's operators over float, forwards and backwards. A backward function gets the gradient
// of the loss by the operator's output and gives those by its weights (added to *dw) and its input
// (written to *dx, unless null). Convolutions are valid: `taps` - 1 steps fewer come out.
#pragma once

#include "train/matrix.h"

namespace qz::train {

constexpr int kTaps = 3;  // of the depthwise convolutions

// y[j][c] = sum over t of x[j + t][c] w[t][c]; w is kTaps x channels.
void DepthwiseForward(const Batch& x, const ConstMatrixView& w, Batch* y);
void DepthwiseBackward(const Batch& x, const ConstMatrixView& w, const Batch& dy, MatrixView dw,
                       Batch* dx);

// y[j][n] = sum over t, k of x[j + t][k] w[t * inputs + k][n]; w is (taps x inputs) x outputs.
void ConvolutionForward(const Batch& x, const ConstMatrixView& w, int taps, Batch* y);
void ConvolutionBackward(const Batch& x, const ConstMatrixView& w, int taps, const Batch& dy,
                         MatrixView dw, Batch* dx);

// The larger of every two neighbouring steps; a last odd one is left out. Of equals the first gets
// the gradient.
void PoolForward(const Batch& x, Batch* y);
void PoolBackward(const Batch& x, const Batch& dy, Batch* dx);

// Batch normalisation over all steps of all sequences: z = (x - mean) / deviation, y = gamma z +
// beta. What the backward pass needs of the forward pass is kept here.
struct Normalisation {
  Batch z;
  RowVector mean;
  RowVector variance;

  void Forward(const Batch& x, const ConstMatrixView& gamma, const ConstMatrixView& beta, Batch* y);
  void Backward(const Batch& dy, const ConstMatrixView& gamma, MatrixView dgamma, MatrixView dbeta,
                Batch* dx) const;
};

constexpr float kNormalisationFloor = 1e-3f;  // added to the variance

}  // namespace qz::train
