// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// The crop kernel against its formulas: copies, 8-bit samples in groups of 8 pixels and one by one, floats.

#include <gtest/gtest.h>
#include <unistd.h>

#include <algorithm>
#include <climits>
#include <cmath>
#include <csignal>
#include <cstdint>
#include <cstring>
#include <limits>
#include <random>
#include <string>
#include <vector>

#include "fastcv/kernels.h"
#include "tests/support/guarded_image.h"
#include "tests/support/sparse_memory.h"

namespace {

using HPC::fastcv::armImageCrop;
using kyface::test::ByteSource;
using kyface::test::GuardedImage;
using kyface::test::SparseMemory;
using u8 = unsigned char;

constexpr float kInfinity = std::numeric_limits<float>::infinity();
constexpr float kNaN = std::numeric_limits<float>::quiet_NaN();

// ratio * sample + 0.5, rounded to single precision once.
float rounded(float ratio, u8 sample) { return std::fma(ratio, static_cast<float>(sample), 0.5f); }

// A sample of the last, fewer than 8 pixels of a row.
u8 singly(float ratio, u8 sample) {
  const float v = rounded(ratio, sample);
  if (std::isnan(v) || v < 0) {
    return 0;
  }
  return v > 255 ? 255 : static_cast<u8>(v);
}

// A sample of a group of 8 pixels.
u8 inGroup(float ratio, u8 sample) {
  const float v = rounded(ratio, sample);
  int32_t integer = 0;
  if (v >= 2147483648.0f) {
    integer = std::numeric_limits<int32_t>::max();
  } else if (v <= -2147483648.0f) {
    integer = std::numeric_limits<int32_t>::min();
  } else if (!std::isnan(v)) {
    integer = static_cast<int32_t>(v);
  }
  const int low = static_cast<int16_t>(static_cast<uint16_t>(integer));
  return static_cast<u8>(std::clamp(low, 0, 255));
}

// What becomes of the sample `element` of a row of `rowElements`.
u8 scaled(float ratio, u8 sample, int element, int rowElements, int nc) {
  if (ratio == 1) {
    return sample;
  }
  return element < rowElements / (8 * nc) * (8 * nc) ? inGroup(ratio, sample) : singly(ratio, sample);
}
float scaled(float ratio, float sample, int, int, int) { return ratio == 1 ? sample : sample * ratio; }

template <typename T, int channels>
struct Instance {
  using Element = T;
  static constexpr int kChannels = channels;
  static constexpr auto kKernel = armImageCrop<T, channels, T, channels, channels>;
};

template <typename I>
class Crop : public testing::Test {
 protected:
  using Sample = typename I::Element;
  static constexpr int kPixel = I::kChannels;

  static Sample next(ByteSource& bytes) {
    if constexpr (sizeof(Sample) == 1) {
      return bytes();
    } else {
      return static_cast<float>(bytes() - 128) / 3;
    }
  }

  // Crops `height` by `width` at row `top`, column `left`, of an image that is larger by `right` columns.
  static void check(int top, int left, int height, int width, int right, int inPad, int outPad, float ratio) {
    ByteSource bytes(static_cast<unsigned>(height * 1000 + width));
    const int inElements = (left + width + right) * kPixel;
    GuardedImage<Sample> in(top + height, inElements, inElements + inPad);
    in.fill([&] { return next(bytes); });
    const int rowElements = width * kPixel;
    GuardedImage<Sample> out(height, rowElements, rowElements + outPad);
    std::vector<Sample> expected;
    for (int r = 0; r < height; ++r) {
      const Sample* row = in.row(top + r) + left * kPixel;
      for (int i = 0; i < rowElements; ++i) {
        expected.push_back(scaled(ratio, row[i], i, rowElements, kPixel));
      }
    }
    I::kKernel(top, left, in.stride(), in.data(), height, width, out.stride(), out.data(), ratio);
    ASSERT_TRUE(out.holds(expected)) << width << " x " << height << " at " << left << ", " << top
                                     << ", padding " << inPad << " and " << outPad << ", times " << ratio;
  }
};

using Instances = testing::Types<Instance<u8, 1>, Instance<u8, 3>, Instance<u8, 4>, Instance<float, 1>,
                                 Instance<float, 3>, Instance<float, 4>>;
struct InstanceNames {
  template <typename I>
  static std::string GetName(int) {
    return (sizeof(typename I::Element) == 1 ? "u8x" : "f32x") + std::to_string(I::kChannels);
  }
};
TYPED_TEST_SUITE(Crop, Instances, InstanceNames);

constexpr float kRatios[] = {1, 0, 2, 200, 255, 0.5f, -1, 1.5f, 128.6f, 199.9f, 256};

TYPED_TEST(Crop, EveryWidth) {
  for (const float ratio : kRatios) {
    for (int width = 1; width <= 70; ++width) {
      this->check(0, 0, 2, width, 0, 0, 0, ratio);
      this->check(1, 2, 3, width, 1, 5, 3, ratio);
    }
  }
}

TYPED_TEST(Crop, EveryHeightAndCorner) {
  for (const float ratio : {1.0f, 3.0f, 0.3f}) {
    for (int height = 1; height <= 5; ++height) {
      for (int left = 0; left <= 9; ++left) {
        this->check(left % 3, left, height, 21, 0, 0, 0, ratio);
        this->check(left % 4, left, height, 16, 2, 1, 7, ratio);
      }
    }
  }
}

TYPED_TEST(Crop, LargeImages) {
  for (const float ratio : {1.0f, 2.0f, 1.7f}) {
    this->check(0, 0, 90, 640, 0, 0, 0, ratio);
    this->check(3, 17, 61, 1278, 5, 2, 9, ratio);
  }
}

TYPED_TEST(Crop, NothingToWrite) {
  constexpr int kElements = 8 * TypeParam::kChannels;
  using Image = GuardedImage<typename TypeParam::Element>;
  Image in(8, kElements, kElements);
  Image out(8, kElements, kElements);
  const auto before = out.contents();
  for (const float ratio : {1.0f, 2.0f, 0.4f}) {
    for (const int none : {0, -1, -8}) {
      TypeParam::kKernel(0, 0, kElements, in.data(), none, 8, kElements, out.data(), ratio);
      TypeParam::kKernel(0, 0, kElements, in.data(), 8, none, kElements, out.data(), ratio);
    }
  }
  EXPECT_TRUE(out.holds(before));
}

// The rectangle and its row pitch lie further than 2^31 bytes into both images.
TYPED_TEST(Crop, OffsetsBeyond32Bits) {
  using Element = typename TypeParam::Element;
  constexpr int kStride = (1 << 24) / sizeof(Element);
  constexpr int kRows = 140, kTop = 133, kWidth = 19;
  constexpr int kRowElements = kWidth * TypeParam::kChannels;
  constexpr size_t kSize = static_cast<size_t>(kRows) << 24;
  const SparseMemory from(kSize), to(kSize);
  Element* const in = from.as<Element>();
  Element* const out = to.as<Element>();
  const auto row = [](Element* image, int r) { return image + static_cast<ptrdiff_t>(r) * kStride; };
  ByteSource bytes(1);
  for (int r = 0; r < kRows; ++r) {
    for (int i = 0; i < kRowElements + TypeParam::kChannels; ++i) {
      row(in, r)[i] = bytes();
    }
  }
  for (const float ratio : {1.0f, 2.0f, 0.75f}) {
    const auto holds = [&](int top, int r) {
      const Element* want = row(in, top + r) + TypeParam::kChannels;
      for (int i = 0; i < kRowElements; ++i) {
        if (row(out, r)[i] != scaled(ratio, want[i], i, kRowElements, TypeParam::kChannels)) {
          return false;
        }
      }
      return true;
    };
    TypeParam::kKernel(kTop, 1, kStride, in, kRows - kTop, kWidth, kStride, out, ratio);
    for (int r = 0; r < kRows - kTop; ++r) {
      ASSERT_TRUE(holds(kTop, r)) << "row " << kTop + r << ", times " << ratio;
    }
    TypeParam::kKernel(0, 1, kStride, in, kRows, kWidth, kStride, out, ratio);
    for (int r = 0; r < kRows; ++r) {
      ASSERT_TRUE(holds(0, r)) << "row " << r << ", times " << ratio;
    }
  }
}

template <typename I>
class CropBytes : public testing::Test {};
using ByteInstances = testing::Types<Instance<u8, 1>, Instance<u8, 3>, Instance<u8, 4>>;
TYPED_TEST_SUITE(CropBytes, ByteInstances, InstanceNames);

// Every sample in rows of `rowPixels` pixels, which are groups of 8 alone, or too short for one.
template <typename I>
void checkEverySample(float ratio, int rowPixels, u8 (*expected)(float, u8)) {
  constexpr int nc = I::kChannels;
  const int row = rowPixels * nc;
  const int rows = (256 + row - 1) / row;
  std::vector<u8> in(static_cast<size_t>(rows) * static_cast<size_t>(row)), out(in.size());
  for (size_t i = 0; i < in.size(); ++i) {
    in[i] = static_cast<u8>(i);
  }
  I::kKernel(0, 0, row, in.data(), rows, rowPixels, row, out.data(), ratio);
  for (size_t i = 0; i < in.size(); ++i) {
    ASSERT_EQ(out[i], ratio == 1 ? in[i] : expected(ratio, in[i]))
        << +in[i] << " times " << ratio << " in rows of " << rowPixels;
  }
}

template <typename I>
void checkEverySample(float ratio) {
  checkEverySample<I>(ratio, 8, inGroup);
  checkEverySample<I>(ratio, 24, inGroup);
  checkEverySample<I>(ratio, 7, singly);
  checkEverySample<I>(ratio, 1, singly);
}

TYPED_TEST(CropBytes, EverySampleTimesEveryByte) {
  for (int ratio = 0; ratio < 256; ++ratio) {
    checkEverySample<TypeParam>(static_cast<float>(ratio));
  }
}

TYPED_TEST(CropBytes, EverySampleTimesAnyFactor) {
  for (const float ratio :
       {0.5f,      0.25f,      0.75f,      1.0000001f, 0.99999994f, 1.5f,       2.5f,    100.1f,
        128.25f,   128.49803f, 128.49804f, 128.5f,     128.50197f,  200.5f,     254.99f, 255.5f,
        256.0f,    257.0f,     300.3f,     1000.0f,    33000.0f,    8421504.5f, 1e10f,   3e38f,
        kInfinity, -0.0f,      -0.001f,    -0.002f,    -0.5f,       -1.0f,      -128.5f, -129.0f,
        -200.0f,   -300.0f,    -1e10f,     -3e38f,     -kInfinity,  kNaN,       1e-3f,   1e-30f}) {
    checkEverySample<TypeParam>(ratio);
  }
  std::minstd_rand engine(1);
  for (int i = 0; i < 300; ++i) {
    checkEverySample<TypeParam>(static_cast<float>(engine() % 1000000) / 3000.0f);
  }
}

TEST(CropExamples, HalvesAreRoundedUp) {
  const u8 in[] = {3, 1, 255, 0};
  u8 out[4];
  armImageCrop<u8, 1, u8, 1, 1>(0, 0, 4, in, 1, 4, 4, out, 0.5f);
  EXPECT_EQ(std::vector<u8>(out, out + 4), (std::vector<u8>{2, 1, 128, 0}));
}

// 129 * 255 is 32895: wrapped to 16 bits it is negative, which saturates to 0; singly it is 255.
TEST(CropExamples, GroupsAndTailsDifferAboveAFactorOf128) {
  const std::vector<u8> in(9, 255);
  std::vector<u8> out(9);
  armImageCrop<u8, 1, u8, 1, 1>(0, 0, 9, in.data(), 1, 9, 9, out.data(), 129);
  EXPECT_EQ(out, (std::vector<u8>{0, 0, 0, 0, 0, 0, 0, 0, 255}));
  armImageCrop<u8, 1, u8, 1, 1>(0, 0, 9, in.data(), 1, 9, 9, out.data(), 128);
  EXPECT_EQ(out, std::vector<u8>(9, 255));
  // A row of 9 is 8 and 1, though the next row follows without a gap.
  const std::vector<u8> rows(27, 255);
  std::vector<u8> scaledRows(27);
  armImageCrop<u8, 1, u8, 1, 1>(0, 0, 9, rows.data(), 3, 9, 9, scaledRows.data(), 200);
  for (size_t i = 0; i < 27; ++i) {
    EXPECT_EQ(scaledRows[i], i % 9 == 8 ? 255 : 0) << i;
  }
}

// A row of 2^31 samples, of which the memory ends early: what lies before the end has been scaled.
template <int nc>
void checkRowBeyond32Bits() {
  constexpr int kSamples = 4096;
  GuardedImage<float> in(1, kSamples, kSamples), out(1, kSamples, kSamples);
  in.fill([] { return 3.0f; });
  static const float* last;
  last = out.data() + kSamples - 16;
  const auto scale = [&] {
    // Where the row leaves the memory, and the process ends.
    signal(SIGSEGV, [](int) { _exit(*last == 6.0f ? 0 : 1); });
    armImageCrop<float, nc, float, nc, nc>(0, 0, INT_MAX, in.data(), 1, INT_MAX / nc + 1, INT_MAX, out.data(),
                                           2.0f);
    _exit(2);
  };
  EXPECT_EXIT(scale(), testing::ExitedWithCode(0), "");
}

TEST(CropExamples, RowsBeyond32Bits) {
  checkRowBeyond32Bits<3>();
  checkRowBeyond32Bits<4>();
}

// In place every sample is scaled once, whatever the width.
TEST(CropExamples, ScalesInPlace) {
  for (int width = 1; width <= 70; ++width) {
    for (const float ratio : {2.0f, 0.5f}) {
      std::vector<u8> samples(static_cast<size_t>(2) * width), expected;
      for (size_t i = 0; i < samples.size(); ++i) {
        samples[i] = static_cast<u8>(7 * i);
        expected.push_back(singly(ratio, samples[i]));
      }
      armImageCrop<u8, 1, u8, 1, 1>(0, 0, width, samples.data(), 2, width, width, samples.data(), ratio);
      ASSERT_EQ(samples, expected) << width << ", times " << ratio;
    }
  }
}

// A copy moves bits: what is no number keeps its payload.
TEST(CropExamples, FloatsAreCopiedBitByBit) {
  std::vector<uint32_t> bits;
  for (uint32_t i = 0; i < 35; ++i) {
    bits.push_back(0x7f800001u + i * 0x10003u);
  }
  std::vector<float> in(bits.size()), out(bits.size());
  memcpy(in.data(), bits.data(), bits.size() * sizeof(float));
  armImageCrop<float, 1, float, 1, 1>(0, 0, 7, in.data(), 5, 7, 7, out.data(), 1.0f);
  EXPECT_EQ(0, memcmp(in.data(), out.data(), bits.size() * sizeof(float)));
}

// Rows that overlap their own copies arrive whole, whichever way they move.
TEST(CropExamples, OverlappingRowsAreCopied) {
  std::vector<u8> image(300);
  for (size_t i = 0; i < image.size(); ++i) {
    image[i] = static_cast<u8>(i);
  }
  std::vector<u8> moved = image;
  armImageCrop<u8, 1, u8, 1, 1>(0, 5, 300, moved.data(), 1, 290, 300, moved.data(), 1.0f);
  for (size_t i = 0; i < 290; ++i) {
    ASSERT_EQ(moved[i], image[i + 5]) << i;
  }
  moved = image;
  armImageCrop<u8, 1, u8, 1, 1>(0, 0, 300, moved.data(), 1, 290, 300, moved.data() + 5, 1.0f);
  for (size_t i = 0; i < 290; ++i) {
    ASSERT_EQ(moved[i + 5], image[i]) << i;
  }
}

}  // namespace
