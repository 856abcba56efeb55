// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// Images that overlap, where the front-ends allow it: what comes out is what comes out of images apart.
#include <gtest/gtest.h>

#include <cstring>
#include <vector>

#include "fastcv/fastcv.h"
#include "tests/support/cvt_families.h"
#include "tests/support/guarded_image.h"

using namespace HPC::fastcv;

namespace {

using kyface::test::ByteSource;
using kyface::test::GuardedImage;
using kyface::test::isFrom420;
using kyface::test::isTo420;
using u8 = unsigned char;

/// How the destination lies in the source's buffer: its first row `before` elements before the first row of
/// the source that is read, its rows `gap` elements less far apart.
struct Place {
  int before;
  int gap;
};

/// Runs `operation(src, dst)`, which reads `height` rows of `width` pixels at column `left` of the source,
/// on images apart and on a destination in the source's own buffer, and compares all of its rows.
template <typename T, int ncSrc, int ncDst, typename Operation>
void check(int width, int height, int left, Place place, const Operation& operation) {
  constexpr int kPad = 2;
  const int sourceElements = (left + width) * ncSrc;
  const int stride = sourceElements + kPad;
  const int outElements = width * ncDst;
  const int outStride = stride - place.gap;
  GuardedImage<T> buffer(height, sourceElements + kPad, stride);
  ByteSource bytes(static_cast<unsigned>(width));
  buffer.fill([&] { return sizeof(T) == 1 ? static_cast<T>(bytes()) : static_cast<T>(bytes() / 255.0); });

  Mat<T, ncSrc, ECO_ENV_ARM> src(left + width, height, buffer.data());
  src.step = static_cast<int64_t>(stride) * static_cast<int64_t>(sizeof(T));
  std::vector<T> apart(static_cast<size_t>(outElements) * static_cast<size_t>(height));
  Mat<T, ncDst, ECO_ENV_ARM> expected(width, height, apart.data());
  ASSERT_EQ(HPC_SUCCESS, operation(src, &expected));

  T* const first = buffer.data() + left * ncSrc - place.before;
  Mat<T, ncDst, ECO_ENV_ARM> dst(width, height, first);
  dst.step = static_cast<int64_t>(outStride) * static_cast<int64_t>(sizeof(T));
  ASSERT_EQ(HPC_SUCCESS, operation(src, &dst));
  for (int r = 0; r < height; ++r) {
    ASSERT_EQ(0, memcmp(first + static_cast<ptrdiff_t>(r) * outStride,
                        &apart[static_cast<size_t>(r) * static_cast<size_t>(outElements)],
                        static_cast<size_t>(outElements) * sizeof(T)))
        << width << " x " << height << " from column " << left << ", row " << r << ", " << place.before
        << " elements before the source, rows " << place.gap << " elements closer";
  }
}

/// All places that are allowed of a destination of rows as long as `width` pixels and of one that is packed.
template <typename T, int ncSrc, int ncDst, typename Operation>
void checkPlaces(int left, const Operation& operation) {
  for (int width = 1; width <= 70; ++width) {
    const int stride = (left + width) * ncSrc + 2;
    for (int before = 0; before <= left * ncSrc; ++before) {
      for (const int gap : {0, 1, stride - width * ncDst}) {
        check<T, ncSrc, ncDst>(width, 3, left, {before, gap}, operation);
        if (testing::Test::HasFatalFailure()) {
          return;
        }
      }
    }
  }
}

/// The conversions that work on overlapping images.
template <ColorCvtType type, typename T, int ncSrc, int ncDst>
constexpr bool kWorksForwards =
    ncDst <= ncSrc && !isTo420(type) && !isFrom420(type) && !(type == CVT_LAB2BGR && sizeof(T) == 1);

template <ColorCvtType type, typename T, int ncSrc, int ncDst>
void checkConversion() {
  if constexpr (kWorksForwards<type, T, ncSrc, ncDst>) {
    checkPlaces<T, ncSrc, ncDst>(0, [](const auto& src, auto* dst) {
      return cvtColor<type, T, ncSrc, T, ncDst, ECO_ENV_ARM>(src, dst);
    });
  }
}

TEST(Overlap, ConversionsInPlace) {
#define CHECK(type, T, ncSrc, ncDst) checkConversion<type, T, ncSrc, ncDst>();
  FASTCV_CVT_COLOR_INSTANCES(CHECK)
#undef CHECK
}

// A conversion of a region to somewhere before it in the same buffer.
template <ColorCvtType type, typename T, int ncSrc, int ncDst>
void checkRegion() {
  if constexpr (kWorksForwards<type, T, ncSrc, ncDst>) {
    constexpr int kLeft = 3;
    checkPlaces<T, ncSrc, ncDst>(kLeft, [](const auto& image, auto* dst) {
      Mat<T, ncSrc, ECO_ENV_ARM> region(image.width - kLeft, image.height, image.data + kLeft * ncSrc);
      region.step = image.step;
      return cvtColor<type, T, ncSrc, T, ncDst, ECO_ENV_ARM>(region, dst);
    });
  }
}

TEST(Overlap, ConversionsOfRegions){
#define CHECK(type, T, ncSrc, ncDst) checkRegion<type, T, ncSrc, ncDst>();
    FASTCV_CVT_COLOR_INSTANCES(CHECK)
#undef CHECK
}

// The luma of a frame, left at the frame's own start.
TEST(Overlap, LumaInPlace) {
  constexpr int kWidth = 70, kHeight = 6, kStride = 75;
  for (const int outStride : {kStride, kWidth}) {
    std::vector<u8> frame(kStride * kHeight / 2 * 3);
    ByteSource bytes(1);
    for (u8& byte : frame) {
      byte = bytes();
    }
    const std::vector<u8> before = frame;
    Mat<u8, 1, ECO_ENV_ARM> src(kWidth, kHeight / 2 * 3, frame.data());
    src.step = kStride;
    Mat<u8, 1, ECO_ENV_ARM> dst(kWidth, kHeight, frame.data());
    dst.step = outStride;
    ASSERT_EQ(HPC_SUCCESS, (cvtColor<CVT_YUV2GRAY, u8, 1, u8, 1, ECO_ENV_ARM>(src, &dst)));
    for (int r = 0; r < kHeight; ++r) {
      EXPECT_EQ(0, memcmp(&frame[r * outStride], &before[r * kStride], kWidth)) << r;
    }
  }
}

template <typename T, int nc>
void checkCrop(T ratio) {
  constexpr int kLeft = 5;
  checkPlaces<T, nc, nc>(kLeft, [ratio](const auto& src, auto* dst) {
    return crop<T, nc, T, nc, nc, ECO_ENV_ARM>(src, {kLeft, 0}, ratio, dst);
  });
}

TEST(Overlap, Crop){
#define CHECK(T, nc)   \
  checkCrop<T, nc>(1); \
  checkCrop<T, nc>(2); \
  checkCrop<T, nc>(200);
    FASTCV_PACKED_INSTANCES(CHECK)
#undef CHECK
}

TEST(Overlap, CropOfSixFloats) {
  float samples[] = {1, 2, 3, 4, 5, 6};
  const Mat<float, 1, ECO_ENV_ARM> src(6, 1, samples);
  Mat<float, 1, ECO_ENV_ARM> dst(5, 1, samples);
  ASSERT_EQ(HPC_SUCCESS, (crop<float, 1, float, 1, 1, ECO_ENV_ARM>(src, {1, 0}, 2.0f, &dst)));
  EXPECT_EQ(std::vector<float>(samples, samples + 6), (std::vector<float>{4, 6, 8, 10, 12, 6}));
}

}  // namespace
