// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// The engine's C interface as the tests call it.
#pragma once

#include <gtest/gtest.h>

#include <vector>

#include "engine/ky_engine.h"
#include "kyface_api/kyface_api.h"
#include "tests/support/picture.h"

namespace kyengine::test {

/// A frame's bytes and what is to be said of them.
struct TestFrame {
  std::vector<uint8_t> bytes;
  int format;
  int width;
  int height;
  int stride;
  int orientation;

  explicit TestFrame(const Picture& picture, int pixel_format = KY_PIXEL_GRAY, int turn = KY_ORIENTATION_0,
                     int padding = 0)
      : format(pixel_format), orientation(turn) {
    const Picture turned = Turned(picture, turn);
    width = turned.width;
    height = turned.height;
    stride = RowBytes(format, width) + padding;
    bytes = Encode(turned, format, stride);
  }
};

/// What a call found, released when it goes.
template <void (*release)(ky_face_t*, int)>
class Faces {
 public:
  Faces() = default;
  ~Faces() { release(faces, count); }
  Faces(const Faces&) = delete;
  Faces& operator=(const Faces&) = delete;

  const ky_face_t& operator[](int i) const { return faces[i]; }

  ky_face_t* faces = nullptr;
  int count = 0;
};

/// An object of the engine, created and destroyed by its operations.
template <int (*create)(ky_handle_t*, const char*, int), void (*destroy)(ky_handle_t)>
class Handle {
 public:
  explicit Handle(int config = KY_CONFIG_DEFAULT, const char* model = nullptr) {
    EXPECT_EQ(KY_SUCCESS, create(&handle_, model, config));
  }
  ~Handle() { destroy(handle_); }
  Handle(const Handle&) = delete;
  Handle& operator=(const Handle&) = delete;
  operator ky_handle_t() const { return handle_; }

 private:
  ky_handle_t handle_ = nullptr;
};

using Detector = Handle<ky_face_create_detector, ky_face_destroy_detector>;
using Detected = Faces<ky_face_release_detector_result>;
using Tracker = Handle<ky_face_create_tracker, ky_face_destroy_tracker>;
using Tracked = Faces<ky_face_release_tracker_result>;

inline int Detect(ky_handle_t detector, const TestFrame& f, Detected& faces) {
  return ky_face_detect(detector, f.bytes.data(), f.format, f.width, f.height, f.stride, f.orientation,
                        &faces.faces, &faces.count);
}

inline int Track(ky_handle_t tracker, const TestFrame& f, Tracked& faces) {
  return ky_face_track(tracker, f.bytes.data(), f.format, f.width, f.height, f.stride, f.orientation,
                       &faces.faces, &faces.count);
}

/// A feature, released when it goes.
class Feature {
 public:
  Feature() = default;
  ~Feature() { ky_verify_release_feature(feature); }
  Feature(const Feature&) = delete;
  Feature& operator=(const Feature&) = delete;

  ky_feature_t feature = nullptr;
  int length = 0;
};

inline int GetFeature(ky_handle_t verifier, const TestFrame& f, const ky_face_t& face, Feature& feature) {
  return ky_verify_get_feature(verifier, f.bytes.data(), f.format, f.width, f.height, f.stride, &face,
                               &feature.feature, &feature.length);
}

inline void ExpectRect(const ky_rect_t& expected, const ky_rect_t& rect, int tolerance) {
  EXPECT_NEAR(expected.left, rect.left, tolerance);
  EXPECT_NEAR(expected.top, rect.top, tolerance);
  EXPECT_NEAR(expected.right, rect.right, tolerance);
  EXPECT_NEAR(expected.bottom, rect.bottom, tolerance);
}

}  // namespace kyengine::test
