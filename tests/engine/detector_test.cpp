// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// The detector: what it finds in which frames, and how it refuses what it cannot take.
#include <algorithm>
#include <limits>
#include <map>
#include <string>
#include <thread>
#include <tuple>
#include <utility>
#include <vector>

#include "engine_calls.h"
#include "tests/support/guarded_image.h"

namespace kyengine::test {
namespace {

/// The part of the portrait about its face, and where the face is in it.
constexpr int kLeft = 160;
constexpr int kTop = 60;
constexpr int kSide = 128;
constexpr ky_rect_t kFace = {kPortraitFace.left - kLeft, kPortraitFace.top - kTop,
                             kPortraitFace.right - kLeft, kPortraitFace.bottom - kTop};
const Picture& AboutFace() {
  static const Picture part = Part(Portrait(), kLeft, kTop, kSide, kSide);
  return part;
}

TEST(DetectorTest, FindsThePortraitsFace) {
  const Detector detector;
  Detected faces;
  ASSERT_EQ(KY_SUCCESS, Detect(detector, TestFrame(Portrait(), KY_PIXEL_RGB), faces));
  ASSERT_EQ(1, faces.count);
  EXPECT_GE(Overlap(kPortraitFace, faces[0].rect), 0.7);
  EXPECT_GT(faces[0].score, 0.7F);
  EXPECT_LT(faces[0].score, 1.0F);
}

TEST(DetectorTest, FaceWithoutLandmarksClaimsNone) {
  const Detector detector(KY_CONFIG_LARGE_FACES);
  Detected faces;
  ASSERT_EQ(KY_SUCCESS, Detect(detector, TestFrame(AboutFace()), faces));
  ASSERT_EQ(1, faces.count);
  EXPECT_EQ(0, faces[0].points_count);
  EXPECT_EQ(0, faces[0].yaw);
  EXPECT_EQ(0, faces[0].pitch);
  EXPECT_EQ(0, faces[0].roll);
  EXPECT_EQ(0, faces[0].eye_dist);
  EXPECT_EQ(0, faces[0].id);
}

class EveryFrame : public testing::TestWithParam<std::tuple<int, int>> {
 protected:
  // Wider than high, so that a turn the wrong way round shows.
  const Picture picture_ = Part(Portrait(), kLeft, kTop, kSide + 24, kSide);

  /// What is found in the picture in this format, not turned and without padding.
  const ky_face_t& Upright(int format) const {
    static std::map<int, ky_face_t> found;
    if (!found.contains(format)) {
      const Detector detector(KY_CONFIG_LARGE_FACES);
      Detected faces;
      EXPECT_EQ(KY_SUCCESS, Detect(detector, TestFrame(picture_, format), faces));
      EXPECT_EQ(1, faces.count);
      found[format] = faces.count > 0 ? faces[0] : ky_face_t{};
    }
    return found[format];
  }
};

TEST_P(EveryFrame, ShowsTheSameFace) {
  const auto [format, orientation] = GetParam();
  const Detector detector(KY_CONFIG_LARGE_FACES);
  Detected faces;
  ASSERT_EQ(KY_SUCCESS, Detect(detector, TestFrame(picture_, format, orientation, 26), faces));
  ASSERT_EQ(1, faces.count);
  EXPECT_GE(Overlap(Turned(kFace, picture_.width, picture_.height, orientation), faces[0].rect), 0.75);

  // The search looks at the same upright picture however the frame is turned and padded: the box is the same
  // to the pixel.
  const ky_face_t& upright = Upright(format);
  ExpectRect(Turned(upright.rect, picture_.width, picture_.height, orientation), faces[0].rect, 0);
  EXPECT_EQ(upright.score, faces[0].score);
}

INSTANTIATE_TEST_SUITE_P(DetectorTest, EveryFrame,
                         testing::Combine(testing::Values(KY_PIXEL_GRAY, KY_PIXEL_BGR, KY_PIXEL_RGB,
                                                          KY_PIXEL_BGRA, KY_PIXEL_RGBA, KY_PIXEL_NV21,
                                                          KY_PIXEL_NV12),
                                          testing::Values(KY_ORIENTATION_0, KY_ORIENTATION_90,
                                                          KY_ORIENTATION_180, KY_ORIENTATION_270)));

TEST(DetectorTest, DoesNotFindAFaceThatIsNotUpright) {
  const Detector detector(KY_CONFIG_LARGE_FACES);
  TestFrame frame(AboutFace(), KY_PIXEL_GRAY, KY_ORIENTATION_90);
  for (const int orientation : {KY_ORIENTATION_0, KY_ORIENTATION_180, KY_ORIENTATION_270}) {
    frame.orientation = orientation;
    Detected faces;
    ASSERT_EQ(KY_SUCCESS, Detect(detector, frame, faces));
    EXPECT_EQ(0, faces.count) << orientation;
    EXPECT_EQ(nullptr, faces.faces);
  }
}

TEST(DetectorTest, ColoursCount) {
  // Red and blue of one luma, exchanged, are another picture: the channels are where the format says.
  Picture picture = AboutFace();
  for (size_t i = 0; i < picture.rgb.size(); i += 3) {
    picture.rgb[i + 1] = picture.rgb[i + 2] = 0;
  }
  const Detector detector(KY_CONFIG_LARGE_FACES);
  Detected as_red;
  Detected as_blue;
  TestFrame frame(picture, KY_PIXEL_RGB);
  ASSERT_EQ(KY_SUCCESS, Detect(detector, frame, as_red));
  frame.format = KY_PIXEL_BGR;
  ASSERT_EQ(KY_SUCCESS, Detect(detector, frame, as_blue));
  ASSERT_EQ(1, as_red.count);
  EXPECT_TRUE(as_blue.count == 0 || as_blue[0].score != as_red[0].score);
}

TEST(DetectorTest, ReadsNothingOutsideTheFrame) {
  const Detector detector(KY_CONFIG_LARGE_FACES);
  for (const int format : {KY_PIXEL_GRAY, KY_PIXEL_RGB, KY_PIXEL_BGRA, KY_PIXEL_NV21}) {
    for (const int orientation : {KY_ORIENTATION_0, KY_ORIENTATION_90}) {
      const TestFrame frame(AboutFace(), format, orientation, 6);
      kyface::test::GuardedImage<unsigned char> image(Rows(format, frame.height),
                                                      RowBytes(format, frame.width), frame.stride);
      std::copy(frame.bytes.begin(), frame.bytes.end(), image.data());
      Detected faces;
      ASSERT_EQ(KY_SUCCESS, ky_face_detect(detector, image.data(), format, frame.width, frame.height,
                                           frame.stride, orientation, &faces.faces, &faces.count));
      EXPECT_EQ(1, faces.count);
    }
  }
}

TEST(DetectorTest, FacesAtTheBorderStayInTheFrame) {
  // The frame cuts off the right side of the face.
  const Picture cut = Part(Portrait(), 130, kTop, kPortraitFace.right - 130 - 8, kSide);
  const Detector detector(KY_CONFIG_LARGE_FACES);
  ASSERT_EQ(KY_SUCCESS, ky_face_detect_set_threshold(detector, 0.3F));
  for (const int orientation :
       {KY_ORIENTATION_0, KY_ORIENTATION_90, KY_ORIENTATION_180, KY_ORIENTATION_270}) {
    const TestFrame frame(cut, KY_PIXEL_GRAY, orientation);
    Detected faces;
    ASSERT_EQ(KY_SUCCESS, Detect(detector, frame, faces));
    ASSERT_GE(faces.count, 1);
    for (int i = 0; i < faces.count; ++i) {
      EXPECT_GE(faces[i].rect.left, 0);
      EXPECT_GE(faces[i].rect.top, 0);
      EXPECT_LE(faces[i].rect.right, frame.width);
      EXPECT_LE(faces[i].rect.bottom, frame.height);
      EXPECT_LT(faces[i].rect.left, faces[i].rect.right);
      EXPECT_LT(faces[i].rect.top, faces[i].rect.bottom);
    }
  }
}

TEST(DetectorTest, FindsFacesFromTheConfiguredSizeOn) {
  // A face of 44 pixels, in a small frame and in a large one.
  const Picture small = View(Portrait(), 222, 126, 0.5, 0, 120);
  const Picture large = Part(small, -120, -100, 340, 280);
  const ky_rect_t in_small = {37, 38, 82, 82};
  const ky_rect_t in_large = {157, 138, 202, 182};
  for (const auto& [config, finds] : {std::pair<int, bool>(KY_CONFIG_DEFAULT, true),
                                      {KY_CONFIG_LARGE_FACES, false},
                                      {KY_CONFIG_SMALL_FACES, true},
                                      {KY_MIN_SMALLEST_FACE, true},
                                      {36, true},
                                      {75, false},
                                      {KY_MAX_SMALLEST_FACE, false}}) {
    const Detector detector(config);
    for (const auto& [picture, rect] : {std::pair(&small, in_small), {&large, in_large}}) {
      Detected faces;
      ASSERT_EQ(KY_SUCCESS, Detect(detector, TestFrame(*picture), faces));
      ASSERT_EQ(finds ? 1 : 0, faces.count) << "configuration " << config << ", width " << picture->width;
      if (finds) {
        EXPECT_GE(Overlap(rect, faces[0].rect), 0.6) << "configuration " << config;
      }
    }
  }
}

TEST(DetectorTest, DefaultFindsSmallFacesInFramesOfAnySize) {
  // The portrait's face has 88 pixels.
  const Detector detector;
  const Picture face = View(Portrait(), 222, 126, 38.0 / 88, 0, 100);
  for (const auto& [width, height] : {std::pair(100, 100), {320, 240}, {641, 367}}) {
    Detected faces;
    ASSERT_EQ(KY_SUCCESS, Detect(detector, TestFrame(Part(face, 0, 0, width, height)), faces));
    ASSERT_EQ(1, faces.count) << width;
    EXPECT_GE(Overlap({31, 31, 69, 69}, faces[0].rect), 0.6) << width;
  }
}

TEST(DetectorTest, LargeFacesAreFoundInReducedFrames) {
  // Reduced to two thirds, and halved before it is reduced to 0.44.
  const Picture large = View(Portrait(), 222, 126, 3, 0, 420);
  const Picture view = View(Portrait(), 222, 126, 1, 0, 140);
  Detected expected;
  ASSERT_EQ(KY_SUCCESS, Detect(Detector(KY_CONFIG_LARGE_FACES), TestFrame(view), expected));
  ASSERT_EQ(1, expected.count);
  const ky_rect_t r = expected[0].rect;
  const ky_rect_t tripled = {3 * r.left, 3 * r.top, 3 * r.right, 3 * r.bottom};
  for (const int smallest : {120, 180}) {
    Detected faces;
    ASSERT_EQ(KY_SUCCESS, Detect(Detector(smallest), TestFrame(large), faces));
    ASSERT_EQ(1, faces.count) << smallest;
    EXPECT_GE(Overlap(tripled, faces[0].rect), 0.8) << smallest;
  }
}

TEST(DetectorTest, TinyFramesHoldNoFace) {
  const Detector detector;
  for (const auto& [width, height] : {std::pair(1, 1), {2, 200}, {200, 2}, {30, 30}, {35, 35}}) {
    Detected faces;
    EXPECT_EQ(KY_SUCCESS, Detect(detector, TestFrame(Part(Portrait(), 180, 84, width, height)), faces));
    EXPECT_EQ(0, faces.count);
  }
}

TEST(DetectorTest, FrameWithoutAFace) {
  const Detector detector;
  Detected faces;
  ASSERT_EQ(KY_SUCCESS, Detect(detector, TestFrame(Picture(160, 120, 90), KY_PIXEL_BGR), faces));
  EXPECT_EQ(0, faces.count);
  EXPECT_EQ(nullptr, faces.faces);
}

// ---- threshold
// -----------------------------------------------------------------------------------------------

TEST(DetectorTest, ThresholdIsHonouredAndFacesAreSorted) {
  // Two views of the face beside each other, one of them rolled.
  constexpr int kView = 124;
  Picture two(2 * kView, kView + 12, 128);
  const Picture straight = View(Portrait(), 222, 126, 1, 0, kView);
  const Picture rolled = View(Portrait(), 222, 126, 1.1, 14, kView);
  for (int y = 0; y < kView; ++y) {
    std::copy_n(rolled.at(0, y), 3 * kView, two.at(0, y));
    std::copy_n(straight.at(0, y), 3 * kView, two.at(kView, y + 12));
  }
  const TestFrame frame(two, KY_PIXEL_RGBA);
  const Detector detector(KY_CONFIG_LARGE_FACES);
  float threshold = 0;
  ASSERT_EQ(KY_SUCCESS, ky_face_detect_get_threshold(detector, &threshold));
  EXPECT_EQ(KY_DEFAULT_THRESHOLD, threshold);

  ASSERT_EQ(KY_SUCCESS, ky_face_detect_set_threshold(detector, KY_MIN_THRESHOLD));
  Detected all;
  ASSERT_EQ(KY_SUCCESS, Detect(detector, frame, all));
  ASSERT_GT(all.count, 2);
  for (int i = 1; i < all.count; ++i) {
    EXPECT_GE(all[i - 1].score, all[i].score);
  }
  EXPECT_GE(all[all.count - 1].score, KY_MIN_THRESHOLD);

  // At every threshold exactly the faces that score above it are left.
  for (const float t : {0.1F, 0.3F, 0.6F, (all[0].score + all[1].score) / 2, 0.99F, 1.0F}) {
    ASSERT_EQ(KY_SUCCESS, ky_face_detect_set_threshold(detector, t));
    ASSERT_EQ(KY_SUCCESS, ky_face_detect_get_threshold(detector, &threshold));
    EXPECT_EQ(t, threshold);
    int expected = 0;
    while (expected < all.count && all[expected].score >= t) {
      ++expected;
    }
    Detected faces;
    ASSERT_EQ(KY_SUCCESS, Detect(detector, frame, faces));
    ASSERT_EQ(expected, faces.count) << t;
    for (int i = 0; i < faces.count; ++i) {
      ExpectRect(all[i].rect, faces[i].rect, 0);
      EXPECT_EQ(all[i].score, faces[i].score);
    }
  }
}

TEST(DetectorTest, RefusesThresholdsOutOfRange) {
  const Detector detector;
  for (const float t : {0.0F, -1.0F, 0.0099F, 1.0001F, 5.0F, std::numeric_limits<float>::infinity(),
                        std::numeric_limits<float>::quiet_NaN()}) {
    EXPECT_EQ(KY_ERROR_RANGE, ky_face_detect_set_threshold(detector, t)) << t;
  }
  float threshold = 0;
  EXPECT_EQ(KY_SUCCESS, ky_face_detect_get_threshold(detector, &threshold));
  EXPECT_EQ(KY_DEFAULT_THRESHOLD, threshold);
  EXPECT_EQ(KY_ERROR_NULL_POINTER, ky_face_detect_get_threshold(detector, nullptr));
}

TEST(DetectorTest, ThresholdsOfTwoDetectorsAreApart) {
  const Detector one;
  const Detector other;
  ASSERT_EQ(KY_SUCCESS, ky_face_detect_set_threshold(one, 0.25F));
  float threshold = 0;
  ASSERT_EQ(KY_SUCCESS, ky_face_detect_get_threshold(other, &threshold));
  EXPECT_EQ(KY_DEFAULT_THRESHOLD, threshold);
}

// ---- what is refused
// -----------------------------------------------------------------------------------------

TEST(DetectorTest, ThresholdNeedsADetector) {
  int no_detector = 0;
  for (ky_handle_t handle : {ky_handle_t{nullptr}, ky_handle_t{&no_detector}}) {
    float threshold = 3;
    EXPECT_EQ(KY_ERROR_HANDLE, ky_face_detect_get_threshold(handle, &threshold));
    EXPECT_EQ(3, threshold);
    EXPECT_EQ(KY_ERROR_HANDLE, ky_face_detect_set_threshold(handle, 0.5F));
  }
}

TEST(DetectorTest, ResultsOutliveTheirDetector) {
  Detected faces;
  {
    const Detector detector(KY_CONFIG_LARGE_FACES);
    ASSERT_EQ(KY_SUCCESS, Detect(detector, TestFrame(AboutFace()), faces));
  }
  ASSERT_EQ(1, faces.count);
  EXPECT_GE(Overlap(kFace, faces[0].rect), 0.75);
}

TEST(DetectorTest, ThreadsMayShareADetector) {
  const TestFrame frame(AboutFace(), KY_PIXEL_NV21);
  const Detector shared(KY_CONFIG_LARGE_FACES);
  const Detector own(KY_CONFIG_LARGE_FACES);
  Detected expected;
  ASSERT_EQ(KY_SUCCESS, Detect(shared, frame, expected));
  ASSERT_EQ(1, expected.count);
  std::vector<std::thread> threads;
  for (const ky_handle_t handle : {ky_handle_t{shared}, ky_handle_t{shared}, ky_handle_t{own}}) {
    threads.emplace_back([&frame, &expected, handle] {
      for (int i = 0; i < 3; ++i) {
        Detected faces;
        ASSERT_EQ(KY_SUCCESS, Detect(handle, frame, faces));
        ASSERT_EQ(1, faces.count);
        ExpectRect(expected[0].rect, faces[0].rect, 0);
      }
    });
  }
  for (std::thread& thread : threads) {
    thread.join();
  }
}

TEST(DetectorTest, TellsAboutItself) {
  testing::internal::CaptureStdout();
  EXPECT_EQ(KY_SUCCESS, ky_face_algorithm_info());
  const std::string text = testing::internal::GetCapturedStdout();
  EXPECT_NE(std::string::npos, text.find("dlib 19.")) << text;
  for (const char* part : {"detector", "landmarks", "tracker", "verifier"}) {
    EXPECT_NE(std::string::npos, text.find(part)) << text;
  }
}

}  // namespace
}  // namespace kyengine::test
