// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// Right-angle rotation of packed images against the index mapping, pixel by pixel.

#include <gtest/gtest.h>
#include <sys/mman.h>

#include <cstdint>
#include <cstring>
#include <random>
#include <string>
#include <vector>

#include "fastcv/kernels.h"
#include "tests/support/death.h"
#include "tests/support/guarded_image.h"
#include "tests/support/rotated.h"

namespace {

using HPC::fastcv::armRotateNx90degree;
using HPC::fastcv::imgRotate180degree;
using HPC::fastcv::imgRotate270degree;
using HPC::fastcv::imgRotate90degree;
using kyface::test::GuardedImage;
using kyface::test::literally;
using kyface::test::Place;
using kyface::test::sourceOf;
using u8 = unsigned char;

// Any bit pattern; as floats they are also infinities, denormals and signalling NaNs, which must not change.
class Bits {
 public:
  explicit Bits(unsigned seed) : engine_(seed) {}
  template <typename T>
  T next() {
    const uint32_t bits = static_cast<uint32_t>(engine_()) * 2654435761u;
    T value;
    memcpy(&value, &bits, sizeof(T));
    return value;
  }

 private:
  std::minstd_rand engine_;
};

template <typename T, int channels>
struct Instance {
  using Element = T;
  static constexpr int kChannels = channels;

  static void work(int degree, int inHeight, int inWidth, int inStride, const T* in, int outHeight,
                   int outWidth, int outStride, T* out) {
    const auto kernel = degree == 90    ? imgRotate90degree<T, channels, 64, 64>
                        : degree == 180 ? imgRotate180degree<T, channels, 64, 64>
                                        : imgRotate270degree<T, channels, 64, 64>;
    kernel(inHeight, inWidth, inStride, in, outHeight, outWidth, outStride, out);
  }
  static void dispatch(int degree, int inHeight, int inWidth, int inStride, const T* in, int outHeight,
                       int outWidth, int outStride, T* out) {
    armRotateNx90degree<T, channels, channels, channels>(inHeight, inWidth, inStride, in, outHeight, outWidth,
                                                         outStride, out, degree);
  }
};

template <typename I>
class Rotate : public testing::Test {
 protected:
  using Element = typename I::Element;
  static constexpr int kChannels = I::kChannels;
  using Function = void (*)(int, int, int, int, const Element*, int, int, int, Element*);

  // Rotates a source of `height` by `width` into a destination of `outHeight` by `outWidth` and compares
  // every element of it, padding included. Of the source only the first `present` columns exist.
  static void check(Function function, int degree, int height, int width, int present, int outHeight,
                    int outWidth, int inPad, int outPad) {
    Bits bits(static_cast<unsigned>(height * 1000 + width));
    GuardedImage<Element> in(height, present * kChannels, width * kChannels + inPad);
    in.fill([&] { return bits.next<Element>(); });
    GuardedImage<Element> out(outHeight, outWidth * kChannels, outWidth * kChannels + outPad);
    std::vector<Element> expected(static_cast<size_t>(outHeight) * static_cast<size_t>(outWidth) * kChannels);
    Element* next = expected.data();
    for (int r = 0; r < outHeight; ++r) {
      for (int c = 0; c < outWidth; ++c, next += kChannels) {
        const Place from = sourceOf(degree, height, width, r, c);
        memcpy(next, in.row(from.row) + from.column * kChannels, kChannels * sizeof(Element));
      }
    }
    function(degree, height, width, in.stride(), in.data(), outHeight, outWidth, out.stride(), out.data());
    ASSERT_TRUE(out.holds(expected)) << degree << " degrees, " << width << " x " << height << " to "
                                     << outWidth << " x " << outHeight << ", padding " << inPad << " and "
                                     << outPad;
  }

  static void check(Function function, int degree, int height, int width, int inPad, int outPad) {
    const bool turned = degree != 180;
    check(function, degree, height, width, width, turned ? width : height, turned ? height : width, inPad,
          outPad);
  }
};

using Instances =
    testing::Types<Instance<u8, 1>, Instance<u8, 2>, Instance<u8, 3>, Instance<u8, 4>, Instance<float, 1>,
                   Instance<float, 2>, Instance<float, 3>, Instance<float, 4>>;

struct InstanceNames {
  template <typename I>
  static std::string GetName(int) {
    return (sizeof(typename I::Element) == 1 ? "u8x" : "f32x") + std::to_string(I::kChannels);
  }
};
TYPED_TEST_SUITE(Rotate, Instances, InstanceNames);

constexpr int kAngles[] = {90, 180, 270};

// Sizes around every tile and block boundary.
std::vector<int> edges() {
  std::vector<int> sizes;
  for (int size = 1; size <= 35; ++size) {
    sizes.push_back(size);
  }
  sizes.insert(sizes.end(), {63, 64, 65, 127, 128, 129});
  return sizes;
}

TYPED_TEST(Rotate, EveryEdgeByEveryEdge) {
  for (const int degree : kAngles) {
    for (const int height : edges()) {
      for (const int width : edges()) {
        // Packed and padded by turns; every size meets both.
        const bool padded = (height + width) % 2 != 0;
        this->check(TypeParam::work, degree, height, width, padded ? 5 : 0, padded ? 3 : 0);
        if (degree == 180 && width < height) {
          // Rows as far apart as the image is high are not packed.
          const int pad = (height - width) * TypeParam::kChannels;
          this->check(TypeParam::work, degree, height, width, pad, pad);
        }
      }
    }
  }
}

TYPED_TEST(Rotate, LargeImages) {
  for (const int degree : kAngles) {
    this->check(TypeParam::work, degree, 200, 331, 0, 0);
    this->check(TypeParam::work, degree, 331, 200, 0, 1);
    this->check(TypeParam::work, degree, 193, 318, 7, 0);
    this->check(TypeParam::dispatch, degree, 318, 193, 9, 11);
  }
}

// The loops cover the destination; the source's size only says where its pixels are.
TYPED_TEST(Rotate, PartOfTheSource) {
  for (const int degree : kAngles) {
    for (const int outHeight : {1, 7, 64, 70}) {
      for (const int outWidth : {1, 9, 64, 75}) {
        this->check(TypeParam::work, degree, 80, 90, 90, outHeight, outWidth, 0, 0);
      }
    }
  }
  // What a destination of 21 rows does not show of a source row need not exist.
  this->check(TypeParam::work, 90, 40, 50, 21, 21, 40, 0, 0);
  this->check(TypeParam::work, 90, 80, 100, 70, 70, 80, 0, 0);
}

// Nothing before the first pixel is read or written: these images begin at the start of a page.
TYPED_TEST(Rotate, PagesOnBothSides) {
  for (const int degree : kAngles) {
    this->check(TypeParam::work, degree, 64, 64, 0, 0);
    this->check(TypeParam::work, degree, 16, 256, 0, 0);
    this->check(TypeParam::work, degree, 256, 16, 0, 0);
  }
}

TYPED_TEST(Rotate, NothingToWrite) {
  using T = typename TypeParam::Element;
  GuardedImage<T> in(4, 4 * TypeParam::kChannels, 4 * TypeParam::kChannels);
  GuardedImage<T> out(4, 4 * TypeParam::kChannels, 4 * TypeParam::kChannels);
  const std::vector<T> before = out.contents();
  for (const int degree : kAngles) {
    for (const int none : {0, -1, -64, -65}) {
      TypeParam::work(degree, 4, 4, in.stride(), in.data(), none, 4, out.stride(), out.data());
      TypeParam::work(degree, 4, 4, in.stride(), in.data(), 4, none, out.stride(), out.data());
      TypeParam::work(degree, none, none, in.stride(), in.data(), none, none, out.stride(), out.data());
    }
  }
  EXPECT_TRUE(out.holds(before));
}

// Turned twice, back where it was: by the dispatcher, through an image of the other shape.
TYPED_TEST(Rotate, ThereAndBack) {
  using T = typename TypeParam::Element;
  constexpr int nc = TypeParam::kChannels;
  constexpr int kHeight = 75, kWidth = 141;
  Bits bits(7);
  GuardedImage<T> image(kHeight, kWidth * nc, kWidth * nc + 3);
  image.fill([&] { return bits.next<T>(); });
  const std::vector<T> original = image.contents();
  GuardedImage<T> upright(kWidth, kHeight * nc, kHeight * nc + 2);
  GuardedImage<T> flat(kHeight, kWidth * nc, kWidth * nc);
  GuardedImage<T> back(kHeight, kWidth * nc, kWidth * nc + 1);
  const auto turn = [](int degree, const GuardedImage<T>& from, GuardedImage<T>& to) {
    TypeParam::dispatch(degree, from.rows(), from.rowElements() / nc, from.stride(), from.data(), to.rows(),
                        to.rowElements() / nc, to.stride(), to.data());
  };
  turn(90, image, upright);
  turn(270, upright, back);
  EXPECT_TRUE(back.holds(original));
  turn(270, image, upright);
  turn(90, upright, back);
  EXPECT_TRUE(back.holds(original));
  turn(180, image, flat);
  turn(180, flat, back);
  EXPECT_TRUE(back.holds(original));
  turn(90, image, upright);
  turn(90, upright, back);
  EXPECT_TRUE(back.holds(flat.contents()));
}

// Rows further apart than 2^31 bytes all in all, on both sides.
TYPED_TEST(Rotate, OffsetsBeyond32Bits) {
  using T = typename TypeParam::Element;
  constexpr int nc = TypeParam::kChannels;
  constexpr int kLong = 2100, kShort = 5;
  constexpr int kStride = (1 << 20) / sizeof(T);
  constexpr size_t kSize = static_cast<size_t>(kLong) << 20;
  const auto sparse = [&] {
    void* memory =
        mmap(nullptr, kSize, PROT_READ | PROT_WRITE, MAP_PRIVATE | MAP_ANONYMOUS | MAP_NORESERVE, -1, 0);
    return memory == MAP_FAILED ? nullptr : static_cast<T*>(memory);
  };
  T* const tall = sparse();
  T* const other = sparse();
  ASSERT_TRUE(tall != nullptr && other != nullptr);
  const auto pixel = [](T* image, int stride, int r, int c) {
    return image + static_cast<ptrdiff_t>(r) * stride + c * nc;
  };
  Bits bits(3);
  for (int r = 0; r < kLong; ++r) {
    for (int i = 0; i < kShort * nc; ++i) {
      pixel(tall, kStride, r, 0)[i] = bits.next<T>();
    }
  }
  constexpr int kWideStride = kLong * nc;
  std::vector<T> wide(static_cast<size_t>(kShort) * kWideStride);
  const auto expect = [&](int degree, T* from, int fromStride, int height, int width, T* to, int toStride) {
    const int outHeight = degree == 180 ? height : width;
    const int outWidth = degree == 180 ? width : height;
    TypeParam::work(degree, height, width, fromStride, from, outHeight, outWidth, toStride, to);
    for (int r = 0; r < outHeight; ++r) {
      for (int c = 0; c < outWidth; ++c) {
        const Place at = sourceOf(degree, height, width, r, c);
        ASSERT_EQ(
            0, memcmp(pixel(to, toStride, r, c), pixel(from, fromStride, at.row, at.column), nc * sizeof(T)))
            << degree << " degrees, row " << r << ", column " << c;
      }
    }
  };
  expect(90, tall, kStride, kLong, kShort, wide.data(), kWideStride);
  expect(270, tall, kStride, kLong, kShort, wide.data(), kWideStride);
  expect(90, wide.data(), kWideStride, kShort, kLong, other, kStride);
  expect(270, wide.data(), kWideStride, kShort, kLong, other, kStride);
  expect(180, tall, kStride, kLong, kShort, other, kStride);
  munmap(tall, kSize);
  munmap(other, kSize);
}

TYPED_TEST(Rotate, Assertions) {
  using T = typename TypeParam::Element;
  std::vector<T> in(4 * TypeParam::kChannels), out(in);
  constexpr int kStride = 2 * TypeParam::kChannels;
  const auto rotate = [&](const T* from, int inHeight, int inWidth, int inStride, T* to, int outHeight,
                          int outWidth, int degree) {
    TypeParam::dispatch(degree, inHeight, inWidth, inStride, from, outHeight, outWidth, kStride, to);
  };
  const auto failure = [](const char* expression) {
    std::string pattern = literally("fastcv/src/arm/rotate_arm:");
    pattern += "[0-9]+: .*armRotateNx90degree.*assertion ";
    pattern += literally(std::string(1, '"').append(expression).append("\" failed"));
    return pattern;
  };
  const std::string noInput = failure("inData != NULL");
  const std::string noOutput = failure("outData != NULL");
  const std::string noSize =
      failure("inHeight != 0 && inWidth != 0 && inWidthStride != 0 && outHeight != 0 && outWidth != 0");
  const std::string noAngle = failure("degree == 90 || degree == 180 || degree == 270");
  // The first that fails, whatever else is wrong.
  EXPECT_DEATH(rotate(nullptr, 0, 0, 0, nullptr, 0, 0, 0), noInput);
  EXPECT_DEATH(rotate(in.data(), 0, 0, 0, nullptr, 0, 0, 0), noOutput);
  EXPECT_DEATH(rotate(in.data(), 0, 2, kStride, out.data(), 2, 2, 0), noSize);
  EXPECT_DEATH(rotate(in.data(), 2, 0, kStride, out.data(), 2, 2, 90), noSize);
  EXPECT_DEATH(rotate(in.data(), 2, 2, 0, out.data(), 2, 2, 90), noSize);
  EXPECT_DEATH(rotate(in.data(), 2, 2, kStride, out.data(), 0, 2, 90), noSize);
  EXPECT_DEATH(rotate(in.data(), 2, 2, kStride, out.data(), 2, 0, 90), noSize);
  for (const int degree : {0, 360, -90, 45, 91}) {
    EXPECT_DEATH(rotate(in.data(), 2, 2, kStride, out.data(), 2, 2, degree), noAngle);
  }
}

TEST(RotateAssertions, TheDestinationsStrideIsNotTested) {
  const u8 in[] = {1, 2, 3};
  u8 out[] = {0, 0, 0};
  armRotateNx90degree<u8, 1, 1, 1>(1, 3, 3, in, 3, 1, 0, out, 90);
  EXPECT_EQ(out[0], 3);  // three rows on one another
}

TEST(RotateAssertions, NameTheInstance) {
  const u8 in[] = {1};
  EXPECT_DEATH((armRotateNx90degree<u8, 1, 1, 1>(1, 1, 1, in, 1, 1, 1, nullptr, 90)), "unsigned char");
  EXPECT_DEATH((armRotateNx90degree<float, 3, 3, 3>(1, 1, 3, nullptr, 1, 1, 3, nullptr, 90)), "T = float");
}

TEST(RotateExamples, OneRowBecomesOneColumn) {
  const u8 row[] = {10, 20, 30, 40};
  u8 column[4];
  imgRotate90degree<u8, 1, 64, 64>(1, 4, 4, row, 4, 1, 1, column);
  EXPECT_EQ(std::vector<u8>(column, column + 4), (std::vector<u8>{10, 20, 30, 40}));
  imgRotate270degree<u8, 1, 64, 64>(1, 4, 4, row, 4, 1, 1, column);
  EXPECT_EQ(std::vector<u8>(column, column + 4), (std::vector<u8>{40, 30, 20, 10}));
}

TEST(RotateExamples, PixelsKeepTheirByteOrder) {
  const u8 in[] = {1, 2, 3, 4, 5, 6, 7, 8};
  u8 out[8];
  imgRotate90degree<u8, 4, 64, 64>(1, 2, 8, in, 2, 1, 4, out);
  EXPECT_EQ(std::vector<u8>(out, out + 8), (std::vector<u8>{1, 2, 3, 4, 5, 6, 7, 8}));
  imgRotate180degree<u8, 4, 64, 64>(1, 2, 8, in, 1, 2, 8, out);
  EXPECT_EQ(std::vector<u8>(out, out + 8), (std::vector<u8>{5, 6, 7, 8, 1, 2, 3, 4}));
  imgRotate270degree<u8, 4, 64, 64>(1, 2, 8, in, 2, 1, 4, out);
  EXPECT_EQ(std::vector<u8>(out, out + 8), (std::vector<u8>{5, 6, 7, 8, 1, 2, 3, 4}));
}

}  // namespace
