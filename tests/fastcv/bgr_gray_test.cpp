// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// Gray and back, against the formulas.

#include <gtest/gtest.h>

#include <cmath>
#include <vector>

#include "fastcv/kernels.h"
#include "tests/support/packed_kernel.h"

namespace {

using HPC::fastcv::armBGR2GRAYImage;
using HPC::fastcv::armGRAY2BGRImage;
using kyface::test::checkAllColours;
using kyface::test::checkShapes;
using kyface::test::kKernelName;
using kyface::test::PackedKernel;
using kyface::test::sameNumber;

using u8 = unsigned char;

void grayOfBytes(const u8* in, u8* out, bool) {
  *out = static_cast<u8>((29 * in[0] + 150 * in[1] + 77 * in[2] + 128) / 256);
}

void grayOfFloats(const float* in, float* out, bool) {
  *out = std::fma(in[1], 0.587f, std::fma(in[2], 0.299f, in[0] * 0.114f));
}

template <typename T, int nc>
void spread(const T* in, T* out, bool) {
  out[0] = out[1] = out[2] = *in;
  if (nc == 4) {
    out[3] = sizeof(T) == 1 ? T(255) : T(1);
  }
}

const PackedKernel<u8> kBytes[] = {
    {"BGR2GRAY", armBGR2GRAYImage<u8, 3, u8, 1>, 3, 1, grayOfBytes},
    {"BGRA2GRAY", armBGR2GRAYImage<u8, 4, u8, 1>, 4, 1, grayOfBytes},
    {"GRAY2BGR", armGRAY2BGRImage<u8, 1, u8, 3>, 1, 3, spread<u8, 3>},
    {"GRAY2BGRA", armGRAY2BGRImage<u8, 1, u8, 4>, 1, 4, spread<u8, 4>},
};
const PackedKernel<float> kFloats[] = {
    {"BGR2GRAY", armBGR2GRAYImage<float, 3, float, 1>, 3, 1, grayOfFloats, sameNumber},
    {"BGRA2GRAY", armBGR2GRAYImage<float, 4, float, 1>, 4, 1, grayOfFloats, sameNumber},
    {"GRAY2BGR", armGRAY2BGRImage<float, 1, float, 3>, 1, 3, spread<float, 3>},
    {"GRAY2BGRA", armGRAY2BGRImage<float, 1, float, 4>, 1, 4, spread<float, 4>},
};

class GrayBytes : public testing::TestWithParam<PackedKernel<u8>> {};
class GrayFloats : public testing::TestWithParam<PackedKernel<float>> {};

TEST_P(GrayBytes, EveryShape) { checkShapes(GetParam()); }
TEST_P(GrayFloats, EveryShape) { checkShapes(GetParam()); }

INSTANTIATE_TEST_SUITE_P(Gray, GrayBytes, testing::ValuesIn(kBytes), kKernelName);
INSTANTIATE_TEST_SUITE_P(Gray, GrayFloats, testing::ValuesIn(kFloats), kKernelName);

TEST(Gray, AllColours) { checkAllColours(kBytes[0]); }
TEST(Gray, AllColoursWhateverTheAlpha) { checkAllColours(kBytes[1]); }

TEST(GrayExamples, Bytes) {
  const u8 bgr[] = {255, 255, 255, 0, 0, 255, 255, 0, 0, 0, 255, 0};
  u8 gray[4];
  armBGR2GRAYImage<u8, 3, u8, 1>(1, 4, 12, bgr, 4, gray);
  EXPECT_EQ(std::vector<u8>(gray, gray + 4), (std::vector<u8>{255, 77, 29, 149}));
  const u8 value = 37;
  u8 bgra[4];
  armGRAY2BGRImage<u8, 1, u8, 4>(1, 1, 1, &value, 4, bgra);
  EXPECT_EQ(std::vector<u8>(bgra, bgra + 4), (std::vector<u8>{37, 37, 37, 255}));
}

TEST(GrayExamples, Floats) {
  const float white[] = {2, 2, 2};
  float gray;
  armBGR2GRAYImage<float, 3, float, 1>(1, 1, 3, white, 1, &gray);
  EXPECT_NEAR(gray, 2.0f, 1e-6f);
  const float value = 0.5f;
  float bgra[4];
  armGRAY2BGRImage<float, 1, float, 4>(1, 1, 1, &value, 4, bgra);
  EXPECT_EQ(std::vector<float>(bgra, bgra + 4), (std::vector<float>{0.5f, 0.5f, 0.5f, 1.0f}));
}

}  // namespace
