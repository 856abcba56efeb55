// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// crop, rotate and rotate_YUV420: which check answers, in which order, and what reaches the kernel.

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <limits>
#include <vector>

#include "fastcv/fastcv.h"
#include "tests/support/death.h"

namespace {

using namespace HPC::fastcv;
using kyface::test::literally;
using u8 = unsigned char;

constexpr int kMost = std::numeric_limits<int>::max();

template <typename T, int nc>
using Image = Mat<T, nc, ECO_ENV_ARM>;

// An image over its own pixels, numbered from 1.
template <typename T, int nc>
struct Picture {
  std::vector<T> pixels;
  Image<T, nc> mat;

  Picture(int width, int height)
      : pixels(static_cast<size_t>(width) * static_cast<size_t>(height) * nc),
        mat(width, height, pixels.data()) {
    for (size_t i = 0; i < pixels.size(); ++i) {
      pixels[i] = static_cast<T>(i % 251 + 1);
    }
  }
};

template <typename T, int nc>
auto cropOf = crop<T, nc, T, nc, nc, ECO_ENV_ARM>;
template <typename T, int nc>
auto rotateOf = rotate<T, nc, nc, nc, ECO_ENV_ARM>;
template <YUV420Type type>
auto rotateFrameOf = rotate_YUV420<type, u8, ECO_ENV_ARM>;

template <typename T, int channels>
struct Instance {
  using Element = T;
  static constexpr int kChannels = channels;
};
template <typename I>
class PackedFrontEnd : public testing::Test {};
using Instances = testing::Types<Instance<u8, 1>, Instance<u8, 3>, Instance<u8, 4>, Instance<float, 1>,
                                 Instance<float, 3>, Instance<float, 4>>;
TYPED_TEST_SUITE(PackedFrontEnd, Instances);

// ---- crop

TYPED_TEST(PackedFrontEnd, CropCopiesAndScales) {
  using T = typename TypeParam::Element;
  constexpr int nc = TypeParam::kChannels;
  Picture<T, nc> src(9, 6), dst(4, 3);
  // Padded on both sides: the steps are counted in bytes, whatever an element is.
  std::vector<T> padded(7 * 11 * nc);
  Image<T, nc> view(4, 3, padded.data());
  view.step = static_cast<int64_t>(7 * nc * sizeof(T));
  for (const T ratio : {T{1}, T{2}, T{0}}) {
    ASSERT_EQ((cropOf<T, nc>(src.mat, {3, 2}, ratio, &dst.mat)), HPC_SUCCESS);
    ASSERT_EQ((cropOf<T, nc>(src.mat, {3, 2}, ratio, &view)), HPC_SUCCESS);
    for (size_t r = 0; r < 3; ++r) {
      for (size_t i = 0; i < 4 * nc; ++i) {
        const T sample = src.pixels[((r + 2) * 9 + 3) * nc + i];
        const float product = static_cast<float>(sample) * static_cast<float>(ratio);
        const T want = static_cast<T>(sizeof(T) == 1 ? std::min(product, 255.0f) : product);
        EXPECT_EQ(dst.pixels[r * 4 * nc + i], want);
        EXPECT_EQ(padded[r * 7 * nc + i], want);
      }
    }
  }
  // Between the rows nothing was written.
  EXPECT_EQ(padded[4 * nc], 0);
}

TYPED_TEST(PackedFrontEnd, CropChecks) {
  using T = typename TypeParam::Element;
  constexpr int nc = TypeParam::kChannels;
  Picture<T, nc> src(9, 6), dst(4, 3);
  const std::vector<T> before = dst.pixels;
  const auto status = [&](int x, int y) { return cropOf<T, nc>(src.mat, {x, y}, T{2}, &dst.mat); };
  // Inside, up to the bottom right corner; not a column or row further.
  EXPECT_EQ(status(6, 0), HPC_INVALID_ARGS);
  EXPECT_EQ(status(0, 4), HPC_INVALID_ARGS);
  EXPECT_EQ(status(-1, 0), HPC_INVALID_ARGS);
  EXPECT_EQ(status(0, -1), HPC_INVALID_ARGS);
  EXPECT_EQ(status(10, 0), HPC_INVALID_ARGS);
  EXPECT_EQ(status(0, 7), HPC_INVALID_ARGS);
  EXPECT_EQ(status(kMost, 0), HPC_INVALID_ARGS);
  EXPECT_EQ(status(0, kMost), HPC_INVALID_ARGS);
  // An empty matrix comes before a bad rectangle.
  src.mat.dims = 0;
  EXPECT_EQ(status(-1, 0), HPC_MAT_EMPTY);
  src.mat.dims = 2;
  dst.mat.dims = 0;
  EXPECT_EQ(status(-1, 0), HPC_MAT_EMPTY);
  EXPECT_EQ(status(0, 0), HPC_MAT_EMPTY);
  dst.mat.dims = 2;
  EXPECT_EQ(dst.pixels, before);
  EXPECT_EQ(status(5, 3), HPC_SUCCESS);
  EXPECT_NE(dst.pixels, before);
}

TYPED_TEST(PackedFrontEnd, CropOfNothing) {
  using T = typename TypeParam::Element;
  constexpr int nc = TypeParam::kChannels;
  Picture<T, nc> src(9, 6), dst(4, 3);
  const std::vector<T> before = dst.pixels;
  // The corner may lie on the far edges when there is nothing to copy, or less.
  dst.mat.height = 0;
  EXPECT_EQ((cropOf<T, nc>(src.mat, {5, 6}, T{1}, &dst.mat)), HPC_SUCCESS);
  dst.mat.height = -2;
  EXPECT_EQ((cropOf<T, nc>(src.mat, {5, 6}, T{1}, &dst.mat)), HPC_SUCCESS);
  dst.mat.height = 3;
  for (const int width : {0, -1, -4}) {
    dst.mat.width = width;
    EXPECT_EQ((cropOf<T, nc>(src.mat, {9, 3}, T{1}, &dst.mat)), HPC_SUCCESS);
    EXPECT_EQ((cropOf<T, nc>(src.mat, {9, 3}, T{2}, &dst.mat)), HPC_SUCCESS);
  }
  // The right edge is compared in 32 bits that wrap.
  src.mat.width = kMost;
  dst.mat.width = 4;
  dst.mat.height = 0;
  EXPECT_EQ((cropOf<T, nc>(src.mat, {kMost, 0}, T{1}, &dst.mat)), HPC_SUCCESS);
  dst.mat.width = -4;
  EXPECT_EQ((cropOf<T, nc>(src.mat, {kMost, 0}, T{1}, &dst.mat)), HPC_SUCCESS);
  EXPECT_EQ(dst.pixels, before);
}

TEST(CropFrontEnd, FactorsOfBytes) {
  Picture<u8, 1> src(9, 1), dst(9, 1);
  src.pixels.assign(9, 200);
  ASSERT_EQ((cropOf<u8, 1>(src.mat, {0, 0}, 1, &dst.mat)), HPC_SUCCESS);
  EXPECT_EQ(dst.pixels, src.pixels);
  ASSERT_EQ((cropOf<u8, 1>(src.mat, {0, 0}, 2, &dst.mat)), HPC_SUCCESS);
  EXPECT_EQ(dst.pixels, std::vector<u8>(9, 255));
  // 200 * 200 wraps in the group of 8, and saturates in the pixel that is left over.
  ASSERT_EQ((cropOf<u8, 1>(src.mat, {0, 0}, 200, &dst.mat)), HPC_SUCCESS);
  EXPECT_EQ(dst.pixels, (std::vector<u8>{0, 0, 0, 0, 0, 0, 0, 0, 255}));
}

// ---- rotate

TYPED_TEST(PackedFrontEnd, RotateTurns) {
  using T = typename TypeParam::Element;
  constexpr int nc = TypeParam::kChannels;
  Picture<T, nc> src(4, 2), upright(2, 4), flat(4, 2);
  const auto pixel = [](const Picture<T, nc>& picture, int r, int c) {
    const auto at = picture.pixels.begin() + (r * picture.mat.width + c) * nc;
    return std::vector<T>(at, at + nc);
  };
  ASSERT_EQ((rotateOf<T, nc>(src.mat, &upright.mat, 90)), HPC_SUCCESS);
  for (int r = 0; r < 4; ++r) {
    for (int c = 0; c < 2; ++c) {
      EXPECT_EQ(pixel(upright, r, c), pixel(src, 1 - c, r));
    }
  }
  ASSERT_EQ((rotateOf<T, nc>(src.mat, &upright.mat, 270)), HPC_SUCCESS);
  for (int r = 0; r < 4; ++r) {
    for (int c = 0; c < 2; ++c) {
      EXPECT_EQ(pixel(upright, r, c), pixel(src, c, 3 - r));
    }
  }
  ASSERT_EQ((rotateOf<T, nc>(src.mat, &flat.mat, 180)), HPC_SUCCESS);
  for (int r = 0; r < 2; ++r) {
    for (int c = 0; c < 4; ++c) {
      EXPECT_EQ(pixel(flat, r, c), pixel(src, 1 - r, 3 - c));
    }
  }
}

TYPED_TEST(PackedFrontEnd, RotateCountsStepsInElements) {
  using T = typename TypeParam::Element;
  constexpr int nc = TypeParam::kChannels;
  std::vector<T> from(5 * nc * 3), to(6 * nc * 3);
  for (size_t i = 0; i < from.size(); ++i) {
    from[i] = static_cast<T>(i + 1);
  }
  Image<T, nc> src(3, 3, from.data()), dst(3, 3, to.data());
  src.step = static_cast<int64_t>(5 * nc * sizeof(T));
  // Only the low 32 bits of a step in elements count.
  dst.step = static_cast<int64_t>(6 * nc * sizeof(T)) + static_cast<int64_t>(sizeof(T)) * (int64_t{1} << 32);
  ASSERT_EQ((rotateOf<T, nc>(src, &dst, 180)), HPC_SUCCESS);
  for (int r = 0; r < 3; ++r) {
    for (int i = 0; i < 6 * nc; ++i) {
      const int c = i / nc;
      const T want =
          c < 3 && r < 3 ? from[static_cast<size_t>((2 - r) * 5 * nc + (2 - c) * nc + i % nc)] : T{0};
      EXPECT_EQ(to[static_cast<size_t>(r * 6 * nc + i)], want) << r << ", " << i;
    }
  }
}

TYPED_TEST(PackedFrontEnd, RotateChecks) {
  using T = typename TypeParam::Element;
  constexpr int nc = TypeParam::kChannels;
  Picture<T, nc> src(4, 2), upright(2, 4), flat(4, 2);
  const std::vector<T> before = upright.pixels;
  const auto status = [&](Picture<T, nc>& to, float degree) {
    return rotateOf<T, nc>(src.mat, &to.mat, degree);
  };
  // Sizes.
  EXPECT_EQ(status(flat, 90), HPC_INVALID_ARGS);
  EXPECT_EQ(status(flat, 270), HPC_INVALID_ARGS);
  EXPECT_EQ(status(upright, 180), HPC_INVALID_ARGS);
  for (const int off : {-1, 1}) {
    upright.mat.width += off;
    EXPECT_EQ(status(upright, 90), HPC_INVALID_ARGS);
    upright.mat.width -= off;
    upright.mat.height += off;
    EXPECT_EQ(status(upright, 270), HPC_INVALID_ARGS);
    upright.mat.height -= off;
    flat.mat.width += off;
    EXPECT_EQ(status(flat, 180), HPC_INVALID_ARGS);
    flat.mat.width -= off;
    flat.mat.height += off;
    EXPECT_EQ(status(flat, 180), HPC_INVALID_ARGS);
    flat.mat.height -= off;
  }
  // Angles, though the sizes fit.
  for (const float degree :
       {0.0f, 360.0f, -90.0f, -180.0f, -270.0f, 45.0f, 89.9999f, 90.5f, 450.0f, std::nextafter(90.0f, 0.0f),
        std::nextafter(90.0f, 100.0f), std::nextafter(270.0f, 300.0f), std::nextafter(270.0f, 0.0f),
        std::numeric_limits<float>::infinity(), std::numeric_limits<float>::quiet_NaN()}) {
    EXPECT_EQ(status(upright, degree), HPC_INVALID_ARGS) << degree;
  }
  for (const float degree : {std::nextafter(180.0f, 0.0f), std::nextafter(180.0f, 200.0f), 0.0f}) {
    EXPECT_EQ(status(flat, degree), HPC_INVALID_ARGS) << degree;
  }
  // Null data before empty, empty before the angle.
  src.mat.data = nullptr;
  src.mat.dims = 0;
  EXPECT_EQ(status(upright, 45), HPC_POINTER_NULL);
  src.mat.data = src.pixels.data();
  upright.mat.data = nullptr;
  EXPECT_EQ(status(upright, 45), HPC_POINTER_NULL);
  upright.mat.data = upright.pixels.data();
  EXPECT_EQ(status(upright, 45), HPC_MAT_EMPTY);
  src.mat.dims = 2;
  upright.mat.dims = 0;
  EXPECT_EQ(status(upright, 45), HPC_MAT_EMPTY);
  upright.mat.dims = 2;
  EXPECT_EQ(status(upright, 45), HPC_INVALID_ARGS);
  EXPECT_EQ(upright.pixels, before);
  EXPECT_EQ(flat.pixels, (Picture<T, nc>(4, 2).pixels));
}

TYPED_TEST(PackedFrontEnd, RotateLetsZeroSizesThroughToTheAssertions) {
  using T = typename TypeParam::Element;
  constexpr int nc = TypeParam::kChannels;
  const std::string failure =
      literally("inHeight != 0 && inWidth != 0 && inWidthStride != 0 && outHeight != 0 && outWidth != 0");
  Picture<T, nc> src(4, 4), dst(4, 4);
  src.mat.height = 0;
  dst.mat.width = 0;
  EXPECT_DEATH((void)(rotateOf<T, nc>(src.mat, &dst.mat, 90)), failure);
  src.mat.height = 4;
  dst.mat.width = 4;
  src.mat.step = 0;
  EXPECT_DEATH((void)(rotateOf<T, nc>(src.mat, &dst.mat, 180)), failure);
}

// ---- rotate_YUV420

template <YUV420Type frameType>
struct Layout {
  static constexpr YUV420Type kType = frameType;
};
template <typename L>
class FrameFrontEnd : public testing::Test {};
using Layouts = testing::Types<Layout<YUV420_NV21>, Layout<YUV420_NV12>, Layout<YUV420_I420>>;
TYPED_TEST_SUITE(FrameFrontEnd, Layouts);

TYPED_TEST(FrameFrontEnd, Turns) {
  constexpr auto turn = &rotate_YUV420<TypeParam::kType, u8, ECO_ENV_ARM>;
  constexpr bool planar = TypeParam::kType == YUV420_I420;
  // 4 x 2 pixels: two rows of luma, then two chroma pairs or two samples of either plane.
  std::vector<u8> from = {1, 2, 3, 4, 5, 6, 7, 8, 11, 12, 13, 14};
  std::vector<u8> to(12);
  const Image<u8, 1> src(4, 3, from.data());
  Image<u8, 1> upright(2, 6, to.data());
  ASSERT_EQ(turn(src, &upright, 90), HPC_SUCCESS);
  EXPECT_EQ(to, (std::vector<u8>{5, 1, 6, 2, 7, 3, 8, 4, 11, 12, 13, 14}));
  ASSERT_EQ(turn(src, &upright, 270), HPC_SUCCESS);
  EXPECT_EQ(to, planar ? (std::vector<u8>{4, 8, 3, 7, 2, 6, 1, 5, 12, 11, 14, 13})
                       : (std::vector<u8>{4, 8, 3, 7, 2, 6, 1, 5, 13, 14, 11, 12}));
  Image<u8, 1> flat(4, 3, to.data());
  ASSERT_EQ(turn(src, &flat, 180), HPC_SUCCESS);
  EXPECT_EQ(to, planar ? (std::vector<u8>{8, 7, 6, 5, 4, 3, 2, 1, 12, 11, 14, 13})
                       : (std::vector<u8>{8, 7, 6, 5, 4, 3, 2, 1, 13, 14, 11, 12}));
}

TYPED_TEST(FrameFrontEnd, Checks) {
  constexpr auto turn = &rotate_YUV420<TypeParam::kType, u8, ECO_ENV_ARM>;
  std::vector<u8> from(640 * 722, 7), to(640 * 722, 9);
  const std::vector<u8> before = to;
  Image<u8, 1> src(640, 720, from.data());
  Image<u8, 1> upright(480, 960, to.data()), flat(640, 720, to.data());
  EXPECT_EQ(turn(src, nullptr, 45), HPC_POINTER_NULL);
  src.dims = 0;
  EXPECT_EQ(turn(src, nullptr, 90), HPC_POINTER_NULL);
  EXPECT_EQ(turn(src, &upright, 45), HPC_MAT_EMPTY);
  src.dims = 2;
  upright.dims = 0;
  EXPECT_EQ(turn(src, &upright, 45), HPC_MAT_EMPTY);
  upright.dims = 2;
  for (const float degree :
       {0.0f, 360.0f, -90.0f, 90.5f, std::nextafter(90.0f, 0.0f), std::numeric_limits<float>::quiet_NaN()}) {
    EXPECT_EQ(turn(src, &upright, degree), HPC_INVALID_ARGS) << degree;
  }
  EXPECT_EQ(turn(src, &flat, 90), HPC_INVALID_ARGS);
  EXPECT_EQ(turn(src, &flat, 270), HPC_INVALID_ARGS);
  EXPECT_EQ(turn(src, &upright, 180), HPC_INVALID_ARGS);
  // 958 rows hold 638 of luma, 962 hold 641.
  for (const int height : {958, 959, 962}) {
    upright.height = height;
    EXPECT_EQ(turn(src, &upright, 90), HPC_INVALID_ARGS) << height;
  }
  for (const int height : {718, 719, 722}) {
    flat.height = height;
    EXPECT_EQ(turn(src, &flat, 180), HPC_INVALID_ARGS) << height;
  }
  flat.height = 720;
  flat.width = 639;
  EXPECT_EQ(turn(src, &flat, 180), HPC_INVALID_ARGS);
  flat.width = 640;
  EXPECT_EQ(to, before);
  // 961 rows hold as much luma as 960 do; 721 as 720.
  for (const int height : {960, 961}) {
    upright.height = height;
    EXPECT_EQ(turn(src, &upright, 90), HPC_SUCCESS) << height;
    EXPECT_EQ(turn(src, &upright, 270), HPC_SUCCESS) << height;
  }
  for (const int height : {720, 721}) {
    flat.height = height;
    EXPECT_EQ(turn(src, &flat, 180), HPC_SUCCESS) << height;
  }
}

TYPED_TEST(FrameFrontEnd, SizesBelowOne) {
  constexpr auto turn = &rotate_YUV420<TypeParam::kType, u8, ECO_ENV_ARM>;
  std::vector<u8> from(64, 7), to(64, 9);
  const std::vector<u8> before = to;
  const auto none = [&](int width, int height, int outWidth, int outHeight, float degree) {
    Image<u8, 1> src(width, height, from.data()), dst(outWidth, outHeight, to.data());
    EXPECT_EQ(turn(src, &dst, degree), HPC_SUCCESS) << width << " x " << height << ", " << degree;
  };
  none(0, 0, 0, 0, 90);
  none(0, 0, 0, 0, 180);
  none(-4, 6, 4, -6, 90);
  none(4, -6, -4, 6, 270);
  none(-4, -6, -4, -6, 180);
  none(-4, -6, -4, -6, 90);
  none(-4, 6, -4, 6, 180);
  none(4, -6, 4, -6, 180);
  none(0, 6, 4, 0, 90);
  EXPECT_EQ(to, before);
}

}  // namespace
