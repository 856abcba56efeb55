// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// The open engine's C interface with any scalars, over images that hold what valid ones describe: an invalid
// call fails with a code and touches nothing, a valid one stays inside its image. Noise has no face; so that
// there is something to follow and to compare, some images show one.

#include <algorithm>
#include <cmath>
#include <cstring>
#include <vector>

#include "engine/ky_engine.h"
#include "fuzz_input.h"
#include "kyface_api/kyface_api.h"
#include "tests/support/guarded_image.h"
#include "tests/support/picture.h"

namespace {

using kyface::fuzz::Input;
using kyface::fuzz::wrap;
using kyface::test::GuardedImage;

struct Image {
  int format, width, height, stride, orientation;

  bool isPairs() const { return format == KY_PIXEL_NV21 || format == KY_PIXEL_NV12; }

  int bytesPerPixel() const {
    return format == KY_PIXEL_BGR || format == KY_PIXEL_RGB     ? 3
           : format == KY_PIXEL_BGRA || format == KY_PIXEL_RGBA ? 4
                                                                : 1;
  }

  bool isValid() const {
    const auto side = [this](int s) {
      return s >= 1 && s <= KY_MAX_FRAME_SIDE && (!isPairs() || s % 2 == 0);
    };
    return format >= KY_PIXEL_GRAY && format <= KY_PIXEL_NV12 && side(width) && side(height) &&
           stride >= int64_t{width} * bytesPerPixel();
  }

  bool isTurnValid() const { return orientation >= 0 && orientation <= 270 && orientation % 90 == 0; }

  int64_t rows() const { return isPairs() ? int64_t{height} * 3 / 2 : height; }
};

Image someImage(Input& input) {
  const auto scalar = [&](int low, int high) { return input.seldom(6) ? input.any() : input.in(low, high); };
  Image image{};
  image.format = scalar(-1, 7);
  image.width = scalar(0, 130);
  image.height = scalar(0, 130);
  image.stride =
      input.seldom(6) ? input.any() : wrap(int64_t{image.width} * image.bytesPerPixel() + input.in(0, 4));
  image.orientation = wrap(int64_t{scalar(0, 3)} * 90);
  return image;
}

/// A square of a size to show the portrait's face in.
Image someSquare(Input& input) {
  Image image{};
  image.format = input.in(KY_PIXEL_GRAY, KY_PIXEL_NV12);
  image.width = 2 * input.in(44, 70);
  image.height = image.width;
  image.stride = image.width * image.bytesPerPixel() + input.in(0, 4);
  image.orientation = 90 * input.in(0, 3);
  return image;
}

/// The face, whole or in part, more or less upright, and from 60 to 120 pixels large.
std::vector<uint8_t> someFace(Input& input, const Image& image) {
  using namespace kyengine::test;
  const double x = 222 + input.in(-40, 40);
  const double y = 127 + input.in(-40, 40);
  const double zoom = input.in(70, 140) / 100.0;
  const double roll = input.in(-12, 12);
  return Encode(Turned(View(Portrait(), x, y, zoom, roll, image.width), image.orientation), image.format,
                image.stride);
}

void checkFaces(const ky_face_t* faces, int count, const Image& image) {
  for (int i = 0; i < count; ++i) {
    const ky_rect_t& rect = faces[i].rect;
    FUZZ_CHECK(rect.left >= 0 && rect.left <= rect.right && rect.right <= image.width);
    FUZZ_CHECK(rect.top >= 0 && rect.top <= rect.bottom && rect.bottom <= image.height);
    FUZZ_CHECK(faces[i].points_count >= 0 && faces[i].points_count <= KY_FACE_MAX_POINTS);
    FUZZ_CHECK(i == 0 || std::isfinite(faces[i].score));
  }
}

// Objects live for the whole run: creating them is what takes time.
ky_handle_t detector;
ky_handle_t tracker;
ky_handle_t verifier;

void begin() {
  if (detector == nullptr) {
    FUZZ_CHECK(ky_face_create_detector(&detector, nullptr, KY_CONFIG_LARGE_FACES) == 0);
    FUZZ_CHECK(ky_face_create_tracker(&tracker, nullptr, KY_CONFIG_LARGE_FACES) == 0);
    FUZZ_CHECK(ky_verify_create_handle(&verifier, nullptr) == 0);
  }
  // What one input does is not to depend on those before it.
  FUZZ_CHECK(ky_face_detect_set_threshold(detector, KY_DEFAULT_THRESHOLD) == 0);
  ky_face_reset_tracker(tracker);
  FUZZ_CHECK(ky_face_track_set_detect_interval(tracker, KY_DEFAULT_DETECT_INTERVAL, nullptr) == 0);
  FUZZ_CHECK(ky_face_track_set_detect_face_cnt_limit(tracker, KY_DEFAULT_FACE_LIMIT, nullptr) == 0);
  FUZZ_CHECK(ky_face_track_set_alignment_threshold(tracker, KY_DEFAULT_ALIGNMENT_THRESHOLD, nullptr) == 0);
}

/// An image in memory, and the last face that was found in one like it.
struct Scene {
  Image image;
  bool valid;
  GuardedImage<unsigned char> pixels;
  ky_face_t face;
};

using Search = int (*)(ky_handle_t, const unsigned char*, int, int, int, int, int, ky_face_t**, int*);

void search(Search find, ky_handle_t handle, void (*release)(ky_face_t*, int), Scene& scene) {
  const Image& image = scene.image;
  ky_face_t* faces = nullptr;
  int count = 0;
  const int result = find(handle, scene.pixels.data(), image.format, image.width, image.height, image.stride,
                          image.orientation, &faces, &count);
  FUZZ_CHECK((result == 0) == (scene.valid && image.isTurnValid()));
  FUZZ_CHECK(count >= 0 && (count == 0) == (faces == nullptr));
  checkFaces(faces, count, image);
  if (count > 0) {
    scene.face = faces[0];
  }
  release(faces, count);
}

/// Any record of a face.
ky_face_t someRecord(Input& input) {
  ky_face_t face{};
  face.rect = {input.in(-40, 140), input.in(-40, 140), input.in(-40, 140), input.in(-40, 140)};
  if (input.seldom(4)) {
    face.rect.right = input.any();
    face.rect.top = input.any();
  }
  face.points_count = input.seldom(4) ? input.any() : input.in(0, 6);
  face.roll = input.anyFloat();
  face.eye_dist = input.seldom(4) ? input.anyFloat() : static_cast<float>(input.in(-3, 100));
  for (int i = 0; i < 6; ++i) {
    face.points_array[i] = {static_cast<float>(input.in(0, 130)), static_cast<float>(input.in(0, 130))};
  }
  if (input.seldom(4)) {
    face.points_array[input.in(0, 3)].x = input.anyFloat();
  }
  return face;
}

void extract(Input& input, const Scene& scene) {
  const Image& image = scene.image;
  const ky_face_t face = input.seldom(2) ? scene.face : someRecord(input);
  ky_feature_t feature = nullptr;
  int length = 0;
  const int result = ky_verify_get_feature(verifier, scene.pixels.data(), image.format, image.width,
                                           image.height, image.stride, &face, &feature, &length);
  FUZZ_CHECK(scene.valid || result != 0);
  FUZZ_CHECK((result == 0) == (feature != nullptr));
  if (result != 0) {
    return;
  }
  FUZZ_CHECK(length == ky_verify_get_feature_length(verifier));
  std::vector<char> text(static_cast<size_t>((length + 2) / 3 * 4 + 1));
  ky_verify_serialize_feature(feature, text.data());
  FUZZ_CHECK(std::memchr(text.data(), 0, text.size()) != nullptr);
  const ky_feature_t again = ky_verify_deserialize_feature(text.data());
  float score = -1;
  FUZZ_CHECK(ky_verify_compare_feature(verifier, feature, again, &score) == 0 && score == 1);
  ky_verify_release_feature(again);
  ky_verify_release_feature(feature);
}

void step(Input& input, Scene& scene) {
  switch (input.byte() % 8) {
    case 0:
      search(ky_face_detect, detector, ky_face_release_detector_result, scene);
      break;
    case 1:
    case 2:
      search(ky_face_track, tracker, ky_face_release_tracker_result, scene);
      break;
    case 3:
      extract(input, scene);
      break;
    case 4: {
      int previous = 0;
      ky_face_track_set_detect_interval(tracker, input.any(), &previous);
      ky_face_track_set_detect_face_cnt_limit(tracker, input.any(), nullptr);
      ky_face_track_set_alignment_threshold(tracker, input.any(), &previous);
      break;
    }
    case 5:
      ky_face_reset_tracker(tracker);
      break;
    case 6: {
      float threshold = 0;
      ky_face_detect_set_threshold(
          detector, input.seldom(3) ? input.anyFloat() : static_cast<float>(input.any()) / 128);
      FUZZ_CHECK(ky_face_detect_get_threshold(detector, &threshold) == 0);
      FUZZ_CHECK(threshold >= KY_MIN_THRESHOLD && threshold <= KY_MAX_THRESHOLD);
      break;
    }
    default: {
      // What is no handle of that kind is refused without a look at what it points to.
      const Image& image = scene.image;
      ky_face_t* faces = nullptr;
      int count = 0;
      const ky_handle_t wrong = input.seldom(2) ? static_cast<ky_handle_t>(&faces) : tracker;
      FUZZ_CHECK(ky_face_detect(wrong, scene.pixels.data(), image.format, image.width, image.height,
                                image.stride, image.orientation, &faces, &count) != 0);
      FUZZ_CHECK(faces == nullptr && count == 0);
      break;
    }
  }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  begin();
  // Noise takes all bytes that there are: what is decided comes out of the first.
  constexpr size_t kDecisions = 160;
  Input input(data, std::min(size, kDecisions));
  Input noise(data + std::min(size, kDecisions), size - std::min(size, kDecisions));

  const bool showsFace = input.seldom(2);
  const Image image = showsFace ? someSquare(input) : someImage(input);
  const bool valid = image.isValid();
  if (valid && image.rows() * image.stride > 1 << 18) {
    return 0;
  }
  Scene scene{
      image, valid,
      GuardedImage<unsigned char>(valid ? static_cast<int>(image.rows()) : 0,
                                  valid ? image.width * image.bytesPerPixel() : 0, valid ? image.stride : 0),
      ky_face_t{}};
  scene.pixels.fill([&] { return noise.pixel(); });
  for (int steps = input.in(1, 6); steps > 0; --steps) {
    if (showsFace && !input.seldom(4)) {
      const std::vector<uint8_t> frame = someFace(input, image);
      std::copy(frame.begin(), frame.end(), scene.pixels.data());
    }
    step(input, scene);
  }
  return 0;
}
