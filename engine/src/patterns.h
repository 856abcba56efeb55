// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// What uniform local binary patterns say about a face.
#pragma once

#include <array>
#include <cstdint>
#include <span>

#include "frame.h"

namespace kyengine {

/// Where a face lies in a picture: a square, turned clockwise about its centre.
struct FaceCrop {
  dlib::dpoint centre;
  double side;
  double angle;  ///< in radians
};

/// Histograms of the patterns in 8 x 8 cells, 59 bins each.
constexpr int kPatternBytes = 64 * 59;
using Patterns = std::array<uint8_t, kPatternBytes>;

/// Describes what the crop shows. What lies outside the picture counts as black.
Patterns patternsOf(const GrayImage& picture, const FaceCrop& crop);

/// How alike two faces are, from 0 to 1; symmetric, and 1 for patterns and themselves.
float similarity(std::span<const uint8_t, kPatternBytes> a, std::span<const uint8_t, kPatternBytes> b);

}  // namespace kyengine
