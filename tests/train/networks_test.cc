// SPDX-License-Identifier: Apache-2.0
// The two networks as wholes: gradients, the folding between them, and the device's arithmetic.

#include <gtest/gtest.h>

#include <cmath>

#include "base/number_generator.h"
#include "model/check_weights.h"
#include "model/packing.h"
#include "model/reference_network.h"
#include "model/synthetic_features.h"
#include "model/synthetic_model.h"
#include "train/equivalence.h"
#include "train/float_network.h"
#include "train/quantised_network.h"

namespace qz::train {
namespace {

constexpr int kRows = model::kInputRows;
constexpr int kFrames = kRows + static_cast<int>(config::kFramesBetweenRuns);  // two windows

Batch SyntheticFeatures(int sequences, uint64_t seed) {
  Batch features;
  features.Resize(sequences, kFrames, model::kInputChannels);
  for (int s = 0; s < sequences; ++s) {
    const model::Tensor first = model::SyntheticWindow(seed + static_cast<uint64_t>(2 * s));
    const model::Tensor second = model::SyntheticWindow(seed + static_cast<uint64_t>(2 * s + 1));
    for (int row = 0; row < kFrames; ++row) {
      const int8_t* const from = row < kRows ? first.Row(row) : second.Row(row - kRows);
      for (int c = 0; c < model::kInputChannels; ++c) {
        features.values(s * kFrames + row, c) = static_cast<float>(from[c] + 128);
      }
    }
  }
  return features;
}

// Parameters with normalisations that have seen some features.
Values SettledParameters(const Batch& features) {
  Values parameters = InitialParameters(7);
  FloatNetwork network;
  const TrainingNoise no_noise;
  network.Forward(parameters, features, &no_noise);
  network.MoveRunning(1, &parameters);
  return parameters;
}

Batch RandomGradient(const Batch& logits) {
  base::NumberGenerator random(9);
  Batch gradient = logits;
  for (Eigen::Index i = 0; i < gradient.values.size(); ++i) {
    gradient.values.data()[i] = static_cast<float>(random.Uniform(-1, 1));
  }
  return gradient;
}

double Dot(const Matrix& a, const Matrix& b) {
  return a.cast<double>().cwiseProduct(b.cast<double>()).sum();
}

double Similarity(const Matrix& a, const Matrix& b) {
  return Dot(a, b) / std::sqrt(Dot(a, a) * Dot(b, b) + 1e-30);
}

// A step along a layer's gradient changes the loss by the gradient's square, for small steps; a
// gradient that is incorrect anywhere on the way does not.
TEST(FloatNetwork, GradientOfEveryLayerIsItsSlope) {
  const Batch features = SyntheticFeatures(2, 100);
  const TrainingNoise noise{0.25f, 3};  // what is dropped follows from the seed
  Values parameters = SettledParameters(features);
  FloatNetwork network;
  const Batch dlogits = RandomGradient(network.Forward(parameters, features, &noise));
  Values gradient(kParameters.trained);
  network.Backward(parameters, dlogits, &gradient);
  const auto loss_at = [&](const MatrixView& direction, MatrixView values, float step) {
    values += step * direction;
    const double loss = Dot(network.Forward(parameters, features, &noise).values, dlogits.values);
    values -= step * direction;
    return loss;
  };
  for (size_t i = 0; i < kLayers; ++i) {
    MatrixView direction = WeightOf(gradient, i);
    const double square = Dot(direction, direction);
    ASSERT_GT(square, 0) << "layer " << i;
    const float step = static_cast<float>(1e-3 / std::sqrt(square));
    const double slope = (loss_at(direction, WeightOf(parameters, i), step) -
                          loss_at(direction, WeightOf(parameters, i), -step)) /
                         static_cast<double>(2 * step);
    EXPECT_NEAR(slope / square, 1, 0.05) << "layer " << i;
  }
}

TEST(FloatNetwork, FoldingKeepsTheResult) {
  const Batch features = SyntheticFeatures(3, 200);
  Values parameters = SettledParameters(features);
  FloatNetwork network;
  const TrainingNoise no_noise;
  const Matrix normalised = network.Forward(parameters, features, &no_noise).values;
  FoldNormalisations(&parameters);
  const Matrix folded = network.Forward(parameters, features, nullptr).values;
  EXPECT_LT((normalised - folded).cwiseAbs().maxCoeff(), 2e-3f);
  EXPECT_GT(normalised.cwiseAbs().maxCoeff(), 0.1f) << "nothing was compared";
}

// Over the same weights, already rounded, both networks are the same but for the rounding of
// tensors: outputs and gradients agree but for noise.
TEST(QuantisedNetwork, FollowsTheFloatNetworkForwardsAndBackwards) {
  const Batch features = SyntheticFeatures(4, 300);
  Values parameters = SettledParameters(features);
  FoldNormalisations(&parameters);
  ClampWeights(&parameters);
  const QuantisedParameters quantised(parameters);
  for (size_t i = 0; i < kLayers; ++i) {
    WeightOf(parameters, i) =
        WeightOf(quantised.integers, i).array().rowwise() * quantised.weight_step[i].array();
  }
  FloatNetwork over_float;
  QuantisedNetwork device;
  const Batch logits = over_float.Forward(parameters, features, nullptr);
  const Batch steps = device.Forward(quantised, features);
  EXPECT_GT(Similarity(logits.values, steps.values), 0.9);

  const Batch dlogits = RandomGradient(logits);
  Values by_float(kParameters.trained), by_device(kParameters.trained);
  over_float.Backward(parameters, dlogits, &by_float);
  device.Backward(quantised, dlogits, &by_device);
  const auto expect_alike = [](const Matrix& expected, const Matrix& got, size_t layer) {
    EXPECT_GT(Similarity(expected, got), 0.5) << "layer " << layer;
    EXPECT_NEAR(got.norm() / expected.norm(), 1, 0.5) << "layer " << layer;
  };
  for (size_t i = 0; i < kLayers; ++i) {
    expect_alike(WeightOf(by_float, i), WeightOf(by_device, i), i);
    if (kPlan[i].depthwise()) continue;
    const size_t bias = kParameters.layers[i].bias;
    expect_alike(RowAt(by_float, i, bias), RowAt(by_device, i, bias), i);
  }
}

std::vector<Batch> SomeFeatures() { return {SyntheticFeatures(1, 400), SyntheticFeatures(1, 500)}; }

TEST(EquivalenceCheck, HoldsForTrainedAndForeignModels) {
  Values parameters = SettledParameters(SyntheticFeatures(2, 100));
  FoldNormalisations(&parameters);
  const QuantisedParameters trained(parameters);
  const model::PackedModel packed = model::Pack(ArraysOf(trained));
  EXPECT_TRUE(model::CheckWeights(packed).empty());
  const model::PackedModel foreign = model::MakeSyntheticModel(1);
  for (const EquivalenceCheck& check :
       {Prove(trained, packed, SomeFeatures()),
        Prove(ParametersOf(model::Unpack(foreign)), foreign, SomeFeatures())}) {
    EXPECT_EQ(check.difference, "");
    EXPECT_EQ(check.trainer_digest, check.module_digest);
    EXPECT_EQ(check.runs, 4u);
    EXPECT_GT(check.bytes, 4u * 70000);
  }
}

TEST(EquivalenceCheck, NamesTheFirstDifference) {
  const model::PackedModel model = model::MakeSyntheticModel(1);
  const QuantisedParameters parameters = ParametersOf(model::Unpack(model));
  model::PackedModel other = model;
  const size_t bias = model::FindTable(8)->BiasOffset(13);
  model::Store<int32_t>(other, bias, model::Load<int32_t>(other, bias) + 40000);
  const EquivalenceCheck check = Prove(parameters, other, SomeFeatures());
  EXPECT_NE(check.trainer_digest, check.module_digest);
  EXPECT_EQ(check.difference.rfind("run 0, operator 8, row ", 0), 0u) << check.difference;
  EXPECT_NE(check.difference.find(", channel 13: the trainer's is "), std::string::npos)
      << check.difference;
}

}  // namespace
}  // namespace qz::train
