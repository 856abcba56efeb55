// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// Rotation of whole 4:2:0 frames against the layouts, sample by sample.

#include <gtest/gtest.h>

#include <atomic>
#include <cstdint>
#include <cstdlib>
#include <string>
#include <vector>

#include "fastcv/kernels.h"
#include "tests/support/death.h"
#include "tests/support/guarded_image.h"
#include "tests/support/rotated.h"
#include "tests/support/sparse_memory.h"

// Refusing memory takes an allocator of one's own, which a sanitizer already is.
#if defined(__has_feature)
#if __has_feature(address_sanitizer) || __has_feature(thread_sanitizer)
#define OWN_ALLOCATOR 0
#endif
#endif
#if defined(__SANITIZE_ADDRESS__) || defined(__SANITIZE_THREAD__)
#define OWN_ALLOCATOR 0
#endif
#if !defined(OWN_ALLOCATOR)
#define OWN_ALLOCATOR 1
#endif

#if OWN_ALLOCATOR
namespace {
// The allocations between `watch` and `stop`.
struct Allocations {
  std::atomic<bool> watched = false;
  int refused = -1;  // the number of the one that gets no memory
  std::vector<size_t>* sizes = nullptr;
  int released = 0;
};
Allocations allocations;
}  // namespace

extern "C" void* __libc_malloc(size_t size);
extern "C" void __libc_free(void* memory);

extern "C" void* malloc(size_t size) {
  if (!allocations.watched) {
    return __libc_malloc(size);
  }
  allocations.watched = false;
  const bool refused = static_cast<int>(allocations.sizes->size()) == allocations.refused;
  allocations.sizes->push_back(size);
  allocations.watched = true;
  return refused ? nullptr : __libc_malloc(size);
}

extern "C" void free(void* memory) {
  if (allocations.watched && memory != nullptr) {
    ++allocations.released;
  }
  __libc_free(memory);
}
#endif

namespace {

using HPC::fastcv::armRotateNx90degree_YUV420;
using HPC::fastcv::imgRotate_I420;
using kyface::test::ByteSource;
using kyface::test::GuardedImage;
using kyface::test::literally;
using kyface::test::Place;
using kyface::test::sourceOf;
using kyface::test::SparseMemory;
using u8 = unsigned char;
using Offset = ptrdiff_t;

constexpr int kSemiPlanar = 0;
constexpr int kPlanar = 1;
constexpr int kAngles[] = {90, 180, 270};

// The size of a frame: `rows` of the whole buffer.
struct Size {
  int rows;
  int width;
  int luma() const { return rows * 2 / 3; }
  int chromaRows() const { return luma() / 2; }
  int chromaColumns() const { return width / 2; }
};

// Where the samples of a frame lie.
class Frame {
 public:
  Frame(int type, Size size, int stride) : size_(size), stride_(stride) {
    const Offset u = static_cast<Offset>(size.luma()) * stride;
    if (type == kSemiPlanar) {
      return;
    }
    const Offset v = (size.luma() + static_cast<Offset>(size.luma() / 4)) * stride +
                     static_cast<Offset>(size.width / 2) * (size.luma() % 4 / 2);
    u_ = rowsFrom(u, false);
    v_ = rowsFrom(v, size.luma() % 4 / 2 != 0);
  }

  Offset luma(int r, int c) const { return static_cast<Offset>(r) * stride_ + c; }
  Offset pair(int r, int c) const { return (static_cast<Offset>(size_.luma()) + r) * stride_ + 2 * c; }
  Offset u(int r, int c) const { return u_[static_cast<size_t>(r)] + c; }
  Offset v(int r, int c) const { return v_[static_cast<size_t>(r)] + c; }

 private:
  // The beginnings of a plane's rows: by half a width and by the rest of the stride in turn.
  std::vector<Offset> rowsFrom(Offset at, bool restFirst) const {
    std::vector<Offset> rows;
    bool rest = restFirst;
    for (int r = 0; r < size_.chromaRows(); ++r, rest = !rest) {
      rows.push_back(at);
      at += rest ? stride_ - size_.width / 2 : size_.width / 2;
    }
    return rows;
  }

  Size size_;
  int stride_;
  std::vector<Offset> u_;
  std::vector<Offset> v_;
};

// Calls `sample(destination, source)` with the offsets of every sample that a rotation moves.
template <typename Sample>
void forEachMoved(int type, int degree, Size in, int inStride, Size out, int outStride,
                  const Sample& sample) {
  const Frame from(type, in, inStride);
  const Frame to(type, out, outStride);
  for (int r = 0; r < out.luma(); ++r) {
    for (int c = 0; c < out.width; ++c) {
      const Place at = sourceOf(degree, in.luma(), in.width, r, c);
      sample(to.luma(r, c), from.luma(at.row, at.column));
    }
  }
  for (int r = 0; r < out.chromaRows(); ++r) {
    for (int c = 0; c < out.chromaColumns(); ++c) {
      const Place at = sourceOf(degree, in.chromaRows(), in.chromaColumns(), r, c);
      if (type == kSemiPlanar) {
        sample(to.pair(r, c), from.pair(at.row, at.column));
        sample(to.pair(r, c) + 1, from.pair(at.row, at.column) + 1);
      } else {
        sample(to.u(r, c), from.u(at.row, at.column));
        sample(to.v(r, c), from.v(at.row, at.column));
      }
    }
  }
}

Size turned(int degree, Size size) {
  // The least rows that hold a luma of `width` rows.
  return degree == 180 ? size : Size{(3 * size.width + 1) / 2, size.luma()};
}

void turn(int type, int degree, Size in, const GuardedImage<u8>& from, Size out, GuardedImage<u8>& to) {
  armRotateNx90degree_YUV420<u8>(in.rows, in.width, from.stride(), from.data(), out.rows, out.width,
                                 to.stride(), to.data(), degree, type);
}

void check(int type, int degree, Size in, int inPad, int outPad) {
  const Size out = turned(degree, in);
  ASSERT_EQ(out.luma(), degree == 180 ? in.luma() : in.width);
  GuardedImage<u8> from(in.rows, in.width, in.width + inPad);
  from.fill(ByteSource(static_cast<unsigned>(in.rows * 1000 + in.width)));
  GuardedImage<u8> to(out.rows, out.width, out.width + outPad);
  std::vector<u8> expected = to.contents();
  forEachMoved(type, degree, in, from.stride(), out, to.stride(), [&](Offset at, Offset source) {
    const Offset row = at / to.stride();
    expected[static_cast<size_t>(row * out.width + at % to.stride())] = from.data()[source];
  });
  turn(type, degree, in, from, out, to);
  ASSERT_TRUE(to.holds(expected)) << degree << " degrees, " << in.width << " x " << in.luma() << ", padding "
                                  << inPad << " and " << outPad;
}

class RotateYuv420 : public testing::TestWithParam<int> {};

// Luma heights of every remainder by 4, on the side of the source and, turned, of the destination.
TEST_P(RotateYuv420, EverySmallEvenSize) {
  for (const int degree : kAngles) {
    for (int luma = 2; luma <= 40; luma += 2) {
      for (int width = 2; width <= 40; width += 2) {
        const Size size = {luma / 2 * 3, width};
        const bool padded = (luma + width) % 4 == 0;
        check(GetParam(), degree, size, padded ? 6 : 0, padded ? 3 : 0);
      }
    }
  }
}

TEST_P(RotateYuv420, BlockBoundaries) {
  for (const int degree : kAngles) {
    for (const int luma : {62, 64, 66, 126, 128, 130, 132}) {
      for (const int width : {62, 64, 66, 126, 128, 130, 254, 258}) {
        check(GetParam(), degree, {luma / 2 * 3, width}, 0, 0);
        check(GetParam(), degree, {luma / 2 * 3, width}, 2, 5);
      }
    }
  }
}

TEST_P(RotateYuv420, LargeFrames) {
  for (const int degree : kAngles) {
    check(GetParam(), degree, {360, 320}, 0, 0);
    check(GetParam(), degree, {357, 318}, 0, 0);
    check(GetParam(), degree, {357, 318}, 10, 0);
    check(GetParam(), degree, {363, 322}, 0, 14);
  }
}

// What is odd loses its last chroma row or column.
TEST_P(RotateYuv420, OddSizes) {
  for (const int degree : kAngles) {
    for (int rows = 1; rows <= 26; ++rows) {
      for (int width = 1; width <= 19; ++width) {
        check(GetParam(), degree, {rows, width}, 0, 0);
        check(GetParam(), degree, {rows, width}, 1, 2);
      }
    }
  }
}

TEST_P(RotateYuv420, ThereAndBack) {
  for (const int luma : {96, 98}) {
    for (const int width : {140, 142}) {
      const Size size = {luma / 2 * 3, width};
      const Size upright = turned(90, size);
      GuardedImage<u8> image(size.rows, size.width, size.width + 4);
      image.fill(ByteSource(1));
      const std::vector<u8> original = image.contents();
      GuardedImage<u8> other(upright.rows, upright.width, upright.width);
      GuardedImage<u8> flat(size.rows, size.width, size.width);
      GuardedImage<u8> back(size.rows, size.width, size.width + 2);
      turn(GetParam(), 90, size, image, upright, other);
      turn(GetParam(), 270, upright, other, size, back);
      EXPECT_TRUE(back.holds(original));
      turn(GetParam(), 270, size, image, upright, other);
      turn(GetParam(), 90, upright, other, size, back);
      EXPECT_TRUE(back.holds(original));
      turn(GetParam(), 180, size, image, size, flat);
      turn(GetParam(), 180, size, flat, size, back);
      EXPECT_TRUE(back.holds(original));
    }
  }
}

TEST_P(RotateYuv420, OtherAnglesWriteNothing) {
  const Size size = {12, 8};
  GuardedImage<u8> from(12, 8, 8), to(12, 8, 8);
  const std::vector<u8> before = to.contents();
  for (const int degree : {0, 1, 45, 89, 91, 360, -90, -180}) {
    turn(GetParam(), degree, size, from, size, to);
  }
  EXPECT_TRUE(to.holds(before));
}

TEST_P(RotateYuv420, NothingToWrite) {
  GuardedImage<u8> from(12, 8, 8), to(12, 8, 8);
  const std::vector<u8> before = to.contents();
  for (const int degree : kAngles) {
    for (const int none : {0, -1, -3, -12}) {
      turn(GetParam(), degree, {none, 8}, from, {none, 8}, to);
      turn(GetParam(), degree, {12, none}, from, {12, none}, to);
      turn(GetParam(), degree, {none, none}, from, {none, none}, to);
    }
  }
  EXPECT_TRUE(to.holds(before));
}

// Sizes and strides below 0, whose products are not: nothing is read either.
TEST_P(RotateYuv420, NothingToRead) {
  GuardedImage<u8> from(1, 4, 4), to(1, 4, 4);
  const std::vector<u8> before = to.contents();
  for (const int degree : kAngles) {
    for (const int width : {-2, -3, -4, -8}) {
      for (const int rows : {-3, -6, -12}) {
        armRotateNx90degree_YUV420<u8>(rows, width, width, from.data(), rows, width, width, to.data(), degree,
                                       GetParam());
      }
    }
  }
  EXPECT_TRUE(to.holds(before));
}

// Planes that begin further than 2^31 bytes into both frames.
TEST_P(RotateYuv420, OffsetsBeyond32Bits) {
  constexpr int kStride = 1 << 20;
  const Size in = {3300, 10};  // 2200 luma rows
  const Size half = {15, 2200};
  const size_t size = static_cast<size_t>(in.rows) * kStride;
  const SparseMemory tallMemory(size), otherMemory(size);
  u8* const tall = tallMemory.as<u8>();
  u8* const other = otherMemory.as<u8>();
  ByteSource bytes(5);
  for (int r = 0; r < in.rows; ++r) {
    for (int c = 0; c < in.width; ++c) {
      tall[static_cast<Offset>(r) * kStride + c] = bytes();
    }
  }
  std::vector<u8> flat(static_cast<size_t>(half.rows) * static_cast<size_t>(half.width));
  const auto expect = [&](int degree, Size inSize, const u8* from, int inStride, Size outSize, u8* to,
                          int outStride) {
    armRotateNx90degree_YUV420<u8>(inSize.rows, inSize.width, inStride, from, outSize.rows, outSize.width,
                                   outStride, to, degree, GetParam());
    int wrong = 0;
    forEachMoved(GetParam(), degree, inSize, inStride, outSize, outStride,
                 [&](Offset at, Offset source) { wrong += to[at] != from[source]; });
    EXPECT_EQ(wrong, 0) << degree << " degrees";
  };
  for (const int degree : {90, 270}) {
    expect(degree, in, tall, kStride, half, flat.data(), half.width);
    expect(degree, half, flat.data(), half.width, in, other, kStride);
  }
  expect(180, in, tall, kStride, in, other, kStride);
}

INSTANTIATE_TEST_SUITE_P(Layouts, RotateYuv420, testing::Values(kSemiPlanar, kPlanar),
                         [](const auto& i) { return i.param == kSemiPlanar ? "SemiPlanar" : "Planar"; });

TEST(RotateYuv420Dispatch, PlanarIsTheWorker) {
  const Size in = {15, 10}, out = turned(90, in);
  GuardedImage<u8> from(in.rows, in.width, 13), to(out.rows, out.width, 12), same(out.rows, out.width, 12);
  from.fill(ByteSource(2));
  turn(kPlanar, 90, in, from, out, to);
  imgRotate_I420<u8>(in.rows, in.width, 13, from.data(), out.rows, out.width, 12, same.data(), 90);
  EXPECT_TRUE(same.holds(to.contents()));
}

TEST(RotateYuv420Dispatch, AssertsTheType) {
  const std::string failure = literally("fastcv/src/arm/rotate_arm:") +
                              "[0-9]+: .*armRotateNx90degree_YUV420.*" +
                              literally("assertion \"yuv420_type == 0 || yuv420_type == 1\" failed");
  u8 frame[6] = {};
  for (const int type : {-1, 2, 3}) {
    EXPECT_DEATH(armRotateNx90degree_YUV420<u8>(3, 2, 2, frame, 3, 2, 2, frame, 90, type), failure);
    // The type is the first and only thing that is looked at.
    EXPECT_DEATH(armRotateNx90degree_YUV420<u8>(0, 0, 0, nullptr, 0, 0, 0, nullptr, 45, type), failure);
  }
}

// The examples of a picture of 4 x 2.
TEST(RotateYuv420Examples, PairsKeepTheirOrder) {
  const std::vector<u8> in = {1, 2, 3, 4, 5, 6, 7, 8, 11, 12, 13, 14};
  std::vector<u8> out(12);
  armRotateNx90degree_YUV420<u8>(3, 4, 4, in.data(), 6, 2, 2, out.data(), 90, kSemiPlanar);
  EXPECT_EQ(out, (std::vector<u8>{5, 1, 6, 2, 7, 3, 8, 4, 11, 12, 13, 14}));
}

// Luma 6 x 6: three chroma rows a plane, so that V begins in the middle of a buffer row.
TEST(RotateYuv420Examples, PlaneInTheMiddleOfARow) {
  constexpr int kStride = 8;
  std::vector<u8> in(9 * kStride, 0), out(9 * kStride, 0), expected(9 * kStride, 0);
  const auto put = [](std::vector<u8>& frame, int row, int column, std::vector<u8> samples) {
    std::copy(samples.begin(), samples.end(), frame.begin() + row * kStride + column);
  };
  put(in, 6, 0, {1, 2, 3, 4, 5, 6});
  put(in, 7, 0, {7, 8, 9, 11, 12, 13});
  put(in, 8, 0, {14, 15, 16, 17, 18, 19});
  armRotateNx90degree_YUV420<u8>(9, 6, kStride, in.data(), 9, 6, kStride, out.data(), 90, kPlanar);
  put(expected, 6, 0, {7, 4, 1, 8, 5, 2});
  put(expected, 7, 0, {9, 6, 3, 17, 14, 11});
  put(expected, 8, 0, {18, 15, 12, 19, 16, 13});
  EXPECT_EQ(out, expected);
}

// So large that no memory can be had for the scratch planes; neither frame is touched.
TEST(RotateI420Memory, NothingIsDoneWithoutIt) {
  GuardedImage<u8> from(3, 4, 4), to(3, 4, 4);
  const std::vector<u8> before = to.contents();
  for (const int degree : kAngles) {
    imgRotate_I420<u8>(3 << 28, 1 << 30, 4, from.data(), 3, 4, 4, to.data(), degree);
  }
  EXPECT_TRUE(to.holds(before));
}

#if OWN_ALLOCATOR
class RotateI420Scratch : public testing::Test {
 protected:
  static std::vector<u8> rotate(int refused, std::vector<size_t>* sizes, int* released) {
    constexpr Size kIn = {18, 20}, kOut = {30, 12};
    const std::vector<u8> in(18 * 20, 7);
    std::vector<u8> out(30 * 12, 9);
    sizes->reserve(8);
    allocations.sizes = sizes;
    allocations.refused = refused;
    allocations.released = 0;
    allocations.watched = true;
    imgRotate_I420<u8>(kIn.rows, kIn.width, kIn.width, in.data(), kOut.rows, kOut.width, kOut.width,
                       out.data(), 90);
    allocations.watched = false;
    *released = allocations.released;
    return out;
  }
};

TEST_F(RotateI420Scratch, TwoPlanesAreTakenAndReleased) {
  std::vector<size_t> sizes;
  int released = 0;
  EXPECT_EQ(rotate(-1, &sizes, &released), std::vector<u8>(30 * 12, 7));
  EXPECT_EQ(sizes, (std::vector<size_t>{60, 60}));  // 20 * 6 / 2
  EXPECT_EQ(released, 2);
}

TEST_F(RotateI420Scratch, NothingIsDoneWithoutEither) {
  for (const int refused : {0, 1}) {
    std::vector<size_t> sizes;
    int released = 0;
    EXPECT_EQ(rotate(refused, &sizes, &released), std::vector<u8>(30 * 12, 9)) << refused;
    EXPECT_EQ(released, 1) << refused;
  }
}
#endif

}  // namespace
