// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// Malformed matrices that pass the checks, over buffers of exactly the rows that a kernel works on: row r
// begins r steps behind the first, whatever the step, and nothing else is touched.
#include <gtest/gtest.h>

#include <algorithm>
#include <climits>
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

template <typename T, int nc>
using Image = Mat<T, nc, ECO_ENV_ARM>;

// Even, and one that no kernel goes beyond.
constexpr int kWidth = 34;

/// `rows` rows of `kWidth` pixels, `stride` elements apart: overlapping where that is short, upwards where it
/// is negative.
template <typename T, int nc>
class Rows {
 public:
  static constexpr int kElements = kWidth * nc;

  Rows(int rows, int stride)
      : rows_(rows),
        stride_(stride),
        lowest_(std::min(0, (rows - 1) * stride)),
        memory_(1, size(rows, stride), size(rows, stride)) {
    ByteSource bytes(7);
    memory_.fill([&] { return sizeof(T) == 1 ? static_cast<T>(bytes()) : static_cast<T>(bytes() / 255.0); });
  }

  /// The matrix that is given to a front-end, of a height of its own.
  Image<T, nc> matrix(int height) {
    Image<T, nc> mat(kWidth, height, memory_.data() - lowest_);
    mat.step = int64_t{stride_} * static_cast<int64_t>(sizeof(T));
    return mat;
  }

  /// The rows one after the other.
  std::vector<T> contents() const {
    std::vector<T> all;
    for (int r = 0; r < rows_; ++r) {
      const T* row = memory_.data() - lowest_ + r * stride_;
      all.insert(all.end(), row, row + kElements);
    }
    return all;
  }

  bool overlap() const { return std::abs(stride_) < kElements; }

 private:
  static int size(int rows, int stride) { return std::abs((rows - 1) * stride) + kElements; }

  int rows_;
  int stride_;
  int lowest_;
  GuardedImage<T> memory_;
};

/// Runs `run(src, &dst)` on `srcRows` and `dstRows` rows with the given strides. The rows of the result,
/// where they do not overlap, must be those of the same rows one after the other, with sizes and steps that
/// are in order.
template <typename T, int nc, int ncDst, typename Run, typename RunInOrder>
void check(int srcRows, int srcStride, int srcHeight, int dstRows, int dstStride, int dstHeight, Run run,
           RunInOrder runInOrder) {
  SCOPED_TRACE(testing::Message() << "strides " << srcStride << " and " << dstStride << ", heights "
                                  << srcHeight << " and " << dstHeight);
  Rows<T, nc> src(srcRows, srcStride);
  Rows<T, ncDst> dst(dstRows, dstStride);
  Image<T, ncDst> out = dst.matrix(dstHeight);
  const std::vector<T> pixels = src.contents();
  ASSERT_EQ(run(src.matrix(srcHeight), &out), HPC_SUCCESS);
  EXPECT_EQ(src.contents(), pixels);
  if (!dst.overlap()) {
    std::vector<T> in = pixels, want(dst.contents().size());
    Image<T, ncDst> wanted(kWidth, dstRows, want.data());
    ASSERT_EQ(runInOrder(Image<T, nc>(kWidth, srcRows, in.data()), &wanted), HPC_SUCCESS);
    EXPECT_EQ(dst.contents(), want);
  }
}

// Steps that hold no row.
std::vector<int> shortSteps(int row) { return {row - 1, row / 2, 1, 0, -1, -row / 2, -row, -row - 5}; }

// ---- cvtColor

template <ColorCvtType type, typename T, int ncSrc, int ncDst>
void convert() {
  // Kernels for planar frames refuse strides of 0 by assertion.
  constexpr bool kPlanar = type == CVT_BGR2I420 || type == CVT_I4202BGR || type == CVT_YUV2GRAY;
  constexpr int kSrcRow = kWidth * ncSrc, kDstRow = kWidth * ncDst;
  const auto run = cvtColor<type, T, ncSrc, T, ncDst, ECO_ENV_ARM>;
  const auto runBoth = [&](int picture, int srcStride, int srcHeight, int dstStride, int dstHeight) {
    if (!kPlanar || (srcStride != 0 && dstStride != 0)) {
      check<T, ncSrc, ncDst>(isFrom420(type) ? picture / 2 * 3 : picture, srcStride, srcHeight,
                             isTo420(type) ? picture / 2 * 3 : picture, dstStride, dstHeight, run, run);
    }
  };
  // The source's height against the destination's: what conversions to 4:2:0 ask, and all others with a short
  // step. A conversion from 4:2:0 takes the latter's for the picture's.
  for (const int dstHeight : {6, 7, 8}) {
    const int picture = isFrom420(type) ? dstHeight : 4;
    if (picture % 2 != 0) {
      continue;  // the reference does not take it
    }
    for (const int step : shortSteps(kSrcRow)) {
      runBoth(picture, step, 4, kDstRow + 3, dstHeight);
    }
    for (const int step : shortSteps(kDstRow)) {
      runBoth(picture, kSrcRow + 3, 4, step, dstHeight);
    }
    runBoth(picture, -kSrcRow, 4, -kDstRow, dstHeight);
  }
  // A frame that is up to two rows too high, with steps that are in order.
  for (const int more : {0, 1, 2}) {
    if (isFrom420(type)) {
      runBoth(4, kSrcRow + 3, 6 + more, kDstRow, 4);
    } else if (isTo420(type)) {
      runBoth(4, kSrcRow, 4, kDstRow + 3, 6 + more);
    }
  }
}

TEST(Malformed, CvtColor){
#define INSTANCE(type, T, ncSrc, ncDst)                                \
  {                                                                    \
    SCOPED_TRACE(#type ", " #T ", " #ncSrc " to " #ncDst " channels"); \
    convert<type, T, ncSrc, ncDst>();                                  \
  }
    FASTCV_CVT_COLOR_INSTANCES(INSTANCE)
#undef INSTANCE
}

// A picture of 7 rows, as a short step lets it through: its chroma begins behind the seventh, of which
// nothing else is made than gray.
TEST(Malformed, OddPictureHeights) {
  const int step = kWidth - 2;
  Rows<u8, 1> src(7 + 3, step);
  Rows<u8, 3> dst(7, Rows<u8, 3>::kElements + 1);
  const std::vector<u8> before = dst.contents();
  Image<u8, 3> out = dst.matrix(7);
  ASSERT_EQ((cvtColor<CVT_NV212BGR, u8, 1, u8, 3, ECO_ENV_ARM>(src.matrix(4), &out)), HPC_SUCCESS);
  std::vector<u8> frame = src.contents();
  frame.erase(frame.begin() + 6 * kWidth, frame.begin() + 7 * kWidth);
  std::vector<u8> want(6 * kWidth * 3);
  Image<u8, 3> wanted(kWidth, 6, want.data());
  ASSERT_EQ(
      (cvtColor<CVT_NV212BGR, u8, 1, u8, 3, ECO_ENV_ARM>(Image<u8, 1>(kWidth, 9, frame.data()), &wanted)),
      HPC_SUCCESS);
  want.insert(want.end(), before.end() - kWidth * 3, before.end());
  EXPECT_EQ(dst.contents(), want);

  Rows<u8, 1> luma(7, step);
  Rows<u8, 1> gray(7, kWidth + 1);
  Image<u8, 1> grayOut = gray.matrix(7);
  ASSERT_EQ((cvtColor<CVT_YUV2GRAY, u8, 1, u8, 1, ECO_ENV_ARM>(luma.matrix(4), &grayOut)), HPC_SUCCESS);
  EXPECT_EQ(gray.contents(), luma.contents());

  EXPECT_DEATH((cvtColor<CVT_I4202BGR, u8, 1, u8, 3, ECO_ENV_ARM>(src.matrix(4), &out)), "height % 2 == 0");
}

// Many rows of nothing: there is nothing to walk. Walked, so many of so many widths would take minutes, which
// the program is not given.
template <ColorCvtType type, typename T, int ncSrc, int ncDst>
void convertNothing() {
  constexpr int kHeight = 1 << 30, kFrameHeight = kHeight / 2 * 3;
  for (int width = 0; width >= -64; width -= 2) {
    T none[1] = {};
    Image<T, ncSrc> src(width, isFrom420(type) ? kFrameHeight : kHeight, none);
    Image<T, ncDst> dst(width, isTo420(type) ? kFrameHeight : kHeight, none);
    if (width == 0 && (type == CVT_BGR2I420 || type == CVT_I4202BGR || type == CVT_YUV2GRAY)) {
      continue;  // an assertion
    }
    EXPECT_EQ((cvtColor<type, T, ncSrc, T, ncDst, ECO_ENV_ARM>(src, &dst)), HPC_SUCCESS) << "width " << width;
  }
}

TEST(Malformed, ManyRowsOfNothing) {
#define INSTANCE(type, T, ncSrc, ncDst)                                \
  {                                                                    \
    SCOPED_TRACE(#type ", " #T ", " #ncSrc " to " #ncDst " channels"); \
    convertNothing<type, T, ncSrc, ncDst>();                           \
  }
  FASTCV_CVT_COLOR_INSTANCES(INSTANCE)
#undef INSTANCE
}

// ---- crop and rotate

template <typename T, int nc>
void cropAndRotate() {
  constexpr int kRow = kWidth * nc;
  for (const int step : shortSteps(kRow)) {
    for (const T ratio : {T{1}, T{2}}) {
      const auto run = [&](const Image<T, nc>& src, Image<T, nc>* dst) {
        return crop<T, nc, T, nc, nc, ECO_ENV_ARM>(src, {0, 0}, ratio, dst);
      };
      check<T, nc, nc>(5, step, 5, 5, kRow + 3, 5, run, run);
      check<T, nc, nc>(5, kRow + 3, 5, 5, step, 5, run, run);
    }
    const auto turn = [](const Image<T, nc>& src, Image<T, nc>* dst) {
      return rotate<T, nc, nc, nc, ECO_ENV_ARM>(src, dst, 180);
    };
    if (step != 0) {
      check<T, nc, nc>(5, step, 5, 5, kRow + 3, 5, turn, turn);
    }
    check<T, nc, nc>(5, kRow + 3, 5, 5, step, 5, turn, turn);
    // As many rows as columns, so that quarter turns have room in the same rows.
    for (const float degree : {90.0f, 270.0f}) {
      const auto quarter = [&](const Image<T, nc>& src, Image<T, nc>* dst) {
        return rotate<T, nc, nc, nc, ECO_ENV_ARM>(src, dst, degree);
      };
      if (step != 0) {
        check<T, nc, nc>(kWidth, step, kWidth, kWidth, kRow + 3, kWidth, quarter, quarter);
      }
      check<T, nc, nc>(kWidth, kRow + 3, kWidth, kWidth, step, kWidth, quarter, quarter);
    }
  }
}

TEST(Malformed, CropAndRotate){
#define INSTANCE(T, nc)                    \
  {                                        \
    SCOPED_TRACE(#T ", " #nc " channels"); \
    cropAndRotate<T, nc>();                \
  }
    FASTCV_PACKED_INSTANCES(INSTANCE)
#undef INSTANCE
}

// A rectangle whose far edge is beyond 2^31 wraps to a negative one, which lies inside; without rows it is
// copied.
TEST(Malformed, CropOfARectangleThatWraps) {
  Rows<u8, 1> src(2, kWidth);
  Rows<u8, 1> dst(2, kWidth);
  const std::vector<u8> before = dst.contents();
  const auto run = crop<u8, 1, u8, 1, 1, ECO_ENV_ARM>;
  Image<u8, 1> out = dst.matrix(0);
  out.width = INT_MAX;
  EXPECT_EQ(run(src.matrix(2), {1, 0}, 1, &out), HPC_SUCCESS);
  EXPECT_EQ(run(src.matrix(2), {0, 0}, 1, &out), HPC_INVALID_ARGS);
  out.width = 0;
  out.height = INT_MAX;
  EXPECT_EQ(run(src.matrix(2), {0, 1}, 1, &out), HPC_SUCCESS);
  EXPECT_EQ(run(src.matrix(2), {0, 0}, 1, &out), HPC_INVALID_ARGS);
  EXPECT_EQ(dst.contents(), before);
}

template <YUV420Type type>
void rotateFrame() {
  constexpr int kRows = kWidth / 2 * 3;  // a square picture
  for (const float degree : {90.0f, 180.0f, 270.0f}) {
    const auto run = [&](const Image<u8, 1>& src, Image<u8, 1>* dst) {
      return rotate_YUV420<type, u8, ECO_ENV_ARM>(src, dst, degree);
    };
    for (const int step : shortSteps(kWidth)) {
      check<u8, 1, 1>(kRows, step, kRows, kRows, kWidth + 3, kRows, run, run);
      check<u8, 1, 1>(kRows, kWidth + 3, kRows, kRows, step, kRows, run, run);
    }
    // One row more changes nothing.
    check<u8, 1, 1>(kRows, kWidth, kRows + 1, kRows, kWidth, kRows, run, run);
    check<u8, 1, 1>(kRows, kWidth, kRows, kRows, kWidth, kRows + 1, run, run);
  }
}

TEST(Malformed, RotateYuv420) {
#define INSTANCE(type)   \
  {                      \
    SCOPED_TRACE(#type); \
    rotateFrame<type>(); \
  }
  FASTCV_YUV420_INSTANCES(INSTANCE)
#undef INSTANCE
}

}  // namespace
