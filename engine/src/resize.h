// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// Pictures in another size.
#pragma once

#include <vector>

#include "frame.h"

namespace kyengine {

/// Samples pictures in another size, bilinearly: the corners' pixels are those of the result's corners. Its
/// memory is kept from one use to the next.
class Resizer {
 public:
  /// Fills `to`, of a size of its own, with `from`. Neither is empty, and they are not the same.
  void resize(const GrayImage& from, GrayImage& to);

 private:
  std::vector<int> columns_;    ///< where the left one of a pixel's two columns is
  std::vector<float> ways_;     ///< how far it is on the way to the right one
  std::vector<float> blended_;  ///< a row between two rows
};

/// Halves a picture in both directions: a pixel is the mean of four, rounded to nearest. An odd last row or
/// column is left out. `from` has at least two rows and two columns.
void halve(const GrayImage& from, GrayImage& to);

}  // namespace kyengine
