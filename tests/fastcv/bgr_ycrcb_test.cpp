// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// YCrCb and back, against the formulas.

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <vector>

#include "fastcv/kernels.h"
#include "tests/support/packed_kernel.h"

namespace {

using HPC::fastcv::armBGR2YCrCbImage;
using HPC::fastcv::armYCrCb2BGRImage;
using kyface::test::checkAllColours;
using kyface::test::checkShapes;
using kyface::test::kKernelName;
using kyface::test::PackedKernel;
using kyface::test::sameNumber;

using u8 = unsigned char;

// The floor of value / 16384, for values above -2^24.
int floorDivided(int value) { return (value + (1 << 24)) / 16384 - 1024; }
u8 limited(int value) { return static_cast<u8>(std::clamp(value, 0, 255)); }

void encoded(const u8* in, u8* out, bool) {
  const int b = in[0], r = in[2];
  const int y = floorDivided(1868 * b + 9617 * in[1] + 4899 * r + 8192);
  out[0] = static_cast<u8>(y);
  out[1] = limited(floorDivided((r - y) * 11682 + 2105344));
  out[2] = limited(floorDivided((b - y) * 9241 + 2105344));
}

template <int nc>
void decoded(const u8* in, u8* out, bool) {
  const int y = in[0], cr = in[1] - 128, cb = in[2] - 128;
  out[0] = limited(y + floorDivided(29049 * cb + 8192));
  out[1] = limited(y + floorDivided(-11698 * cr - 5636 * cb + 8192));
  out[2] = limited(y + floorDivided(22987 * cr + 8192));
  if (nc == 4) {
    out[3] = 255;
  }
}

void encodedFloat(const float* in, float* out, bool) {
  const float b = in[0], r = in[2];
  const float y = std::fma(r, 0.299f, std::fma(b, 0.114f, in[1] * 0.587f));
  out[0] = y;
  out[1] = std::fma(r - y, 0.713f, 0.5f);
  out[2] = std::fma(b - y, 0.564f, 0.5f);
}

template <int nc>
void decodedFloat(const float* in, float* out, bool) {
  const float y = in[0], cr = in[1] - 0.5f, cb = in[2] - 0.5f;
  out[0] = std::fma(cb, 1.773f, y);
  out[1] = std::fma(cb, -0.344f, std::fma(cr, -0.714f, y));
  out[2] = std::fma(cr, 1.403f, y);
  if (nc == 4) {
    out[3] = 1;
  }
}

const PackedKernel<u8> kBytes[] = {
    {"BGR2YCrCb", armBGR2YCrCbImage<u8, 3, u8, 3>, 3, 3, encoded},
    {"BGRA2YCrCb", armBGR2YCrCbImage<u8, 4, u8, 3>, 4, 3, encoded},
    {"YCrCb2BGR", armYCrCb2BGRImage<u8, 3, u8, 3>, 3, 3, decoded<3>},
    {"YCrCb2BGRA", armYCrCb2BGRImage<u8, 3, u8, 4>, 3, 4, decoded<4>},
};
const PackedKernel<float> kFloats[] = {
    {"BGR2YCrCb", armBGR2YCrCbImage<float, 3, float, 3>, 3, 3, encodedFloat, sameNumber},
    {"BGRA2YCrCb", armBGR2YCrCbImage<float, 4, float, 3>, 4, 3, encodedFloat, sameNumber},
    {"YCrCb2BGR", armYCrCb2BGRImage<float, 3, float, 3>, 3, 3, decodedFloat<3>, sameNumber},
    {"YCrCb2BGRA", armYCrCb2BGRImage<float, 3, float, 4>, 3, 4, decodedFloat<4>, sameNumber},
};

class YCrCbBytes : public testing::TestWithParam<PackedKernel<u8>> {};
class YCrCbFloats : public testing::TestWithParam<PackedKernel<float>> {};

TEST_P(YCrCbBytes, EveryShape) { checkShapes(GetParam()); }
TEST_P(YCrCbBytes, AllColours) { checkAllColours(GetParam()); }
TEST_P(YCrCbFloats, EveryShape) { checkShapes(GetParam()); }

INSTANTIATE_TEST_SUITE_P(YCrCb, YCrCbBytes, testing::ValuesIn(kBytes), kKernelName);
INSTANTIATE_TEST_SUITE_P(YCrCb, YCrCbFloats, testing::ValuesIn(kFloats), kKernelName);

TEST(YCrCbExamples, GrayHasNoChroma) {
  for (int v = 0; v < 256; ++v) {
    const std::vector<u8> in(3 * 17, static_cast<u8>(v));
    std::vector<u8> out(in.size());
    armBGR2YCrCbImage<u8, 3, u8, 3>(1, 17, 51, in.data(), 51, out.data());
    for (size_t i = 0; i < out.size(); i += 3) {
      ASSERT_EQ(std::vector<u8>(&out[i], &out[i] + 3), (std::vector<u8>{static_cast<u8>(v), 128, 128}));
    }
  }
}

TEST(YCrCbExamples, Bytes) {
  const u8 red[] = {0, 0, 255};
  u8 out[3];
  armBGR2YCrCbImage<u8, 3, u8, 3>(1, 1, 3, red, 3, out);
  EXPECT_EQ(std::vector<u8>(out, out + 3), (std::vector<u8>{76, 255, 85}));
  const u8 reddest[] = {128, 255, 128};
  armYCrCb2BGRImage<u8, 3, u8, 3>(1, 1, 3, reddest, 3, out);
  EXPECT_EQ(out[2], 255);
}

TEST(YCrCbExamples, Floats) {
  const float black[] = {0, 0, 0};
  float out[3];
  armBGR2YCrCbImage<float, 3, float, 3>(1, 1, 3, black, 3, out);
  EXPECT_EQ(std::vector<float>(out, out + 3), (std::vector<float>{0, 0.5f, 0.5f}));
  const float gray[] = {0.3f, 0.5f, 0.5f};
  armYCrCb2BGRImage<float, 3, float, 3>(1, 1, 3, gray, 3, out);
  EXPECT_EQ(std::vector<float>(out, out + 3), (std::vector<float>{0.3f, 0.3f, 0.3f}));
}

// There and back, an 8-bit colour is at most 2 away.
TEST(YCrCbRoundTrip, Bytes) {
  std::vector<u8> in, mid, out;
  for (int b = 0; b < 256; b += 5) {
    for (int g = 0; g < 256; g += 5) {
      for (int r = 0; r < 256; r += 5) {
        in.insert(in.end(), {static_cast<u8>(b), static_cast<u8>(g), static_cast<u8>(r)});
      }
    }
  }
  const int width = static_cast<int>(in.size() / 3);
  mid.resize(in.size());
  out.resize(in.size());
  armBGR2YCrCbImage<u8, 3, u8, 3>(1, width, width * 3, in.data(), width * 3, mid.data());
  armYCrCb2BGRImage<u8, 3, u8, 3>(1, width, width * 3, mid.data(), width * 3, out.data());
  for (size_t i = 0; i < in.size(); i += 3) {
    // Where the chroma was clamped, the colour is lost.
    if (mid[i + 1] != 255 && mid[i + 1] != 0 && mid[i + 2] != 255 && mid[i + 2] != 0) {
      for (size_t c = 0; c < 3; ++c) {
        ASSERT_LE(std::abs(in[i + c] - out[i + c]), 2) << +in[i] << ", " << +in[i + 1] << ", " << +in[i + 2];
      }
    }
  }
}

}  // namespace
