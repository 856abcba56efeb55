// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// Images whose rows lie further apart than 32 bits can say: every operation gives what it gives with the rows
// close together.
#include <gtest/gtest.h>

#include <algorithm>
#include <cstring>
#include <vector>

#include "fastcv/fastcv.h"
#include "frame/frame.h"
#include "tests/support/cvt_families.h"
#include "tests/support/guarded_image.h"
#include "tests/support/sparse_memory.h"

using namespace HPC::fastcv;

namespace {

using kyface::test::ByteSource;
using kyface::test::DistantRows;
using kyface::test::isFrom420;
using kyface::test::isTo420;
using kyface::test::RepeatedMemory;
using u8 = unsigned char;

template <typename T, int nc>
using Image = Mat<T, nc, ECO_ENV_ARM>;

// A width with whole blocks and what is left of them, where no kernel reaches beyond its rows.
constexpr int kWidth = 66;

// The most rows of an image here, and of a float image, which is four times as large.
template <typename T>
constexpr int kMostRows = sizeof(T) == 1 ? 6 : 3;

// Two images for all tests: to set memory of this size up takes its time under emulation.
template <typename T>
const DistantRows<T>& distant(bool source) {
  static const DistantRows<T> rows[] = {DistantRows<T>(kMostRows<T>), DistantRows<T>(kMostRows<T>)};
  return rows[source ? 0 : 1];
}

/// The same rows twice: close together, and far apart.
template <typename T, int nc>
class Twin {
 public:
  Twin(bool source, int width, int rows)
      : elements_(width * nc),
        rows_(rows),
        distant_(distant<T>(source)),
        memory_(static_cast<size_t>(elements_ + kPad) * static_cast<size_t>(rows)),
        close(width, rows, memory_.data()),
        apart(width, rows, distant_.row(0, elements_)) {
    close.step = static_cast<int64_t>(elements_ + kPad) * static_cast<int64_t>(sizeof(T));
    apart.step = int64_t{DistantRows<T>::kStride} * static_cast<int64_t>(sizeof(T));
    ByteSource bytes(source ? 1 : 2);
    for (int r = 0; r < rows; ++r) {
      for (int i = 0; i < elements_; ++i) {
        const u8 value = bytes();
        distant_.row(r, elements_)[i] = at(r)[i] = sizeof(T) == 1 ? value : static_cast<T>(value / 255.0);
      }
    }
  }

  ::testing::AssertionResult agrees() const {
    for (int r = 0; r < rows_; ++r) {
      if (memcmp(at(r), distant_.row(r, elements_), static_cast<size_t>(elements_) * sizeof(T)) != 0) {
        return ::testing::AssertionFailure() << "row " << r;
      }
    }
    return ::testing::AssertionSuccess();
  }

 private:
  static constexpr int kPad = 5;  // so that no two rows are joined into one

  T* at(int r) const { return close.data + static_cast<ptrdiff_t>(r) * (elements_ + kPad); }

  int elements_;
  int rows_;
  const DistantRows<T>& distant_;
  std::vector<T> memory_;

 public:
  Image<T, nc> close;
  Image<T, nc> apart;
};

/// Runs an operation on the rows close together and on those far apart.
template <typename T, int ncSrc, int ncDst, typename Operation>
void expectSame(const Twin<T, ncSrc>& src, Twin<T, ncDst>& dst, Operation run) {
  ASSERT_EQ(run(src.close, &dst.close), HPC_SUCCESS);
  ASSERT_FALSE(dst.agrees());
  ASSERT_EQ(run(src.apart, &dst.apart), HPC_SUCCESS);
  EXPECT_TRUE(dst.agrees());
  EXPECT_TRUE(src.agrees());
}

/// Quarter turns, whose results have few, distant rows where the images have many, close ones; then half a
/// turn.
template <typename T, int nc, typename Operation>
void expectSameTurned(int rows, int turnedWidth, int turnedRows, Operation run) {
  const Twin<T, nc> src(true, kWidth, rows);
  for (const float degree : {90.0f, 270.0f}) {
    std::vector<T> want(static_cast<size_t>(turnedRows) * static_cast<size_t>(turnedWidth) * nc),
        got(want.size());
    Image<T, nc> close(turnedWidth, turnedRows, want.data());
    Image<T, nc> apart(turnedWidth, turnedRows, got.data());
    ASSERT_EQ(run(src.close, &close, degree), HPC_SUCCESS);
    ASSERT_EQ(run(src.apart, &apart, degree), HPC_SUCCESS);
    EXPECT_EQ(want, got);
    const auto turn = [&](const Image<T, nc>&, Image<T, nc>* dst) { return run(close, dst, degree); };
    Twin<T, nc> back(false, kWidth, rows);
    expectSame(src, back, turn);
  }
  Twin<T, nc> dst(false, kWidth, rows);
  expectSame(src, dst, [&](const Image<T, nc>& from, Image<T, nc>* to) { return run(from, to, 180.0f); });
}

// ---- cvtColor

template <ColorCvtType type, typename T, int ncSrc, int ncDst>
void convert() {
  for (const int height : {2, kMostRows<T> == 3 ? 3 : 4}) {
    Twin<T, ncSrc> src(true, kWidth, isFrom420(type) ? height / 2 * 3 : height);
    Twin<T, ncDst> dst(false, kWidth, isTo420(type) ? height / 2 * 3 : height);
    expectSame(src, dst, cvtColor<type, T, ncSrc, T, ncDst, ECO_ENV_ARM>);
  }
}

TEST(DistantRows, CvtColor) {
#define INSTANCE(type, T, ncSrc, ncDst)                                \
  {                                                                    \
    SCOPED_TRACE(#type ", " #T ", " #ncSrc " to " #ncDst " channels"); \
    convert<type, T, ncSrc, ncDst>();                                  \
  }
  FASTCV_CVT_COLOR_INSTANCES(INSTANCE)
#undef INSTANCE
}

// ---- crop and rotate

template <typename T, int nc>
void cropRows() {
  const Twin<T, nc> src(true, kWidth + 3, kMostRows<T>);
  for (const T ratio : {T{1}, T{2}}) {
    for (const Point2_<int> corner : {Point2_<int>{0, 0}, Point2_<int>{2, 1}}) {
      Twin<T, nc> dst(false, kWidth, kMostRows<T> - corner.y);
      expectSame(src, dst, [&](const Image<T, nc>& from, Image<T, nc>* to) {
        return crop<T, nc, T, nc, nc, ECO_ENV_ARM>(from, corner, ratio, to);
      });
    }
  }
}

TEST(DistantRows, CropAndRotate){
#define INSTANCE(T, nc)                                                                              \
  {                                                                                                  \
    SCOPED_TRACE(#T ", " #nc " channels");                                                           \
    cropRows<T, nc>();                                                                               \
    expectSameTurned<T, nc>(kMostRows<T>, kMostRows<T>, kWidth, rotate<T, nc, nc, nc, ECO_ENV_ARM>); \
  }
    FASTCV_PACKED_INSTANCES(INSTANCE)
#undef INSTANCE
}

TEST(DistantRows, RotateYuv420){
#define INSTANCE(type)                                                                                   \
  {                                                                                                      \
    SCOPED_TRACE(#type);                                                                                 \
    for (const int luma : {2, 4}) {                                                                      \
      expectSameTurned<u8, 1>(luma / 2 * 3, luma, kWidth / 2 * 3, rotate_YUV420<type, u8, ECO_ENV_ARM>); \
    }                                                                                                    \
  }
    FASTCV_YUV420_INSTANCES(INSTANCE)
#undef INSTANCE
}

// ---- frame helpers

// The only one that does not touch all of its frame.
TEST(DistantRows, CropNv21) {
  constexpr int kCropped = 64;
  Twin<u8, 1> frame(true, kWidth, 6);
  std::vector<u8> expected(size_t{kCropped} * 2 * 4), got(expected.size());
  // Rows of the whole frame, close together, are those of the wide one from its last columns on.
  std::vector<u8> packed;
  for (int r = 0; r < 6; ++r) {
    const u8* row = distant<u8>(true).row(r, kWidth);
    packed.insert(packed.end(), row, row + kWidth);
  }
  for (const int x : {0, 2}) {
    cropNv21(packed.data(), kWidth, 4, x, 2, kCropped, 2, expected.data());
    cropNv21(distant<u8>(true).begin(), DistantRows<u8>::kStride, 4, DistantRows<u8>::kStride - kWidth + x, 2,
             kCropped, 2, got.data());
    EXPECT_EQ(expected, got);
  }
}

// ---- packed images, whose rows are done as one

// More than 2^31 bytes of source.
TEST(DistantRows, AreJoined) {
  constexpr int kBlock = 1 << 21, kBlocks = 1025;  // of the source, in bytes
  constexpr int kPixels = kBlock / 4;
  const RepeatedMemory from(kBlocks, kBlock), to(kBlocks, kPixels);
  u8* const last = from.as<u8>() + ptrdiff_t{kBlocks - 1} * kBlock;
  ByteSource bytes(3);
  std::generate_n(from.as<u8>(), kBlock, [&] { return bytes(); });
  std::generate_n(last, kBlock, [&] { return bytes(); });
  const Image<u8, 4> src(kPixels, kBlocks, from.as<u8>());
  Image<u8, 1> dst(kPixels, kBlocks, to.as<u8>());
  const auto run = cvtColor<CVT_BGR2GRAY, u8, 4, u8, 1, ECO_ENV_ARM>;
  ASSERT_EQ(run(src, &dst), HPC_SUCCESS);

  std::vector<u8> expected(kPixels);
  Image<u8, 1> one(kPixels, 1, expected.data());
  for (const int r : {0, kBlocks - 1}) {
    ASSERT_EQ(run(Image<u8, 4>(kPixels, 1, from.as<u8>() + ptrdiff_t{r} * kBlock), &one), HPC_SUCCESS);
    EXPECT_EQ(memcmp(expected.data(), to.as<u8>() + ptrdiff_t{r} * kPixels, kPixels), 0) << "row " << r;
  }
}

}  // namespace
