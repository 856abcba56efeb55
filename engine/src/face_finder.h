// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// The search for faces in an upright picture, which detector and tracker share.
#pragma once

#include <vector>

#include "model.h"

namespace kyengine {

/// A face that was found. Where it lies may reach beyond the picture's border.
struct FoundFace {
  dlib::drectangle box;  ///< in the upright picture
  float score;           ///< as `ky_engine.h` defines it
};

/// What frames are searched for: pictures that come one by one, or a camera's that must be followed.
enum class Use { kStills, kVideo };

/// A model and the way it is applied. Not for several threads at once: the search works in buffers of its
/// own.
class FaceFinder {
 public:
  /// Throws Failure when `model_path` or `config` is not one that `ky_engine.h` lists.
  FaceFinder(const char* modelPath, int config, Use use);

  /// Finds faces with a score of at least `threshold`, the best first.
  std::vector<FoundFace> find(const GrayImage& upright, float threshold);

  /// Whether a picture of this size has room for a face at all. Finding none in one that has not costs
  /// nothing.
  bool hasRoom(int width, int height) const;

  /// The record of a face, with its landmarks and without an identity.
  ky_face_t record(const GrayImage& upright, const FoundFace& face, const Frame& frame) const;

 private:
  FaceFinder(Model model, int config, Use use);
  double scaleFor(int width, int height) const;

  int config_;
  Use use_;
  std::shared_ptr<const LandmarkModel> landmarks_;
  Scanner scanner_;
  Resizer resizer_;
  GrayImage halved_;
  GrayImage searched_;
};

}  // namespace kyengine
