// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// Landmark points of a face, and what they say about its pose.
#pragma once

#include "frame.h"
// The configuration above comes first.
#include <dlib/image_processing/shape_predictor.h>

#include <istream>
#include <memory>
#include <vector>

namespace kyengine {

/// The centres of the two eyes, the one on the viewer's left first.
struct Eyes {
  dlib::dpoint left;
  dlib::dpoint right;
};

/// Where a head looks, in degrees; the signs are those of `ky_engine.h`.
struct Pose {
  double yaw;
  double pitch;
};

/// Finds the eyes among the points of a model of 68 or of 5; false for any other number of points, and when
/// both eyes are in one place.
bool findEyes(const std::vector<dlib::dpoint>& points, Eyes* eyes);

/// The roll of the line through the eyes, in degrees.
double rollOf(const Eyes& eyes);

/// Estimates the pose from 68 points: the turn that brings a generic head's eye corners, mouth corners, nose
/// tip and chin closest to where they are seen, at a distance that makes perspective negligible. False for
/// any other number of points and for points that no head shows.
bool estimatePose(const std::vector<dlib::dpoint>& points, Pose* pose);

/// A landmark model; immutable and shared by the handles that were created from one file.
class LandmarkModel {
 public:
  /// Reads a model serialized by dlib; throws when there is none, one whose parts do not agree, or one of
  /// more than KY_FACE_MAX_POINTS points.
  explicit LandmarkModel(std::istream& in);

  /// The points of the face in `box` of the upright picture.
  std::vector<dlib::dpoint> locate(const GrayImage& upright, const dlib::drectangle& box) const;

 private:
  dlib::shape_predictor predictor_;
};

/// Fills the landmark points and the pose of `face`. What the model cannot tell is 0, as is all of it without
/// a model.
void describe(const LandmarkModel* model, const GrayImage& upright, const dlib::drectangle& box,
              const Frame& frame, ky_face_t* face);

}  // namespace kyengine
