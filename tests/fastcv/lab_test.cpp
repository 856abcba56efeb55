// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// The Lab kernels and their tables against the formulas, written out per pixel.

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <cstring>
#include <limits>
#include <random>
#include <string>
#include <vector>

#include "fastcv/fastcv.h"
#include "fastcv/kernels.h"
#include "fastcv/src/arm/roots.h"
#include "simd/lab_tables.h"
#include "tests/support/guarded_image.h"
#include "tests/support/lab_reference.h"

namespace {

using HPC::fastcv::armBGR2LABImage;
using HPC::fastcv::armLAB2BGRImage;
using kyface::test::ByteSource;
using kyface::test::GuardedImage;
using u8 = unsigned char;

template <typename T>
using Kernel = void (*)(int, int, int, const T*, int, T*);

int floorShift(int value, int bits) {
  const int divisor = 1 << bits;
  return value >= 0 ? value / divisor : -((-value + divisor - 1) / divisor);
}

u8 limited(int value) { return static_cast<u8>(std::clamp(value, 0, 255)); }

// ---- the formulas

struct Lab8 {
  u8 l, a, b;
};

Lab8 labOf(int b, int g, int r) {
  static const std::vector<int> gamma = [] {
    std::vector<int> table;
    for (int i = 0; i < 256; ++i) {
      table.push_back(kyface::test::gammaEntry(i));
    }
    return table;
  }();
  static const std::vector<int> root = [] {
    std::vector<int> table;
    for (int i = 0; i < 3072; ++i) {
      table.push_back(kyface::test::cubeRootEntry(i));
    }
    return table;
  }();
  const int gb = gamma[b], gg = gamma[g], gr = gamma[r];
  const int fx = root[(gg * 1541 + gb * 778 + gr * 1777 + 2048) / 4096];
  const int fy = root[(gg * 2929 + gb * 296 + gr * 871 + 2048) / 4096];
  const int fz = root[(gg * 448 + gb * 3575 + gr * 73 + 2048) / 4096];
  return {limited(floorShift(fy * 296 - 1320550, 15)), limited(floorShift((fx - fy) * 500 + 4210688, 15)),
          limited(floorShift((fy - fz) * 200 + 4210688, 15))};
}

using Pieces = std::vector<std::array<float, 4>>;

float valueAt(const Pieces& pieces, int k, float u) {
  const std::array<float, 4>& a = pieces[k];
  return std::fma(u, std::fma(u, std::fma(u, a[3], a[2]), a[1]), a[0]);
}

float valueAt(const Pieces& pieces, float v) {
  const float t = v * 1024.0f;
  const int k = t >= 1023.0f ? 1023 : t > 0.0f ? static_cast<int>(t) : 0;
  return valueAt(pieces, k, t - static_cast<float>(k));
}

const Pieces& expansion() {
  static const Pieces pieces = kyface::test::splineThrough(kyface::test::expanded);
  return pieces;
}
const Pieces& compression() {
  static const Pieces pieces = kyface::test::splineThrough(kyface::test::compressed);
  return pieces;
}

struct Colour {
  float c[3];
};

Colour labOf(const float* bgr) {
  const float b = valueAt(expansion(), bgr[0]);
  const float g = valueAt(expansion(), bgr[1]);
  const float r = valueAt(expansion(), bgr[2]);
  const float x = std::fma(r, 0.43395275f, std::fma(b, 0.18982783f, g * 0.37621942f));
  const float y = std::fma(r, 0.212671f, std::fma(b, 0.072169f, g * 0.71516f));
  const float z = std::fma(r, 0.017757913f, std::fma(b, 0.87276554f, g * 0.109476514f));
  const auto f = [](float t) {
    return t > 0.008856f ? std::pow(t, 0.33333334f) : std::fma(7.787f, t, 0.13793103f);
  };
  return {{y > 0.008856f ? std::fma(116.0f, f(y), -16.0f) : 903.3f * y, 500.0f * (f(x) - f(y)),
           200.0f * (f(y) - f(z))}};
}

float displayed(float v) {
  return v < 0.0f   ? valueAt(compression(), 0, 0.0f)
         : v > 1.0f ? valueAt(compression(), 1023, 1.0f)
                    : valueAt(compression(), v);
}

struct Light {
  float x, y, z;
};

// X depends on L and a alone, Z on L and b.
Light lightOf(float l, float a, float b) {
  float y, fy;
  if (l <= 7.999625f) {
    y = l * 0.001107052f;
    fy = std::fma(7.787f, y, 0.13793103f);
  } else {
    fy = std::fma(l, 0.00862069f, 0.13793103f);
    y = fy * fy * fy;
  }
  const float fx = std::fma(a, 0.002f, fy);
  const float fz = std::fma(-b, 0.005f, fy);
  const auto unrooted = [](float f) { return f > 0.20689271f ? f * f * f : (f - 0.13793103f) * 0.12841916f; };
  return {unrooted(fx), y, unrooted(fz)};
}

Colour bgrOf(const Light& light) {
  const auto sum = [&](float wx, float wy, float wz) {
    return displayed(std::fma(wz, light.z, std::fma(wy, light.y, wx * light.x)));
  };
  return {{sum(0.052890975f, -0.204043f, 1.1511517f), sum(-0.9212352f, 1.875991f, 0.045244265f),
           sum(3.0799327f, -1.53715f, -0.542782f)}};
}

// The bytes of a Lab pixel's colour.
struct Bytes {
  u8 c[3];
};

Light lightOf8(int l, int a, int b) {
  return lightOf(static_cast<float>(l) * 0.39215687f, static_cast<float>(a - 128),
                 static_cast<float>(b - 128));
}

Bytes bytesOf(const Light& light) {
  const Colour colour = bgrOf(light);
  Bytes bytes;
  for (int i = 0; i < 3; ++i) {
    bytes.c[i] = limited(static_cast<int>(std::fma(colour.c[i], 255.0f, 0.5f)));
  }
  return bytes;
}

// Bit for bit, but that one NaN is as good as another.
::testing::AssertionResult same(float actual, float expected) {
  if ((std::isnan(actual) && std::isnan(expected)) || memcmp(&actual, &expected, sizeof(actual)) == 0) {
    return ::testing::AssertionSuccess();
  }
  return ::testing::AssertionFailure() << std::hexfloat << actual << ", expected " << expected;
}

// ---- the tables

TEST(LabTables, EveryGammaAndRoot) {
  for (int i = 0; i < 256; ++i) {
    ASSERT_EQ(HPC::fastcv::arm::kGammaTable[i], kyface::test::gammaEntry(i)) << i;
  }
  for (int i = 0; i < 3072; ++i) {
    ASSERT_EQ(HPC::fastcv::arm::kCubeRootTable[i], kyface::test::cubeRootEntry(i)) << i;
  }
}

void expectSpline(const HPC::fastcv::arm::Spline& spline, const Pieces& pieces) {
  for (int k = 0; k < 1024; ++k) {
    for (int i = 0; i < 4; ++i) {
      ASSERT_TRUE(same(spline.piece[k][i], pieces[k][i])) << "piece " << k << ", number " << i;
    }
  }
}

TEST(LabTables, EveryPieceOfTheSplines) {
  expectSpline(HPC::fastcv::arm::kExpansionSpline, expansion());
  expectSpline(HPC::fastcv::arm::kCompressionSpline, compression());
}

TEST(LabTables, TheSplinesFollowTheCurves) {
  double expansionError = 0, compressionError = 0;
  for (int i = 0; i <= 10000; ++i) {
    const float v = static_cast<float>(i) / 10000;
    const long double x = v;
    const long double linear = x <= 0.04045L ? x / 12.92L : std::pow((x + 0.055L) / 1.055L, 2.4L);
    const long double display = x <= 0.0031308L ? x * 12.92L : 1.055L * std::pow(x, 1 / 2.4L) - 0.055L;
    expansionError =
        std::max(expansionError, static_cast<double>(std::abs(valueAt(expansion(), v) - linear)));
    compressionError =
        std::max(compressionError, static_cast<double>(std::abs(valueAt(compression(), v) - display)));
  }
  EXPECT_LT(expansionError, 1e-6);
  EXPECT_LT(compressionError, 2e-4);  // at the corner of the curve
}

// All tables are the same on every platform.
TEST(LabTables, AreTheSameEverywhere) {
  const auto hash = [](const void* data, size_t size) {
    uint64_t h = 0xcbf29ce484222325;
    for (size_t i = 0; i < size; ++i) {
      h = (h ^ static_cast<const u8*>(data)[i]) * 0x100000001b3;
    }
    return h;
  };
  using namespace HPC::fastcv::arm;
  EXPECT_EQ(hash(&kGammaTable, sizeof(kGammaTable)), 7293597511432615590u);
  EXPECT_EQ(hash(&kCubeRootTable, sizeof(kCubeRootTable)), 4682337296457511013u);
  EXPECT_EQ(hash(&kExpansionSpline, sizeof(kExpansionSpline)), 9985829604570667242u);
  EXPECT_EQ(hash(&kCompressionSpline, sizeof(kCompressionSpline)), 14252970876428570013u);
  EXPECT_EQ(hash(&kCompressedBytes, sizeof(kCompressedBytes)), 997279842289598155u);
}

// ---- 8-bit, every colour

TEST(Lab8, EveryColour) {
  constexpr int kSize = 256;
  std::vector<u8> bgr(kSize * kSize * 3), bgra(kSize * kSize * 4), lab(kSize * kSize * 3),
      labOfBgra(lab.size());
  for (int b = 0; b < 256; ++b) {
    for (int i = 0; i < kSize * kSize; ++i) {
      const u8 pixel[4] = {static_cast<u8>(b), static_cast<u8>(i >> 8), static_cast<u8>(i),
                           static_cast<u8>(i * 7)};
      memcpy(&bgr[i * 3], pixel, 3);
      memcpy(&bgra[i * 4], pixel, 4);
    }
    armBGR2LABImage<u8, 3, u8, 3>(kSize, kSize, kSize * 3, bgr.data(), kSize * 3, lab.data());
    armBGR2LABImage<u8, 4, u8, 3>(kSize, kSize, kSize * 4, bgra.data(), kSize * 3, labOfBgra.data());
    ASSERT_EQ(lab, labOfBgra);
    for (int i = 0; i < kSize * kSize; ++i) {
      const Lab8 expected = labOf(b, i >> 8, i & 255);
      const u8* actual = &lab[i * 3];
      const bool right = actual[0] == expected.l && actual[1] == expected.a && actual[2] == expected.b;
      ASSERT_TRUE(right) << b << ", " << (i >> 8) << ", " << (i & 255);
    }
  }
}

TEST(Lab8, EveryLab) {
  constexpr int kSize = 256;
  std::vector<u8> lab(kSize * kSize * 3), bgr(lab.size()), bgra(kSize * kSize * 4);
  for (int l = 0; l < 256; ++l) {
    for (int i = 0; i < kSize * kSize; ++i) {
      const u8 pixel[3] = {static_cast<u8>(l), static_cast<u8>(i >> 8), static_cast<u8>(i)};
      memcpy(&lab[i * 3], pixel, 3);
    }
    Light ofA[256], ofB[256];
    for (int i = 0; i < 256; ++i) {
      ofA[i] = lightOf8(l, i, 0);
      ofB[i] = lightOf8(l, 0, i);
    }
    armLAB2BGRImage<u8, 3, u8, 3>(kSize, kSize, kSize * 3, lab.data(), kSize * 3, bgr.data());
    // With alpha it is the same arithmetic: now and then will do.
    const bool alphaToo = l % 8 == 0;
    if (alphaToo) {
      armLAB2BGRImage<u8, 3, u8, 4>(kSize, kSize, kSize * 3, lab.data(), kSize * 4, bgra.data());
    }
    for (int i = 0; i < kSize * kSize; ++i) {
      const Bytes expected = bytesOf({ofA[i >> 8].x, ofA[i >> 8].y, ofB[i & 255].z});
      const bool right = memcmp(&bgr[i * 3], expected.c, 3) == 0 &&
                         (!alphaToo || (memcmp(&bgra[i * 4], expected.c, 3) == 0 && bgra[i * 4 + 3] == 255));
      ASSERT_TRUE(right) << l << ", " << (i >> 8) << ", " << (i & 255);
    }
  }
}

TEST(Lab8, Examples) {
  const u8 black[3] = {0, 0, 0}, white[3] = {255, 255, 255};
  u8 out[3];
  armBGR2LABImage<u8, 3, u8, 3>(1, 1, 3, black, 3, out);
  EXPECT_EQ(std::vector<u8>(out, out + 3), (std::vector<u8>{0, 128, 128}));
  armBGR2LABImage<u8, 3, u8, 3>(1, 1, 3, white, 3, out);
  EXPECT_EQ(std::vector<u8>(out, out + 3), (std::vector<u8>{255, 128, 128}));
  // Far outside the colours on both sides.
  const u8 green[3] = {128, 0, 128}, magenta[3] = {128, 255, 128};
  armLAB2BGRImage<u8, 3, u8, 3>(1, 1, 3, green, 3, out);
  EXPECT_EQ(out[2], 0);
  armLAB2BGRImage<u8, 3, u8, 3>(1, 1, 3, magenta, 3, out);
  EXPECT_EQ(out[1], 0);
  EXPECT_EQ(out[2], 255);
}

// A colour comes back within a few levels: the steps of 8-bit Lab are coarser where colours are dark.
TEST(Lab8, RoundTrip) {
  std::vector<u8> bgr, lab, back;
  for (int b = 0; b < 256; b += 5) {
    for (int g = 0; g < 256; g += 5) {
      for (int r = 0; r < 256; r += 5) {
        bgr.insert(bgr.end(), {static_cast<u8>(b), static_cast<u8>(g), static_cast<u8>(r)});
      }
    }
  }
  lab.resize(bgr.size());
  back.resize(bgr.size() + 12);
  const int width = static_cast<int>(bgr.size() / 3);
  lab.resize(lab.size() + 12);
  armBGR2LABImage<u8, 3, u8, 3>(1, width, 0, bgr.data(), 0, lab.data());
  armLAB2BGRImage<u8, 3, u8, 3>(1, width, 0, lab.data(), 0, back.data());
  int largest = 0;
  for (size_t i = 0; i < bgr.size(); ++i) {
    largest = std::max(largest, std::abs(bgr[i] - back[i]));
  }
  EXPECT_LE(largest, 23);
}

// ---- sizes

// A kernel over images of one element type, with what a pixel should become.
template <typename T>
struct Variant {
  const char* name;
  Kernel<T> kernel;
  int srcChannels;
  int dstChannels;
  void (*pixel)(const T* src, T* dst);
};

void forward8(const u8* src, u8* dst) {
  const Lab8 lab = labOf(src[0], src[1], src[2]);
  dst[0] = lab.l;
  dst[1] = lab.a;
  dst[2] = lab.b;
}
void back8(const u8* src, u8* dst) { memcpy(dst, bytesOf(lightOf8(src[0], src[1], src[2])).c, 3); }
void forward32(const float* src, float* dst) { memcpy(dst, labOf(src).c, sizeof(Colour)); }
void back32(const float* src, float* dst) {
  memcpy(dst, bgrOf(lightOf(src[0], src[1], src[2])).c, sizeof(Colour));
}

// Rows of a kernel that writes its rows and nothing else, between pages that may not be touched.
template <typename T, typename Next>
void checkSize(const Variant<T>& variant, int height, int width, int inPad, int outPad, Next next) {
  const int rows = std::max(height, 0);
  GuardedImage<T> in(rows, width * variant.srcChannels, width * variant.srcChannels + inPad);
  in.fill(next);
  GuardedImage<T> out(rows, width * variant.dstChannels, width * variant.dstChannels + outPad);
  std::vector<T> expected(static_cast<size_t>(rows) * static_cast<size_t>(width * variant.dstChannels), T{1});
  for (int y = 0; y < rows; ++y) {
    for (int x = 0; x < width; ++x) {
      variant.pixel(in.row(y) + x * variant.srcChannels, &expected[(y * width + x) * variant.dstChannels]);
    }
  }
  variant.kernel(height, width, in.stride(), in.data(), out.stride(), out.data());
  ASSERT_TRUE(out.holds(expected)) << variant.name << ", " << width << " x " << height;
}

template <typename T, typename Next>
void checkSizes(const Variant<T>& variant, Next next) {
  for (int width = 1; width <= 67; ++width) {
    for (const int height : {-1, 0, 1, 3}) {
      checkSize(variant, height, width, 0, 0, next);
      checkSize(variant, height, width, 5, 7, next);
    }
  }
  checkSize(variant, 2, 0, 3, 3, next);
  checkSize(variant, 30, 641, 1, 0, next);
}

float unit(std::minstd_rand& engine) { return static_cast<float>(engine() & 0xffffff) / 0xffffff; }

TEST(Lab8, SizesForward) {
  checkSizes<u8>({"BGR", armBGR2LABImage<u8, 3, u8, 3>, 3, 3, forward8}, ByteSource(1));
  checkSizes<u8>({"BGRA", armBGR2LABImage<u8, 4, u8, 3>, 4, 3, forward8}, ByteSource(2));
}

TEST(LabF32, SizesForward) {
  std::minstd_rand engine(3);
  const auto next = [&] { return 1.2f * unit(engine) - 0.1f; };
  checkSizes<float>({"BGR", armBGR2LABImage<float, 3, float, 3>, 3, 3, forward32}, next);
  checkSizes<float>({"BGRA", armBGR2LABImage<float, 4, float, 3>, 4, 3, forward32}, next);
}

TEST(LabF32, SizesBack) {
  std::minstd_rand engine(4);
  const auto next = [&] { return 100.0f * unit(engine) - (engine() % 3 == 0 ? 50.0f : 0.0f); };
  checkSizes<float>({"BGR", armLAB2BGRImage<float, 3, float, 3>, 3, 3, back32}, next);
  // The fourth channel is expected to be 1, which is what the expectation is filled with.
  checkSizes<float>({"BGRA", armLAB2BGRImage<float, 3, float, 4>, 3, 4, back32}, next);
}

// How many pixels a row of 8-bit Lab to BGR covers: groups of 8 while the first lies before width - 3, then
// single ones.
int covered(int width) {
  int x = 0;
  while (x < width - 3) {
    x += 8;
  }
  return std::max(x, width);
}

// Both buffers end, to the byte, where the last row's last group does. What groups write beyond their row
// stays, if no later row writes there.
void checkBack8(int channels, Kernel<u8> kernel, int height, int width, int inPad, int outPad) {
  const int rows = std::max(height, 0);
  const int beyond = width < 1 ? 0 : covered(width) - width;
  const int inStride = width * 3 + inPad, outStride = width * channels + outPad;
  const auto sizeOf = [&](int stride, int nc) {
    return rows == 0 ? 0 : (rows - 1) * stride + (width + beyond) * nc;
  };
  GuardedImage<u8> in(1, sizeOf(inStride, 3), sizeOf(inStride, 3));
  in.fill(ByteSource(static_cast<unsigned>(width)));
  GuardedImage<u8> out(1, sizeOf(outStride, channels), sizeOf(outStride, channels));
  std::vector<u8> expected = out.contents();
  for (int y = 0; y < rows && width > 0; ++y) {
    for (int x = 0; x < covered(width); ++x) {
      u8* pixel = &expected[y * outStride + x * channels];
      back8(in.data() + y * inStride + x * 3, pixel);
      if (channels == 4) {
        pixel[3] = 255;
      }
    }
  }
  kernel(height, width, inStride, in.data(), outStride, out.data());
  ASSERT_TRUE(out.holds(expected)) << width << " x " << height;
}

TEST(Lab8, SizesBack) {
  EXPECT_EQ(covered(12), 16);
  EXPECT_EQ(covered(9), 9);
  EXPECT_EQ(covered(3), 3);
  EXPECT_EQ(covered(4), 8);
  for (const int channels : {3, 4}) {
    const Kernel<u8> kernel = channels == 3 ? armLAB2BGRImage<u8, 3, u8, 3> : armLAB2BGRImage<u8, 3, u8, 4>;
    for (int width = 0; width <= 67; ++width) {
      for (const int height : {-1, 0, 1, 2, 5}) {
        checkBack8(channels, kernel, height, width, 0, 0);
        checkBack8(channels, kernel, height, width, 5, 7);
        checkBack8(channels, kernel, height, width, 20, 33);
      }
    }
    checkBack8(channels, kernel, 30, 638, 0, 0);
  }
}

// ---- float values

// Runs a kernel over pixels of three channels and compares with the formulas.
void checkValues(const Variant<float>& variant, const std::vector<float>& src) {
  const int pixels = static_cast<int>(src.size() / 3);
  std::vector<float> dst(src.size());
  variant.kernel(1, pixels, pixels * 3, src.data(), pixels * 3, dst.data());
  for (int i = 0; i < pixels; ++i) {
    float expected[3];
    variant.pixel(&src[i * 3], expected);
    for (int c = 0; c < 3; ++c) {
      ASSERT_TRUE(same(dst[i * 3 + c], expected[c]))
          << variant.name << " of " << src[i * 3] << ", " << src[i * 3 + 1] << ", " << src[i * 3 + 2]
          << ", channel " << c;
    }
  }
}

const Variant<float> kForward32 = {"BGR to Lab", armBGR2LABImage<float, 3, float, 3>, 3, 3, forward32};
const Variant<float> kBack32 = {"Lab to BGR", armLAB2BGRImage<float, 3, float, 3>, 3, 3, back32};

TEST(LabF32, ManyColours) {
  std::minstd_rand engine(5);
  std::vector<float> colours, labs;
  for (int i = 0; i < 300000; ++i) {
    const float scale = i % 4 == 0 ? 0.02f : i % 4 == 1 ? 3.0f : 1.0f;
    for (int c = 0; c < 3; ++c) {
      colours.push_back((unit(engine) - (i % 5 == 0 ? 0.5f : 0.0f)) * scale);
      labs.push_back(c == 0 ? unit(engine) * (i % 3 == 0 ? 9.0f : 110.0f) : (unit(engine) - 0.5f) * 256.0f);
    }
  }
  checkValues(kForward32, colours);
  checkValues(kBack32, labs);
}

// The roots are powf's own, to the last bit: every float of the range that colours reach, many of those
// beyond. Few of them have to be asked for.
TEST(LabF32, RootsArePowf) {
  using namespace HPC::fastcv::arm;
#if defined(__x86_64__)
  constexpr uint32_t kStep = 1;
#else
  constexpr uint32_t kStep = 101;  // the emulator is slow
#endif
  constexpr uint32_t kLanes = sizeof(Floats) / sizeof(float);
  const RootFactors factors;
  const auto bitsOf = [](float v) {
    uint32_t bits;
    memcpy(&bits, &v, sizeof(bits));
    return bits;
  };
  long blocks = 0, asked = 0;
  const auto check = [&](uint32_t from, uint32_t to, uint32_t step) {
    for (uint32_t bits = from; bits < to; bits += kLanes * step) {
      float t[kLanes], actual[kLanes];
      for (uint32_t i = 0; i < kLanes; ++i) {
        const uint32_t each = bits + i * step;
        memcpy(&t[i], &each, sizeof(each));
      }
      const Roots roots(load(t), factors);
      const bool doubtful = anySet(~roots.clear());
      store(actual, doubtful ? roots.settled() : roots.rounded());
      ++blocks;
      asked += doubtful ? 1 : 0;
      for (uint32_t i = 0; i < kLanes; ++i) {
        ASSERT_TRUE(same(actual[i], std::pow(t[i], 0.33333334f))) << std::hexfloat << t[i];
      }
    }
  };
  check(bitsOf(0.008856f), bitsOf(8.0f), kStep);
  EXPECT_LT(asked, blocks * kLanes / 200);
  check(bitsOf(8.0f), bitsOf(std::numeric_limits<float>::max()) - kLanes * kStep * 997, kStep * 997);
  const Roots infinite(splat<Floats>(std::numeric_limits<float>::infinity()), factors);
  EXPECT_TRUE(std::isinf(infinite.settled()[0]));
}

std::vector<float> neighbours(std::initializer_list<float> values) {
  std::vector<float> all;
  for (const float value : values) {
    all.insert(all.end(), {value, std::nextafter(value, -1e30f), std::nextafter(value, 1e30f)});
  }
  return all;
}

// Every triple of values around which the formulas branch, of zeros, extremes and no numbers.
TEST(LabF32, BranchesAndExtremes) {
  constexpr float kInfinity = std::numeric_limits<float>::infinity();
  const std::vector<float> extremes = {0.0f,    -0.0f, 1e-40f, -1e-40f,   1e38f,      -1e38f,
                                       3.4e38f, 5e9f,  -5e9f,  kInfinity, -kInfinity, std::nanf("")};
  const auto triples = [](const std::vector<float>& x, const std::vector<float>& y,
                          const std::vector<float>& z) {
    std::vector<float> all;
    for (const float a : x) {
      for (const float b : y) {
        for (const float c : z) {
          all.insert(all.end(), {a, b, c});
        }
      }
    }
    return all;
  };
  std::vector<float> channel =
      neighbours({0.0f, 0.04045f, 0.0031308f, 0.5f, 1.0f, 1023.0f / 1024, 0.008856f, 0.0927f});
  channel.insert(channel.end(), extremes.begin(), extremes.end());
  checkValues(kForward32, triples(channel, channel, channel));

  std::vector<float> l = neighbours({0.0f, 7.999625f, 8.0f, 50.0f, 100.0f});
  l.insert(l.end(), extremes.begin(), extremes.end());
  std::vector<float> ab = neighbours({0.0f, -128.0f, 127.0f, 20.0f});
  ab.insert(ab.end(), extremes.begin(), extremes.end());
  checkValues(kBack32, triples(l, ab, ab));
}

TEST(LabF32, Examples) {
  const float labs[] = {0, 0, 0, 100, 0, 0, 50, -500, 0, 50, 500, 0};
  float bgr[12];
  armLAB2BGRImage<float, 3, float, 3>(1, 4, 12, labs, 12, bgr);
  for (int i = 0; i < 3; ++i) {
    EXPECT_EQ(bgr[i], 0.0f);
    EXPECT_NEAR(bgr[3 + i], 1.0f, 1e-4f);
  }
  EXPECT_EQ(bgr[6 + 2], 0.0f);
  EXPECT_EQ(bgr[9 + 2], 1.0f);
  EXPECT_EQ(bgr[9 + 1], 0.0f);
}

// Against the definition of Lab in long double: the splines and float cost less than a thousandth of a unit.
TEST(LabF32, IsLab) {
  constexpr int kColours = 5000;
  std::minstd_rand engine(6);
  std::vector<float> colours(3 * kColours), labs(colours.size()), back(colours.size());
  for (float& value : colours) {
    value = unit(engine);
  }
  armBGR2LABImage<float, 3, float, 3>(1, kColours, 0, colours.data(), 0, labs.data());
  armLAB2BGRImage<float, 3, float, 3>(1, kColours, 0, labs.data(), 0, back.data());
  long double error = 0, returned = 0;
  for (int i = 0; i < kColours; ++i) {
    long double linear[3];
    for (int c = 0; c < 3; ++c) {
      const long double v = colours[i * 3 + c];
      linear[c] = v <= 0.04045L ? v / 12.92L : std::pow((v + 0.055L) / 1.055L, 2.4L);
      returned = std::max(returned, std::abs(v - back[i * 3 + c]));
    }
    const auto f = [](long double t) { return t > 0.008856L ? std::cbrt(t) : 7.787L * t + 16.0L / 116; };
    const long double x = (0.412453L * linear[2] + 0.357580L * linear[1] + 0.180423L * linear[0]) / 0.950456L;
    const long double y = 0.212671L * linear[2] + 0.715160L * linear[1] + 0.072169L * linear[0];
    const long double z = (0.019334L * linear[2] + 0.119193L * linear[1] + 0.950227L * linear[0]) / 1.088754L;
    const long double l = y > 0.008856L ? 116 * f(y) - 16 : 903.3L * y;
    error = std::max({error, std::abs(l - labs[i * 3]), std::abs(500 * (f(x) - f(y)) - labs[i * 3 + 1]),
                      std::abs(200 * (f(y) - f(z)) - labs[i * 3 + 2])});
  }
  EXPECT_LT(error, 5e-4);
  EXPECT_LT(returned, 2e-4);
}

// ---- through the front-end

template <HPC::fastcv::ColorCvtType type, typename T, int ncSrc, int ncDst>
void checkFrontEnd(Kernel<T> kernel) {
  using namespace HPC::fastcv;
  constexpr int kWidth = 16, kHeight = 6, kInStride = kWidth * ncSrc + 4, kOutStride = kWidth * ncDst + 8;
  std::vector<T> in(kHeight * kInStride), out(kHeight * kOutStride, T{7}), expected = out;
  std::minstd_rand engine(9);
  for (T& value : in) {
    value = sizeof(T) == 1 ? static_cast<T>(engine() >> 8) : static_cast<T>(unit(engine));
  }
  Mat<T, ncSrc, ECO_ENV_ARM> src(kWidth, kHeight, in.data());
  Mat<T, ncDst, ECO_ENV_ARM> dst(kWidth, kHeight, out.data());
  src.step = kInStride * static_cast<int64_t>(sizeof(T));
  dst.step = kOutStride * static_cast<int64_t>(sizeof(T));
  EXPECT_EQ((cvtColor<type, T, ncSrc, T, ncDst, ECO_ENV_ARM>(src, &dst)), HPC_SUCCESS);
  kernel(kHeight, kWidth, kInStride, in.data(), kOutStride, expected.data());
  EXPECT_EQ(out, expected);
  const std::vector<T> before = out;
  dst.height = kHeight - 1;
  EXPECT_EQ((cvtColor<type, T, ncSrc, T, ncDst, ECO_ENV_ARM>(src, &dst)), HPC_INVALID_ARGS);
  EXPECT_EQ(out, before);
}

TEST(LabFrontEnd, EveryInstance) {
  using namespace HPC::fastcv;
  checkFrontEnd<CVT_BGR2LAB, u8, 3, 3>(armBGR2LABImage<u8, 3, u8, 3>);
  checkFrontEnd<CVT_BGR2LAB, u8, 4, 3>(armBGR2LABImage<u8, 4, u8, 3>);
  checkFrontEnd<CVT_BGR2LAB, float, 3, 3>(armBGR2LABImage<float, 3, float, 3>);
  checkFrontEnd<CVT_BGR2LAB, float, 4, 3>(armBGR2LABImage<float, 4, float, 3>);
  checkFrontEnd<CVT_LAB2BGR, u8, 3, 3>(armLAB2BGRImage<u8, 3, u8, 3>);
  checkFrontEnd<CVT_LAB2BGR, u8, 3, 4>(armLAB2BGRImage<u8, 3, u8, 4>);
  checkFrontEnd<CVT_LAB2BGR, float, 3, 3>(armLAB2BGRImage<float, 3, float, 3>);
  checkFrontEnd<CVT_LAB2BGR, float, 3, 4>(armLAB2BGRImage<float, 3, float, 4>);
}

}  // namespace
