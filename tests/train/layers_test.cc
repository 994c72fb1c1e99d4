// SPDX-License-Identifier: Apache-2.0
// Every backward function against differences of its forward function.

#include "train/layers.h"

#include <gtest/gtest.h>

#include <functional>
#include <vector>

#include "base/number_generator.h"
#include "train/loss.h"

namespace qz::train {
namespace {

void Fill(base::NumberGenerator* random, Matrix* values) {
  for (Eigen::Index i = 0; i < values->size(); ++i) {
    values->data()[i] = static_cast<float>(random->Uniform(-1, 1));
  }
}

Batch RandomBatch(base::NumberGenerator* random, int sequences, int steps, int channels) {
  Batch batch;
  batch.Resize(sequences, steps, channels);
  Fill(random, &batch.values);
  return batch;
}

// The derivatives of `value` by each of the numbers at `x`, by central differences.
std::vector<double> Slopes(Eigen::Index count, float* x, const std::function<double()>& value) {
  constexpr float kStep = 1.0f / 64;
  std::vector<double> slopes;
  for (Eigen::Index i = 0; i < count; ++i) {
    const float before = x[i];
    x[i] = before + kStep;
    const double above = value();
    x[i] = before - kStep;
    const double below = value();
    x[i] = before;
    slopes.push_back((above - below) / static_cast<double>(2 * kStep));
  }
  return slopes;
}

void ExpectNear(const std::vector<double>& slopes, const Matrix& gradient, double tolerance,
                const char* what) {
  ASSERT_EQ(slopes.size(), static_cast<size_t>(gradient.size()));
  for (size_t i = 0; i < slopes.size(); ++i) {
    ASSERT_NEAR(slopes[i], static_cast<double>(gradient.data()[i]), tolerance) << what << " " << i;
  }
}

// The sum of an output times fixed random numbers: its gradient by the output is those numbers.
double Dot(const Batch& y, const Batch& dy) {
  return y.values.cast<double>().cwiseProduct(dy.values.cast<double>()).sum();
}

TEST(Layers, DepthwiseGradientsAreItsSlopes) {
  base::NumberGenerator random(1);
  Batch x = RandomBatch(&random, 2, 7, 5);
  Matrix w(3, 5);
  Fill(&random, &w);
  const Batch dy = RandomBatch(&random, 2, 5, 5);
  const ConstMatrixView view(w.data(), 3, 5);
  Batch y;
  const auto value = [&] {
    DepthwiseForward(x, view, &y);
    return Dot(y, dy);
  };
  Matrix dw = Matrix::Ones(3, 5);  // gradients are added to what is there
  Batch dx;
  DepthwiseBackward(x, view, dy, MatrixView(dw.data(), 3, 5), &dx);
  ExpectNear(Slopes(x.values.size(), x.values.data(), value), dx.values, 1e-4, "input");
  ExpectNear(Slopes(w.size(), w.data(), value), dw - Matrix::Ones(3, 5), 1e-4, "weight");
}

TEST(Layers, ConvolutionGradientsAreItsSlopes) {
  for (const int taps : {1, 3}) {
    base::NumberGenerator random(2);
    Batch x = RandomBatch(&random, 3, 6, 4);
    Matrix w(taps * 4, 5);
    Fill(&random, &w);
    const Batch dy = RandomBatch(&random, 3, 6 - taps + 1, 5);
    const ConstMatrixView view(w.data(), w.rows(), w.cols());
    Batch y;
    const auto value = [&] {
      ConvolutionForward(x, view, taps, &y);
      return Dot(y, dy);
    };
    Matrix dw = Matrix::Ones(w.rows(), w.cols());
    Batch dx;
    ConvolutionBackward(x, view, taps, dy, MatrixView(dw.data(), w.rows(), w.cols()), &dx);
    ExpectNear(Slopes(x.values.size(), x.values.data(), value), dx.values, 1e-4, "input");
    ExpectNear(Slopes(w.size(), w.data(), value), dw - Matrix::Ones(w.rows(), w.cols()), 1e-4,
               "weight");
  }
}

TEST(Layers, PoolPassesTheGradientToTheLarger) {
  Batch x;
  x.Resize(1, 5, 2);
  x.values << 1, 4, 2, 4, -3, 0, -5, 1, 9, 9;
  Batch y, dx;
  PoolForward(x, &y);
  Matrix larger(2, 2);
  larger << 2, 4, -3, 1;
  EXPECT_EQ(y.values, larger);
  Batch dy = y;
  dy.values << 10, 20, 30, 40;
  PoolBackward(x, dy, &dx);
  Matrix expected(5, 2);
  expected << 0, 20, 10, 0, 30, 0, 0, 40, 0, 0;
  EXPECT_EQ(dx.values, expected);
}

TEST(Layers, NormalisationGradientsAreItsSlopes) {
  base::NumberGenerator random(3);
  Batch x = RandomBatch(&random, 2, 9, 3);
  Matrix gamma(1, 3), beta(1, 3);
  Fill(&random, &gamma);
  Fill(&random, &beta);
  const ConstMatrixView gammas(gamma.data(), 1, 3), betas(beta.data(), 1, 3);
  const Batch dy = RandomBatch(&random, 2, 9, 3);
  Normalisation normalisation;
  Batch y, dx;
  const auto value = [&] {
    Normalisation().Forward(x, gammas, betas, &y);
    return Dot(y, dy);
  };
  normalisation.Forward(x, gammas, betas, &y);
  EXPECT_NEAR(normalisation.z.values.mean(), 0, 1e-6);
  Matrix dgamma = Matrix::Zero(1, 3), dbeta = Matrix::Zero(1, 3);
  normalisation.Backward(dy, gammas, MatrixView(dgamma.data(), 1, 3),
                         MatrixView(dbeta.data(), 1, 3), &dx);
  ExpectNear(Slopes(x.values.size(), x.values.data(), value), dx.values, 2e-3, "input");
  ExpectNear(Slopes(3, gamma.data(), value), dgamma, 1e-3, "gamma");
  ExpectNear(Slopes(3, beta.data(), value), dbeta, 1e-3, "beta");
}

TEST(Loss, GradientIsItsSlope) {
  base::NumberGenerator random(4);
  Batch logits = RandomBatch(&random, 2, 3, model::kClasses);
  logits.values *= 3;
  Matrix targets = Matrix::Zero(2, model::kClasses);
  targets(0, 1) = targets(1, 4) = 1;
  LossShape shape;
  shape.smoothing = 0.05f;
  shape.positive_weight(1) = 2;
  shape.positive_weight(4) = 3;
  Batch gradient, unused;
  ClipLoss(logits, targets, shape, 2, &gradient);
  ExpectNear(Slopes(logits.values.size(), logits.values.data(),
                    [&] { return ClipLoss(logits, targets, shape, 2, &unused); }),
             gradient.values, 1e-3, "logit");
}

TEST(Loss, DistillationGradientIsItsSlope) {
  base::NumberGenerator random(5);
  Batch logits = RandomBatch(&random, 2, 3, 5);
  const Batch targets = RandomBatch(&random, 2, 3, 5);
  Batch gradient, unused;
  DistillationLoss(logits, targets, 2, &gradient);
  ExpectNear(Slopes(logits.values.size(), logits.values.data(),
                    [&] { return DistillationLoss(logits, targets, 2, &unused); }),
             gradient.values, 1e-3, "logit");
  DistillationLoss(targets, targets, 2, &gradient);
  EXPECT_EQ(gradient.values.cwiseAbs().maxCoeff(), 0);
}

TEST(Loss, SurvivesFarLogits) {
  Batch logits, gradient;
  logits.Resize(1, 2, model::kClasses);
  logits.values.setZero();
  logits.values.leftCols(4) << 900, -900, 900, -900, 900, -900, -900, 900;
  Matrix targets = Matrix::Zero(1, model::kClasses);
  targets(1) = targets(3) = 1;
  const double loss = ClipLoss(logits, targets, LossShape(), 1, &gradient);
  EXPECT_GT(loss, 2600);
  EXPECT_LT(loss, 4000);
  EXPECT_TRUE(gradient.values.allFinite());
}

}  // namespace
}  // namespace qz::train
