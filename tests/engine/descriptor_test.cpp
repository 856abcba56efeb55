// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// The face descriptor's network against its definition, and its model files.
#include "engine/src/descriptor.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <bit>
#include <cmath>
#include <cstring>
#include <limits>
#include <random>
#include <span>
#include <vector>

#include "tests/support/descriptor_model.h"
#include "tests/support/guarded_image.h"

namespace kyengine::test {
namespace {

constexpr ResidualBlock kFewBlocks[] = {{16, false}, {48, true}, {48, false}, {64, true}, {64, true}};

DescriptorShape SmallShape(int side) { return {side, 16, kFewBlocks, 32}; }

ky_result_t Read(const std::vector<uint8_t>& file, const DescriptorShape& shape, Descriptor* descriptor) {
  DescriptorHeader header;
  const ky_result_t result = DescriptorHeader::read(file, shape, &header);
  if (result != KY_SUCCESS) {
    return result;
  }
  const std::span<const uint8_t> rest = std::span(file).subspan(DescriptorHeader::kSize);
  return Descriptor::read(header, rest.first(std::min<size_t>(rest.size(), header.length)), shape,
                          descriptor);
}

std::vector<uint8_t> RandomPicture(int side, uint32_t seed) {
  std::mt19937 random(seed);
  std::vector<uint8_t> rgb(static_cast<size_t>(side) * static_cast<size_t>(side) * 3);
  std::generate(rgb.begin(), rgb.end(), [&random] { return static_cast<uint8_t>(random()); });
  return rgb;
}

/// The numbers of a picture whose last byte is the last before a protected page; so is their own last.
std::vector<float> Describe(const Descriptor& descriptor, const std::vector<uint8_t>& rgb) {
  const int size = static_cast<int>(rgb.size());
  kyface::test::GuardedImage<uint8_t> picture(1, size, size);
  std::copy(rgb.begin(), rgb.end(), picture.data());
  kyface::test::GuardedImage<float> numbers(1, descriptor.outputs(), descriptor.outputs());
  EXPECT_EQ(KY_SUCCESS, descriptor.describe(picture.data(), numbers.data()));
  return numbers.contents();
}

void ExpectAsDefined(const DescriptorShape& shape, uint32_t seed) {
  const auto model = RandomModel(shape, seed);
  Descriptor descriptor;
  ASSERT_EQ(KY_SUCCESS, Read(FileOf(model), shape, &descriptor));
  ASSERT_EQ(shape.outputs, descriptor.outputs());
  const auto rgb = RandomPicture(shape.side, seed);
  const std::vector<float> numbers = Describe(descriptor, rgb);
  const std::vector<double> expected = NumbersOf(model, shape, rgb);
  ASSERT_EQ(expected.size(), numbers.size());
  double distance = 0;
  double norm = 0;
  for (size_t i = 0; i < expected.size(); ++i) {
    distance += std::pow(static_cast<double>(numbers[i]) - expected[i], 2);
    norm += std::pow(expected[i], 2);
  }
  EXPECT_GT(norm, 0.01);
  EXPECT_LT(std::sqrt(distance), 1e-5 * std::sqrt(norm)) << "side " << shape.side << ", seed " << seed;
}

TEST(DescriptorTest, SmallNetworksOfEverySizeAreAsDefined) {
  // From the least side that every convolution has a pixel in: odd and even ones on each level.
  for (int side = 55; side <= 110; ++side) {
    ExpectAsDefined(SmallShape(side), static_cast<uint32_t>(side));
  }
}

TEST(DescriptorTest, TheFullNetworkIsAsDefined) { ExpectAsDefined(faceDescriptorShape(), 1); }

TEST(DescriptorTest, CountsOfTheFullNetwork) {
  const DescriptorShape& shape = faceDescriptorShape();
  EXPECT_EQ(150, shape.side);
  EXPECT_EQ(128, shape.outputs);
  EXPECT_EQ(29, shape.convolutions());
  size_t weights = 0;
  for (const ModelConvolution& c : RandomModel(shape, 2)) {
    weights += c.weights.size();
  }
  EXPECT_EQ(5603936U, weights);
}

TEST(DescriptorTest, EveryMachineGivesTheSameBits) {
  const DescriptorShape& shape = faceDescriptorShape();
  Descriptor descriptor;
  ASSERT_EQ(KY_SUCCESS, Read(FileOf(RandomModel(shape, 3)), shape, &descriptor));
  uint32_t hash = 2166136261;
  for (const float number : Describe(descriptor, RandomPicture(shape.side, 3))) {
    hash = (hash ^ std::bit_cast<uint32_t>(number)) * 16777619;
  }
  EXPECT_EQ(3788363079U, hash);
}

// ---- model files

constexpr int kSide = 60;

class ModelFileTest : public testing::Test {
 protected:
  ModelFileTest() : model_(RandomModel(shape_, 5)), file_(FileOf(model_)) {}

  ky_result_t Read(const std::vector<uint8_t>& file) const {
    Descriptor descriptor;
    return test::Read(file, shape_, &descriptor);
  }

  /// Writes `value` at `offset` of the file, with checksums that agree.
  template <typename T>
  std::vector<uint8_t> With(size_t offset, T value) const {
    std::vector<uint8_t> file = file_;
    std::memcpy(&file[offset], &value, sizeof(value));
    Seal(file);
    return file;
  }

  const DescriptorShape shape_ = SmallShape(kSide);
  std::vector<ModelConvolution> model_;
  std::vector<uint8_t> file_;
};

constexpr size_t kFirstConvolution = DescriptorHeader::kSize;
constexpr size_t kFirstFactor = kFirstConvolution + 24;

TEST_F(ModelFileTest, IsRecognisedByItsFirstBytes) {
  EXPECT_EQ(KY_SUCCESS, Read(file_));
  EXPECT_TRUE(DescriptorHeader::recognises(file_));
  EXPECT_FALSE(DescriptorHeader::recognises(std::span(file_).first(7)));
  EXPECT_FALSE(DescriptorHeader::recognises({}));
  for (size_t i = 0; i < 8; ++i) {
    EXPECT_FALSE(DescriptorHeader::recognises(With(i, uint8_t{'x'})));
    EXPECT_EQ(KY_ERROR_MODEL, Read(With(i, uint8_t{'x'})));
  }
}

TEST_F(ModelFileTest, NoBitMayChange) {
  std::mt19937 random(7);
  for (size_t i = 0; i < DescriptorHeader::kSize + 1000; ++i) {
    std::vector<uint8_t> file = file_;
    const size_t at = i < DescriptorHeader::kSize ? i : random() % file.size();
    file[at] ^= static_cast<uint8_t>(1U << random() % 8);
    EXPECT_EQ(KY_ERROR_MODEL, Read(file)) << at;
  }
}

TEST_F(ModelFileTest, TruncatedFilesAreRefused) {
  for (const size_t length : {size_t{0}, size_t{1}, size_t{8}, size_t{39}, size_t{40}, size_t{41},
                              kFirstFactor, size_t{5000}, file_.size() - 4, file_.size() - 1}) {
    const std::vector<uint8_t> file(file_.begin(), file_.begin() + static_cast<ptrdiff_t>(length));
    EXPECT_EQ(KY_ERROR_MODEL, Read(file)) << length;
    // Also where the length and the checksums say so.
    if (length > 40) {
      std::vector<uint8_t> sealed = file;
      const uint64_t left = length - 40;
      std::memcpy(&sealed[16], &left, sizeof(left));
      Seal(sealed);
      EXPECT_EQ(KY_ERROR_MODEL, Read(sealed)) << length;
    }
  }
  // And one that has more than its convolutions.
  std::vector<uint8_t> longer = file_;
  longer.resize(longer.size() + 4);
  const uint64_t length = longer.size() - 40;
  std::memcpy(&longer[16], &length, sizeof(length));
  Seal(longer);
  EXPECT_EQ(KY_ERROR_MODEL, Read(longer));
}

TEST_F(ModelFileTest, LengthsBeyondTheNetworksAreRefusedUnseen) {
  for (const uint64_t length : {uint64_t{1} << 63, ~uint64_t{0}, uint64_t{1} << 32, uint64_t{100000000}}) {
    DescriptorHeader header;
    EXPECT_EQ(KY_ERROR_MODEL, DescriptorHeader::read(With(16, length), shape_, &header));
  }
}

TEST_F(ModelFileTest, OtherNetworksAreRefused) {
  EXPECT_EQ(KY_ERROR_MODEL, Read(With(8, uint32_t{2}))) << "layout";
  EXPECT_EQ(KY_ERROR_MODEL, Read(With(12, uint32_t{11}))) << "convolutions";
  const std::array<uint32_t, 6> head = {
      7, 2, 3, 16, model_[0].bytes ? 1U : 4U, static_cast<uint32_t>(model_[0].zero)};
  for (size_t i = 0; i < head.size() - 1; ++i) {
    for (const uint32_t other : {head[i] + 1, head[i] - 1, head[i] + 16, 0U, 0xffffffffU}) {
      EXPECT_EQ(KY_ERROR_MODEL, Read(With(kFirstConvolution + 4 * i, other))) << i << ", " << other;
    }
  }
  for (const uint32_t zero : {256U, 0x80000000U}) {
    EXPECT_EQ(KY_ERROR_MODEL, Read(With(kFirstConvolution + 20, zero)));
  }
  EXPECT_EQ(KY_ERROR_MODEL, Read(FileOf(RandomModel(faceDescriptorShape(), 1))));
  Descriptor descriptor;
  EXPECT_EQ(KY_ERROR_MODEL, test::Read(file_, faceDescriptorShape(), &descriptor));
}

TEST_F(ModelFileTest, WhatIsNoNumberIsRefused) {
  constexpr float kNan = std::numeric_limits<float>::quiet_NaN();
  constexpr float kInfinite = std::numeric_limits<float>::infinity();
  for (const float bad : {kNan, -kNan, kInfinite, -kInfinite, 1e30F, -2e4F}) {
    for (size_t i = 0; i < 32; ++i) {
      EXPECT_EQ(KY_ERROR_MODEL, Read(With(kFirstFactor + 4 * i, bad))) << i << ", " << bad;
    }
  }
  // The matrix's last weight.
  std::vector<ModelConvolution> model = model_;
  ModelConvolution& matrix = model.back();
  matrix.bytes = false;
  matrix.zero = 0;
  std::fill(matrix.weights.begin(), matrix.weights.end(), 1.0F);
  EXPECT_EQ(KY_SUCCESS, Read(FileOf(model)));
  matrix.weights.back() = kNan;
  EXPECT_EQ(KY_ERROR_MODEL, Read(FileOf(model)));
}

TEST_F(ModelFileTest, NumbersThatOverflowAreAFailure) {
  std::vector<ModelConvolution> model = model_;
  for (ModelConvolution& c : model) {
    c.bytes = false;
    c.zero = 0;
    std::fill(c.weights.begin(), c.weights.end(), 9000.0F);
    std::fill(c.factors.begin(), c.factors.end(), 9000.0F);
  }
  Descriptor descriptor;
  ASSERT_EQ(KY_SUCCESS, test::Read(FileOf(model), shape_, &descriptor));
  std::vector<float> numbers(32);
  const std::vector<uint8_t> white(static_cast<size_t>(kSide) * kSide * 3, 255);
  EXPECT_EQ(KY_ERROR_MODEL, descriptor.describe(white.data(), numbers.data()));
}

TEST_F(ModelFileTest, FingerprintsTellModelsApart) {
  Descriptor a;
  Descriptor b;
  ASSERT_EQ(KY_SUCCESS, test::Read(file_, shape_, &a));
  ASSERT_EQ(KY_SUCCESS, test::Read(FileOf(RandomModel(shape_, 6)), shape_, &b));
  EXPECT_NE(a.fingerprint(), b.fingerprint());
}

}  // namespace
}  // namespace kyengine::test
