// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// The five metrics against the formulas, written out per pixel.

#include <gtest/gtest.h>

#include <algorithm>
#include <climits>
#include <cstring>
#include <string>
#include <vector>

#include "brightness/brightness.h"
#include "tests/support/guarded_image.h"
#include "tests/support/lab_reference.h"
#include "tests/support/sparse_memory.h"

// The same metrics for callers whose declarations lack the `const`.
using PlainMetric = unsigned char(unsigned char*, int, int, int, int, int, int, int, int);
PlainMetric calcGray_YUV, calcGray_BGRA, calcGray_RGBA, calcLuminance_BGRA, calcLuminance_RGBA;

namespace {

using kyface::test::ByteSource;
using kyface::test::GuardedImage;
using kyface::test::LightnessReference;
using kyface::test::SparseMemory;
using u8 = unsigned char;

using Metric = unsigned char (*)(const u8*, int, int, int, int, int, int, int, int);

struct Variant {
  const char* name;
  Metric metric;
  PlainMetric* plain;
  int channels;
  int (*value)(const u8* pixel);
};

int lightness(int b, int g, int r) {
  static const LightnessReference reference;
  return reference(b, g, r);
}

const Variant kVariants[] = {
    {"Gray_YUV", calcGray_YUV, calcGray_YUV, 3, [](const u8* p) { return static_cast<int>(p[0]); }},
    {"Gray_BGRA", calcGray_BGRA, calcGray_BGRA, 4,
     [](const u8* p) { return (77 * p[0] + 150 * p[1] + 29 * p[2] + 128) / 256; }},
    {"Gray_RGBA", calcGray_RGBA, calcGray_RGBA, 4,
     [](const u8* p) { return (77 * p[2] + 150 * p[1] + 29 * p[0] + 128) / 256; }},
    {"Luminance_BGRA", calcLuminance_BGRA, calcLuminance_BGRA, 4,
     [](const u8* p) { return lightness(p[0], p[1], p[2]); }},
    {"Luminance_RGBA", calcLuminance_RGBA, calcLuminance_RGBA, 4,
     [](const u8* p) { return lightness(p[2], p[1], p[0]); }},
};

// The low 32 bits of a number, as a signed one.
int64_t wrapped(int64_t value) {
  const int64_t low = value & 0xffffffff;
  return low >= 0x80000000 ? low - 0x100000000 : low;
}

// The rounded mean of a sum over an area of columns by rows.
int meanOf(int64_t sum, int64_t columns, int64_t rows) {
  const int64_t n =
      wrapped(static_cast<int64_t>(static_cast<uint64_t>(columns) * static_cast<uint64_t>(rows)));
  return n == 0 ? 0 : static_cast<int>((wrapped(sum + n / 2) / n) & 255);
}

int expectedMean(const Variant& variant, const u8* data, int width, int stride, int height, int rectX,
                 int rectY, int rectW, int rectH) {
  if (data == nullptr || stride < 1 || wrapped(static_cast<int64_t>(rectW) * rectH) == 0) {
    return 255;
  }
  const int64_t x0 = std::max(rectX, 0), y0 = std::max(rectY, 0);
  const int64_t x1 = std::min<int64_t>(static_cast<int64_t>(rectX) + rectW - 1, width - 1LL);
  const int64_t y1 = std::min<int64_t>(static_cast<int64_t>(rectY) + rectH - 1, height - 1LL);
  int64_t sum = 0;
  for (int64_t y = y0; y <= y1; ++y) {
    for (int64_t x = x0; x <= x1; ++x) {
      sum += variant.value(data + y * stride + x * variant.channels);
    }
  }
  return meanOf(sum, x1 - x0 + 1, y1 - y0 + 1);
}

class Metrics : public testing::TestWithParam<Variant> {
 protected:
  static int measure(const u8* data, int width, int stride, int height, int rectX, int rectY, int rectW,
                     int rectH) {
    return GetParam().metric(data, width, stride, height, -1, rectX, rectY, rectW, rectH);
  }

  // Measures a rectangle of an image that ends flush with a protected page.
  static void check(const GuardedImage<u8>& image, int rectX, int rectY, int rectW, int rectH) {
    const Variant& variant = GetParam();
    const int width = image.rowElements() / variant.channels;
    ASSERT_EQ(
        measure(image.data(), width, image.stride(), image.rows(), rectX, rectY, rectW, rectH),
        expectedMean(variant, image.data(), width, image.stride(), image.rows(), rectX, rectY, rectW, rectH))
        << width << " x " << image.rows() << ": " << rectX << ", " << rectY << ", " << rectW << ", " << rectH;
  }
};

// All widths across several blocks, whole and inset rectangles, padded and packed rows.
TEST_P(Metrics, EveryWidth) {
  const int nc = GetParam().channels;
  for (int width = 1; width <= 150; ++width) {
    for (const int pad : {0, 5}) {
      GuardedImage<u8> image(3, width * nc, width * nc + pad);
      image.fill(ByteSource(static_cast<unsigned>(width)));
      check(image, 0, 0, width, 3);
      check(image, 1, 1, width - 2, 1);
      check(image, 0, 2, width, 1);
    }
  }
}

// A single white pixel shows in the mean of up to 509: each pixel of the rectangle counts once, no other
// counts.
TEST_P(Metrics, EveryPixelCountsOnce) {
  const int nc = GetParam().channels;
  for (const int columns :
       {1, 2, 3, 7, 8, 15, 16, 17, 31, 32, 33, 47, 63, 64, 65, 79, 80, 95, 111, 127, 128, 129, 144}) {
    const int width = columns + 4;
    GuardedImage<u8> image(3, width * nc, width * nc);
    image.fill([] { return u8{0}; });
    for (int y = 0; y < 3; ++y) {
      for (int x = 0; x < width; ++x) {
        memset(image.row(y) + x * nc, 255, static_cast<size_t>(nc));
        const bool inside = x >= 2 && x < columns + 2 && y < 2;
        const int expected = inside ? (255 + columns) / (2 * columns) : 0;
        ASSERT_EQ(measure(image.data(), width, image.stride(), 3, 2, 0, columns, 2), expected)
            << columns << " columns, white at " << x << ", " << y;
        memset(image.row(y) + x * nc, 0, static_cast<size_t>(nc));
      }
    }
  }
}

// Rectangles that lie in every way across the left, top, right and bottom edges, beyond them, and of negative
// size.
TEST_P(Metrics, EveryClip) {
  constexpr int kWidth = 6, kHeight = 4;
  const int nc = GetParam().channels;
  GuardedImage<u8> image(kHeight, kWidth * nc, kWidth * nc + 3);
  image.fill(ByteSource(7));
  for (int x = -3; x <= kWidth + 2; ++x) {
    for (int y = -2; y <= kHeight + 1; ++y) {
      for (int w = -3; w <= kWidth + 4; ++w) {
        for (int h = -2; h <= kHeight + 3; ++h) {
          if (w != 0 && h != 0) {
            check(image, x, y, w, h);
          }
        }
      }
    }
  }
}

TEST_P(Metrics, ExtremeArguments) {
  const int nc = GetParam().channels;
  GuardedImage<u8> image(4, 5 * nc, 5 * nc);
  image.fill(ByteSource(8));
  constexpr int kValues[] = {INT_MIN, INT_MIN + 1, -1, 0, 2, INT_MAX - 1, INT_MAX};
  for (const int x : kValues) {
    for (const int y : kValues) {
      for (const int w : {INT_MIN, INT_MIN + 3, -1, 3, INT_MAX}) {
        for (const int h : {INT_MIN + 1, -7, 2, INT_MAX}) {
          if (static_cast<unsigned>(w) * static_cast<unsigned>(h) != 0) {
            check(image, x, y, w, h);
          }
        }
      }
    }
  }
  // Images without a pixel.
  for (const int size : {0, -1, INT_MIN}) {
    EXPECT_EQ(measure(image.data(), size, nc, 4, 0, 0, 3, 3),
              expectedMean(GetParam(), image.data(), size, nc, 4, 0, 0, 3, 3));
    EXPECT_EQ(measure(image.data(), 5, nc, size, 0, 0, 3, 3),
              expectedMean(GetParam(), image.data(), 5, nc, size, 0, 0, 3, 3));
  }
}

// Edges that 32 bits cannot hold are right of and below every image.
TEST_P(Metrics, RectanglesBeyond32Bits) {
  const int nc = GetParam().channels;
  const std::vector<u8> image(static_cast<size_t>(8) * 8 * nc, 200);
  const int level = GetParam().value(image.data());
  EXPECT_EQ(measure(image.data(), 8, 8 * nc, 8, 2, 0, INT_MAX, 8), level);
  EXPECT_EQ(measure(image.data(), 8, 8 * nc, 8, 0, 7, 8, INT_MAX), level);
  EXPECT_EQ(measure(image.data(), 8, 8 * nc, 8, 1, 1, INT_MAX, INT_MAX), level);
  // Far left of and above the image, and of a negative size.
  EXPECT_EQ(measure(image.data(), 8, 8 * nc, 8, INT_MIN, INT_MIN, INT_MIN + 1, INT_MIN + 1), 0);
}

TEST_P(Metrics, RectanglesWithoutPixels) {
  const u8 pixel[4] = {200, 200, 200, 200};
  // Four columns too far right: n = -4, and (0 - 2) / -4 is 0.
  EXPECT_EQ(measure(pixel, 1, 4, 1, 5, 0, 1, 1), 0);
  EXPECT_EQ(measure(pixel, 1, 4, 1, 1, 0, 1, 1), 0);  // n = 0
  EXPECT_EQ(measure(pixel, 1, 4, 1, 0, -9, 1, 2), 0);
}

TEST_P(Metrics, RefusedArguments) {
  const u8 pixel[4] = {};
  struct {
    const u8* data;
    int stride, w, h;
  } const kRefused[] = {{nullptr, 4, 1, 1}, {pixel, 0, 1, 1}, {pixel, -4, 1, 1},
                        {pixel, 4, 0, 1},   {pixel, 4, 1, 0}, {pixel, 4, 65536, 65536}};
  for (const auto& arguments : kRefused) {
    testing::internal::CaptureStdout();
    const int result = measure(arguments.data, 1, arguments.stride, 1, 0, 0, arguments.w, arguments.h);
    EXPECT_EQ(testing::internal::GetCapturedStdout(), "wrong enter\r\n");
    EXPECT_EQ(result, 255);
  }
  testing::internal::CaptureStdout();
  EXPECT_EQ(measure(pixel, 1, 4, 1, 0, 0, 1, 1), 0);
  EXPECT_EQ(testing::internal::GetCapturedStdout(), "");
}

TEST_P(Metrics, PlainPointers) {
  const int nc = GetParam().channels;
  GuardedImage<u8> image(4, 37 * nc, 37 * nc + 2);
  image.fill(ByteSource(9));
  EXPECT_EQ(GetParam().plain(image.data(), 37, image.stride(), 4, -1, 3, 1, 30, 9),
            expectedMean(GetParam(), image.data(), 37, image.stride(), 4, 3, 1, 30, 9));
}

TEST_P(Metrics, BlackAndWhite) {
  const std::vector<u8> black(64 * 64 * 4, 0), white(64 * 64 * 4, 255);
  const int stride = 64 * GetParam().channels;
  EXPECT_EQ(measure(black.data(), 64, stride, 64, 0, 0, 64, 64), 0);
  EXPECT_EQ(measure(white.data(), 64, stride, 64, 0, 0, 64, 64), 255);
}

// A picture whose rows overlap is as large as one likes. Around the sizes from which sum + n / 2 exceeds an
// int and from which the sum wraps.
TEST_P(Metrics, SumsWrap) {
  const int nc = GetParam().channels;
  const std::vector<u8> white(70000 * 4, 255);
  const auto expectMean = [&](int columns, int rows, bool safe) {
    const int expected = meanOf(255LL * columns * rows, columns, rows);
    EXPECT_EQ(expected == 255, safe);
    EXPECT_EQ(measure(white.data(), columns, nc, rows, 0, 0, columns, rows), expected)
        << columns << " x " << rows;
  };
  expectMean(47486, 177, true);    // 8 405 022
  expectMean(14929, 563, false);   // 8 405 027
  expectMean(65537, 257, false);   // 16 843 009
  expectMean(10468, 1609, false);  // 16 843 012
}

// More than 2^31 pixels: n is negative.
TEST(Metrics, CountsWrap) {
  constexpr int kColumns = 65536, kRows = 32771;
  const std::vector<u8> luma(kColumns * 3 + kRows, 3);
  EXPECT_EQ(calcGray_YUV(luma.data(), kColumns, 1, kRows, 0, 0, 0, kColumns, kRows),
            meanOf(3LL * kColumns * kRows, kColumns, kRows));
}

// Rows further from the first than 32 bits can say.
TEST_P(Metrics, DistantRows) {
  constexpr int kStride = INT_MAX - 3, kRows = 4;
  const size_t size = static_cast<size_t>(kStride) * (kRows - 1) + 4096;
  const SparseMemory memory(size);
  u8* data = memory.as<u8>();
  for (int row = 0; row < kRows; ++row) {
    memset(data + static_cast<ptrdiff_t>(row) * kStride, 60 * (row + 1), 40);
  }
  EXPECT_EQ(measure(data, 10, kStride, kRows, 0, 0, 10, kRows),
            expectedMean(GetParam(), data, 10, kStride, kRows, 0, 0, 10, kRows));
  EXPECT_EQ(measure(data, 10, kStride, kRows, 3, 3, 1, 1),
            expectedMean(GetParam(), data, 10, kStride, kRows, 3, 3, 1, 1));
}

// One pixel at a time, whose mean is its value: a lattice through all colours with the extremes.
TEST_P(Metrics, Colours) {
  const Variant& variant = GetParam();
  for (int b = 0; b < 256; b += 15) {
    for (int g = 0; g < 256; g += 15) {
      for (int r = 0; r < 256; r += 15) {
        const u8 pixel[4] = {static_cast<u8>(b), static_cast<u8>(g), static_cast<u8>(r), 99};
        ASSERT_EQ(measure(pixel, 1, 4, 1, 0, 0, 1, 1), variant.value(pixel)) << b << ", " << g << ", " << r;
      }
    }
  }
}

INSTANTIATE_TEST_SUITE_P(All, Metrics, testing::ValuesIn(kVariants),
                         [](const auto& i) { return i.param.name; });

TEST(GrayExamples, BlueWeighsMoreThanRed) {
  const u8 blueFirst[] = {255, 0, 0, 255};
  EXPECT_EQ(calcGray_BGRA(blueFirst, 1, 4, 1, 1, 0, 0, 1, 1), 77);
  EXPECT_EQ(calcGray_RGBA(blueFirst, 1, 4, 1, 1, 0, 0, 1, 1), 29);
}

}  // namespace
