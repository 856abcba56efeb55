// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// What detector and tracker refuse, and with which codes.
#include <limits>
#include <set>
#include <vector>

#include "engine_calls.h"

namespace kyengine::test {
namespace {

/// The operations of a detector or of a tracker.
struct Kind {
  const char* name;
  int (*create)(ky_handle_t*, const char*, int);
  void (*destroy)(ky_handle_t);
  int (*search)(ky_handle_t, const unsigned char*, int, int, int, int, int, ky_face_t**, int*);
  void (*release)(ky_face_t*, int);
};

constexpr Kind kDetector = {"Detector", ky_face_create_detector, ky_face_destroy_detector, ky_face_detect,
                            ky_face_release_detector_result};
constexpr Kind kTracker = {"Tracker", ky_face_create_tracker, ky_face_destroy_tracker, ky_face_track,
                           ky_face_release_tracker_result};

class RefusalTest : public testing::TestWithParam<Kind> {
 protected:
  void SetUp() override { ASSERT_EQ(KY_SUCCESS, GetParam().create(&handle_, nullptr, KY_CONFIG_DEFAULT)); }
  void TearDown() override { GetParam().destroy(handle_); }

  /// Searches a gray frame without a face.
  int Search(ky_handle_t handle, const unsigned char* image, ky_face_t** faces, int* count) const {
    return GetParam().search(handle, image, KY_PIXEL_GRAY, 64, 64, 64, KY_ORIENTATION_0, faces, count);
  }

  const std::vector<uint8_t> bytes_ = std::vector<uint8_t>(64 * 64 * 4);
  ky_handle_t handle_ = nullptr;
};

INSTANTIATE_TEST_SUITE_P(Refusal, RefusalTest, testing::Values(kDetector, kTracker),
                         [](const auto& kind) { return kind.param.name; });

TEST_P(RefusalTest, FramesThatCannotBe) {
  const struct {
    int code;
    int format;
    int width;
    int height;
    int stride;
    int orientation;
  } cases[] = {
      {KY_ERROR_PIXEL_FORMAT, -1, 64, 64, 256, 0},
      {KY_ERROR_PIXEL_FORMAT, 7, 64, 64, 256, 0},
      {KY_ERROR_SIZE, KY_PIXEL_GRAY, 0, 64, 64, 0},
      {KY_ERROR_SIZE, KY_PIXEL_GRAY, 64, 0, 64, 0},
      {KY_ERROR_SIZE, KY_PIXEL_GRAY, -64, 64, 64, 0},
      {KY_ERROR_SIZE, KY_PIXEL_GRAY, 64, -1, 64, 0},
      {KY_ERROR_SIZE, KY_PIXEL_GRAY, KY_MAX_FRAME_SIDE + 1, 1, 10000, 0},
      {KY_ERROR_SIZE, KY_PIXEL_GRAY, 1, KY_MAX_FRAME_SIDE + 1, 1, 0},
      {KY_ERROR_SIZE, KY_PIXEL_RGBA, std::numeric_limits<int>::max(), 2, std::numeric_limits<int>::max(), 0},
      {KY_ERROR_SIZE, KY_PIXEL_NV21, 63, 64, 64, 0},
      {KY_ERROR_SIZE, KY_PIXEL_NV21, 64, 63, 64, 0},
      {KY_ERROR_SIZE, KY_PIXEL_NV12, 63, 63, 64, 0},
      {KY_ERROR_STRIDE, KY_PIXEL_GRAY, 64, 64, 63, 0},
      {KY_ERROR_STRIDE, KY_PIXEL_NV12, 64, 64, 63, 0},
      {KY_ERROR_STRIDE, KY_PIXEL_BGR, 64, 64, 191, 0},
      {KY_ERROR_STRIDE, KY_PIXEL_RGBA, 64, 64, 255, 0},
      {KY_ERROR_STRIDE, KY_PIXEL_GRAY, 64, 64, 0, 0},
      {KY_ERROR_STRIDE, KY_PIXEL_GRAY, 64, 64, -64, 0},
      {KY_ERROR_ORIENTATION, KY_PIXEL_GRAY, 64, 64, 64, 1},
      {KY_ERROR_ORIENTATION, KY_PIXEL_GRAY, 64, 64, 64, 45},
      {KY_ERROR_ORIENTATION, KY_PIXEL_GRAY, 64, 64, 64, -90},
      {KY_ERROR_ORIENTATION, KY_PIXEL_GRAY, 64, 64, 64, 360},
  };
  for (const auto& c : cases) {
    ky_face_t sentinel;
    ky_face_t* faces = &sentinel;
    int count = 77;
    EXPECT_EQ(c.code, GetParam().search(handle_, bytes_.data(), c.format, c.width, c.height, c.stride,
                                        c.orientation, &faces, &count))
        << "format " << c.format << ", " << c.width << " x " << c.height << ", stride " << c.stride
        << ", turn " << c.orientation;
    EXPECT_EQ(nullptr, faces);
    EXPECT_EQ(0, count);
    GetParam().release(faces, count);
  }
}

TEST_P(RefusalTest, NullPointers) {
  ky_face_t* faces = nullptr;
  int count = 0;
  EXPECT_EQ(KY_SUCCESS, Search(handle_, bytes_.data(), &faces, &count));
  EXPECT_EQ(KY_ERROR_NULL_POINTER, Search(handle_, nullptr, &faces, &count));
  EXPECT_EQ(KY_ERROR_NULL_POINTER, Search(handle_, bytes_.data(), nullptr, &count));
  EXPECT_EQ(KY_ERROR_NULL_POINTER, Search(handle_, bytes_.data(), &faces, nullptr));
  EXPECT_EQ(KY_ERROR_NULL_POINTER, GetParam().create(nullptr, nullptr, KY_CONFIG_DEFAULT));
  GetParam().release(nullptr, 0);
}

TEST_P(RefusalTest, HandlesOfNothing) {
  ky_handle_t destroyed = nullptr;
  ASSERT_EQ(KY_SUCCESS, GetParam().create(&destroyed, nullptr, KY_CONFIG_DEFAULT));
  GetParam().destroy(destroyed);
  int nothing = 0;
  for (ky_handle_t handle : {ky_handle_t{nullptr}, ky_handle_t{&nothing}, destroyed}) {
    ky_face_t* faces = nullptr;
    int count = 0;
    EXPECT_EQ(KY_ERROR_HANDLE, Search(handle, bytes_.data(), &faces, &count));
    GetParam().destroy(handle);
  }
}

// A handle names one object for as long as the process lives, whatever comes and goes.
TEST_P(RefusalTest, HandlesAreNotUsedAgain) {
  const Kind& other = GetParam().create == kDetector.create ? kTracker : kDetector;
  std::set<ky_handle_t> handles = {handle_};
  for (int i = 0; i < 50; ++i) {
    for (const Kind& kind : {GetParam(), other}) {
      ky_handle_t handle = nullptr;
      ASSERT_EQ(KY_SUCCESS, kind.create(&handle, nullptr, KY_CONFIG_DEFAULT));
      kind.destroy(handle);
      EXPECT_TRUE(handles.insert(handle).second) << "object " << i;
    }
  }
  EXPECT_EQ(0u, handles.count(nullptr));
}

TEST_P(RefusalTest, HandlesOfTheOtherKind) {
  const Kind& other = GetParam().create == kDetector.create ? kTracker : kDetector;
  ky_handle_t handle = nullptr;
  ASSERT_EQ(KY_SUCCESS, other.create(&handle, nullptr, KY_CONFIG_DEFAULT));
  ky_face_t* faces = nullptr;
  int count = 0;
  EXPECT_EQ(KY_ERROR_HANDLE, Search(handle, bytes_.data(), &faces, &count));
  GetParam().destroy(handle);
  EXPECT_EQ(KY_SUCCESS, other.search(handle, bytes_.data(), KY_PIXEL_GRAY, 64, 64, 64, 0, &faces, &count));
  other.destroy(handle);
}

TEST_P(RefusalTest, ConfigurationsThatAreNone) {
  for (const int config : {-1, 3, 1 << 20}) {
    int anything = 0;
    ky_handle_t handle = &anything;
    EXPECT_EQ(KY_ERROR_CONFIG, GetParam().create(&handle, nullptr, config));
    EXPECT_EQ(nullptr, handle);
  }
}

}  // namespace
}  // namespace kyengine::test
