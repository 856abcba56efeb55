// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// Verifiers with a descriptor's model: random weights, written as a file.
#include <unistd.h>

#include <array>
#include <bit>
#include <cmath>
#include <cstdio>
#include <cstring>
#include <fstream>
#include <functional>
#include <limits>
#include <memory>
#include <string>

#include "engine_calls.h"
#include "feature_text.h"
#include "landmark_model.h"
#include "tests/support/descriptor_model.h"

namespace kyengine::test {
namespace {

/// Files that go when the tests are over.
class Files {
 public:
  ~Files() {
    for (const std::string& path : paths_) {
      std::remove(path.c_str());
    }
  }

  std::string Write(const std::string& name, const std::vector<uint8_t>& bytes) {
    const std::string path = testing::TempDir() + "ky_described_" + std::to_string(getpid()) + "_" + name;
    std::ofstream(path, std::ios::binary)
        .write(reinterpret_cast<const char*>(bytes.data()), static_cast<std::streamsize>(bytes.size()));
    paths_.push_back(path);
    return path;
  }

 private:
  std::vector<std::string> paths_;
};

class Verifier {
 public:
  explicit Verifier(const char* path) { EXPECT_EQ(KY_SUCCESS, ky_verify_create_handle(&handle_, path)); }
  explicit Verifier(const std::string& path) : Verifier(path.c_str()) {}
  ~Verifier() { ky_verify_destroy_handle(handle_); }
  Verifier(const Verifier&) = delete;
  Verifier& operator=(const Verifier&) = delete;
  operator ky_handle_t() const { return handle_; }

 private:
  ky_handle_t handle_ = nullptr;
};

/// The portrait's eyes, and its face with them.
constexpr ky_pointf_t kLeftEye = {201, 106};
constexpr ky_pointf_t kRightEye = {244, 109};

ky_face_t FaceWithEyes(ky_pointf_t left, ky_pointf_t right, const ky_rect_t& rect = kPortraitFace) {
  ky_face_t face = {};
  face.rect = rect;
  face.points_count = 5;
  const ky_pointf_t points[] = {right, right, left, left, {(left.x + right.x) / 2, left.y + 20}};
  std::copy(std::begin(points), std::end(points), face.points_array);
  return face;
}

std::string TextOf(const Feature& feature) {
  std::vector<char> text(KY_DESCRIPTOR_TEXT_LENGTH + 1, '#');
  ky_verify_serialize_feature(feature.feature, text.data());
  EXPECT_EQ('#', text.back()) << "written beyond the text";
  EXPECT_EQ('\0', text[KY_DESCRIPTOR_TEXT_LENGTH - 1]);
  return text.data();
}

class DescribedTest : public testing::Test {
 protected:
  // The model, its file and the verifier are large, and the same for all tests.
  static void SetUpTestSuite() {
    convolutions_ = new auto(RandomModel(faceDescriptorShape(), 21));
    model_ = new std::vector<uint8_t>(FileOf(*convolutions_));
    files_ = new Files;
    path_ = new std::string(files_->Write("model", *model_));
    shared_ = new Verifier(*path_);
  }
  static void TearDownTestSuite() {
    delete shared_;
    delete files_;
    delete model_;
    delete path_;
    delete convolutions_;
  }

  std::unique_ptr<Feature> FeatureOf(const TestFrame& frame, const ky_face_t& face) const {
    auto feature = std::make_unique<Feature>();
    EXPECT_EQ(KY_SUCCESS, GetFeature(verifier_, frame, face, *feature));
    EXPECT_EQ(KY_DESCRIPTOR_LENGTH, feature->length);
    return feature;
  }

  std::unique_ptr<Feature> PortraitFeature(int format = KY_PIXEL_RGB) const {
    return FeatureOf(TestFrame(Portrait(), format), FaceWithEyes(kLeftEye, kRightEye));
  }

  /// The text of the portrait's feature, which many tests take.
  const std::string& PortraitText() const {
    static const std::string text = TextOf(*PortraitFeature());
    return text;
  }

  static int Create(const std::vector<uint8_t>& bytes) {
    Files files;
    const std::string path = files.Write("other", bytes);
    ky_handle_t handle = nullptr;
    const int result = ky_verify_create_handle(&handle, path.c_str());
    EXPECT_EQ(result == KY_SUCCESS, handle != nullptr);
    ky_verify_destroy_handle(handle);
    return result;
  }

  float Compare(ky_feature_t a, ky_feature_t b) const {
    float score = -1;
    EXPECT_EQ(KY_SUCCESS, ky_verify_compare_feature(verifier_, a, b, &score));
    return score;
  }

  static inline std::vector<ModelConvolution>* convolutions_ = nullptr;
  static inline std::vector<uint8_t>* model_ = nullptr;
  static inline Files* files_ = nullptr;
  static inline std::string* path_ = nullptr;
  static inline Verifier* shared_ = nullptr;
  const Verifier& verifier_ = *shared_;
};

TEST_F(DescribedTest, TellsItsVersionAndLength) {
  EXPECT_EQ(KY_DESCRIPTOR_VERSION, ky_verify_get_version(verifier_));
  EXPECT_EQ(KY_DESCRIPTOR_LENGTH, ky_verify_get_feature_length(verifier_));
  EXPECT_EQ((KY_DESCRIPTOR_LENGTH + 2) / 3 * 4 + 1, KY_DESCRIPTOR_TEXT_LENGTH);
}

TEST_F(DescribedTest, FacesWithoutEyesAreRefused) {
  const TestFrame frame(Portrait());
  ky_face_t face = {};
  face.rect = kPortraitFace;
  for (const int points : {0, 1, 5, 67, 68, 69}) {
    // Of 5 and 68 points both eyes are in one place.
    face.points_count = points;
    Feature feature;
    feature.length = 7;
    EXPECT_EQ(KY_ERROR_EYES, GetFeature(verifier_, frame, face, feature)) << points;
    EXPECT_EQ(nullptr, feature.feature);
    EXPECT_EQ(0, feature.length);
  }
}

TEST_F(DescribedTest, SmallFacesAreRefused) {
  const TestFrame frame(Portrait());
  const auto get = [&](float distance) {
    Feature feature;
    return GetFeature(verifier_, frame, FaceWithEyes({220 - distance / 2, 108}, {220 + distance / 2, 108}),
                      feature);
  };
  EXPECT_EQ(KY_SUCCESS, get(KY_SMALLEST_EYE_DISTANCE));
  EXPECT_EQ(KY_ERROR_FACE, get(KY_SMALLEST_EYE_DISTANCE - 0.1F));
  EXPECT_EQ(KY_ERROR_FACE, get(0.5F));
  EXPECT_EQ(KY_SUCCESS, get(480));
  EXPECT_EQ(KY_ERROR_FACE, get(600));
}

TEST_F(DescribedTest, TextsAreBase64AndSurviveARoundTrip) {
  const auto feature = PortraitFeature();
  const std::string text = TextOf(*feature);
  const std::vector<uint8_t> bytes = FromBase64(text);
  ASSERT_EQ(static_cast<size_t>(KY_DESCRIPTOR_LENGTH), bytes.size());
  EXPECT_EQ(text, Base64(bytes));
  uint32_t tag = 0;
  std::memcpy(&tag, &(*model_)[32], sizeof(tag));
  const std::array<uint8_t, 9> head = {'K',
                                       'Y',
                                       2,
                                       static_cast<uint8_t>(tag),
                                       static_cast<uint8_t>(tag >> 8),
                                       static_cast<uint8_t>(tag >> 16),
                                       static_cast<uint8_t>(tag >> 24),
                                       128,
                                       0};
  EXPECT_TRUE(std::equal(head.begin(), head.end(), bytes.begin()));

  Feature read;
  read.feature = ky_verify_deserialize_feature(text.c_str());
  ASSERT_NE(nullptr, read.feature);
  EXPECT_EQ(text, TextOf(read));
  EXPECT_EQ(1.0F, Compare(feature->feature, read.feature));
}

/// CRC-32 by its definition, over all but the last four bytes, which it is written to.
std::string Sealed(std::vector<uint8_t> bytes) {
  uint32_t remainder = 0xffffffff;
  for (size_t i = 0; i + 4 < bytes.size(); ++i) {
    remainder ^= bytes[i];
    for (int bit = 0; bit < 8; ++bit) {
      remainder = remainder >> 1 ^ ((remainder & 1) != 0 ? 0xedb88320 : 0);
    }
  }
  remainder = ~remainder;
  std::memcpy(&bytes[bytes.size() - 4], &remainder, sizeof(remainder));
  return Base64(bytes);
}

TEST_F(DescribedTest, TextsThatWereNeverWrittenAreRefused) {
  const std::string& text = PortraitText();
  const std::vector<uint8_t> bytes = FromBase64(text);
  ASSERT_EQ(text, Sealed(bytes));
  for (size_t i = 0; i < bytes.size(); ++i) {
    std::vector<uint8_t> changed = bytes;
    changed[i] ^= 0x10;
    EXPECT_TRUE(IsRefused(Base64(changed))) << i;
  }
  for (const float bad : {std::numeric_limits<float>::quiet_NaN(), std::numeric_limits<float>::infinity(),
                          -std::numeric_limits<float>::infinity()}) {
    for (const size_t number : {size_t{0}, size_t{64}, size_t{127}}) {
      std::vector<uint8_t> changed = bytes;
      std::memcpy(&changed[9 + 4 * number], &bad, sizeof(bad));
      EXPECT_TRUE(IsRefused(Sealed(changed)));
    }
  }
  for (const uint8_t version : {0, 1, 3, 255}) {
    std::vector<uint8_t> changed = bytes;
    changed[2] = version;
    EXPECT_TRUE(IsRefused(Sealed(changed))) << version;
  }
  std::vector<uint8_t> other_count = bytes;
  other_count[7] = 127;
  EXPECT_TRUE(IsRefused(Sealed(other_count)));
  for (const char* more : {"A", "AAAA", "=", "\n"}) {
    EXPECT_TRUE(IsRefused(text + more));
  }
  for (size_t length = 0; length < text.size(); length += 7) {
    EXPECT_TRUE(IsRefused(text.substr(0, length)));
  }
}

TEST_F(DescribedTest, SimilarityIsHalfAtTheThresholdsDistance) {
  const std::vector<uint8_t> bytes = FromBase64(PortraitText());
  std::array<float, 128> numbers = {};
  const auto feature_of = [&] {
    std::vector<uint8_t> changed = bytes;
    std::memcpy(&changed[9], numbers.data(), sizeof(numbers));
    auto feature = std::make_unique<Feature>();
    feature->feature = ky_verify_deserialize_feature(Sealed(changed).c_str());
    EXPECT_NE(nullptr, feature->feature);
    return feature;
  };
  const auto origin = feature_of();
  for (const double distance : {0.0, 0.1, 0.3, 0.6, 0.9, 1.19, 1.2, 1.5, 1e9}) {
    // In one number, and spread over all.
    for (const bool spread : {false, true}) {
      numbers.fill(spread ? static_cast<float>(distance / std::sqrt(128.0)) : 0);
      if (!spread) {
        numbers[77] = static_cast<float>(-distance);
      }
      const auto other = feature_of();
      const float score = Compare(origin->feature, other->feature);
      EXPECT_NEAR(std::max(0.0, 1 - distance / 1.2), score, 1e-6) << distance;
      EXPECT_EQ(score, Compare(other->feature, origin->feature));
      EXPECT_EQ(1.0F, Compare(other->feature, other->feature));
    }
  }
  numbers.fill(std::numeric_limits<float>::max());
  EXPECT_EQ(0.0F, Compare(origin->feature, feature_of()->feature));
}

TEST_F(DescribedTest, KindsNeverCompare) {
  Files files;
  const Verifier patterns(nullptr);
  const Verifier other(files.Write("second", FileOf(RandomModel(faceDescriptorShape(), 22))));
  const Verifier same(files.Write("copy", *model_));
  const TestFrame frame(Portrait(), KY_PIXEL_RGB);
  const ky_face_t face = FaceWithEyes(kLeftEye, kRightEye);
  const std::array<ky_handle_t, 3> verifiers = {verifier_, patterns, other};
  std::array<Feature, 3> features;
  for (size_t i = 0; i < features.size(); ++i) {
    ASSERT_EQ(KY_SUCCESS, GetFeature(verifiers[i], frame, face, features[i]));
  }
  for (size_t v = 0; v < 3; ++v) {
    for (size_t a = 0; a < 3; ++a) {
      for (size_t b = 0; b < 3; ++b) {
        float score = 7;
        const int result =
            ky_verify_compare_feature(verifiers[v], features[a].feature, features[b].feature, &score);
        EXPECT_EQ(a == v && b == v ? KY_SUCCESS : KY_ERROR_FEATURE_KIND, result) << v << a << b;
        EXPECT_EQ(a == v && b == v ? 1.0F : 0.0F, score);
      }
    }
  }
  float score = 0;
  EXPECT_EQ(KY_SUCCESS, ky_verify_compare_feature(same, features[0].feature, features[0].feature, &score));
}

TEST_F(DescribedTest, ColourCounts) {
  const std::string& rgb = PortraitText();
  for (const int format : {KY_PIXEL_BGR, KY_PIXEL_BGRA, KY_PIXEL_RGBA}) {
    EXPECT_EQ(rgb, TextOf(*PortraitFeature(format))) << format;
  }
  EXPECT_EQ(TextOf(*PortraitFeature(KY_PIXEL_NV21)), TextOf(*PortraitFeature(KY_PIXEL_NV12)));
  EXPECT_NE(rgb, TextOf(*PortraitFeature(KY_PIXEL_GRAY)));
}

/// The portrait as a frame made with whole numbers, the same on every machine.
TestFrame WholeNumbers(int format) {
  TestFrame frame(Portrait(), format);
  if (format == KY_PIXEL_RGB) {
    return frame;
  }
  for (int y = 0; y < frame.height; ++y) {
    for (int x = 0; x < frame.width; ++x) {
      const uint8_t* const p = Portrait().at(x, y);
      frame.bytes[static_cast<size_t>(y * frame.stride + x)] = p[1];
      if (format == KY_PIXEL_NV21) {
        uint8_t* const chroma =
            &frame.bytes[static_cast<size_t>((frame.height + y / 2) * frame.stride + x / 2 * 2)];
        chroma[0] = static_cast<uint8_t>(128 + (p[0] - p[1]) / 2);
        chroma[1] = static_cast<uint8_t>(128 + (p[2] - p[1]) / 2);
      }
    }
  }
  return frame;
}

TEST_F(DescribedTest, EveryMachineGivesTheSameFeature) {
  const std::pair<int, uint32_t> expected[] = {
      {KY_PIXEL_RGB, 323317156}, {KY_PIXEL_NV21, 1971039753}, {KY_PIXEL_GRAY, 506912797}};
  for (const auto& [format, golden] : expected) {
    uint32_t hash = 2166136261;
    for (const char c : TextOf(*FeatureOf(WholeNumbers(format), FaceWithEyes(kLeftEye, kRightEye)))) {
      hash = (hash ^ static_cast<uint8_t>(c)) * 16777619;
    }
    EXPECT_EQ(golden, hash) << format;
  }
}

// ---- model files

std::vector<uint8_t> Following(const std::string& bytes) { return {bytes.begin(), bytes.end()}; }

TEST_F(DescribedTest, ALandmarkModelMayFollow) {
  const std::vector<ky_pointf_t> places = FivePoints({0.3F, 0.3F}, {0.7F, 0.33F});
  Files files;
  const Verifier both(files.Write("both", FileOf(*convolutions_, Following(Landmarks(places)))));
  EXPECT_EQ(KY_DESCRIPTOR_VERSION, ky_verify_get_version(both));
  const TestFrame frame(Portrait(), KY_PIXEL_RGB);
  ky_face_t face = {};
  face.rect = kPortraitFace;
  Feature by_model;
  ASSERT_EQ(KY_SUCCESS, GetFeature(both, frame, face, by_model));

  // The same points in the record, and the descriptor alone.
  face.points_count = 5;
  for (size_t i = 0; i < places.size(); ++i) {
    face.points_array[i] = {static_cast<float>(kPortraitFace.left) + 86 * places[i].x,
                            static_cast<float>(kPortraitFace.top) + 86 * places[i].y};
  }
  Feature by_record;
  ASSERT_EQ(KY_SUCCESS, GetFeature(verifier_, frame, face, by_record));
  EXPECT_GT(Compare(by_model.feature, by_record.feature), 0.99F);
}

TEST_F(DescribedTest, DamagedFilesAreRefused) {
  const auto& model = *convolutions_;
  const std::string landmarks = Landmarks(FivePoints({0.3F, 0.3F}, {0.7F, 0.33F}));
  const std::vector<uint8_t> both = FileOf(model, Following(landmarks));
  EXPECT_EQ(KY_SUCCESS, Create(both));
  for (const size_t missing : {size_t{1}, landmarks.size() / 2, landmarks.size(), landmarks.size() + 1,
                               both.size() / 2, both.size() - 41, both.size() - 40, both.size() - 12,
                               both.size() - 8, both.size() - 3, both.size()}) {
    EXPECT_EQ(KY_ERROR_MODEL, Create({both.begin(), both.end() - static_cast<ptrdiff_t>(missing)}))
        << missing << " bytes less";
  }
  std::vector<uint8_t> longer = both;
  longer.push_back(0);
  EXPECT_EQ(KY_ERROR_MODEL, Create(longer));
  EXPECT_EQ(KY_ERROR_LANDMARK_MODEL, Create(FileOf(model, std::vector<uint8_t>(1000, 'x'))));
  EXPECT_EQ(KY_ERROR_MODEL, Create(std::vector<uint8_t>(100000, 'x')));
  EXPECT_EQ(KY_ERROR_MODEL_FILE, [] {
    ky_handle_t handle = nullptr;
    return ky_verify_create_handle(&handle, "/nowhere/at/all");
  }());
  ky_handle_t handle = nullptr;
  EXPECT_EQ(KY_ERROR_MODEL, ky_verify_create_handle(&handle, testing::TempDir().c_str()));
}

TEST_F(DescribedTest, DetectorsRefuseVerifiersModels) {
  ky_handle_t detector = nullptr;
  EXPECT_EQ(KY_ERROR_MODEL, ky_face_create_detector(&detector, path_->c_str(), KY_CONFIG_DEFAULT));
  EXPECT_EQ(nullptr, detector);

  // Nor do they take the landmarks that follow, which the verifier has in use.
  Files files;
  const std::string both = files.Write(
      "both", FileOf(*convolutions_, Following(Landmarks(FivePoints({0.3F, 0.3F}, {0.7F, 0.33F})))));
  const Verifier verifier(both);
  EXPECT_EQ(KY_ERROR_MODEL, ky_face_create_detector(&detector, both.c_str(), KY_CONFIG_DEFAULT));
  ky_face_destroy_detector(detector);
}

}  // namespace
}  // namespace kyengine::test
