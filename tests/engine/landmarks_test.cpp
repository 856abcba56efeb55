// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// Landmarks of dlib's model of 68 points, on the portrait and in frames that are tracked.
#include <cmath>
#include <optional>
#include <vector>

#include "engine_calls.h"

namespace kyengine::test {
namespace {

constexpr int kPoints = 68;

/// What is seen in the portrait, set by hand, and among which points of the model. Several points stand for
/// their centre.
struct Seen {
  int first;
  int count;
  double x;
  double y;
};
constexpr Seen kSeen[] = {{36, 6, 203, 101.5}, {42, 6, 247.5, 103}, {30, 1, 223.5, 127},
                          {48, 1, 203.5, 140}, {54, 1, 244.5, 141}, {8, 1, 224, 178.5}};
constexpr double kEyeDistance = 44.5;

/// How far, in eyes' distances, a face's points are from what is seen, at worst.
double WorstError(const ky_face_t& face, const std::vector<ky_pointf_t>& seen, double eye_distance) {
  double worst = 0;
  for (size_t i = 0; i < std::size(kSeen); ++i) {
    double x = 0;
    double y = 0;
    for (int p = kSeen[i].first; p < kSeen[i].first + kSeen[i].count; ++p) {
      x += static_cast<double>(face.points_array[p].x) / kSeen[i].count;
      y += static_cast<double>(face.points_array[p].y) / kSeen[i].count;
    }
    worst =
        std::max(worst, std::hypot(x - static_cast<double>(seen[i].x), y - static_cast<double>(seen[i].y)));
  }
  return worst / eye_distance;
}

/// Emulated, the model takes ten seconds to read; handles to it share what is read while there is one.
class LandmarksTest : public ::testing::Test {
 protected:
  static void SetUpTestSuite() { kept_.emplace(KY_CONFIG_DEFAULT, KY_LANDMARKS); }
  static void TearDownTestSuite() { kept_.reset(); }

  static inline std::optional<Detector> kept_;
};

TEST_F(LandmarksTest, AreWhereTheyAreSeenInThePortrait) {
  const Detector detector(KY_CONFIG_DEFAULT, KY_LANDMARKS);
  Detected faces;
  ASSERT_EQ(KY_SUCCESS, Detect(detector, TestFrame(Portrait(), KY_PIXEL_RGB), faces));
  ASSERT_EQ(1, faces.count);
  const ky_face_t& face = faces[0];
  ASSERT_EQ(kPoints, face.points_count);
  std::vector<ky_pointf_t> seen;
  for (const Seen& s : kSeen) {
    seen.push_back({static_cast<float>(s.x), static_cast<float>(s.y)});
  }
  EXPECT_LE(WorstError(face, seen, kEyeDistance), 0.1);
  EXPECT_NEAR(kEyeDistance, face.eye_dist, 4);
  EXPECT_NEAR(2, face.roll, 4);
  EXPECT_NEAR(0, face.yaw, 12);
  EXPECT_NEAR(0, face.pitch, 25) << "a smile reads as a nod";
}

TEST_F(LandmarksTest, ATrackerCarriesThemBetweenDetections) {
  constexpr int kSide = 152;
  const Tracker tracker(KY_CONFIG_LARGE_FACES, KY_LANDMARKS);
  ASSERT_EQ(KY_SUCCESS, ky_face_track_set_detect_interval(tracker, KY_MAX_DETECT_INTERVAL, nullptr));
  for (int i = 0; i < 8; ++i) {
    const double x = 230 - 1.5 * i;
    const double y = 134 - i;
    const double zoom = 1 + 0.006 * i;
    const double roll = 1.2 * i;
    const Picture picture = View(Portrait(), x, y, zoom, roll, kSide);
    Tracked faces;
    ASSERT_EQ(KY_SUCCESS, Track(tracker, TestFrame(picture, KY_PIXEL_NV21), faces));
    ASSERT_EQ(1, faces.count) << "frame " << i;
    ASSERT_EQ(kPoints, faces[0].points_count);
    std::vector<ky_pointf_t> seen;
    for (const Seen& s : kSeen) {
      seen.push_back(InView(s.x, s.y, x, y, zoom, roll, kSide));
    }
    EXPECT_LE(WorstError(faces[0], seen, zoom * kEyeDistance), 0.12) << "frame " << i;
    EXPECT_NEAR(2 + roll, faces[0].roll, 5) << "frame " << i;
    EXPECT_NEAR(zoom * kEyeDistance, faces[0].eye_dist, 4.5) << "frame " << i;
  }
}

}  // namespace
}  // namespace kyengine::test
