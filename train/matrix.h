// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <Eigen/Core>

namespace qz::train {

// Rows are time steps, columns channels, as in the network's own tensors.
using Matrix = Eigen::Matrix<float, Eigen::Dynamic, Eigen::Dynamic, Eigen::RowMajor>;
using RowVector = Eigen::Matrix<float, 1, Eigen::Dynamic>;
using MatrixView = Eigen::Map<Matrix>;
using ConstMatrixView = Eigen::Map<const Matrix>;

// Some sequences of the same length, one below the other: values is (sequences x steps) x channels.
struct Batch {
  int sequences = 0;
  Matrix values;

  Eigen::Index steps() const { return values.rows() / sequences; }
  Eigen::Index channels() const { return values.cols(); }
  // Of another shape, contents undefined.
  void Resize(int sequence_count, Eigen::Index step_count, Eigen::Index channel_count) {
    sequences = sequence_count;
    values.resize(sequence_count * step_count, channel_count);
  }
};

}  // namespace qz::train
