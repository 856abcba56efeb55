// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// The open engine's C interface with any scalars, over images that hold what valid ones describe: an invalid
// call fails with a code and touches nothing, a valid one stays inside its image.

#include <algorithm>
#include <cmath>

#include "engine/ky_engine.h"
#include "fuzz_input.h"
#include "kyface_api/kyface_api.h"
#include "tests/support/guarded_image.h"

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

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  if (detector == nullptr) {
    FUZZ_CHECK(ky_face_create_detector(&detector, nullptr, KY_CONFIG_LARGE_FACES) == 0);
    FUZZ_CHECK(ky_face_create_tracker(&tracker, nullptr, KY_CONFIG_LARGE_FACES) == 0);
    FUZZ_CHECK(ky_verify_create_handle(&verifier, nullptr) == 0);
  }
  Input input(data, size);
  const uint8_t operation = input.byte();
  const Image image = someImage(input);
  const bool valid = image.isValid();
  if (valid && image.rows() * image.stride > 1 << 18) {
    return 0;
  }
  GuardedImage<unsigned char> pixels(valid ? static_cast<int>(image.rows()) : 0,
                                     valid ? image.width * image.bytesPerPixel() : 0,
                                     valid ? image.stride : 0);
  pixels.fill([&] { return input.pixel(); });

  ky_face_t* faces = nullptr;
  int count = 0;
  const auto checked = [&](int result) {
    FUZZ_CHECK((result == 0) == (valid && image.isTurnValid()));
    FUZZ_CHECK(count >= 0 && (count == 0) == (faces == nullptr));
    checkFaces(faces, count, image);
  };
  switch (operation % 8) {
    case 0:
      checked(ky_face_detect(detector, pixels.data(), image.format, image.width, image.height, image.stride,
                             image.orientation, &faces, &count));
      ky_face_release_detector_result(faces, count);
      break;
    case 1:
    case 2:
      checked(ky_face_track(tracker, pixels.data(), image.format, image.width, image.height, image.stride,
                            image.orientation, &faces, &count));
      ky_face_release_tracker_result(faces, count);
      break;
    case 3: {
      ky_face_t face{};
      face.rect = {input.in(-40, 140), input.in(-40, 140), input.in(-40, 140), input.in(-40, 140)};
      if (input.seldom(4)) {
        face.rect.right = input.any();
        face.rect.top = input.any();
      }
      face.points_count = input.seldom(4) ? input.any() : input.in(0, 4);
      face.roll = input.anyFloat();
      face.eye_dist = input.seldom(4) ? input.anyFloat() : static_cast<float>(input.in(-3, 100));
      for (ky_pointf_t& point : face.points_array) {
        point = {static_cast<float>(input.pixel()), static_cast<float>(input.pixel())};
      }
      if (input.seldom(4)) {
        face.points_array[input.in(0, 3)].x = input.anyFloat();
      }
      ky_feature_t feature = nullptr;
      int length = 0;
      const int result = ky_verify_get_feature(verifier, pixels.data(), image.format, image.width,
                                               image.height, image.stride, &face, &feature, &length);
      FUZZ_CHECK(valid || result != 0);
      FUZZ_CHECK((result == 0) == (feature != nullptr));
      if (result == 0) {
        float score = -1;
        FUZZ_CHECK(ky_verify_compare_feature(verifier, feature, feature, &score) == 0 && score >= 0 &&
                   score <= 1);
        ky_verify_release_feature(feature);
      }
      break;
    }
    case 4: {
      int previous = 0;
      const int value = input.any();
      ky_face_track_set_detect_interval(tracker, value, &previous);
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
      const ky_handle_t wrong = input.seldom(2) ? static_cast<ky_handle_t>(&faces) : tracker;
      FUZZ_CHECK(ky_face_detect(wrong, pixels.data(), image.format, image.width, image.height, image.stride,
                                image.orientation, &faces, &count) != 0);
      FUZZ_CHECK(faces == nullptr && count == 0);
      break;
    }
  }
  return 0;
}
