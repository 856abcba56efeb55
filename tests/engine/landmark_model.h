// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// Landmark models as files of dlib's.
#pragma once

#include "engine/src/dlib_config.h"
// The configuration of dlib comes first.
#include <dlib/image_processing/shape_predictor.h>

#include <algorithm>
#include <sstream>
#include <string>
#include <utility>
#include <vector>

#include "kyface_api/kyface_api.h"

namespace kyengine::test {

/// A landmark model that puts its points at the same places of every box, given from 0 to 1 in both
/// directions.
inline std::string Landmarks(const std::vector<ky_pointf_t>& points) {
  dlib::matrix<float, 0, 1> shape(static_cast<long>(2 * points.size()));
  for (size_t i = 0; i < points.size(); ++i) {
    shape(static_cast<long>(2 * i)) = points[i].x;
    shape(static_cast<long>(2 * i + 1)) = points[i].y;
  }
  std::ostringstream out;
  serialize(dlib::shape_predictor(shape, {}, {}), out);
  return out.str();
}

/// A landmark model part by part, as dlib writes them, so that parts can be made that do not fit one another:
/// one cascade of one tree.
struct LandmarkParts {
  std::vector<float> shape = {0.3F, 0.3F, 0.7F, 0.3F};
  std::vector<std::pair<unsigned long, unsigned long>> splits = {{0, 1}};  ///< the pixels of each
  std::vector<std::vector<float>> leaves = {{0, 0, 0, 0}, {0.1F, 0, 0.1F, 0}};
  std::vector<unsigned long> anchors = {0, 1};
  std::vector<ky_pointf_t> deltas = {{0.1F, 0.1F}, {-0.1F, 0.1F}};
  unsigned long anchor_lists = 1;  ///< how many there are said to be

  std::string Bytes() const {
    std::ostringstream out;
    const auto natural = [&](unsigned long number) { dlib::serialize(number, out); };
    const auto column = [&](const std::vector<float>& numbers) {
      dlib::matrix<float, 0, 1> matrix(static_cast<long>(numbers.size()));
      std::copy(numbers.begin(), numbers.end(), matrix.begin());
      dlib::serialize(matrix, out);
    };
    dlib::serialize(1, out);
    column(shape);
    natural(1);
    natural(1);
    natural(splits.size());
    for (const auto& [a, b] : splits) {
      natural(a);
      natural(b);
      dlib::serialize(20.0F, out);
    }
    natural(leaves.size());
    for (const auto& leaf : leaves) {
      column(leaf);
    }
    natural(anchor_lists);
    dlib::serialize(anchors, out);
    natural(1);
    natural(deltas.size());
    for (const ky_pointf_t& delta : deltas) {
      dlib::serialize(delta.x, out);
      dlib::serialize(delta.y, out);
    }
    return out.str();
  }
};

/// Points of a model of five: the eyes' centres at the given places.
inline std::vector<ky_pointf_t> FivePoints(ky_pointf_t left, ky_pointf_t right) {
  return {{right.x + 0.08F, right.y},
          {right.x - 0.08F, right.y},
          {left.x - 0.08F, left.y},
          {left.x + 0.08F, left.y},
          {0.5F, 0.6F}};
}

}  // namespace kyengine::test
