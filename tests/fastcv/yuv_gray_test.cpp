// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// The luma plane of a 4:2:0 buffer as a gray image.

#include <gtest/gtest.h>

#include <algorithm>
#include <vector>

#include "fastcv/kernels.h"
#include "tests/support/assertion_report.h"
#include "tests/support/guarded_image.h"

namespace {

using kyface::test::assertionReport;
using kyface::test::ByteSource;
using kyface::test::GuardedImage;
using kyface::test::somethingWritten;

using u8 = unsigned char;
constexpr auto kKernel = HPC::fastcv::armYUV2GRAYImage<u8, 1, u8, 1>;

// The source ends with its last luma byte, at a protected page: chroma is not read.
void check(int height, int width, int inPad, int outPad) {
  const int rows = std::max(height, 0);
  const int row = std::max(width, 0);
  GuardedImage<u8> in(rows, row, row + inPad);
  in.fill(ByteSource(static_cast<unsigned>(height * 1000 + width)));
  GuardedImage<u8> out(rows, row, row + outPad);
  kKernel(height, width, in.stride(), in.data(), out.stride(), out.data());
  ASSERT_TRUE(out.holds(in.contents())) << width << " x " << height;
}

TEST(YuvGray, EveryWidthAndHeight) {
  for (int width = 1; width <= 70; ++width) {
    for (const int height : {-1, 1, 2, 3, 4, 5, 6}) {
      check(height, width, 0, 0);
      check(height, width, 3, 9);
      check(height, width, 9, 0);
    }
  }
}

TEST(YuvGray, LargeSizes) {
  check(481, 640, 0, 0);
  check(65, 1279, 1, 65);
}

TEST(YuvGray, NegativeSizes) {
  check(3, -1, 8, 8);
  check(-3, -1, 8, 8);
  check(-2, 8, 0, 0);
}

class YuvGrayDeath : public testing::Test {
 protected:
  YuvGrayDeath() {
    somethingWritten = [this] { return out_ != std::vector<u8>(out_.size(), 77); };
  }
  ~YuvGrayDeath() override {
    somethingWritten = [] { return false; };
  }

  void expect(const char* expression, int height, int width, int inStride, bool in, int outStride, bool out) {
    EXPECT_DEATH(
        kKernel(height, width, inStride, in ? in_.data() : nullptr, outStride, out ? out_.data() : nullptr),
        assertionReport("fastcv/src/arm/YUV_GRAY_arm", "armYUV2GRAYImage", expression));
  }

 private:
  std::vector<u8> in_ = std::vector<u8>(64, 50);
  std::vector<u8> out_ = std::vector<u8>(64, 77);
};

constexpr char kNonZero[] = "height != 0 && width != 0 && inWidthStride != 0 && outWidthStride != 0";

TEST_F(YuvGrayDeath, Pointers) {
  expect("inData != NULL", 4, 4, 8, false, 8, true);
  expect("outData != NULL", 4, 4, 8, true, 8, false);
}

TEST_F(YuvGrayDeath, Zeroes) {
  expect(kNonZero, 0, 4, 8, true, 8, true);
  expect(kNonZero, 4, 0, 8, true, 8, true);
  expect(kNonZero, 4, 4, 0, true, 8, true);
  expect(kNonZero, 4, 4, 8, true, 0, true);
}

TEST_F(YuvGrayDeath, Order) {
  expect("inData != NULL", 0, 0, 0, false, 0, false);
  expect("outData != NULL", 0, 0, 0, true, 0, false);
}

}  // namespace
