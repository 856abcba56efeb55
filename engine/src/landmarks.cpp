// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

#include "landmarks.h"

#include <dlib/matrix.h>

#include <algorithm>
#include <array>
#include <cmath>
#include <cstddef>

#include "serialized.h"

namespace kyengine {
namespace {

double degrees(double radians) { return radians * 180 / dlib::pi; }

/// Mean of the `count` points from `first` on.
dlib::dpoint centre(const std::vector<dlib::dpoint>& points, size_t first, size_t count) {
  dlib::dpoint sum(0, 0);
  for (size_t i = first; i < first + count; ++i) {
    sum += points[i];
  }
  return sum / static_cast<double>(count);
}

/// A point of the generic head: x to the viewer's right, y down, z towards the viewer, and its index among
/// the 68.
struct HeadPoint {
  size_t index;
  double x;
  double y;
  double z;
};

// As seen from the front, the mean of the faces that models of 68 points are trained with; in depth, an
// average adult head. The eyes' outer corners are 450 apart.
constexpr std::array<HeadPoint, 5> kHead = {{{30, 0, 0, 0},
                                             {36, -225, -183, -135},
                                             {45, 225, -183, -135},
                                             {48, -144, 162, -125},
                                             {54, 144, 162, -125}}};

}  // namespace

bool findEyes(const std::vector<dlib::dpoint>& points, Eyes* eyes) {
  if (points.size() == 68) {
    *eyes = {centre(points, 36, 6), centre(points, 42, 6)};
  } else if (points.size() == 5) {
    // The corners of the eye on the viewer's right come first.
    *eyes = {centre(points, 2, 2), centre(points, 0, 2)};
  } else {
    return false;
  }
  return dlib::length(eyes->right - eyes->left) > 0;
}

double rollOf(const Eyes& eyes) {
  const dlib::dpoint across = eyes.right - eyes.left;
  return degrees(std::atan2(across.y(), across.x()));
}

bool estimatePose(const std::vector<dlib::dpoint>& points, Pose* pose) {
  if (points.size() != 68) {
    return false;
  }
  // Least squares for the 2 x 3 matrix that maps the head, about its mean, to the picture, about its mean.
  dlib::matrix<double, kHead.size(), 3> head;
  dlib::matrix<double, kHead.size(), 2> seen;
  for (size_t i = 0; i < kHead.size(); ++i) {
    const dlib::dpoint& p = points[kHead[i].index];
    const auto row = static_cast<long>(i);
    head(row, 0) = kHead[i].x;
    head(row, 1) = kHead[i].y;
    head(row, 2) = kHead[i].z;
    seen(row, 0) = p.x();
    seen(row, 1) = p.y();
  }
  const auto aboutMean = [](auto m) {
    for (long c = 0; c < m.nc(); ++c) {
      dlib::set_colm(m, c) = dlib::colm(m, c) - dlib::mean(dlib::colm(m, c));
    }
    return m;
  };
  head = aboutMean(head);
  seen = aboutMean(seen);
  const dlib::matrix<double, 3, 2> map = dlib::inv(dlib::trans(head) * head) * dlib::trans(head) * seen;

  // Its columns are the first two rows of the rotation, scaled and not quite at right angles.
  dlib::vector<double, 3> right(map(0, 0), map(1, 0), map(2, 0));
  dlib::vector<double, 3> down(map(0, 1), map(1, 1), map(2, 1));
  if (!(right.length() > 0) || !(right.cross(down).length() > 0)) {
    return false;
  }
  right = right.normalize();
  down = (down - right * right.dot(down)).normalize();
  const dlib::vector<double, 3> towards = right.cross(down);

  // Where the head's axis towards the viewer points to, seen from the viewer: (right.z, down.z, towards.z).
  *pose = {degrees(std::atan2(right.z(), towards.z())), degrees(std::asin(std::clamp(down.z(), -1.0, 1.0)))};
  return true;
}

LandmarkModel::LandmarkModel(std::istream& in) {
  checkLandmarks(in);
  deserialize(predictor_, in);
}

std::vector<dlib::dpoint> LandmarkModel::locate(const GrayImage& upright, const dlib::drectangle& box) const {
  const dlib::full_object_detection shape = predictor_(upright, dlib::rectangle(box));
  std::vector<dlib::dpoint> points(shape.num_parts());
  for (size_t i = 0; i < points.size(); ++i) {
    points[i] = shape.part(i);
  }
  return points;
}

void describe(const LandmarkModel* model, const GrayImage& upright, const dlib::drectangle& box,
              const Frame& frame, ky_face_t* face) {
  face->points_count = 0;
  face->yaw = face->pitch = face->roll = face->eye_dist = 0;
  if (model == nullptr) {
    return;
  }
  const std::vector<dlib::dpoint> points = model->locate(upright, box);
  face->points_count = static_cast<int32_t>(points.size());
  for (size_t i = 0; i < points.size(); ++i) {
    face->points_array[i] = frame.toFrame(points[i]);
  }
  if (Eyes eyes; findEyes(points, &eyes)) {
    face->eye_dist = static_cast<float>(dlib::length(eyes.right - eyes.left));
    face->roll = static_cast<float>(rollOf(eyes));
  }
  if (Pose pose; estimatePose(points, &pose)) {
    face->yaw = static_cast<float>(pose.yaw);
    face->pitch = static_cast<float>(pose.pitch);
  }
}

}  // namespace kyengine
