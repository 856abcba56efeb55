// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// The planar 4:2:0 kernels against the formulas, written out per pixel.

#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <string>
#include <vector>

#include "fastcv/fastcv.h"
#include "fastcv/kernels.h"
#include "tests/support/assertion_report.h"
#include "tests/support/guarded_image.h"

namespace {

using HPC::fastcv::armBGR2I420Image;
using HPC::fastcv::armI4202BGRImage;
using kyface::test::assertionReport;
using kyface::test::ByteSource;
using kyface::test::GuardedImage;
using kyface::test::somethingWritten;

using u8 = unsigned char;
using Kernel = void (*)(int, int, int, const u8*, int, u8*);

struct Variant {
  const char* name;
  const char* function;
  Kernel kernel;
  int channels;
};
const Variant kDecoders[] = {{"I4202BGR", "armI4202BGRImage", armI4202BGRImage<u8, 1, u8, 3>, 3},
                             {"I4202BGRA", "armI4202BGRImage", armI4202BGRImage<u8, 1, u8, 4>, 4}};
const Variant kEncoders[] = {{"BGR2I420", "armBGR2I420Image", armBGR2I420Image<u8, 3, u8, 1>, 3},
                             {"BGRA2I420", "armBGR2I420Image", armBGR2I420Image<u8, 4, u8, 1>, 4}};

// value / 2^20, floored.
int64_t floored(int64_t value) {
  constexpr int64_t kOne = 1 << 20;
  return value >= 0 ? value / kOne : -((-value + kOne - 1) / kOne);
}
u8 limited(int64_t value) { return static_cast<u8>(std::clamp<int64_t>(value, 0, 255)); }

struct Colour {
  u8 b, g, r;
};

Colour colourOf(int y, int u, int v) {
  const int64_t luma = int64_t{1220542} * std::max(0, y - 16);
  u -= 128;
  v -= 128;
  return {limited(floored(luma + int64_t{2116026} * u + 524288)),
          limited(floored(luma - int64_t{852492} * v - int64_t{409993} * u + 524288)),
          limited(floored(luma + int64_t{1673527} * v + 524288))};
}

u8 lumaOf(int b, int g, int r) {
  return limited(floored(int64_t{269484} * r + int64_t{528482} * g + int64_t{102760} * b + 17301504));
}
u8 uOf(int b, int g, int r) {
  return limited(floored(int64_t{-155188} * r - int64_t{305135} * g + int64_t{460324} * b + 134742016));
}
u8 vOf(int b, int g, int r) {
  return limited(floored(int64_t{460324} * r - int64_t{385875} * g - int64_t{74448} * b + 134742016));
}

// Where every chroma row of a frame starts, found by walking the planes row by row: the steps to the next row
// alternate between half a picture row and what is left of the stride row.
struct ChromaRows {
  std::vector<size_t> u, v;

  ChromaRows(int height, int width, int stride) {
    const size_t half = static_cast<size_t>(width) / 2;
    const size_t steps[] = {half, static_cast<size_t>(stride) - half};
    const size_t rows = static_cast<size_t>(height);
    size_t atU = rows * static_cast<size_t>(stride);
    size_t atV = (rows + rows / 4) * static_cast<size_t>(stride) + (rows % 4 == 2 ? half : 0);
    for (size_t j = 0; j < rows / 2; ++j) {
      u.push_back(atU);
      v.push_back(atV);
      atU += steps[j % 2];
      atV += steps[(j + (rows % 4 == 2 ? 1 : 0)) % 2];
    }
  }
};

// A frame of `height` luma rows is `height` / 2 more stride rows; negative heights have none.
int frameRows(int height) { return height < 1 ? 0 : height + height / 2; }
int rowElements(int width) { return std::max(width, 0); }

class Decode : public testing::TestWithParam<Variant> {
 protected:
  // Runs the kernel over one size and compares every byte of the destination, padding included.
  static void check(int height, int width, int inPad, int outPad, unsigned seed) {
    const Variant& variant = GetParam();
    const int nc = variant.channels;
    GuardedImage<u8> frame(frameRows(height), rowElements(width), rowElements(width) + inPad);
    frame.fill(ByteSource(seed));
    GuardedImage<u8> out(std::max(height, 0), rowElements(width) * nc, rowElements(width) * nc + outPad);
    std::vector<u8> expected = out.contents();
    const ChromaRows chroma(std::max(height, 0), rowElements(width), frame.stride());
    for (int r = 0; r < height; ++r) {
      for (int x = 0; x < width; ++x) {
        const Colour c = colourOf(frame.row(r)[x], frame.data()[chroma.u[r / 2] + x / 2],
                                  frame.data()[chroma.v[r / 2] + x / 2]);
        u8* pixel = &expected[(static_cast<size_t>(r) * width + x) * nc];
        pixel[0] = c.b;
        pixel[1] = c.g;
        pixel[2] = c.r;
        if (nc == 4) {
          pixel[3] = 255;
        }
      }
    }
    variant.kernel(height, width, frame.stride(), frame.data(), out.stride(), out.data());
    ASSERT_TRUE(out.holds(expected)) << width << " x " << height << ", strides " << frame.stride() << ", "
                                     << out.stride();
  }
};

class Encode : public testing::TestWithParam<Variant> {
 protected:
  static void check(int height, int width, int inPad, int outPad, unsigned seed) {
    const Variant& variant = GetParam();
    const int nc = variant.channels;
    GuardedImage<u8> in(std::max(height, 0), rowElements(width) * nc, rowElements(width) * nc + inPad);
    in.fill(ByteSource(seed));
    GuardedImage<u8> frame(frameRows(height), rowElements(width), rowElements(width) + outPad);
    std::vector<u8> expected = frame.contents();
    const ChromaRows chroma(std::max(height, 0), rowElements(width), frame.stride());
    // Where a byte of the frame is among its rows' contents.
    const auto at = [&](size_t offset) -> u8& {
      const size_t stride = static_cast<size_t>(frame.stride());
      return expected[offset / stride * static_cast<size_t>(width) + offset % stride];
    };
    for (int r = 0; r < height; ++r) {
      for (int x = 0; x < width; ++x) {
        const u8* pixel = in.row(r) + x * nc;
        expected[static_cast<size_t>(r) * width + x] = lumaOf(pixel[0], pixel[1], pixel[2]);
        if (r % 2 == 0 && x % 2 == 0) {
          at(chroma.u[r / 2] + x / 2) = uOf(pixel[0], pixel[1], pixel[2]);
          at(chroma.v[r / 2] + x / 2) = vOf(pixel[0], pixel[1], pixel[2]);
        }
      }
    }
    variant.kernel(height, width, in.stride(), in.data(), frame.stride(), frame.data());
    ASSERT_TRUE(frame.holds(expected))
        << width << " x " << height << ", strides " << in.stride() << ", " << frame.stride();
  }
};

// Both remainders by 4, and sizes that hold no picture.
constexpr int kHeights[] = {-4, -2, 2, 4, 6, 8, 10};
constexpr int kLargeWidths[] = {126, 128, 130, 318, 640, 1278};

TEST_P(Decode, EveryWidthAndHeight) {
  for (int width = 2; width <= 134; width += 2) {
    for (const int height : kHeights) {
      check(height, width, 0, 0, width);
      check(height, width, 1, 0, width + 1);
      check(height, width, 38, 7, width + 2);
    }
  }
}

TEST_P(Decode, LargeSizes) {
  for (const int width : kLargeWidths) {
    check(66, width, 0, 0, width);
    check(68, width, 33, 1, width);
  }
}

TEST_P(Decode, NegativeWidth) {
  check(4, -2, 64, 64, 1);
  check(-2, -2, 64, 64, 1);
}

TEST_P(Encode, EveryWidthAndHeight) {
  for (int width = 2; width <= 134; width += 2) {
    for (const int height : kHeights) {
      check(height, width, 0, 0, width);
      check(height, width, 0, 1, width + 1);
      check(height, width, 7, 38, width + 2);
    }
  }
}

TEST_P(Encode, LargeSizes) {
  for (const int width : kLargeWidths) {
    check(66, width, 0, 0, width);
    check(68, width, 1, 33, width);
  }
}

TEST_P(Encode, NegativeWidth) {
  check(4, -2, 64, 64, 1);
  check(-2, -2, 64, 64, 1);
}

// All (Y, U, V): a U a call, the Vs along a chroma row, four Ys a block.
TEST_P(Decode, Exhaustive) {
  const Variant& variant = GetParam();
  const int nc = variant.channels;
  constexpr int kWidth = 512, kHeight = 128;
  std::vector<u8> frame(kWidth * kHeight * 3 / 2);
  std::vector<u8> out(static_cast<size_t>(kWidth) * kHeight * nc);
  const ChromaRows chroma(kHeight, kWidth, kWidth);
  const auto luma = [](int r, int x) { return r / 2 * 4 + r % 2 * 2 + x % 2; };
  for (int r = 0; r < kHeight; ++r) {
    for (int x = 0; x < kWidth; ++x) {
      frame[static_cast<size_t>(r) * kWidth + x] = static_cast<u8>(luma(r, x));
      frame[chroma.v[r / 2] + x / 2] = static_cast<u8>(x / 2);
    }
  }
  for (int u = 0; u < 256; ++u) {
    for (const size_t row : chroma.u) {
      std::fill_n(&frame[row], kWidth / 2, static_cast<u8>(u));
    }
    variant.kernel(kHeight, kWidth, kWidth, frame.data(), kWidth * nc, out.data());
    for (int r = 0; r < kHeight; ++r) {
      for (int x = 0; x < kWidth; ++x) {
        const Colour want = colourOf(luma(r, x), u, x / 2);
        const u8* pixel = &out[(static_cast<size_t>(r) * kWidth + x) * nc];
        const bool right =
            pixel[0] == want.b && pixel[1] == want.g && pixel[2] == want.r && (nc == 3 || pixel[3] == 255);
        ASSERT_TRUE(right) << "Y " << luma(r, x) << ", U " << u << ", V " << x / 2;
      }
    }
  }
}

// Every colour once as a top-left pixel: 256 greens along a row, a blue a row, a red a call.
TEST_P(Encode, AllColours) {
  const Variant& variant = GetParam();
  const int nc = variant.channels;
  constexpr int kWidth = 512, kHeight = 512;
  std::vector<u8> in(static_cast<size_t>(kWidth) * kHeight * nc);
  std::vector<u8> frame(kWidth * kHeight * 3 / 2);
  const ChromaRows chroma(kHeight, kWidth, kWidth);
  for (int red = 0; red < 256; ++red) {
    for (int r = 0; r < kHeight; ++r) {
      for (int x = 0; x < kWidth; ++x) {
        u8* pixel = &in[(static_cast<size_t>(r) * kWidth + x) * nc];
        pixel[0] = static_cast<u8>(r / 2);
        pixel[1] = static_cast<u8>(x / 2);
        // The other pixels of the block have another red: they must not reach the chroma.
        pixel[2] = static_cast<u8>(r % 2 == 0 && x % 2 == 0 ? red : 255 - red);
      }
    }
    variant.kernel(kHeight, kWidth, kWidth * nc, in.data(), kWidth, frame.data());
    for (int b = 0; b < 256; ++b) {
      for (int g = 0; g < 256; ++g) {
        const bool right = frame[static_cast<size_t>(b * 2) * kWidth + g * 2] == lumaOf(b, g, red) &&
                           frame[chroma.u[b] + g] == uOf(b, g, red) &&
                           frame[chroma.v[b] + g] == vOf(b, g, red);
        ASSERT_TRUE(right) << "B " << b << ", G " << g << ", R " << red;
      }
    }
  }
}

INSTANTIATE_TEST_SUITE_P(I420, Decode, testing::ValuesIn(kDecoders),
                         [](const auto& i) { return i.param.name; });
INSTANTIATE_TEST_SUITE_P(I420, Encode, testing::ValuesIn(kEncoders),
                         [](const auto& i) { return i.param.name; });

std::vector<u8> decoded(u8 y, u8 u, u8 v) {
  const u8 frame[] = {y, y, y, y, u, v};
  std::vector<u8> out(12);
  armI4202BGRImage<u8, 1, u8, 3>(2, 2, 2, frame, 6, out.data());
  EXPECT_TRUE(std::equal(out.begin() + 3, out.end(), out.begin())) << "the block's pixels differ";
  out.resize(3);
  return out;
}

std::vector<u8> encoded(u8 b, u8 g, u8 r) {
  const u8 in[] = {b, g, r, b, g, r, b, g, r, b, g, r};
  std::vector<u8> frame(6);
  armBGR2I420Image<u8, 3, u8, 1>(2, 2, 6, in, 2, frame.data());
  return frame;
}

TEST(I420Examples, Decode) {
  EXPECT_EQ(decoded(16, 128, 128), (std::vector<u8>{0, 0, 0}));
  EXPECT_EQ(decoded(0, 128, 128), (std::vector<u8>{0, 0, 0}));
  EXPECT_EQ(decoded(235, 128, 128), (std::vector<u8>{255, 255, 255}));
  EXPECT_EQ(decoded(128, 128, 128), (std::vector<u8>{130, 130, 130}));
  // Blue is 534 and -258 before the clamp.
  EXPECT_EQ(decoded(255, 255, 128)[0], 255);
  EXPECT_EQ(decoded(0, 0, 128)[0], 0);
}

TEST(I420Examples, Encode) {
  EXPECT_EQ(encoded(0, 0, 0), (std::vector<u8>{16, 16, 16, 16, 128, 128}));
  EXPECT_EQ(encoded(255, 255, 255), (std::vector<u8>{235, 235, 235, 235, 128, 128}));
}

// Where the second plane starts, at the two remainders of the height by 4.
TEST(I420Examples, Planes) {
  constexpr int kWidth = 4, kStride = 10;
  for (const int height : {6, 8}) {
    const std::vector<u8> red = [&] {
      std::vector<u8> pixels(static_cast<size_t>(height) * kWidth * 3, 0);
      for (size_t i = 2; i < pixels.size(); i += 3) {
        pixels[i] = 255;
      }
      return pixels;
    }();
    std::vector<u8> frame(static_cast<size_t>(height) * kStride * 3 / 2, 7);
    armBGR2I420Image<u8, 3, u8, 1>(height, kWidth, kWidth * 3, red.data(), kStride, frame.data());
    const u8 v = vOf(0, 0, 255);
    const size_t first = static_cast<size_t>(std::find(frame.begin(), frame.end(), v) - frame.begin());
    EXPECT_EQ(first, height == 6 ? 7u * kStride + kWidth / 2 : 10u * kStride);
    // In a height of 6, the plane's first row ends its stride row.
    EXPECT_EQ(frame[first + 2], height == 6 ? 7 : v);
    EXPECT_EQ(std::count(frame.begin(), frame.end(), v), height / 2 * (kWidth / 2));
  }
}

// ---- assertions

constexpr char kPath[] = "fastcv/src/arm/BGR_I420_arm";
constexpr char kNonZero[] = "height != 0 && width != 0 && inWidthStride != 0 && outWidthStride != 0";
constexpr char kEven[] = "width % 2 == 0 && height % 2 == 0";

class I420Death : public testing::TestWithParam<Variant> {
 protected:
  I420Death() {
    somethingWritten = [this] { return out_ != std::vector<u8>(out_.size(), 77); };
  }
  ~I420Death() override {
    somethingWritten = [] { return false; };
  }

  void expect(const char* function, const char* expression, int height, int width, int inStride, bool in,
              int outStride, bool out) {
    EXPECT_DEATH(GetParam().kernel(height, width, inStride, in ? in_.data() : nullptr, outStride,
                                   out ? out_.data() : nullptr),
                 assertionReport(kPath, function, expression));
  }
  void expect(const char* expression, int height, int width, int inStride = 96, bool in = true,
              int outStride = 96, bool out = true) {
    expect(GetParam().function, expression, height, width, inStride, in, outStride, out);
  }

 private:
  std::vector<u8> in_ = std::vector<u8>(96 * 30, 50);
  std::vector<u8> out_ = std::vector<u8>(96 * 30, 77);
};

TEST_P(I420Death, Pointers) {
  expect("inData != NULL", 4, 4, 96, false);
  expect("outData != NULL", 4, 4, 96, true, 96, false);
}

TEST_P(I420Death, Zeroes) {
  expect(kNonZero, 0, 4);
  expect(kNonZero, 4, 0);
  expect(kNonZero, 4, 4, 0);
  expect(kNonZero, 4, 4, 96, true, 0);
}

TEST_P(I420Death, OddSizes) {
  const char* const kernel =
      GetParam().kernel == kDecoders[0].kernel || GetParam().kernel == kDecoders[1].kernel ? "YUV420ptoRGB"
                                                                                           : "RGBtoYUV420p";
  expect(kernel, kEven, 4, 5, 96, true, 96, true);
  expect(kernel, kEven, 5, 4, 96, true, 96, true);
  expect(kernel, kEven, 1, 1, 96, true, 96, true);
}

TEST_P(I420Death, Order) {
  expect("inData != NULL", 0, 5, 0, false, 0, false);
  expect("outData != NULL", 0, 5, 0, true, 0, false);
  expect(kNonZero, 0, 5, 0, true, 0, true);
}

INSTANTIATE_TEST_SUITE_P(Decode, I420Death, testing::ValuesIn(kDecoders),
                         [](const auto& i) { return i.param.name; });
INSTANTIATE_TEST_SUITE_P(Encode, I420Death, testing::ValuesIn(kEncoders),
                         [](const auto& i) { return i.param.name; });

// The front-end leaves data pointers to the kernel.
TEST(I420FrontEndDeath, NullData) {
  using HPC::fastcv::cvtColor;
  using HPC::fastcv::ECO_ENV_ARM;
  using HPC::fastcv::Mat;
  std::vector<u8> pixels(12);
  std::vector<u8> frame(6);
  const Mat<u8, 1, ECO_ENV_ARM> noFrame(2, 3, nullptr);
  Mat<u8, 3, ECO_ENV_ARM> picture(2, 2, pixels.data());
  EXPECT_DEATH((cvtColor<HPC::fastcv::CVT_I4202BGR, u8, 1, u8, 3, ECO_ENV_ARM>(noFrame, &picture)),
               assertionReport(kPath, "armI4202BGRImage", "inData != NULL"));
  const Mat<u8, 3, ECO_ENV_ARM> noPicture(2, 2, nullptr);
  Mat<u8, 1, ECO_ENV_ARM> planes(2, 3, frame.data());
  EXPECT_DEATH((cvtColor<HPC::fastcv::CVT_BGR2I420, u8, 3, u8, 1, ECO_ENV_ARM>(noPicture, &planes)),
               assertionReport(kPath, "armBGR2I420Image", "inData != NULL"));
}

}  // namespace
