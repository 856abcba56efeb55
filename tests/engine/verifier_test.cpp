// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// The verifier: features, their texts, and how alike they are.
#include <algorithm>
#include <array>
#include <cmath>
#include <cstring>
#include <limits>
#include <memory>
#include <random>
#include <string>

#include "engine_calls.h"
#include "feature_text.h"
#include "tests/support/guarded_image.h"

namespace kyengine::test {
namespace {

constexpr int kSide = 200;

class VerifierTest : public testing::Test {
 protected:
  void SetUp() override { ASSERT_EQ(KY_SUCCESS, ky_verify_create_handle(&verifier_, nullptr)); }
  void TearDown() override { ky_verify_destroy_handle(verifier_); }

  float Compare(const Feature& a, const Feature& b) const {
    float score = -1;
    EXPECT_EQ(KY_SUCCESS, ky_verify_compare_feature(verifier_, a.feature, b.feature, &score));
    return score;
  }

  /// The feature of what `rect` shows.
  std::unique_ptr<Feature> FeatureOf(const TestFrame& frame, const ky_rect_t& rect) const {
    ky_face_t face = {};
    face.rect = rect;
    auto feature = std::make_unique<Feature>();
    EXPECT_EQ(KY_SUCCESS, GetFeature(verifier_, frame, face, *feature));
    EXPECT_NE(nullptr, feature->feature);
    EXPECT_EQ(KY_FEATURE_LENGTH, feature->length);
    return feature;
  }

  /// The feature of the one face that a detector finds in a view of the portrait.
  std::unique_ptr<Feature> FeatureOfView(double x, double y, double zoom, double degrees, int format) const {
    const TestFrame frame(View(Portrait(), x, y, zoom, degrees, kSide), format);
    const Detector detector(KY_CONFIG_LARGE_FACES);
    Detected faces;
    EXPECT_EQ(KY_SUCCESS, Detect(detector, frame, faces));
    EXPECT_EQ(1, faces.count);
    auto feature = std::make_unique<Feature>();
    EXPECT_EQ(KY_SUCCESS, GetFeature(verifier_, frame, faces[0], *feature));
    return feature;
  }

  static std::string TextOf(const Feature& feature) {
    std::vector<char> text(KY_FEATURE_TEXT_LENGTH + 1, '#');
    ky_verify_serialize_feature(feature.feature, text.data());
    EXPECT_EQ('#', text.back()) << "written beyond the text";
    EXPECT_EQ('\0', text[KY_FEATURE_TEXT_LENGTH - 1]);
    return text.data();
  }

  /// The feature of the portrait's face, in the box about it.
  std::unique_ptr<Feature> PortraitFeature() const {
    static const TestFrame frame(Portrait());
    return FeatureOf(frame, kPortraitFace);
  }

  ky_handle_t verifier_ = nullptr;
};

TEST_F(VerifierTest, VersionAndLength) {
  EXPECT_EQ(KY_VERIFY_VERSION, ky_verify_get_version(verifier_));
  EXPECT_EQ(KY_FEATURE_LENGTH, ky_verify_get_feature_length(verifier_));
  EXPECT_EQ((KY_FEATURE_LENGTH + 2) / 3 * 4 + 1, KY_FEATURE_TEXT_LENGTH);
  const Detector detector;
  for (ky_handle_t other : {ky_handle_t{nullptr}, ky_handle_t{detector}}) {
    EXPECT_EQ(KY_ERROR_HANDLE, ky_verify_get_version(other));
    EXPECT_EQ(KY_ERROR_HANDLE, ky_verify_get_feature_length(other));
  }
}

// ---- similarity
// ----------------------------------------------------------------------------------------------

TEST_F(VerifierTest, SameFaceIsFarMoreAlikeThanAnythingElse) {
  const auto reference = FeatureOfView(222, 126, 1, 0, KY_PIXEL_NV21);
  EXPECT_EQ(1.0F, Compare(*reference, *reference));

  float least_same = 1;
  const struct {
    double x, y, zoom, degrees;
  } views[] = {{215, 120, 1.1, 2}, {230, 134, 1.3, -3}, {226, 122, 1.0, 5}, {218, 130, 1.45, 0}};
  for (const auto& v : views) {
    for (const int format : {KY_PIXEL_NV21, KY_PIXEL_RGBA}) {
      const auto same = FeatureOfView(v.x, v.y, v.zoom, v.degrees, format);
      const float score = Compare(*reference, *same);
      EXPECT_EQ(score, Compare(*same, *reference));
      least_same = std::min(least_same, score);
    }
  }
  EXPECT_GT(least_same, 0.5F);

  float most_other = 0;
  const TestFrame portrait(Portrait());
  for (int top = 0; top + 90 <= 512; top += 60) {
    for (int left = 0; left + 90 <= 512; left += 60) {
      const ky_rect_t rect = {left, top, left + 90, top + 90};
      if (Overlap(rect, kPortraitFace) == 0) {
        const float score = Compare(*reference, *FeatureOf(portrait, rect));
        EXPECT_GE(score, 0.0F);
        most_other = std::max(most_other, score);
      }
    }
  }
  std::mt19937 random(3);
  Picture noise(kSide, kSide);
  std::generate(noise.rgb.begin(), noise.rgb.end(), [&] { return static_cast<uint8_t>(random()); });
  most_other = std::max(most_other, Compare(*reference, *FeatureOf(TestFrame(noise), {50, 50, 140, 140})));
  most_other = std::max(
      most_other, Compare(*reference, *FeatureOf(TestFrame(Picture(kSide, kSide, 80)), {50, 50, 140, 140})));
  EXPECT_LT(most_other, 0.45F);
  RecordProperty("least_same", std::to_string(least_same));
  RecordProperty("most_other", std::to_string(most_other));
}

TEST_F(VerifierTest, LightMattersLittle) {
  Picture darker = Portrait();
  for (uint8_t& value : darker.rgb) {
    value = static_cast<uint8_t>(20 + value * 0.6);
  }
  EXPECT_GT(Compare(*PortraitFeature(), *FeatureOf(TestFrame(darker), kPortraitFace)), 0.75F);
}

TEST_F(VerifierTest, BrightnessAloneDoesNotMatter) {
  // Half the contrast, from as dark as can be to as bright as can be.
  const auto lit = [&](int offset) {
    Picture picture = Portrait();
    for (uint8_t& value : picture.rgb) {
      value = static_cast<uint8_t>(value / 2 + offset);
    }
    return FeatureOf(TestFrame(picture, KY_PIXEL_RGB), kPortraitFace);
  };
  const auto darkest = lit(0);
  for (const int offset : {32, 64, 96, 128}) {
    EXPECT_GT(Compare(*darkest, *lit(offset)), 0.99F) << offset;
  }
}

TEST_F(VerifierTest, EveryFormatGivesTheSameFeature) {
  const Picture about_face = Part(Portrait(), 140, 40, 168, 168);
  const ky_rect_t rect = {39, 43, 126, 130};
  const auto gray = FeatureOf(TestFrame(about_face), rect);
  for (int format = KY_PIXEL_BGR; format <= KY_PIXEL_NV12; ++format) {
    EXPECT_GT(Compare(*gray, *FeatureOf(TestFrame(about_face, format, KY_ORIENTATION_0, 10), rect)), 0.9F)
        << format;
  }
}

/// The record of a face turned by `degrees` about (x, y) with the landmarks of a 5 or 68 point model where
/// its eyes are; the other points lie in between.
ky_face_t WithEyes(int points, ky_pointf_t left, ky_pointf_t right, const ky_rect_t& rect) {
  ky_face_t face = {};
  face.rect = rect;
  face.points_count = points;
  const float cx = (left.x + right.x) / 2;
  const float cy = (left.y + right.y) / 2;
  std::fill(std::begin(face.points_array), std::end(face.points_array), ky_pointf_t{cx, cy});
  // Corners to both sides of the centres.
  const float dx = (right.x - left.x) / 8;
  const float dy = (right.y - left.y) / 8;
  const auto eye = [&](int first, int count, ky_pointf_t centre) {
    for (int i = 0; i < count; ++i) {
      const float side = i % 2 == 0 ? -1.0F : 1.0F;
      face.points_array[first + i] = {centre.x + side * dx, centre.y + side * dy};
    }
  };
  if (points == 5) {
    eye(2, 2, left);
    eye(0, 2, right);
  } else {
    eye(36, 6, left);
    eye(42, 6, right);
  }
  return face;
}

TEST_F(VerifierTest, EyesAlignTheCrop) {
  // The eyes of the portrait.
  constexpr ky_pointf_t kLeft = {201, 106};
  constexpr ky_pointf_t kRight = {244, 109};
  const TestFrame portrait(Portrait());
  for (const int points : {5, 68}) {
    Feature straight;
    ASSERT_EQ(KY_SUCCESS,
              GetFeature(verifier_, portrait, WithEyes(points, kLeft, kRight, kPortraitFace), straight));
    for (const double degrees : {-60.0, 20.0, 90.0}) {
      const double x = 222;
      const double y = 126;
      const double zoom = 1.2;
      const TestFrame turned(View(Portrait(), x, y, zoom, degrees, kSide));
      const ky_pointf_t left = InView(kLeft.x, kLeft.y, x, y, zoom, degrees, kSide);
      const ky_pointf_t right = InView(kRight.x, kRight.y, x, y, zoom, degrees, kSide);
      const ky_rect_t rect = {45, 45, 155, 155};
      Feature aligned;
      ASSERT_EQ(KY_SUCCESS, GetFeature(verifier_, turned, WithEyes(points, left, right, rect), aligned));
      EXPECT_GT(Compare(straight, aligned), 0.8F) << points << " points, " << degrees << " degrees";
      const auto not_aligned = FeatureOf(turned, rect);
      EXPECT_LT(Compare(straight, *not_aligned), Compare(straight, aligned) - 0.2F);
    }
    // Crops by the eyes and by the box show about the same.
    EXPECT_GT(Compare(straight, *PortraitFeature()), 0.6F);
  }
}

// ---- text
// ----------------------------------------------------------------------------------------------------

TEST_F(VerifierTest, TextIsBase64OfTheFeature) {
  const auto feature = PortraitFeature();
  const std::string text = TextOf(*feature);
  ASSERT_EQ(static_cast<size_t>(KY_FEATURE_TEXT_LENGTH - 1), text.size());
  const std::vector<uint8_t> bytes = FromBase64(text);
  ASSERT_EQ(static_cast<size_t>(KY_FEATURE_LENGTH), bytes.size());
  EXPECT_EQ(text, Base64(bytes));
  // Of 64 cells none is empty.
  for (size_t cell = 0; cell < 64; ++cell) {
    const auto first = bytes.begin() + 3 + static_cast<ptrdiff_t>(cell) * 59;
    EXPECT_GT(*std::max_element(first, first + 59), 0);
  }
}

TEST_F(VerifierTest, TextSurvivesARoundTrip) {
  const auto feature = PortraitFeature();
  const std::string text = TextOf(*feature);
  Feature read;
  read.feature = ky_verify_deserialize_feature(text.c_str());
  ASSERT_NE(nullptr, read.feature);
  EXPECT_NE(feature->feature, read.feature);
  EXPECT_EQ(text, TextOf(read));
  EXPECT_EQ(1.0F, Compare(*feature, read));
}

TEST_F(VerifierTest, CorruptTextsAreRefused) {
  const std::string text = TextOf(*PortraitFeature());
  ASSERT_FALSE(IsRefused(text));
  std::mt19937 random(11);
  for (int i = 0; i < 2000; ++i) {
    // Any one character becomes any other, another digit of base64 as well as what is none.
    std::string corrupt = text;
    char& c = corrupt[random() % corrupt.size()];
    const char was = c;
    c = static_cast<char>(1 + random() % 255);
    if (c != was) {
      EXPECT_TRUE(IsRefused(corrupt)) << i;
    }
  }
  for (const char c : {'=', ' ', '\n', '-', '_', '\x80', '\xff'}) {
    for (const size_t at : {size_t{0}, text.size() / 2, text.size() - 1}) {
      std::string corrupt = text;
      corrupt[at] = c;
      EXPECT_TRUE(IsRefused(corrupt));
    }
  }
  std::string swapped = text;
  std::swap_ranges(swapped.begin() + 100, swapped.begin() + 400, swapped.begin() + 2000);
  EXPECT_TRUE(IsRefused(swapped));
}

TEST_F(VerifierTest, TextsOfOtherLengthsAreRefused) {
  const std::string text = TextOf(*PortraitFeature());
  for (const size_t length :
       {size_t{0}, size_t{1}, size_t{4}, text.size() / 2, text.size() - 4, text.size() - 1}) {
    EXPECT_TRUE(IsRefused(text.substr(0, length))) << length;
  }
  for (const char* more : {"A", "AAAA", "=", "====", "\n"}) {
    EXPECT_TRUE(IsRefused(text + more));
  }
  EXPECT_TRUE(IsRefused(text + text));
  EXPECT_EQ(nullptr, ky_verify_deserialize_feature(nullptr));
}

TEST_F(VerifierTest, FeaturesOfOtherModelsAreRefused) {
  // Well-formed texts whose bytes are no feature of this version.
  std::vector<uint8_t> bytes = FromBase64(TextOf(*PortraitFeature()));
  std::vector<uint8_t> other_version = bytes;
  ++other_version[2];
  EXPECT_TRUE(IsRefused(Base64(other_version)));
  EXPECT_TRUE(IsRefused(Base64(std::vector<uint8_t>(KY_FEATURE_LENGTH, 0))));
  for (const uint8_t version : {uint8_t{0}, uint8_t{KY_DESCRIPTOR_VERSION + 1}, uint8_t{255}}) {
    EXPECT_TRUE(IsRefused(Base64({'K', 'Y', version}))) << "a mark alone, version " << version;
  }
  for (const size_t length : {size_t{512}, size_t{KY_FEATURE_LENGTH - 3}, size_t{KY_FEATURE_LENGTH + 3}}) {
    std::vector<uint8_t> foreign = bytes;
    foreign.resize(length);
    EXPECT_TRUE(IsRefused(Base64(foreign)));
  }
}

TEST_F(VerifierTest, NothingIsReadBeyondATextsEnd) {
  const std::string text = TextOf(*PortraitFeature());
  // The last readable byte is the terminating zero, or, of a text that has none, the last one that may be
  // looked at.
  for (const size_t length : {size_t{0}, size_t{3}, size_t{1000}, text.size() - 1, text.size()}) {
    kyface::test::GuardedImage<char> guarded(1, static_cast<int>(length) + 1, static_cast<int>(length) + 1);
    std::copy_n(text.begin(), length, guarded.data());
    guarded.data()[length] = '\0';
    Feature read;
    read.feature = ky_verify_deserialize_feature(guarded.data());
    EXPECT_EQ(length == text.size(), read.feature != nullptr);
  }
  kyface::test::GuardedImage<char> endless(1, KY_FEATURE_TEXT_LENGTH, KY_FEATURE_TEXT_LENGTH);
  std::copy(text.begin(), text.end(), endless.data());
  endless.data()[KY_FEATURE_TEXT_LENGTH - 1] = 'A';
  EXPECT_EQ(nullptr, ky_verify_deserialize_feature(endless.data()));
}

TEST_F(VerifierTest, WhatIsNoFeatureHasTheEmptyText) {
  int nothing = 0;
  for (ky_feature_t feature : {ky_feature_t{nullptr}, ky_feature_t{&nothing}}) {
    std::array<char, 3> text = {'a', 'b', 'c'};
    ky_verify_serialize_feature(feature, text.data());
    EXPECT_EQ('\0', text[0]);
    EXPECT_EQ('b', text[1]);
  }
  ky_verify_serialize_feature(PortraitFeature()->feature, nullptr);
}

// ---- what is refused
// -----------------------------------------------------------------------------------------

TEST_F(VerifierTest, RefusesFacesThatCannotBe) {
  const TestFrame frame(Part(Portrait(), 140, 40, 168, 160));
  const ky_rect_t good = {39, 43, 126, 130};
  const float nan = std::numeric_limits<float>::quiet_NaN();
  constexpr int kMost = std::numeric_limits<int32_t>::max();
  constexpr int kLeast = std::numeric_limits<int32_t>::min();
  std::vector<ky_face_t> faces;
  const auto with_rect = [&faces](const ky_rect_t& rect) { faces.emplace_back().rect = rect; };
  for (const ky_rect_t& rect : {ky_rect_t{0, 0, 0, 0},
                                {126, 43, 39, 130},
                                {39, 130, 126, 43},
                                {39, 43, 39, 130},
                                {60, 60, 75, 75},
                                {200, 43, 287, 130},
                                {39, -300, 126, -213},
                                {-2000, -2000, 2000, 2000},
                                {kLeast, kLeast, kMost, kMost},
                                {kMost, 0, kLeast, 90}}) {
    with_rect(rect);
  }
  for (const int count : {-1, KY_FACE_MAX_POINTS + 1, kMost}) {
    with_rect(good);
    faces.back().points_count = count;
  }
  faces.push_back(WithEyes(5, {60, nan}, {100, 60}, good));
  faces.push_back(WithEyes(68, {60, 60}, {std::numeric_limits<float>::infinity(), 60}, good));
  faces.push_back(WithEyes(5, {80, 60}, {84, 60}, good));
  faces.push_back(WithEyes(5, {6000, 60}, {6040, 60}, good));
  faces.push_back(WithEyes(68, {-9000, 60}, {9000, 60}, good));
  faces.push_back(WithEyes(5, {-1e30F, 60}, {1e30F, 60}, good));
  for (size_t i = 0; i < faces.size(); ++i) {
    int anything = 0;
    ky_feature_t feature = &anything;
    int length = 7;
    EXPECT_EQ(KY_ERROR_FACE, ky_verify_get_feature(verifier_, frame.bytes.data(), frame.format, frame.width,
                                                   frame.height, frame.stride, &faces[i], &feature, &length))
        << "face " << i;
    EXPECT_EQ(nullptr, feature);
    EXPECT_EQ(0, length);
  }
  // Eyes in one place, and points of other models, say nothing: the rectangle counts.
  ky_face_t face = WithEyes(5, {80, 60}, {80, 60}, good);
  Feature by_rectangle;
  EXPECT_EQ(KY_SUCCESS, GetFeature(verifier_, frame, face, by_rectangle));
  EXPECT_EQ(1.0F, Compare(by_rectangle, *FeatureOf(frame, good)));
  face = WithEyes(68, {60, 60}, {100, 60}, good);
  face.points_count = KY_FACE_MAX_POINTS;
  Feature many_points;
  EXPECT_EQ(KY_SUCCESS, GetFeature(verifier_, frame, face, many_points));
  EXPECT_EQ(1.0F, Compare(many_points, by_rectangle));
}

TEST_F(VerifierTest, FacesMayReachOverTheBorder) {
  const TestFrame frame(Part(Portrait(), 180, 84, 168, 160));
  EXPECT_NE(nullptr, FeatureOf(frame, {-10, -10, 86, 86})->feature);
  EXPECT_NE(nullptr, FeatureOf(frame, {120, 110, 200, 190})->feature);
  EXPECT_NE(nullptr, FeatureOf(TestFrame(Part(Portrait(), 190, 90, 16, 16)), {0, 0, 16, 16})->feature);
}

TEST_F(VerifierTest, RefusesFramesAndPointers) {
  const TestFrame f(Part(Portrait(), 140, 40, 168, 160));
  ky_face_t face = {};
  face.rect = {39, 43, 126, 130};
  ky_feature_t feature = nullptr;
  int length = 0;
  const auto get = [&](ky_handle_t handle, const uint8_t* image, int format, int width, int stride,
                       const ky_face_t* record, ky_feature_t* out, int* n) {
    return ky_verify_get_feature(handle, image, format, width, f.height, stride, record, out, n);
  };
  const uint8_t* const image = f.bytes.data();
  const Detector detector;
  EXPECT_EQ(KY_ERROR_HANDLE, get(nullptr, image, 0, 168, 168, &face, &feature, &length));
  EXPECT_EQ(KY_ERROR_HANDLE, get(detector, image, 0, 168, 168, &face, &feature, &length));
  EXPECT_EQ(KY_ERROR_NULL_POINTER, get(verifier_, nullptr, 0, 168, 168, &face, &feature, &length));
  EXPECT_EQ(KY_ERROR_NULL_POINTER, get(verifier_, image, 0, 168, 168, nullptr, &feature, &length));
  EXPECT_EQ(KY_ERROR_NULL_POINTER, get(verifier_, image, 0, 168, 168, &face, nullptr, &length));
  EXPECT_EQ(KY_ERROR_NULL_POINTER, get(verifier_, image, 0, 168, 168, &face, &feature, nullptr));
  EXPECT_EQ(KY_ERROR_PIXEL_FORMAT, get(verifier_, image, 9, 168, 168, &face, &feature, &length));
  EXPECT_EQ(KY_ERROR_SIZE, get(verifier_, image, 0, 0, 168, &face, &feature, &length));
  EXPECT_EQ(KY_ERROR_STRIDE, get(verifier_, image, 0, 168, 167, &face, &feature, &length));
  EXPECT_EQ(KY_ERROR_NULL_POINTER, ky_verify_create_handle(nullptr, nullptr));
  EXPECT_EQ(nullptr, feature);
}

TEST_F(VerifierTest, RefusesToCompareWhatIsNoFeature) {
  const auto feature = PortraitFeature();
  Feature released;
  released.feature = ky_verify_deserialize_feature(TextOf(*feature).c_str());
  ky_verify_release_feature(released.feature);
  int nothing = 0;
  const ky_feature_t good = feature->feature;
  for (ky_feature_t bad : {ky_feature_t{nullptr}, ky_feature_t{&nothing}, released.feature, verifier_}) {
    for (const bool first : {true, false}) {
      float score = 7;
      EXPECT_EQ(KY_ERROR_FEATURE,
                ky_verify_compare_feature(verifier_, first ? bad : good, first ? good : bad, &score));
      EXPECT_EQ(0, score);
    }
    ky_verify_release_feature(bad);
  }
  float score = 7;
  EXPECT_EQ(KY_ERROR_HANDLE, ky_verify_compare_feature(nullptr, good, good, &score));
  EXPECT_EQ(KY_ERROR_NULL_POINTER, ky_verify_compare_feature(verifier_, good, good, nullptr));
  EXPECT_EQ(KY_SUCCESS, ky_verify_compare_feature(verifier_, good, good, &score)) << "still there";
}

TEST_F(VerifierTest, FeaturesOutliveTheirVerifier) {
  ky_handle_t other = nullptr;
  ASSERT_EQ(KY_SUCCESS, ky_verify_create_handle(&other, nullptr));
  ky_face_t face = {};
  face.rect = kPortraitFace;
  Feature feature;
  EXPECT_EQ(KY_SUCCESS, GetFeature(other, TestFrame(Portrait()), face, feature));
  ky_verify_destroy_handle(other);
  EXPECT_EQ(KY_ERROR_HANDLE, ky_verify_get_version(other));
  EXPECT_EQ(1.0F, Compare(feature, *PortraitFeature()));
}

}  // namespace
}  // namespace kyengine::test
