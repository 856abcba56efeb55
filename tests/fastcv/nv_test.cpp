// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// The semi-planar kernels against the formulas, written out per pixel.

#include <gtest/gtest.h>

#include <algorithm>
#include <string>
#include <vector>

#include "fastcv/kernels.h"
#include "tests/support/guarded_image.h"

namespace {

using HPC::fastcv::armBGR2NV12Image;
using HPC::fastcv::armBGR2NV21Image;
using HPC::fastcv::armNV122BGRImage;
using HPC::fastcv::armNV122RGBImage;
using HPC::fastcv::armNV212BGRImage;
using HPC::fastcv::armNV212RGBImage;
using HPC::fastcv::armRGB2NV12Image;
using HPC::fastcv::armRGB2NV21Image;
using kyface::test::ByteSource;
using kyface::test::GuardedImage;

using Kernel = void (*)(int, int, int, const unsigned char*, int, unsigned char*);

struct Variant {
  const char* name;
  Kernel kernel;
  int channels;
  int blue;  // channel of blue; red is the other end
  bool vFirst;
};

using u8 = unsigned char;
const Variant kDecoders[] = {
    {"NV212BGR", armNV212BGRImage<u8, 1, u8, 3>, 3, 0, true},
    {"NV212BGRA", armNV212BGRImage<u8, 1, u8, 4>, 4, 0, true},
    {"NV212RGB", armNV212RGBImage<u8, 1, u8, 3>, 3, 2, true},
    {"NV212RGBA", armNV212RGBImage<u8, 1, u8, 4>, 4, 2, true},
    {"NV122BGR", armNV122BGRImage<u8, 1, u8, 3>, 3, 0, false},
    {"NV122BGRA", armNV122BGRImage<u8, 1, u8, 4>, 4, 0, false},
    {"NV122RGB", armNV122RGBImage<u8, 1, u8, 3>, 3, 2, false},
    {"NV122RGBA", armNV122RGBImage<u8, 1, u8, 4>, 4, 2, false},
};
const Variant kEncoders[] = {
    {"BGR2NV21", armBGR2NV21Image<u8, 3, u8, 1>, 3, 0, true},
    {"BGRA2NV21", armBGR2NV21Image<u8, 4, u8, 1>, 4, 0, true},
    {"RGB2NV21", armRGB2NV21Image<u8, 3, u8, 1>, 3, 2, true},
    {"RGBA2NV21", armRGB2NV21Image<u8, 4, u8, 1>, 4, 2, true},
    {"BGR2NV12", armBGR2NV12Image<u8, 3, u8, 1>, 3, 0, false},
    {"BGRA2NV12", armBGR2NV12Image<u8, 4, u8, 1>, 4, 0, false},
    {"RGB2NV12", armRGB2NV12Image<u8, 3, u8, 1>, 3, 2, false},
    {"RGBA2NV12", armRGB2NV12Image<u8, 4, u8, 1>, 4, 2, false},
};

int floorShift(int value, int bits) {
  const int divisor = 1 << bits;
  return value >= 0 ? value / divisor : -((-value + divisor - 1) / divisor);
}

u8 limited(int value) { return static_cast<u8>(std::clamp(value, 0, 255)); }

struct Colour {
  u8 b, g, r;
};

Colour colourOf(int y, int u, int v) {
  u -= 128;
  v -= 128;
  return {limited(floorShift(64 * y + 110 * u + 32, 6)),
          limited(floorShift(64 * y - 24 * u - 44 * v + 32, 6)),
          limited(floorShift(64 * y + 86 * v + 32, 6))};
}

u8 lumaOf(int b, int g, int r) { return static_cast<u8>((16 * b + 74 * g + 38 * r + 64) / 128); }
u8 uOf(int b, int g, int r) { return limited(floorShift(65 * b - 43 * g - 22 * r + 64, 7) + 128); }
u8 vOf(int b, int g, int r) { return limited(floorShift(-12 * b - 55 * g + 67 * r + 64, 7) + 128); }

// A frame of `height` luma rows is `height` + height / 2 rows; negative heights have none.
int frameRows(int height) { return height < 1 ? 0 : height + height / 2; }

class Decode : public testing::TestWithParam<Variant> {
 protected:
  // Runs the kernel over one size and compares every byte of the destination, padding included.
  static void check(int height, int width, int inPad, int outPad, unsigned seed) {
    const Variant& variant = GetParam();
    const int nc = variant.channels;
    GuardedImage<u8> frame(frameRows(height), width, width + inPad);
    frame.fill(ByteSource(seed));
    GuardedImage<u8> out(std::max(height, 0), width * nc, width * nc + outPad);
    std::vector<u8> expected = out.contents();
    for (int r = 0; r < height / 2 * 2; ++r) {
      for (int x = 0; x < width / 2 * 2; ++x) {
        const u8* pair = frame.row(height + r / 2) + x / 2 * 2;
        const Colour c =
            colourOf(frame.row(r)[x], pair[variant.vFirst ? 1 : 0], pair[variant.vFirst ? 0 : 1]);
        u8* pixel = &expected[(static_cast<size_t>(r) * width + x) * nc];
        pixel[variant.blue] = c.b;
        pixel[1] = c.g;
        pixel[2 - variant.blue] = c.r;
        if (nc == 4) {
          pixel[3] = 255;
        }
      }
    }
    variant.kernel(height, width, frame.stride(), frame.data(), out.stride(), out.data());
    ASSERT_TRUE(out.holds(expected)) << width << " x " << height;
  }
};

class Encode : public testing::TestWithParam<Variant> {
 protected:
  static void check(int height, int width, int inPad, int outPad, unsigned seed) {
    const Variant& variant = GetParam();
    const int nc = variant.channels;
    GuardedImage<u8> in(std::max(height, 0), width * nc, width * nc + inPad);
    in.fill(ByteSource(seed));
    GuardedImage<u8> frame(frameRows(height), width, width + outPad);
    std::vector<u8> expected = frame.contents();
    for (int r = 0; r < height / 2 * 2; ++r) {
      for (int x = 0; x < width / 2 * 2; ++x) {
        const u8* pixel = in.row(r) + x * nc;
        const int b = pixel[variant.blue], g = pixel[1], red = pixel[2 - variant.blue];
        expected[static_cast<size_t>(r) * width + x] = lumaOf(b, g, red);
        if (r % 2 == 0 && x % 2 == 0) {
          u8* pair = &expected[(static_cast<size_t>(height) + r / 2) * width + x];
          pair[variant.vFirst ? 1 : 0] = uOf(b, g, red);
          pair[variant.vFirst ? 0 : 1] = vOf(b, g, red);
        }
      }
    }
    variant.kernel(height, width, in.stride(), in.data(), frame.stride(), frame.data());
    ASSERT_TRUE(frame.holds(expected)) << width << " x " << height;
  }
};

constexpr int kHeights[] = {-1, 0, 1, 2, 3, 4, 5, 6};
constexpr int kLargeWidths[] = {127, 128, 129, 318, 640, 1278};

TEST_P(Decode, EveryWidthAndHeight) {
  for (int width = 1; width <= 100; ++width) {
    for (const int height : kHeights) {
      check(height, width, 0, 0, width);
      check(height, width, 5, 7, width + 1);
    }
  }
}

TEST_P(Decode, LargeSizes) {
  for (const int width : kLargeWidths) {
    check(66, width, 0, 0, width);
    check(67, width, 33, 1, width);
  }
}

TEST_P(Encode, EveryWidthAndHeight) {
  for (int width = 1; width <= 100; ++width) {
    for (const int height : kHeights) {
      check(height, width, 0, 0, width);
      check(height, width, 7, 5, width + 1);
    }
  }
}

TEST_P(Encode, LargeSizes) {
  for (const int width : kLargeWidths) {
    check(66, width, 0, 0, width);
    check(67, width, 1, 33, width);
  }
}

// Every colour once as a top-left pixel: 256 greens along a row, a blue a row, a red a call.
TEST_P(Encode, AllColours) {
  const Variant& variant = GetParam();
  const int nc = variant.channels;
  constexpr int kWidth = 512, kHeight = 512;
  std::vector<u8> in(static_cast<size_t>(kWidth) * kHeight * nc);
  std::vector<u8> frame(kWidth * kHeight * 3 / 2);
  for (int red = 0; red < 256; ++red) {
    for (int r = 0; r < kHeight; ++r) {
      for (int x = 0; x < kWidth; ++x) {
        u8* pixel = &in[(static_cast<size_t>(r) * kWidth + x) * nc];
        pixel[variant.blue] = static_cast<u8>(r / 2);
        pixel[1] = static_cast<u8>(x / 2);
        // The other pixels of the block have another red: they must not reach the chroma.
        pixel[2 - variant.blue] = static_cast<u8>(r % 2 == 0 && x % 2 == 0 ? red : 255 - red);
      }
    }
    variant.kernel(kHeight, kWidth, kWidth * nc, in.data(), kWidth, frame.data());
    for (int b = 0; b < 256; ++b) {
      for (int g = 0; g < 256; ++g) {
        const u8* pair = &frame[static_cast<size_t>(kHeight + b) * kWidth + g * 2];
        const bool right = frame[static_cast<size_t>(b * 2) * kWidth + g * 2] == lumaOf(b, g, red) &&
                           pair[variant.vFirst ? 1 : 0] == uOf(b, g, red) &&
                           pair[variant.vFirst ? 0 : 1] == vOf(b, g, red);
        ASSERT_TRUE(right) << "B " << b << ", G " << g << ", R " << red;
      }
    }
  }
}

// Every chroma pair with every luma of a dense lattice.
TEST_P(Decode, AllChroma) {
  const Variant& variant = GetParam();
  const int nc = variant.channels;
  constexpr int kWidth = 512, kHeight = 512;
  std::vector<u8> frame(kWidth * kHeight * 3 / 2);
  std::vector<u8> out(static_cast<size_t>(kWidth) * kHeight * nc);
  for (int j = 0; j < 256; ++j) {
    for (int k = 0; k < 256; ++k) {
      frame[static_cast<size_t>(kHeight + j) * kWidth + 2 * k] = static_cast<u8>(j);
      frame[static_cast<size_t>(kHeight + j) * kWidth + 2 * k + 1] = static_cast<u8>(k);
    }
  }
  for (int start = 0; start < 8; ++start) {
    // Four lumas a block and eight starts: every eighth luma with every chroma pair, and all lumas somewhere.
    const auto luma = [&](int r, int x) {
      return static_cast<u8>((r % 2 * 2 + x % 2) * 64 + start * 8 + (r + x) % 8);
    };
    for (int r = 0; r < kHeight; ++r) {
      for (int x = 0; x < kWidth; ++x) {
        frame[static_cast<size_t>(r) * kWidth + x] = luma(r, x);
      }
    }
    variant.kernel(kHeight, kWidth, kWidth, frame.data(), kWidth * nc, out.data());
    for (int r = 0; r < kHeight; ++r) {
      for (int x = 0; x < kWidth; ++x) {
        const int first = r / 2, second = x / 2;
        const Colour want =
            variant.vFirst ? colourOf(luma(r, x), second, first) : colourOf(luma(r, x), first, second);
        const u8* pixel = &out[(static_cast<size_t>(r) * kWidth + x) * nc];
        const bool right = pixel[variant.blue] == want.b && pixel[1] == want.g &&
                           pixel[2 - variant.blue] == want.r && (nc == 3 || pixel[3] == 255);
        ASSERT_TRUE(right) << "Y " << +luma(r, x) << ", first " << first << ", second " << second;
      }
    }
  }
}

INSTANTIATE_TEST_SUITE_P(Nv, Decode, testing::ValuesIn(kDecoders),
                         [](const auto& i) { return i.param.name; });
INSTANTIATE_TEST_SUITE_P(Nv, Encode, testing::ValuesIn(kEncoders),
                         [](const auto& i) { return i.param.name; });

TEST(NvExamples, Encode) {
  const u8 black[] = {0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0};
  const u8 red[] = {0, 0, 255, 0, 0, 255, 0, 0, 255, 0, 0, 255};
  std::vector<u8> white(12, 255);
  u8 frame[6];
  armBGR2NV21Image<u8, 3, u8, 1>(2, 2, 6, black, 2, frame);
  EXPECT_EQ(std::vector<u8>(frame, frame + 6), (std::vector<u8>{0, 0, 0, 0, 128, 128}));
  armBGR2NV21Image<u8, 3, u8, 1>(2, 2, 6, white.data(), 2, frame);
  EXPECT_EQ(std::vector<u8>(frame, frame + 6), (std::vector<u8>{255, 255, 255, 255, 128, 128}));
  armBGR2NV21Image<u8, 3, u8, 1>(2, 2, 6, red, 2, frame);
  EXPECT_EQ(std::vector<u8>(frame, frame + 6), (std::vector<u8>{76, 76, 76, 76, 255, 84}));
  armBGR2NV12Image<u8, 3, u8, 1>(2, 2, 6, red, 2, frame);
  EXPECT_EQ(std::vector<u8>(frame, frame + 6), (std::vector<u8>{76, 76, 76, 76, 84, 255}));
}

TEST(NvExamples, Decode) {
  const u8 gray[] = {128, 128, 128, 128, 128, 128};
  u8 out[12];
  armNV212BGRImage<u8, 1, u8, 3>(2, 2, 2, gray, 6, out);
  EXPECT_EQ(std::vector<u8>(out, out + 12), std::vector<u8>(12, 128));
  // U 255 drives blue to 473 before the clamp, U 0 to -220.
  const u8 bright[] = {255, 255, 255, 255, 128, 255};
  armNV212BGRImage<u8, 1, u8, 3>(2, 2, 2, bright, 6, out);
  EXPECT_EQ(out[0], 255);
  const u8 dark[] = {0, 0, 0, 0, 128, 0};
  armNV212BGRImage<u8, 1, u8, 3>(2, 2, 2, dark, 6, out);
  EXPECT_EQ(out[0], 0);
}

}  // namespace
