// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// The gray image of a YUV 4:2:0 buffer: its luma plane, which every layout has first.

#include <cstddef>

#include "entry.h"
#include "kernel_assert.h"
#include "simd/copy.h"

namespace HPC::fastcv {
namespace {

constexpr char kSource[] = "fastcv/src/arm/YUV_GRAY_arm";

void YUV2Gray(int height, int width, ptrdiff_t srcStride, const unsigned char* src, ptrdiff_t dstStride,
              unsigned char* dst) {
  if (height < 1 || width < 1) {
    return;
  }
  arm::copyRows(height, width, src, srcStride, dst, dstStride);
}

}  // namespace

template <typename Tsrc, int ncSrc, typename Tdst, int ncDst>
void armYUV2GRAYImage(int height, int width, int inWidthStride, const Tsrc* inData, int outWidthStride,
                      Tdst* outData) {
  // The messages are the expressions as written.
  KERNEL_ASSERT(kSource, inData != NULL);   // NOLINT(modernize-use-nullptr)
  KERNEL_ASSERT(kSource, outData != NULL);  // NOLINT(modernize-use-nullptr)
  KERNEL_ASSERT(kSource, height != 0 && width != 0 && inWidthStride != 0 && outWidthStride != 0);
  YUV2Gray(height, width, inWidthStride, inData, outWidthStride, outData);
}

template FASTCV_EXPORTED void armYUV2GRAYImage<unsigned char, 1, unsigned char, 1>(int, int, int,
                                                                                   const unsigned char*, int,
                                                                                   unsigned char*);

}  // namespace HPC::fastcv
