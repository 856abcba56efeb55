// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// The verifier with the published weights, where scripts/setup.sh models has fetched them.
#include <array>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>

#include "engine_calls.h"
#include "feature_text.h"

namespace kyengine::test {
namespace {

class PublishedTest : public testing::Test {
 protected:
  void SetUp() override {
    if (!std::filesystem::exists(KY_MODEL)) {
      GTEST_SKIP() << "scripts/setup.sh models has not fetched the weights";
    }
    ASSERT_EQ(KY_SUCCESS, ky_verify_create_handle(&verifier_, KY_MODEL));
  }
  void TearDown() override { ky_verify_destroy_handle(verifier_); }

  /// The feature of a view of the portrait, aligned by where its eyes are seen.
  void Extract(double zoom, double degrees, int format, Feature* feature) const {
    constexpr double kX = 222;
    constexpr double kY = 126;
    constexpr int kSide = 240;
    const TestFrame frame(View(Portrait(), kX, kY, zoom, degrees, kSide), format);
    const ky_pointf_t left = InView(201, 106, kX, kY, zoom, degrees, kSide);
    const ky_pointf_t right = InView(244, 109, kX, kY, zoom, degrees, kSide);
    ExtractByEyes(frame, left, right, {40, 40, 200, 200}, feature);
  }

  void ExtractByEyes(const TestFrame& frame, ky_pointf_t left, ky_pointf_t right, const ky_rect_t& rect,
                     Feature* feature) const {
    ky_face_t face = {};
    face.rect = rect;
    face.points_count = 5;
    const std::array<ky_pointf_t, 5> points = {right, right, left, left, {left.x, left.y + 20}};
    std::copy(points.begin(), points.end(), face.points_array);
    ASSERT_EQ(KY_SUCCESS, GetFeature(verifier_, frame, face, *feature));
  }

  ky_handle_t verifier_ = nullptr;
};

TEST_F(PublishedTest, ThePortraitsFeatureIsTheSameEverywhere) {
  Feature feature;
  ExtractByEyes(TestFrame(Portrait(), KY_PIXEL_RGB), {201, 106}, {244, 109}, kPortraitFace, &feature);
  std::vector<char> text(KY_DESCRIPTOR_TEXT_LENGTH);
  ky_verify_serialize_feature(feature.feature, text.data());
  uint32_t hash = 2166136261;
  for (const uint8_t byte : FromBase64(text.data())) {
    hash = (hash ^ byte) * 16777619;
  }
  EXPECT_EQ(1950045934U, hash);
}

TEST_F(PublishedTest, ViewsOfOneFaceAreAlike) {
  Feature straight;
  Extract(1, 0, KY_PIXEL_RGB, &straight);
  for (const double zoom : {0.35, 0.6, 1.4, 2.0}) {
    for (const double degrees : {-40.0, 0.0, 15.0, 90.0}) {
      for (const int format : {KY_PIXEL_RGB, KY_PIXEL_GRAY}) {
        Feature view;
        Extract(zoom, degrees, format, &view);
        float score = 0;
        ASSERT_EQ(KY_SUCCESS, ky_verify_compare_feature(verifier_, straight.feature, view.feature, &score));
        EXPECT_GT(score, 0.7F) << zoom << ", " << degrees << ", format " << format;
      }
    }
  }
}

TEST_F(PublishedTest, EyesInTheWrongPlaceMakeAnotherFace) {
  const TestFrame frame(Portrait(), KY_PIXEL_RGB);
  Feature right;
  Feature wrong;
  ExtractByEyes(frame, {201, 106}, {244, 109}, kPortraitFace, &right);
  ExtractByEyes(frame, {201, 150}, {244, 200}, kPortraitFace, &wrong);
  float score = 1;
  ASSERT_EQ(KY_SUCCESS, ky_verify_compare_feature(verifier_, right.feature, wrong.feature, &score));
  EXPECT_LT(score, KY_VERIFY_THRESHOLD);
}

}  // namespace
}  // namespace kyengine::test
