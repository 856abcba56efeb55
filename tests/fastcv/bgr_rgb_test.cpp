// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// The channel reorderings.

#include <gtest/gtest.h>

#include <vector>

#include "fastcv/kernels.h"
#include "tests/support/packed_kernel.h"

namespace {

using HPC::fastcv::armBGR2BGRAImage;
using HPC::fastcv::armBGR2RGBImage;
using HPC::fastcv::armBGRA2BGRImage;
using kyface::test::checkShapes;
using kyface::test::checkShapesInPlace;
using kyface::test::kKernelName;
using kyface::test::PackedKernel;

using u8 = unsigned char;

// Which source channel each destination channel is; -1 is an opaque alpha.
template <typename T>
PackedKernel<T> reordering(const char* name, typename PackedKernel<T>::Function run, int ncSrc,
                           const std::vector<int>& order) {
  const auto reference = [order](const T* in, T* out, bool) {
    for (size_t c = 0; c < order.size(); ++c) {
      // Bit for bit: an assignment could change the bits of a NaN.
      const T opaque = sizeof(T) == 1 ? T(255) : T(1);
      memcpy(&out[c], order[c] < 0 ? &opaque : &in[order[c]], sizeof(T));
    }
  };
  return {name, run, ncSrc, static_cast<int>(order.size()), reference};
}

template <typename T>
std::vector<PackedKernel<T>> resizing() {
  return {
      reordering<T>("BGR2BGRA", armBGR2BGRAImage<T, 3, T, 4>, 3, {0, 1, 2, -1}),
      reordering<T>("BGRA2BGR", armBGRA2BGRImage<T, 4, T, 3>, 4, {0, 1, 2}),
      reordering<T>("BGR2RGBA", armBGR2RGBImage<T, 3, T, 4>, 3, {2, 1, 0, -1}),
      reordering<T>("BGRA2RGB", armBGR2RGBImage<T, 4, T, 3>, 4, {2, 1, 0}),
  };
}

template <typename T>
std::vector<PackedKernel<T>> sameSize() {
  return {
      reordering<T>("BGR2RGB", armBGR2RGBImage<T, 3, T, 3>, 3, {2, 1, 0}),
      reordering<T>("BGRA2RGBA", armBGR2RGBImage<T, 4, T, 4>, 4, {2, 1, 0, 3}),
  };
}

class ReorderBytes : public testing::TestWithParam<PackedKernel<u8>> {};
class ReorderFloats : public testing::TestWithParam<PackedKernel<float>> {};
class ReorderBytesInPlace : public ReorderBytes {};
class ReorderFloatsInPlace : public ReorderFloats {};

TEST_P(ReorderBytes, EveryShape) { checkShapes(GetParam()); }
TEST_P(ReorderFloats, EveryShape) { checkShapes(GetParam()); }
TEST_P(ReorderBytesInPlace, EveryShape) { checkShapesInPlace(GetParam()); }
TEST_P(ReorderFloatsInPlace, EveryShape) { checkShapesInPlace(GetParam()); }

INSTANTIATE_TEST_SUITE_P(Resizing, ReorderBytes, testing::ValuesIn(resizing<u8>()), kKernelName);
INSTANTIATE_TEST_SUITE_P(Resizing, ReorderFloats, testing::ValuesIn(resizing<float>()), kKernelName);
INSTANTIATE_TEST_SUITE_P(SameSize, ReorderBytes, testing::ValuesIn(sameSize<u8>()), kKernelName);
INSTANTIATE_TEST_SUITE_P(SameSize, ReorderFloats, testing::ValuesIn(sameSize<float>()), kKernelName);
INSTANTIATE_TEST_SUITE_P(SameSize, ReorderBytesInPlace, testing::ValuesIn(sameSize<u8>()), kKernelName);
INSTANTIATE_TEST_SUITE_P(SameSize, ReorderFloatsInPlace, testing::ValuesIn(sameSize<float>()), kKernelName);

TEST(ReorderExamples, Bytes) {
  const u8 bgra[] = {10, 20, 30, 40};
  u8 out[4];
  armBGR2RGBImage<u8, 4, u8, 4>(1, 1, 4, bgra, 4, out);
  EXPECT_EQ(std::vector<u8>(out, out + 4), (std::vector<u8>{30, 20, 10, 40}));
  armBGR2RGBImage<u8, 3, u8, 4>(1, 1, 3, bgra, 4, out);
  EXPECT_EQ(std::vector<u8>(out, out + 4), (std::vector<u8>{30, 20, 10, 255}));
}

TEST(ReorderExamples, Floats) {
  const float bgr[] = {10, 20, 30};
  float out[4];
  armBGR2RGBImage<float, 3, float, 4>(1, 1, 3, bgr, 4, out);
  EXPECT_EQ(std::vector<float>(out, out + 4), (std::vector<float>{30, 20, 10, 1}));
}

// A signalling NaN, and NaNs that differ in their payload, keep every bit.
TEST(ReorderExamples, NanPayloads) {
  std::vector<uint32_t> bits(64 * 4);
  for (uint32_t i = 0; i < bits.size(); ++i) {
    bits[i] = (i % 2 == 0 ? 0x7f800001u : 0xffc00000u) + (i << 4);
  }
  std::vector<float> in(bits.size()), out(bits.size());
  memcpy(in.data(), bits.data(), bits.size() * 4);
  for (const int width : {1, 63, 64}) {
    armBGR2RGBImage<float, 4, float, 4>(1, width, width * 4, in.data(), width * 4, out.data());
    for (int i = 0; i < width * 4; ++i) {
      uint32_t got;
      memcpy(&got, &out[i], 4);
      ASSERT_EQ(got, bits[i % 4 == 3 ? i : i / 4 * 4 + 2 - i % 4]) << i;
    }
  }
}

}  // namespace
