// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// The tracker: faces keep their identities from frame to frame.
#include <sys/mman.h>
#include <unistd.h>

#include <algorithm>
#include <cmath>
#include <limits>
#include <set>
#include <utility>

#include "engine_calls.h"

namespace kyengine::test {
namespace {

constexpr int kSide = 152;

/// A tracker of faces as large as the portrait's that looks for them in every `interval`-th frame.
class EveryNth : public Tracker {
 public:
  explicit EveryNth(int interval) : Tracker(KY_CONFIG_LARGE_FACES) {
    EXPECT_EQ(KY_SUCCESS, ky_face_track_set_detect_interval(*this, interval, nullptr));
  }
};

/// One frame of a camera that pans, zooms and rolls over the portrait, and where the face is in it.
struct Shot {
  Picture picture;
  ky_rect_t face;

  explicit Shot(int i) : picture(View(Portrait(), X(i), Y(i), Zoom(i), Roll(i), kSide)) {
    // The box about the turned box's centre, which is what an upright box about the face is.
    const ky_pointf_t centre = InView(222.5, 126.5, X(i), Y(i), Zoom(i), Roll(i), kSide);
    const float half = static_cast<float>(43.5 * Zoom(i));
    face = {static_cast<int>(centre.x - half), static_cast<int>(centre.y - half),
            static_cast<int>(centre.x + half), static_cast<int>(centre.y + half)};
  }

 private:
  static double X(int i) { return 234 - 1.5 * i; }
  static double Y(int i) { return 134 - i; }
  static double Zoom(int i) { return 1 + 0.006 * i; }
  static double Roll(int i) { return 0.4 * i; }
};

/// A frame without a face.
Picture Empty(int width = kSide, int height = kSide) { return {width, height, 100}; }

/// The portrait's face on the left, on the right, on both sides, or nowhere.
Picture Pair(bool left, bool right) {
  constexpr int kView = 128;
  Picture pair(2 * kView, kView, 100);
  const Picture faces[] = {View(Portrait(), 222, 126, 1, 0, kView),
                           View(Portrait(), 222, 126, 1.05, 6, kView)};
  for (int i = 0; i < 2; ++i) {
    for (int y = 0; (i == 0 ? left : right) && y < kView; ++y) {
      std::copy_n(faces[i].at(0, y), 3 * kView, pair.at(i * kView, y));
    }
  }
  return pair;
}

/// The identities in a frame, 0 for none, of a picture of two sides.
struct Sides {
  int left = 0;
  int right = 0;
};
Sides TrackPair(ky_handle_t tracker, bool left, bool right) {
  Tracked faces;
  EXPECT_EQ(KY_SUCCESS, Track(tracker, TestFrame(Pair(left, right)), faces));
  Sides sides;
  for (int i = 0; i < faces.count; ++i) {
    int& side = faces[i].rect.left + faces[i].rect.right < 256 ? sides.left : sides.right;
    EXPECT_EQ(0, side) << "two faces on one side";
    side = faces[i].id;
  }
  return sides;
}

int TrackOne(ky_handle_t tracker, const Picture& picture) {
  Tracked faces;
  EXPECT_EQ(KY_SUCCESS, Track(tracker, TestFrame(picture), faces));
  EXPECT_LE(faces.count, 1);
  return faces.count == 1 ? faces[0].id : 0;
}

TEST(TrackerTest, OneIdentityThroughAPan) {
  const EveryNth tracker(6);
  int id = 0;
  for (int i = 0; i < 16; ++i) {
    const Shot shot(i);
    Tracked faces;
    ASSERT_EQ(KY_SUCCESS, Track(tracker, TestFrame(shot.picture, KY_PIXEL_NV21), faces));
    ASSERT_EQ(1, faces.count) << "frame " << i;
    EXPECT_GE(Overlap(shot.face, faces[0].rect), 0.6) << "frame " << i;
    EXPECT_GE(faces[0].score, KY_DEFAULT_THRESHOLD);
    EXPECT_EQ(0, faces[0].points_count);
    if (i == 0) {
      id = faces[0].id;
      EXPECT_GE(id, 1);
    }
    EXPECT_EQ(id, faces[0].id) << "frame " << i;
  }
}

TEST(TrackerTest, DefaultSearchesAsManyPixelsInEveryFrame) {
  // The portrait's face has 88 pixels. Of a frame's height of 480 a sixth is what is found, whatever its
  // size.
  const auto finds = [](int config, int face, int width, int height) {
    const Picture view = View(Portrait(), 222, 126, face / 88.0, 0, 2 * face);
    const Tracker tracker(config);
    return TrackOne(tracker, Part(view, 0, 0, width, height)) != 0;
  };
  EXPECT_TRUE(finds(KY_CONFIG_DEFAULT, 88, 640, 480));
  EXPECT_FALSE(finds(KY_CONFIG_DEFAULT, 50, 640, 480));
  EXPECT_TRUE(finds(KY_CONFIG_DEFAULT, 46, 320, 240));
  EXPECT_FALSE(finds(KY_CONFIG_DEFAULT, 88, 1280, 720));
  EXPECT_TRUE(finds(KY_CONFIG_DEFAULT, 156, 1280, 720));
  EXPECT_TRUE(finds(50, 50, 640, 480)) << "a smaller size on demand";
}

TEST(TrackerTest, FollowsInTurnedFrames) {
  for (const int orientation : {KY_ORIENTATION_90, KY_ORIENTATION_180, KY_ORIENTATION_270}) {
    const EveryNth tracker(100);
    for (int i = 0; i < 4; ++i) {
      const Shot shot(i);
      const Picture wide = Part(shot.picture, 0, 0, kSide + 16, kSide);
      Tracked faces;
      ASSERT_EQ(KY_SUCCESS, Track(tracker, TestFrame(wide, KY_PIXEL_BGRA, orientation, 12), faces));
      ASSERT_EQ(1, faces.count) << "frame " << i << ", turned by " << orientation;
      EXPECT_GE(Overlap(Turned(shot.face, wide.width, wide.height, orientation), faces[0].rect), 0.6);
    }
  }
}

TEST(TrackerTest, IdentitySurvivesMissedDetections) {
  const EveryNth tracker(1);
  const int id = TrackOne(tracker, Shot(0).picture);
  ASSERT_NE(0, id);
  for (int i = 0; i < KY_FORGIVEN_MISSES; ++i) {
    EXPECT_EQ(0, TrackOne(tracker, Empty())) << "a face out of sight is not reported";
  }
  EXPECT_EQ(id, TrackOne(tracker, Shot(1).picture));

  for (int i = 0; i <= KY_FORGIVEN_MISSES; ++i) {
    EXPECT_EQ(0, TrackOne(tracker, Empty()));
  }
  const int next = TrackOne(tracker, Shot(1).picture);
  EXPECT_NE(0, next);
  EXPECT_NE(id, next) << "a face that was forgotten is a new one";
}

TEST(TrackerTest, LostBetweenDetectionsIsFoundByTheNext) {
  const EveryNth tracker(4);
  const int id = TrackOne(tracker, Shot(0).picture);
  ASSERT_NE(0, id);
  EXPECT_EQ(0, TrackOne(tracker, Empty()));
  EXPECT_EQ(0, TrackOne(tracker, Shot(0).picture)) << "nobody looks before the next detection";
  EXPECT_EQ(0, TrackOne(tracker, Shot(0).picture));
  EXPECT_EQ(id, TrackOne(tracker, Shot(0).picture));
}

TEST(TrackerTest, IdentitiesAreOneFaceEach) {
  const EveryNth tracker(1);
  std::set<int> seen;
  const Sides first = TrackPair(tracker, true, false);
  ASSERT_NE(0, first.left);
  EXPECT_EQ(0, first.right);

  const Sides both = TrackPair(tracker, true, true);
  EXPECT_EQ(first.left, both.left);
  ASSERT_NE(0, both.right);
  EXPECT_NE(both.left, both.right);

  // The left face is away for long and comes back while the right one stays.
  for (int i = 0; i <= KY_FORGIVEN_MISSES; ++i) {
    const Sides sides = TrackPair(tracker, false, true);
    EXPECT_EQ(0, sides.left);
    EXPECT_EQ(both.right, sides.right);
  }
  const Sides again = TrackPair(tracker, true, true);
  EXPECT_EQ(both.right, again.right);
  EXPECT_GT(again.left, both.right);
}

TEST(TrackerTest, ResetForgets) {
  const EveryNth tracker(100);
  const int id = TrackOne(tracker, Shot(0).picture);
  ASSERT_NE(0, id);
  EXPECT_EQ(id, TrackOne(tracker, Shot(0).picture));
  ky_face_reset_tracker(tracker);
  const int next = TrackOne(tracker, Shot(0).picture);
  EXPECT_NE(0, next) << "the first frame after a reset is searched";
  EXPECT_NE(id, next);
  ky_face_reset_tracker(nullptr);
}

TEST(TrackerTest, FramesOfAnotherSizeStartAnew) {
  const EveryNth tracker(100);
  const int id = TrackOne(tracker, Shot(0).picture);
  ASSERT_NE(0, id);
  const int next = TrackOne(tracker, Part(Shot(0).picture, 0, 0, kSide, kSide - 8));
  EXPECT_NE(0, next);
  EXPECT_NE(id, next);
}

TEST(TrackerTest, LooksAtTheInterval) {
  constexpr int kInterval = 4;
  const EveryNth tracker(kInterval);
  EXPECT_EQ(0, TrackOne(tracker, Empty()));
  for (int i = 1; i < kInterval; ++i) {
    EXPECT_EQ(0, TrackOne(tracker, Shot(0).picture)) << "frame " << i;
  }
  EXPECT_NE(0, TrackOne(tracker, Shot(0).picture));
}

TEST(TrackerTest, ShorterIntervalCountsFromTheLastDetection) {
  const EveryNth tracker(100);
  EXPECT_EQ(0, TrackOne(tracker, Empty()));
  EXPECT_EQ(0, TrackOne(tracker, Shot(0).picture));
  ASSERT_EQ(KY_SUCCESS, ky_face_track_set_detect_interval(tracker, 2, nullptr));
  EXPECT_EQ(0, TrackOne(tracker, Shot(0).picture));
  EXPECT_NE(0, TrackOne(tracker, Shot(0).picture));
}

TEST(TrackerTest, WithoutFacesNothingIsReadBetweenDetections) {
  // Pages that nobody may read stand for the frames between.
  constexpr int kEdge = 256;
  const size_t size = kEdge * kEdge;
  void* const unreadable = mmap(nullptr, size, PROT_NONE, MAP_PRIVATE | MAP_ANONYMOUS, -1, 0);
  ASSERT_NE(MAP_FAILED, unreadable);
  const auto* const frame = static_cast<const unsigned char*>(unreadable);
  const EveryNth tracker(KY_MAX_DETECT_INTERVAL);
  const std::vector<uint8_t> empty(size, 90);
  Tracked first;
  ASSERT_EQ(KY_SUCCESS, ky_face_track(tracker, empty.data(), KY_PIXEL_GRAY, kEdge, kEdge, kEdge,
                                      KY_ORIENTATION_0, &first.faces, &first.count));
  for (int i = 1; i < KY_MAX_DETECT_INTERVAL; ++i) {
    Tracked faces;
    ASSERT_EQ(KY_SUCCESS, ky_face_track(tracker, frame, KY_PIXEL_GRAY, kEdge, kEdge, kEdge, KY_ORIENTATION_0,
                                        &faces.faces, &faces.count));
    ASSERT_EQ(0, faces.count);
  }
  // Nor are frames that are too small for a face.
  for (int i = 0; i < 3 * KY_MAX_DETECT_INTERVAL; ++i) {
    Tracked faces;
    ASSERT_EQ(KY_SUCCESS, ky_face_track(tracker, frame, KY_PIXEL_GRAY, 64, 64, 64, KY_ORIENTATION_0,
                                        &faces.faces, &faces.count));
  }
  munmap(unreadable, size);
}

TEST(TrackerTest, FaceLimitIsHonoured) {
  const EveryNth tracker(2);
  ASSERT_EQ(KY_SUCCESS, ky_face_track_set_detect_face_cnt_limit(tracker, 1, nullptr));
  Tracked best;
  {
    const Detector detector(KY_CONFIG_LARGE_FACES);
    Detected both;
    ASSERT_EQ(KY_SUCCESS, Detect(detector, TestFrame(Pair(true, true)), both));
    ASSERT_EQ(2, both.count);
    ASSERT_EQ(KY_SUCCESS, Track(tracker, TestFrame(Pair(true, true)), best));
    ASSERT_EQ(1, best.count);
    ExpectRect(both[0].rect, best[0].rect, 0);
  }
  // A higher limit counts from the next detection on, a lower one at once.
  ASSERT_EQ(KY_SUCCESS, ky_face_track_set_detect_face_cnt_limit(tracker, 2, nullptr));
  Tracked between;
  ASSERT_EQ(KY_SUCCESS, Track(tracker, TestFrame(Pair(true, true)), between));
  EXPECT_EQ(1, between.count);
  Tracked after;
  ASSERT_EQ(KY_SUCCESS, Track(tracker, TestFrame(Pair(true, true)), after));
  ASSERT_EQ(2, after.count);
  EXPECT_GE(after[0].score, after[1].score);
  EXPECT_EQ(best[0].id, after[0].id);
  ASSERT_EQ(KY_SUCCESS, ky_face_track_set_detect_face_cnt_limit(tracker, 1, nullptr));
  Tracked lowered;
  ASSERT_EQ(KY_SUCCESS, Track(tracker, TestFrame(Pair(true, true)), lowered));
  ASSERT_EQ(1, lowered.count);
  EXPECT_EQ(best[0].id, lowered[0].id);
}

TEST(TrackerTest, FacesComeByTheirScores) {
  const Detector detector(KY_CONFIG_LARGE_FACES);
  Detected both;
  ASSERT_EQ(KY_SUCCESS, Detect(detector, TestFrame(Pair(true, true)), both));
  ASSERT_EQ(2, both.count);
  ASSERT_GT(both[0].score, both[1].score);
  // The less certain one is there first, and has the lower number.
  const bool left = both[1].rect.left < both[0].rect.left;
  const EveryNth tracker(1);
  Tracked first;
  ASSERT_EQ(KY_SUCCESS, Track(tracker, TestFrame(Pair(left, !left)), first));
  ASSERT_EQ(1, first.count);
  Tracked second;
  ASSERT_EQ(KY_SUCCESS, Track(tracker, TestFrame(Pair(true, true)), second));
  ASSERT_EQ(2, second.count);
  EXPECT_GT(second[0].score, second[1].score);
  EXPECT_GT(second[0].id, first[0].id);
  EXPECT_EQ(first[0].id, second[1].id);
}

TEST(TrackerTest, NewFaceTakesThePlaceOfOneOutOfSight) {
  const EveryNth tracker(1);
  ASSERT_EQ(KY_SUCCESS, ky_face_track_set_detect_face_cnt_limit(tracker, 1, nullptr));
  const Sides first = TrackPair(tracker, true, false);
  ASSERT_NE(0, first.left);
  const Sides second = TrackPair(tracker, false, true);
  EXPECT_EQ(0, second.left);
  EXPECT_NE(0, second.right);
  EXPECT_NE(first.left, second.right);
}

TEST(TrackerTest, AlignmentThresholdDecidesWhatIsFollowed) {
  // After the face comes a part of the picture without one.
  const Picture elsewhere = View(Portrait(), 330, 330, 1, 0, kSide);
  const struct {
    int threshold;
    bool follows_face;
    bool follows_elsewhere;
  } cases[] = {{0, true, true}, {KY_DEFAULT_ALIGNMENT_THRESHOLD, true, false}, {100, false, false}};
  for (const auto& c : cases) {
    // Rolled and covered in part, the face agrees well, but not fully.
    Picture covered = View(Portrait(), 236, 138, 1, 4, kSide);
    std::fill(covered.at(0, 0), covered.at(0, 52), 128);
    for (const bool elsewhere_next : {false, true}) {
      const EveryNth tracker(100);
      ASSERT_EQ(KY_SUCCESS, ky_face_track_set_alignment_threshold(tracker, c.threshold, nullptr));
      ASSERT_NE(0, TrackOne(tracker, View(Portrait(), 240, 140, 1, 0, kSide)));
      const bool followed = TrackOne(tracker, elsewhere_next ? elsewhere : covered) != 0;
      EXPECT_EQ(elsewhere_next ? c.follows_elsewhere : c.follows_face, followed)
          << "threshold " << c.threshold << (elsewhere_next ? ", elsewhere" : ", the face");
    }
  }
}

// The shortest side of the face's boxes while it is followed through `frames` views, in which it must be
// lost; with a threshold that takes any agreement.
template <typename ViewOf>
int ShortestSideFollowed(int frames, const ViewOf& viewOf) {
  const EveryNth tracker(100);
  EXPECT_EQ(KY_SUCCESS, ky_face_track_set_alignment_threshold(tracker, 0, nullptr));
  int shortest = kSide;
  for (int i = 0; i < frames; ++i) {
    const Picture view = viewOf(i);
    Tracked faces;
    EXPECT_EQ(KY_SUCCESS, Track(tracker, TestFrame(view), faces));
    if (faces.count != 1) {
      return shortest;
    }
    const ky_rect_t& rect = faces[0].rect;
    shortest = std::min({shortest, rect.right - rect.left, rect.bottom - rect.top});
  }
  ADD_FAILURE() << "followed through all " << frames;
  return shortest;
}

TEST(TrackerTest, FacesAreFollowedUntilHalfOfThemIsOut) {
  // To each side. Boxes are clipped to the frame.
  for (const auto& [across, down] : {std::pair(1, 0), {-1, 0}, {0, 1}, {0, -1}}) {
    SCOPED_TRACE(testing::Message() << across << ", " << down);
    const int shortest = ShortestSideFollowed(24, [right = across, below = down](int i) {
      return View(Portrait(), 222 + right * 8 * i, 126 + below * 8 * i, 1, 0, kSide);
    });
    EXPECT_GE(shortest, 36);
    EXPECT_LE(shortest, 60);
  }
}

TEST(TrackerTest, FacesAreFollowedUntilTheyAreTooSmall) {
  const int smallest =
      ShortestSideFollowed(60, [](int i) { return View(Portrait(), 222, 126, std::pow(0.95, i), 0, kSide); });
  EXPECT_GE(smallest, 16);
  EXPECT_LE(smallest, 20);
}

TEST(TrackerTest, PictureWithoutContrastIsNoAgreement) {
  const EveryNth tracker(100);
  ASSERT_EQ(KY_SUCCESS, ky_face_track_set_alignment_threshold(tracker, 0, nullptr));
  ASSERT_NE(0, TrackOne(tracker, Shot(0).picture));
  EXPECT_EQ(0, TrackOne(tracker, Picture(kSide, kSide, 0)));
}

TEST(TrackerTest, SettingsHaveRanges) {
  const struct {
    int (*set)(ky_handle_t, int, int*);
    int least;
    int most;
    int initial;
  } settings[] = {
      {ky_face_track_set_detect_face_cnt_limit, KY_MIN_FACE_LIMIT, KY_MAX_FACE_LIMIT, KY_DEFAULT_FACE_LIMIT},
      {ky_face_track_set_detect_interval, KY_MIN_DETECT_INTERVAL, KY_MAX_DETECT_INTERVAL,
       KY_DEFAULT_DETECT_INTERVAL},
      {ky_face_track_set_alignment_threshold, KY_MIN_ALIGNMENT_THRESHOLD, KY_MAX_ALIGNMENT_THRESHOLD,
       KY_DEFAULT_ALIGNMENT_THRESHOLD},
  };
  const Tracker tracker;
  for (const auto& s : settings) {
    int previous = -7;
    EXPECT_EQ(KY_SUCCESS, s.set(tracker, s.least, &previous));
    EXPECT_EQ(s.initial, previous);
    EXPECT_EQ(KY_SUCCESS, s.set(tracker, s.most, &previous));
    EXPECT_EQ(s.least, previous);
    for (const int value :
         {s.least - 1, s.most + 1, std::numeric_limits<int>::min(), std::numeric_limits<int>::max()}) {
      previous = -7;
      EXPECT_EQ(KY_ERROR_RANGE, s.set(tracker, value, &previous)) << value;
      EXPECT_EQ(-7, previous);
    }
    EXPECT_EQ(KY_SUCCESS, s.set(tracker, s.initial, nullptr));
    EXPECT_EQ(KY_SUCCESS, s.set(tracker, s.initial, &previous));
    EXPECT_EQ(s.initial, previous);

    previous = -7;
    EXPECT_EQ(KY_ERROR_HANDLE, s.set(nullptr, s.least, &previous));
    const Detector detector;
    EXPECT_EQ(KY_ERROR_HANDLE, s.set(detector, s.least, &previous));
    EXPECT_EQ(-7, previous);
  }
}

}  // namespace
}  // namespace kyengine::test
