// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// Model files: detectors and landmark models that dlib serialized, and everything else.
#include "engine/src/dlib_config.h"
// The configuration of dlib comes first.
#include <dlib/image_processing/frontal_face_detector.h>
#include <dlib/serialize.h>
#include <sys/resource.h>
#include <unistd.h>

#include <cmath>
#include <cstdio>
#include <filesystem>
#include <fstream>
#include <map>
#include <sstream>
#include <string>
#include <tuple>

#include "engine_calls.h"
#include "landmark_model.h"

namespace kyengine::test {
namespace {

constexpr int kSide = 128;
const Picture& AboutFace() {
  static const Picture part = Part(Portrait(), 160, 60, kSide, kSide);
  return part;
}

std::string Bytes(const dlib::frontal_face_detector& detector) {
  std::ostringstream out;
  serialize(detector, out);
  return out.str();
}

const std::string& BuiltIn() {
  static const std::string bytes = Bytes(dlib::get_frontal_face_detector());
  return bytes;
}

class ModelTest : public testing::Test {
 protected:
  void TearDown() override {
    for (const std::string& path : written_) {
      std::remove(path.c_str());
    }
  }

  std::string Write(const std::string& name, const std::string& bytes) {
    const std::string path = testing::TempDir() + "ky_engine_" + std::to_string(getpid()) + "_" + name;
    std::ofstream(path, std::ios::binary) << bytes;
    written_.push_back(path);
    return path;
  }

  static int CreateDetector(const std::string& path) {
    ky_handle_t handle = nullptr;
    const int result = ky_face_create_detector(&handle, path.c_str(), KY_CONFIG_DEFAULT);
    EXPECT_EQ(result == KY_SUCCESS, handle != nullptr);
    ky_face_destroy_detector(handle);
    return result;
  }

  /// The one face in a frame about the portrait's.
  static ky_face_t FaceWith(const char* model, int orientation = KY_ORIENTATION_0) {
    const Detector detector(KY_CONFIG_LARGE_FACES, model);
    Detected faces;
    EXPECT_EQ(KY_SUCCESS, Detect(detector, TestFrame(AboutFace(), KY_PIXEL_GRAY, orientation), faces));
    EXPECT_EQ(1, faces.count);
    return faces.count == 1 ? faces[0] : ky_face_t{};
  }

  std::vector<std::string> written_;
};

TEST_F(ModelTest, SerializedDetectorFindsWhatItWouldFind) {
  const std::string path = Write("detector", BuiltIn());
  const ky_face_t expected = FaceWith(nullptr);
  const ky_face_t face = FaceWith(path.c_str());
  ExpectRect(expected.rect, face.rect, 0);
  EXPECT_EQ(expected.score, face.score);
  EXPECT_EQ(0, face.points_count);

  ky_handle_t tracker = nullptr;
  EXPECT_EQ(KY_SUCCESS, ky_face_create_tracker(&tracker, path.c_str(), KY_CONFIG_DEFAULT));
  Tracked tracked;
  EXPECT_EQ(KY_SUCCESS, Track(tracker, TestFrame(AboutFace()), tracked));
  EXPECT_EQ(1, tracked.count);
  ky_face_destroy_tracker(tracker);
}

TEST_F(ModelTest, DetectorOfOneFilterIsAnother) {
  // The third filter alone sees faces that look to a side, which the portrait's does not.
  const dlib::frontal_face_detector all = dlib::get_frontal_face_detector();
  const dlib::frontal_face_detector one(all.get_scanner(), all.get_overlap_tester(), all.get_w(2));
  const std::string path = Write("one", Bytes(one));
  const Detector detector(KY_CONFIG_LARGE_FACES, path.c_str());
  Detected faces;
  ASSERT_EQ(KY_SUCCESS, Detect(detector, TestFrame(AboutFace()), faces));
  EXPECT_EQ(0, faces.count);
}

TEST_F(ModelTest, DetectorsOfTheFirstVersionAreRead) {
  // They have one filter, in front of the overlap tester.
  const dlib::frontal_face_detector good = dlib::get_frontal_face_detector();
  const auto write = [&](bool whole) {
    std::ostringstream out;
    dlib::serialize(1, out);
    dlib::scan_fhog_pyramid<dlib::pyramid_down<6>> scanner;
    scanner.copy_configuration(good.get_scanner());
    serialize(scanner, out);
    dlib::serialize(good.get_w(0), out);
    if (whole) {
      serialize(good.get_overlap_tester(), out);
    }
    return Write("version1", out.str());
  };
  ExpectRect(FaceWith(nullptr).rect, FaceWith(write(true).c_str()).rect, 0);
  EXPECT_EQ(KY_ERROR_MODEL, CreateDetector(write(false)));
}

TEST_F(ModelTest, FilesThatCannotBeOpened) {
  EXPECT_EQ(KY_ERROR_MODEL_FILE, CreateDetector(""));
  EXPECT_EQ(KY_ERROR_MODEL_FILE, CreateDetector(testing::TempDir() + "ky_engine_there_is_none"));
  ky_handle_t handle = nullptr;
  EXPECT_EQ(KY_ERROR_MODEL_FILE, ky_face_create_tracker(&handle, "/no/such/model", KY_CONFIG_DEFAULT));
  EXPECT_EQ(KY_ERROR_MODEL_FILE, ky_verify_create_handle(&handle, ""));
  EXPECT_EQ(nullptr, handle);
}

TEST_F(ModelTest, FilesThatHoldSomethingElse) {
  EXPECT_EQ(KY_ERROR_MODEL, CreateDetector(testing::TempDir())) << "a folder";
  EXPECT_EQ(KY_ERROR_MODEL, CreateDetector(Write("empty", "")));
  EXPECT_EQ(KY_ERROR_MODEL, CreateDetector(Write("text", "This is no model, however long one reads on.")));
  EXPECT_EQ(KY_ERROR_MODEL, CreateDetector(Write("zeros", std::string(5000, '\0'))));
  EXPECT_EQ(KY_ERROR_MODEL, CreateDetector(Write("ones", std::string(5000, '\1'))));
  EXPECT_EQ(KY_ERROR_MODEL, CreateDetector(Write("picture", std::string(PortraitFile()))));

  ky_handle_t handle = nullptr;
  EXPECT_EQ(KY_ERROR_MODEL, ky_face_create_tracker(&handle, Write("text", "none").c_str(), 0));
  EXPECT_EQ(KY_ERROR_MODEL, ky_verify_create_handle(&handle, Write("text", "none").c_str()));
  EXPECT_EQ(KY_ERROR_MODEL, ky_verify_create_handle(&handle, Write("detector", BuiltIn()).c_str()))
      << "a verifier takes landmarks alone";
}

TEST_F(ModelTest, TruncatedFilesAreRefused) {
  const std::string landmarks = Landmarks(FivePoints({0.3F, 0.3F}, {0.7F, 0.3F}));
  for (const std::string& whole : {BuiltIn(), landmarks}) {
    ASSERT_EQ(KY_SUCCESS, CreateDetector(Write("whole", whole)));
    for (const size_t length : {size_t{1}, size_t{2}, size_t{5}, size_t{10}, whole.size() / 3,
                                whole.size() / 2, whole.size() - 2, whole.size() - 1}) {
      EXPECT_EQ(KY_ERROR_MODEL, CreateDetector(Write("truncated", whole.substr(0, length)))) << length;
    }
  }
}

TEST_F(ModelTest, DetectorsWhosePartsDoNotFitAreRefused) {
  const dlib::frontal_face_detector good = dlib::get_frontal_face_detector();
  using Weights = dlib::frontal_face_detector::feature_vector_type;
  const Weights weights = good.get_w(0);
  const auto write = [&](int version, const std::vector<Weights>& filters, unsigned long count) {
    std::ostringstream out;
    dlib::serialize(version, out);
    dlib::scan_fhog_pyramid<dlib::pyramid_down<6>> scanner;
    scanner.copy_configuration(good.get_scanner());
    serialize(scanner, out);
    serialize(good.get_overlap_tester(), out);
    dlib::serialize(count, out);
    for (const Weights& w : filters) {
      dlib::serialize(w, out);
    }
    return Write("parts", out.str());
  };
  EXPECT_EQ(KY_SUCCESS, CreateDetector(write(2, {weights}, 1)));
  EXPECT_EQ(KY_ERROR_MODEL, CreateDetector(write(3, {weights}, 1)));
  EXPECT_EQ(KY_ERROR_MODEL, CreateDetector(write(2, {}, 0)));
  EXPECT_EQ(KY_ERROR_MODEL, CreateDetector(write(2, {weights}, 1000000000)));
  const Weights shorter = dlib::rowm(weights, dlib::range(0, weights.size() - 2));
  const Weights none;
  EXPECT_EQ(KY_ERROR_MODEL, CreateDetector(write(2, {shorter}, 1)));
  EXPECT_EQ(KY_ERROR_MODEL, CreateDetector(write(2, {weights, none}, 2)));
}

TEST_F(ModelTest, DetectorsThatCannotScanAreRefused) {
  static const dlib::frontal_face_detector kGood = dlib::get_frontal_face_detector();
  static const auto& kScanner = kGood.get_scanner();
  static const long kNumbers = kScanner.get_num_dimensions();
  struct Scan {
    unsigned long cell = kScanner.get_cell_size();
    unsigned long padding = kScanner.get_padding();
    unsigned long width = kScanner.get_detection_window_width();
    unsigned long height = kScanner.get_detection_window_height();
    unsigned long levels = kScanner.get_max_pyramid_levels();
    unsigned long smallest = kScanner.get_min_pyramid_layer_width();
    unsigned long features = 0;
    double overlap = 0.5;
    long numbers = kNumbers;
    long length = kNumbers + 1;
  };
  const auto write = [&](const Scan& scan) {
    std::ostringstream out;
    const auto natural = [&](unsigned long number) { dlib::serialize(number, out); };
    dlib::serialize(2, out);
    dlib::serialize(1, out);
    natural(scan.features);
    natural(0);
    for (const unsigned long number :
         {scan.cell, scan.padding, scan.width, scan.height, scan.levels, scan.smallest, scan.smallest}) {
      natural(number);
    }
    dlib::serialize(1.0, out);
    dlib::serialize(scan.numbers, out);
    dlib::serialize(scan.overlap, out);
    dlib::serialize(1.0, out);
    natural(1);
    dlib::matrix<double, 0, 1> weights(scan.length);
    weights = 0;
    dlib::serialize(weights, out);
    return Write("scan", out.str());
  };
  EXPECT_EQ(KY_SUCCESS, CreateDetector(write({})));
  EXPECT_EQ(KY_ERROR_MODEL, CreateDetector(write({.cell = 0}))) << "a division by 0";
  EXPECT_EQ(KY_ERROR_MODEL, CreateDetector(write({.cell = 65})));
  EXPECT_EQ(KY_ERROR_MODEL, CreateDetector(write({.padding = 1UL << 40})));
  EXPECT_EQ(KY_ERROR_MODEL, CreateDetector(write({.width = 7})));
  EXPECT_EQ(KY_ERROR_MODEL, CreateDetector(write({.width = 1UL << 40})));
  EXPECT_EQ(KY_ERROR_MODEL, CreateDetector(write({.levels = 0})));
  EXPECT_EQ(KY_ERROR_MODEL, CreateDetector(write({.levels = 1UL << 63}))) << "a search without an end";
  EXPECT_EQ(KY_ERROR_MODEL, CreateDetector(write({.smallest = 0}))) << "pictures without pixels";
  EXPECT_EQ(KY_ERROR_MODEL, CreateDetector(write({.features = 1UL << 28}))) << "memory for features";
  EXPECT_EQ(KY_ERROR_MODEL, CreateDetector(write({.overlap = NAN})));
  EXPECT_EQ(KY_ERROR_MODEL, CreateDetector(write({.overlap = 1.5})));
  EXPECT_EQ(KY_ERROR_MODEL, CreateDetector(write({.numbers = kNumbers + 1})));
  EXPECT_EQ(KY_ERROR_MODEL, CreateDetector(write({.length = kNumbers})));
}

TEST_F(ModelTest, PyramidsEndWithTheirLastPixel) {
  // Levels as small as a model may ask for, and no fewer than it may.
  dlib::scan_fhog_pyramid<dlib::pyramid_down<6>> scanner;
  const dlib::frontal_face_detector good = dlib::get_frontal_face_detector();
  scanner.copy_configuration(good.get_scanner());
  scanner.set_min_pyramid_layer_size(1, 1);
  const dlib::frontal_face_detector deep(scanner, good.get_overlap_tester(), good.get_w(0));
  const Detector detector(KY_CONFIG_LARGE_FACES, Write("deep", Bytes(deep)).c_str());
  Detected faces;
  ASSERT_EQ(KY_SUCCESS, Detect(detector, TestFrame(AboutFace()), faces));
  EXPECT_EQ(1, faces.count);
}

TEST_F(ModelTest, WindowsNeedNotBeSquare) {
  // A filter that everything answers to: faces are wherever there is room for one.
  const dlib::frontal_face_detector good = dlib::get_frontal_face_detector();
  dlib::scan_fhog_pyramid<dlib::pyramid_down<6>> scanner;
  scanner.copy_configuration(good.get_scanner());
  scanner.set_detection_window_size(48, 96);
  dlib::matrix<double, 0, 1> weights(scanner.get_num_dimensions() + 1);
  weights = 0;
  weights(weights.size() - 1) = -1;
  const dlib::frontal_face_detector any(scanner, good.get_overlap_tester(), weights);
  const Detector detector(KY_CONFIG_LARGE_FACES, Write("upright", Bytes(any)).c_str());
  const Picture narrow = Part(Portrait(), 160, 60, 56, 104);
  for (const int orientation : {KY_ORIENTATION_0, KY_ORIENTATION_90}) {
    Detected faces;
    ASSERT_EQ(KY_SUCCESS, Detect(detector, TestFrame(narrow, KY_PIXEL_GRAY, orientation), faces));
    EXPECT_GT(faces.count, 0);
  }
  Detected none;
  ASSERT_EQ(KY_SUCCESS, Detect(detector, TestFrame(Part(Portrait(), 160, 60, 104, 56)), none));
  EXPECT_EQ(0, none.count);
}

// ---- landmarks
// -----------------------------------------------------------------------------------------------

TEST_F(ModelTest, LandmarksComeInTheFramesCoordinates) {
  const std::vector<ky_pointf_t> places = FivePoints({0.25F, 0.25F}, {0.75F, 0.35F});
  const std::string path = Write("detector", BuiltIn());
  Write(std::string("detector") + KY_LANDMARKS_SUFFIX, Landmarks(places));
  const ky_rect_t box = FaceWith(nullptr).rect;
  for (const int orientation :
       {KY_ORIENTATION_0, KY_ORIENTATION_90, KY_ORIENTATION_180, KY_ORIENTATION_270}) {
    const ky_face_t face = FaceWith(path.c_str(), orientation);
    ExpectRect(Turned(box, kSide, kSide, orientation), face.rect, 0);
    ASSERT_EQ(5, face.points_count);
    for (size_t i = 0; i < places.size(); ++i) {
      float x = static_cast<float>(box.left) + places[i].x * static_cast<float>(box.right - 1 - box.left);
      float y = static_cast<float>(box.top) + places[i].y * static_cast<float>(box.bottom - 1 - box.top);
      for (int turn = 0; turn < orientation; turn += 90) {
        const float turned_y = kSide - 1 - x;
        x = y;
        y = turned_y;
      }
      EXPECT_NEAR(x, face.points_array[i].x, 0.51) << "point " << i << ", turned by " << orientation;
      EXPECT_NEAR(y, face.points_array[i].y, 0.51) << "point " << i << ", turned by " << orientation;
    }
    // Of the face, not of the frame.
    EXPECT_NEAR(std::hypot(0.5, 0.1) * (box.right - 1 - box.left), face.eye_dist, 1.5);
    EXPECT_NEAR(std::atan2(0.1, 0.5) * 180 / M_PI, face.roll, 1.5);
    EXPECT_EQ(0, face.yaw);
    EXPECT_EQ(0, face.pitch);
  }
}

TEST_F(ModelTest, LandmarkModelAloneGoesWithTheBuiltInDetector) {
  const std::string path = Write("five", Landmarks(FivePoints({0.3F, 0.3F}, {0.7F, 0.3F})));
  const ky_face_t face = FaceWith(path.c_str());
  ExpectRect(FaceWith(nullptr).rect, face.rect, 0);
  EXPECT_EQ(5, face.points_count);
  EXPECT_NEAR(0, face.roll, 0.01);

  const Tracker tracker(KY_CONFIG_LARGE_FACES, path.c_str());
  for (int i = 0; i < 2; ++i) {
    Tracked faces;
    ASSERT_EQ(KY_SUCCESS, Track(tracker, TestFrame(AboutFace()), faces));
    ASSERT_EQ(1, faces.count);
    EXPECT_EQ(5, faces[0].points_count);
  }
}

TEST_F(ModelTest, UnknownLayoutsSayNothingOfThePose) {
  const std::string path = Write("nine", Landmarks(std::vector<ky_pointf_t>(9, {0.5F, 0.5F})));
  const ky_face_t face = FaceWith(path.c_str());
  EXPECT_EQ(9, face.points_count);
  EXPECT_EQ(0, face.eye_dist);
  EXPECT_EQ(0, face.yaw);
  EXPECT_EQ(0, face.pitch);
  EXPECT_EQ(0, face.roll);
}

TEST_F(ModelTest, LandmarksMustFitTheRecord) {
  const std::vector<ky_pointf_t> most(KY_FACE_MAX_POINTS, {0.5F, 0.5F});
  EXPECT_EQ(KY_FACE_MAX_POINTS, FaceWith(Write("most", Landmarks(most)).c_str()).points_count);
  const std::vector<ky_pointf_t> more(KY_FACE_MAX_POINTS + 1, {0.5F, 0.5F});
  EXPECT_EQ(KY_ERROR_MODEL, CreateDetector(Write("more", Landmarks(more))));
  EXPECT_EQ(KY_ERROR_MODEL, CreateDetector(Write("no_points", Landmarks({}))));
}

TEST_F(ModelTest, LandmarksWhosePartsDoNotFitAreRefused) {
  const ky_face_t face = FaceWith(Write("parts", LandmarkParts().Bytes()).c_str());
  EXPECT_EQ(2, face.points_count);
  const auto refused = [&](const LandmarkParts& parts) {
    return CreateDetector(Write("parts", parts.Bytes())) == KY_ERROR_MODEL;
  };
  EXPECT_TRUE(refused({.shape = {0.3F, 0.3F, 0.7F}})) << "half a point";
  EXPECT_TRUE(refused({.shape = {0.3F, 0.3F, 0.7F, NAN}}));
  EXPECT_TRUE(refused({.shape = {0.3F, 0.3F, 0.7F, 1e30F}}));
  EXPECT_TRUE(refused({.splits = {{0, 2}}})) << "a pixel that there is not";
  EXPECT_TRUE(refused({.splits = {{1UL << 40, 0}}}));
  EXPECT_TRUE(refused({.splits = {}})) << "more leaves than ways";
  EXPECT_TRUE(refused({.splits = {}, .leaves = {}})) << "no leaf";
  EXPECT_TRUE(refused({.splits = {{0, 1}, {0, 1}}, .leaves = {{0, 0, 0, 0}, {0, 0, 0, 0}, {0, 0, 0, 0}}}))
      << "a tree with a gap";
  EXPECT_TRUE(refused({.leaves = {{0, 0, 0, 0}, {0, 0}}})) << "a leaf of another shape";
  EXPECT_TRUE(refused({.leaves = {{0, 0, 0, 0}, {0, 0, 0, 0, 0, 0}}}));
  EXPECT_TRUE(refused({.anchors = {0, 2}})) << "a point that there is not";
  EXPECT_TRUE(refused({.anchors = {0, 1, 1}})) << "more points than distances";
  EXPECT_TRUE(refused({.anchors = {0}})) << "more distances than points";
  EXPECT_TRUE(refused({.deltas = {{0, 0}, {0, INFINITY}}}));
  EXPECT_TRUE(refused({.anchor_lists = 0}));
}

/// Bytes of memory that the process had at most.
size_t MostMemory() {
  rusage usage = {};
  getrusage(RUSAGE_SELF, &usage);
  return static_cast<size_t>(usage.ru_maxrss) * 1024;
}

TEST_F(ModelTest, SizesInFilesTakeNoMemory) {
  constexpr long kMany = 1L << 27;
  constexpr unsigned long kCount = kMany;
  const auto bytes = [](auto... numbers) {
    std::ostringstream out;
    (dlib::serialize(numbers, out), ...);
    return out.str();
  };
  ASSERT_EQ(KY_ERROR_MODEL, CreateDetector(Write("first", "This is no model.")));
  const size_t before = MostMemory();
  dlib::matrix<float, 0, 1> point(2);
  point = 0;
  for (const std::string& lie : {
           bytes(1, -kMany, -1L),               // a shape of many points
           bytes(1, -(1L << 33), -(1L << 33)),  // so many that their number wraps
           bytes(1, point, kCount),             // many cascades
           bytes(1, point, 1UL, kCount),        // many trees
           bytes(1, point, 1UL, 1UL, kCount),   // many decisions
           bytes(1, point, 0UL, kCount),        // many lists of pixels
           bytes(2, 1, kCount, kCount),         // a detector with features of a picture
       }) {
    EXPECT_EQ(KY_ERROR_MODEL, CreateDetector(Write("lie", lie)));
  }
  EXPECT_LT(MostMemory() - before, size_t{1} << 26);
}

TEST_F(ModelTest, FileBesideTheModelMustHoldLandmarks) {
  const std::string path = Write("detector", BuiltIn());
  EXPECT_EQ(KY_SUCCESS, CreateDetector(path));
  for (const std::string& bytes : {std::string("none"), std::string(), BuiltIn()}) {
    Write(std::string("detector") + KY_LANDMARKS_SUFFIX, bytes);
    EXPECT_EQ(KY_ERROR_LANDMARK_MODEL, CreateDetector(path));
  }
}

TEST_F(ModelTest, ReplacedFilesAreReadAgain) {
  const std::string path = Write("changing", Landmarks(std::vector<ky_pointf_t>(3, {0.5F, 0.5F})));
  const Detector first(KY_CONFIG_LARGE_FACES, path.c_str());
  Write("changing", Landmarks(std::vector<ky_pointf_t>(4, {0.5F, 0.5F})));
  EXPECT_EQ(4, FaceWith(path.c_str()).points_count);
  Detected faces;
  ASSERT_EQ(KY_SUCCESS, Detect(first, TestFrame(AboutFace()), faces));
  ASSERT_EQ(1, faces.count);
  EXPECT_EQ(3, faces[0].points_count);
}

TEST_F(ModelTest, LandmarksInUseAreShared) {
  // What takes the place of a file unseen shows which models were read again.
  const std::string path = Write("shared", Landmarks(std::vector<ky_pointf_t>(5, {0.25F, 0.5F})));
  const auto written = std::filesystem::last_write_time(path);
  const ky_face_t before = FaceWith(path.c_str());
  const auto first_point = [&] { return FaceWith(path.c_str()).points_array[0].x; };
  {
    const Detector inUse(KY_CONFIG_LARGE_FACES, path.c_str());
    Write("shared", Landmarks(std::vector<ky_pointf_t>(5, {0.75F, 0.5F})));
    std::filesystem::last_write_time(path, written);
    EXPECT_EQ(before.points_array[0].x, first_point());
  }
  EXPECT_LT(before.points_array[0].x + 10, first_point()) << "nobody uses the first any more";
}

TEST_F(ModelTest, PoseOfSixtyEightPoints) {
  // The nose tip, eye corners and mouth corners of an average head, seen from far away after a nod and a
  // turn.
  const std::map<size_t, std::array<double, 3>> head = {{30, {0, 0, 0}},
                                                        {36, {-225, -183, -135}},
                                                        {45, {225, -183, -135}},
                                                        {48, {-144, 162, -125}},
                                                        {54, {144, 162, -125}}};
  for (const auto& [yaw, pitch] :
       {std::pair(0.0, 0.0), {25.0, 0.0}, {-25.0, 0.0}, {0.0, 20.0}, {0.0, -20.0}, {20.0, 15.0}}) {
    const double sy = std::sin(yaw * M_PI / 180);
    const double cy = std::cos(yaw * M_PI / 180);
    const double sp = std::sin(pitch * M_PI / 180);
    const double cp = std::cos(pitch * M_PI / 180);
    std::vector<ky_pointf_t> points(68, {0.5F, 0.5F});
    for (const auto& [index, p] : head) {
      const double y = cp * p[1] + sp * p[2];
      const double z = -sp * p[1] + cp * p[2];
      const double x = cy * p[0] + sy * z;
      points[index] = {static_cast<float>(0.5 + x / 500), static_cast<float>(0.5 + y / 500)};
    }
    const ky_face_t face = FaceWith(Write("pose", Landmarks(points)).c_str());
    ASSERT_EQ(68, face.points_count);
    EXPECT_NEAR(yaw, face.yaw, 4) << pitch;
    EXPECT_NEAR(pitch, face.pitch, 4) << yaw;
  }
  // A face that is its own mirror image looks straight ahead, whatever its proportions.
  // Points are whole pixels: their distances from the middle are.
  const ky_rect_t box = FaceWith(nullptr).rect;
  const float side = static_cast<float>(box.right - 1 - box.left);
  const float middle = std::floor(side / 2) / side;
  std::vector<ky_pointf_t> symmetric(68, {middle, 0.5F});
  for (const auto& [left, right, pixels, down] :
       {std::tuple(size_t{36}, size_t{45}, 26, 0.3F), std::tuple(size_t{48}, size_t{54}, 21, 0.8F)}) {
    symmetric[left] = {middle - static_cast<float>(pixels) / side, down};
    symmetric[right] = {middle + static_cast<float>(pixels) / side, down};
  }
  EXPECT_NEAR(0, FaceWith(Write("pose", Landmarks(symmetric)).c_str()).yaw, 0.01);

  // Points in one place are no head.
  const ky_face_t none =
      FaceWith(Write("pose", Landmarks(std::vector<ky_pointf_t>(68, {0.5F, 0.5F}))).c_str());
  EXPECT_EQ(0, none.yaw);
  EXPECT_EQ(0, none.pitch);
  EXPECT_EQ(0, none.roll);
  EXPECT_EQ(0, none.eye_dist);
}

TEST_F(ModelTest, VerifierAlignsByALandmarkModelOfItsOwn) {
  // Eyes rolled by 30 degrees in every box, as they are in the view.
  const float dx = static_cast<float>(0.2 * std::cos(M_PI / 6));
  const float dy = static_cast<float>(0.2 * std::sin(M_PI / 6));
  const std::string path =
      Write("rolled", Landmarks(FivePoints({0.5F - dx, 0.3F - dy}, {0.5F + dx, 0.3F + dy})));
  const TestFrame rolled(View(Portrait(), 222, 126, 1, 30, kSide));
  ky_handle_t verifier = nullptr;
  ASSERT_EQ(KY_SUCCESS, ky_verify_create_handle(&verifier, path.c_str()));
  ky_face_t face = {};
  face.rect = {20, 20, 107, 107};
  Feature by_model;
  EXPECT_EQ(KY_SUCCESS, GetFeature(verifier, rolled, face, by_model));

  // The same points in the record: the same crop. None, and no model: another.
  face.points_count = 5;
  const std::vector<ky_pointf_t> places = FivePoints({0.5F - dx, 0.3F - dy}, {0.5F + dx, 0.3F + dy});
  for (size_t i = 0; i < places.size(); ++i) {
    face.points_array[i] = {20 + 86 * places[i].x, 20 + 86 * places[i].y};
  }
  Feature by_record;
  EXPECT_EQ(KY_SUCCESS, GetFeature(verifier, rolled, face, by_record));
  face.points_count = 0;
  ky_handle_t without = nullptr;
  ASSERT_EQ(KY_SUCCESS, ky_verify_create_handle(&without, nullptr));
  Feature by_rectangle;
  EXPECT_EQ(KY_SUCCESS, GetFeature(without, rolled, face, by_rectangle));
  float same = 0;
  float other = 0;
  EXPECT_EQ(KY_SUCCESS, ky_verify_compare_feature(verifier, by_model.feature, by_record.feature, &same));
  EXPECT_EQ(KY_SUCCESS, ky_verify_compare_feature(verifier, by_model.feature, by_rectangle.feature, &other));
  EXPECT_GT(same, 0.9F);
  EXPECT_LT(other, 0.6F);
  ky_verify_destroy_handle(without);
  ky_verify_destroy_handle(verifier);
}

}  // namespace
}  // namespace kyengine::test
