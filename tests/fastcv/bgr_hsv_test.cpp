// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// HSV and back, against the formulas: those of the pixels after a row's groups of 8, and those of the groups.

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <cstdlib>
#include <limits>
#include <vector>

#include "fastcv/kernels.h"
#include "tests/support/packed_kernel.h"

namespace {

using HPC::fastcv::armBGR2HSVImage;
using HPC::fastcv::armHSV2BGRImage;
using kyface::test::checkAllColours;
using kyface::test::checkShapes;
using kyface::test::forEachColour;
using kyface::test::kKernelName;
using kyface::test::PackedKernel;
using kyface::test::sameNumber;

using u8 = unsigned char;

constexpr float kEpsilon = 1.1920929e-7f;
constexpr float kPerByte = 0.003921569f;

// 1 / x as the groups have it: the estimate that Arm's processors make of 8 bits of the mantissa, and two
// Newton-Raphson steps. Not for subnormal numbers.
float reciprocal(float x) {
  const auto estimate = [=] {
    if (std::isnan(x)) {
      return x;
    }
    if (std::isinf(x) || x == 0) {
      return std::copysign(x == 0 ? std::numeric_limits<float>::infinity() : 0.0f, x);
    }
    int exponent = 0;
    const int mantissa = static_cast<int>(std::abs(std::frexp(x, &exponent)) * 512);
    const int inverse = ((1 << 19) / (2 * mantissa + 1) + 1) / 2;
    return std::copysign(std::ldexp(static_cast<float>(inverse), -8 - exponent), x);
  };
  const auto step = [=](float y) {
    const bool special = (std::isinf(x) && y == 0) || (x == 0 && std::isinf(y));
    return special ? 2.0f : std::fma(-x, y, 2.0f);
  };
  float y = estimate();
  y = y * step(y);
  return y * step(y);
}

// Rounded to a byte: in single precision and saturated in the groups, in double precision after them.
u8 byteOf(float value, bool grouped) {
  if (grouped) {
    return static_cast<u8>(std::clamp(std::trunc(value + 0.5f), 0.0f, 255.0f));
  }
  const double rounded = static_cast<double>(value) + 0.5;
  return rounded < 0 ? 0 : static_cast<u8>(static_cast<unsigned>(rounded));
}

float divided(float a, float b, bool grouped) { return grouped ? a * reciprocal(b) : a / b; }

// What depends on the largest and the smallest byte alone, computed once for each pair of them: there are
// 2^24 colours.
struct Extremes {
  float k;
  u8 s, v;
};

const Extremes& extremes(int max, int min, bool grouped) {
  static const auto kTable = [] {
    std::vector<Extremes> table(2 << 16);
    for (int i = 0; i < 2 << 16; ++i) {
      const bool group = i >> 16 != 0;
      const float vmax = static_cast<float>(i >> 8 & 255) * kPerByte;
      const float diff = vmax - static_cast<float>(i & 255) * kPerByte;
      table[i] = {divided(30.0f, diff + kEpsilon, group),
                  byteOf(divided(diff, vmax + kEpsilon, group) * 255.0f, group),
                  byteOf(vmax * 255.0f, group)};
    }
    return table;
  }();
  return kTable[(grouped ? 1 << 16 : 0) + max * 256 + min];
}

void hsv(const u8* in, u8* out, bool grouped) {
  const u8 max = std::max({in[0], in[1], in[2]}), min = std::min({in[0], in[1], in[2]});
  const Extremes& extreme = extremes(max, min, grouped);
  const float b = in[0] * kPerByte, g = in[1] * kPerByte, r = in[2] * kPerByte, k = extreme.k;
  float h = max == in[2]   ? (g - b) * k
            : max == in[1] ? std::fma(b - r, k, 60.0f)
                           : std::fma(r - g, k, 120.0f);
  if (h < -0.5f) {
    h = h + 180.0f;
  }
  out[0] = byteOf(h, grouped);
  out[1] = extreme.s;
  out[2] = extreme.v;
}

void hsvFloat(const float* in, float* out, bool grouped) {
  const float b = in[0], g = in[1], r = in[2];
  const float vmax = std::max({b, g, r}), diff = vmax - std::min({b, g, r});
  const float k = divided(60.0f, diff + kEpsilon, grouped);
  float h = vmax == r ? (g - b) * k : vmax == g ? (b - r) * k + 120.0f : (r - g) * k + 240.0f;
  if (h < 0.0f) {
    h = h + 360.0f;
  }
  out[0] = h;
  out[1] = divided(diff, vmax + kEpsilon, grouped);
  out[2] = vmax;
}

struct Bgr {
  float b, g, r;
};

Bgr bgrOf(float h, float v, float c) {
  const float m = v - c;
  Bgr out = {m - (h - 6.0f) * c, m, v};
  if (h < 5.0f) {
    out = {v, m, m + (h - 4.0f) * c};
  }
  if (h < 4.0f) {
    out = {v, m + (4.0f - h) * c, m};
  }
  if (h < 3.0f) {
    out = {m + (h - 2.0f) * c, v, m};
  }
  if (h < 2.0f) {
    out = {m, v, m + (2.0f - h) * c};
  }
  if (h < 1.0f) {
    out = {m, m + h * c, v};
  }
  return out;
}

template <int nc>
void bgr(const u8* in, u8* out, bool grouped) {
  const float twice = static_cast<float>(in[0] + in[0]);
  const float v = in[2] * kPerByte, c = in[1] * kPerByte * v;
  const Bgr want = bgrOf(grouped ? twice * 0.016666668f : twice / 60.0f, v, c);
  out[0] = byteOf(want.b * 255.0f, grouped);
  out[1] = byteOf(want.g * 255.0f, grouped);
  out[2] = byteOf(want.r * 255.0f, grouped);
  if (nc == 4) {
    out[3] = 255;
  }
}

template <int nc>
void bgrFloat(const float* in, float* out, bool) {
  const Bgr want = bgrOf(in[0] / 60.0f, in[2], in[2] * in[1]);
  out[0] = want.b;
  out[1] = want.g;
  out[2] = want.r;
  if (nc == 4) {
    out[3] = 1;
  }
}

const PackedKernel<u8> kBytes[] = {
    {"BGR2HSV", armBGR2HSVImage<u8, 3, u8, 3>, 3, 3, hsv},
    {"BGRA2HSV", armBGR2HSVImage<u8, 4, u8, 3>, 4, 3, hsv},
    {"HSV2BGR", armHSV2BGRImage<u8, 3, u8, 3>, 3, 3, bgr<3>},
    {"HSV2BGRA", armHSV2BGRImage<u8, 3, u8, 4>, 3, 4, bgr<4>},
};
// A zero may have either sign.
bool sameValue(float got, float want) { return got == want || sameNumber(got, want); }
const PackedKernel<float> kFloats[] = {
    {"BGR2HSV", armBGR2HSVImage<float, 3, float, 3>, 3, 3, hsvFloat, sameValue, false},
    {"BGRA2HSV", armBGR2HSVImage<float, 4, float, 3>, 4, 3, hsvFloat, sameValue, false},
    {"HSV2BGR", armHSV2BGRImage<float, 3, float, 3>, 3, 3, bgrFloat<3>, sameNumber},
    {"HSV2BGRA", armHSV2BGRImage<float, 3, float, 4>, 3, 4, bgrFloat<4>, sameNumber},
};

class HsvBytes : public testing::TestWithParam<PackedKernel<u8>> {};
class HsvFloats : public testing::TestWithParam<PackedKernel<float>> {};

TEST_P(HsvBytes, EveryShape) { checkShapes(GetParam()); }
TEST_P(HsvBytes, AllColours) { checkAllColours(GetParam()); }
TEST_P(HsvFloats, EveryShape) { checkShapes(GetParam()); }

INSTANTIATE_TEST_SUITE_P(Hsv, HsvBytes, testing::ValuesIn(kBytes), kKernelName);
INSTANTIATE_TEST_SUITE_P(Hsv, HsvFloats, testing::ValuesIn(kFloats), kKernelName);

// The groups' refined estimates against true division, over all colours: a hue or a saturation next to a half
// may be rounded the other way, in at most one colour of 2000 (Arm: 5118 hues and 5172 saturations in 2^24;
// x86-64, whose estimate is its own: 5115 and 1824 on an Intel processor). Hues of 0 and 180 are next to each
// other.
TEST(HsvBound, Bytes) {
  int hues = 0, saturations = 0;
  forEachColour(kBytes[0], {}, [&](const u8* in, const u8* out, bool) {
    u8 want[3];
    hsv(in, want, false);
    const int hue = std::abs(out[0] - want[0]);
    const bool near = (hue <= 1 || hue >= 179) && std::abs(out[1] - want[1]) <= 1 && out[2] == want[2];
    ASSERT_TRUE(near) << "(" << +in[0] << ", " << +in[1] << ", " << +in[2] << "): " << +out[0] << ", "
                      << +out[1];
    hues += hue != 0;
    saturations += out[1] != want[1];
  });
  EXPECT_LE(hues, (1 << 24) / 2000);
  EXPECT_LE(saturations, (1 << 24) / 2000);
}

// Colours k / 51, with all the ties between channels, and their negatives and multiples.
std::vector<float> floatColours() {
  std::vector<float> colours;
  for (const float scale : {1.0f, 255.0f, -1.0f}) {
    for (int b = 0; b <= 51; b += 3) {
      for (int g = 0; g <= 51; g += 3) {
        for (int r = 0; r <= 51; r += 3) {
          for (const int channel : {b, g, r}) {
            colours.push_back(scale * static_cast<float>(channel) / 51.0f);
          }
        }
      }
    }
  }
  return colours;
}

// Of floats too, the groups are within 4 ulp of true division: relative to 1 for S, to
// the circle for H.
TEST(HsvBound, Floats) {
  const std::vector<float> in = floatColours();
  std::vector<float> out(in.size());
  const int width = static_cast<int>(in.size() / 3);
  armBGR2HSVImage<float, 3, float, 3>(1, width, width * 3, in.data(), width * 3, out.data());
  for (size_t i = 0; i < in.size() / 24 * 24; i += 3) {
    float grouped[3], divided[3];
    hsvFloat(&in[i], grouped, true);
    hsvFloat(&in[i], divided, false);
    const float magnitude = std::max(1.0f, std::abs(divided[1]));
    const bool right =
        sameValue(out[i], grouped[0]) && sameValue(out[i + 1], grouped[1]) && out[i + 2] == grouped[2];
    ASSERT_TRUE(right) << in[i] << ", " << in[i + 1] << ", " << in[i + 2];
    ASSERT_NEAR(out[i], divided[0], 4 * 3.1e-5f) << in[i] << ", " << in[i + 1] << ", " << in[i + 2];
    ASSERT_NEAR(out[i + 1], divided[1], 4 * 1.2e-7f * magnitude)
        << in[i] << ", " << in[i + 1] << ", " << in[i + 2];
  }
}

// Hues on, before and behind every sector's start, below 0 and beyond the circle.
TEST(Hsv, FloatSectors) {
  std::vector<float> in;
  for (int h = -90; h <= 540; h += 5) {
    for (const float near : {std::nextafter(static_cast<float>(h), -1000.0f), static_cast<float>(h),
                             std::nextafter(static_cast<float>(h), 1000.0f), static_cast<float>(h) + 1.7f}) {
      for (const float s : {0.0f, 0.3f, 1.0f}) {
        for (const float v : {0.0f, 0.7f, 1.0f, 255.0f}) {
          in.insert(in.end(), {near, s, v});
        }
      }
    }
  }
  std::vector<float> out(in.size());
  const int width = static_cast<int>(in.size() / 3);
  armHSV2BGRImage<float, 3, float, 3>(1, width, width * 3, in.data(), width * 3, out.data());
  for (size_t i = 0; i < in.size(); i += 3) {
    float want[3];
    bgrFloat<3>(&in[i], want, true);
    for (size_t c = 0; c < 3; ++c) {
      ASSERT_TRUE(sameNumber(out[i + c], want[c]))
          << "H " << in[i] << ", S " << in[i + 1] << ", V " << in[i + 2] << ", channel " << c << ": "
          << out[i + c] << ", " << want[c];
    }
  }
}

// One colour, as a group of 8 and as a single pixel.
void expectBytes(PackedKernel<u8>::Function run, std::vector<u8> in, const std::vector<u8>& want) {
  std::vector<u8> pixels, out(9 * 3);
  for (int i = 0; i < 9; ++i) {
    pixels.insert(pixels.end(), in.begin(), in.end());
  }
  run(1, 9, 27, pixels.data(), 27, out.data());
  EXPECT_EQ(std::vector<u8>(out.begin(), out.begin() + 3), want);
  EXPECT_EQ(std::vector<u8>(out.begin() + 24, out.end()), want);
}

TEST(HsvExamples, ToBytes) {
  const auto run = armBGR2HSVImage<u8, 3, u8, 3>;
  for (const int gray : {0, 1, 100, 255}) {
    const u8 v = static_cast<u8>(gray);
    expectBytes(run, {v, v, v}, {0, 0, v});
  }
  expectBytes(run, {255, 0, 0}, {120, 255, 255});
  expectBytes(run, {0, 255, 0}, {60, 255, 255});
  expectBytes(run, {0, 0, 255}, {0, 255, 255});
  // A hue of -0.94 half degrees joins the circle, one of -0.24 does not.
  expectBytes(run, {8, 0, 255}, {179, 255, 255});
  expectBytes(run, {2, 0, 255}, {0, 255, 255});
}

TEST(HsvExamples, FromBytes) {
  const auto run = armHSV2BGRImage<u8, 3, u8, 3>;
  expectBytes(run, {0, 255, 255}, {0, 0, 255});
  expectBytes(run, {60, 255, 255}, {0, 255, 0});
  expectBytes(run, {120, 255, 255}, {255, 0, 0});
  // Hues beyond the circle keep the last sector's rule: blue would be negative.
  expectBytes(run, {180, 255, 255}, {0, 0, 255});
  expectBytes(run, {255, 255, 255}, {0, 0, 255});
}

TEST(HsvExamples, Floats) {
  const float blue[] = {1, 0, 0};
  float out[3];
  armBGR2HSVImage<float, 3, float, 3>(1, 1, 3, blue, 3, out);
  EXPECT_NEAR(out[0], 240.0f, 1e-4f);
  EXPECT_NEAR(out[1], 1.0f, 1e-6f);
  EXPECT_EQ(out[2], 1.0f);
}

}  // namespace
