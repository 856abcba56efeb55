// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// Histograms of oriented gradients, the features that faces are searched in.
///
/// A picture is divided into square cells. Each pixel votes with the length of its gradient for the direction
/// that this has, one of 18, in the four cells around it, by how close their centres are. A cell of the
/// result has 31 features: its 18 votes, the 9 of directions without their sign, both limited and averaged
/// over the four blocks of two by two cells that hold the cell, each with that block's energy as its measure;
/// and how much the cell contributes to each of the four (P. Felzenszwalb et al., "Object Detection with
/// Discriminatively Trained Part-Based Models", 2010). They are those of dlib's `extract_fhog_features`, on
/// whose detectors they are meant to be used, up to rounding.
#pragma once

#include <cstddef>
#include <cstdint>
#include <vector>

#include "frame.h"

namespace kyengine {

constexpr int kDirections = 18;
constexpr int kFeatures = 31;

/// Sizes of cells that are supported, in pixels.
constexpr int kSmallestCell = 2;
constexpr int kLargestCell = 64;

/// Direction and length of the gradients of a row's pixels from `first` to `last - 1`, written to the same
/// places. The gradient of a pixel is the difference of its neighbours, to the right minus to the left and
/// `below` minus `above`, so that `first` is at least 1 and the rows have a pixel `last`. Directions are
/// numbered in steps of 20 degrees from 0, to the right, over 4.5, downwards; what lies in the middle of two
/// goes to the one nearer to 0 or 9. Of no gradient the length is 0 and the direction any.
void findGradients(const uint8_t* above, const uint8_t* row, const uint8_t* below, int first, int last,
                   uint8_t* directions, float* lengths);

/// The features of some rows of cells of a picture, one plane for each, with a margin of zeros around. Its
/// memory is kept from one use to the next.
class FeatureMap {
 public:
  /// Cells in the result for a picture of `pixels` in that direction: those that have neighbours on all
  /// sides. Not positive when there are none.
  static int cellsOf(int pixels, int cell) {
    // NOLINTNEXTLINE(bugprone-incorrect-roundings): as dlib counts them
    return static_cast<int>(static_cast<float>(pixels) / static_cast<float>(cell) + 0.5F) - 2;
  }

  /// Computes the rows of cells from `first` to `first + rows - 1` of the picture. Rows outside of it are
  /// zero, as are `left` columns before and at least `right` columns behind its cells.
  void computeCells(const GrayImage& picture, int cell, int first, int rows, int left, int right);

  /// A row of a feature's plane, from the margin on.
  const float* row(int feature, int row) const {
    return &features_[(static_cast<size_t>(feature) * static_cast<size_t>(rows_) + static_cast<size_t>(row)) *
                      static_cast<size_t>(stride_)];
  }

  /// Numbers from one row to the next.
  int stride() const { return stride_; }

 private:
  /// The numbers of a cell's histogram, filled up to whole vectors.
  static constexpr int kSlots = 20;

  void vote(const GrayImage& picture, int cell, int first, int rows);
  void normalise(int rows);
  void describe(int firstRow, int rows, int left);
  float* histogram(int row, int column) {
    return &votes_[(static_cast<size_t>(row) * static_cast<size_t>(columns_ + 2) +
                    static_cast<size_t>(column)) *
                   kSlots];
  }

  int columns_ = 0;  ///< cells across the picture, those at its border too
  int rows_ = 0;
  int stride_ = 0;
  std::vector<float> features_;
  std::vector<float> votes_;  ///< histograms of cells, with a row and a column more on each side
  std::vector<float> energies_;
  std::vector<float> limits_;   ///< of a block: what a vote counts at most,
  std::vector<float> factors_;  ///< and by how much it is multiplied
  std::vector<float> described_;
  std::vector<float> weights_;
  std::vector<uint8_t> directions_;
  std::vector<float> lengths_;
};

}  // namespace kyengine
