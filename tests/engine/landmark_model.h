// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// Landmark models as files of dlib's.
#pragma once

#include "engine/src/dlib_config.h"
// The configuration of dlib comes first.
#include <dlib/image_processing/shape_predictor.h>

#include <sstream>
#include <string>
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

/// Points of a model of five: the eyes' centres at the given places.
inline std::vector<ky_pointf_t> FivePoints(ky_pointf_t left, ky_pointf_t right) {
  return {{right.x + 0.08F, right.y},
          {right.x - 0.08F, right.y},
          {left.x - 0.08F, left.y},
          {left.x + 0.08F, left.y},
          {0.5F, 0.6F}};
}

}  // namespace kyengine::test
