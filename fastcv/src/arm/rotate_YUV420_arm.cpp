// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// Rotation of whole YUV 4:2:0 frames by right angles: the luma as an image of one-byte pixels; the chroma of
// a semi-planar frame as one of two-byte pixels, of a planar frame plane by plane.

#include <cstdlib>
#include <memory>

#include "entry.h"
#include "i420.h"
#include "kernel_assert.h"
#include "rotate.h"
#include "simd/copy.h"

namespace HPC::fastcv {
namespace {

using arm::Rows;

template <int bytes>
void rotatePlane(int degree, const arm::SourceImage& in, const arm::TargetImage& out) {
  arm::rotatePixels<bytes, arm::kRotateBlock, arm::kRotateBlock>(degree, in, out);
}

struct Free {
  void operator()(unsigned char* memory) const { free(memory); }
};
using Scratch = std::unique_ptr<unsigned char, Free>;

// Copies `height` rows of `width` bytes to `packed`, with nothing between them.
void gather(const Rows<const unsigned char>& rows, ptrdiff_t height, ptrdiff_t width, unsigned char* packed) {
  if (height < 1 || width < 1) {
    return;
  }
  if (rows.afterEven == width && rows.afterOdd == width) {
    width *= height;
    height = 1;
  }
  for (ptrdiff_t r = 0; r < height; ++r) {
    arm::copyRow(rows.at(r), packed + r * width, width);
  }
}

}  // namespace

template <typename T>
void imgRotate_I420(int inHeight, int inWidth, int inWidthStride, const T* inData, int outHeight,
                    int outWidth, int outWidthStride, T* outData, int degree) {
  const int lumaIn = arm::lumaHeightOf(inHeight);
  const int lumaOut = arm::lumaHeightOf(outHeight);
  const int chromaHeight = lumaIn / 2;
  const int chromaWidth = inWidth / 2;
  const size_t size = static_cast<size_t>(static_cast<ptrdiff_t>(inWidth) * chromaHeight / 2);
  const Scratch u(static_cast<unsigned char*>(malloc(size)));
  const Scratch v(static_cast<unsigned char*>(malloc(size)));
  if (u == nullptr || v == nullptr) {
    return;
  }
  const auto in = arm::chromaPlanesOf<0>(inData, lumaIn, inWidth, inWidthStride);
  gather(arm::chromaRowsOf(in.u, in.uStep, inWidthStride, inWidth), chromaHeight, chromaWidth, u.get());
  gather(arm::chromaRowsOf(in.v, in.vStep, inWidthStride, inWidth), chromaHeight, chromaWidth, v.get());
  const ptrdiff_t outStride = outWidthStride;
  const auto out = arm::chromaPlanesOf<0>(outData, lumaOut, outWidth, outStride);
  rotatePlane<1>(degree, {inData, inWidthStride, lumaIn, inWidth},
                 {{outData, outStride, outStride}, lumaOut, outWidth});
  rotatePlane<1>(degree, {u.get(), chromaWidth, chromaHeight, chromaWidth},
                 {arm::chromaRowsOf(out.u, out.uStep, outStride, outWidth), lumaOut / 2, outWidth / 2});
  rotatePlane<1>(degree, {v.get(), chromaWidth, chromaHeight, chromaWidth},
                 {arm::chromaRowsOf(out.v, out.vStep, outStride, outWidth), lumaOut / 2, outWidth / 2});
}

template <typename T>
void armRotateNx90degree_YUV420(int inHeight, int inWidth, int inWidthStride, const T* inData, int outHeight,
                                int outWidth, int outWidthStride, T* outData, int degree, int yuv420_type) {
  KERNEL_ASSERT(arm::kRotatePath, yuv420_type == 0 || yuv420_type == 1);
  if (yuv420_type == 1) {
    imgRotate_I420<T>(inHeight, inWidth, inWidthStride, inData, outHeight, outWidth, outWidthStride, outData,
                      degree);
    return;
  }
  const ptrdiff_t inStride = inWidthStride;
  const ptrdiff_t outStride = outWidthStride;
  const int lumaIn = arm::lumaHeightOf(inHeight);
  const int lumaOut = arm::lumaHeightOf(outHeight);
  rotatePlane<1>(degree, {inData, inStride, lumaIn, inWidth},
                 {{outData, outStride, outStride}, lumaOut, outWidth});
  rotatePlane<2>(degree, {inData + lumaIn * inStride, inStride, lumaIn / 2, inWidth / 2},
                 {{outData + lumaOut * outStride, outStride, outStride}, lumaOut / 2, outWidth / 2});
}

template FASTCV_EXPORTED void imgRotate_I420<unsigned char>(int, int, int, const unsigned char*, int, int,
                                                            int, unsigned char*, int);
template FASTCV_EXPORTED void armRotateNx90degree_YUV420<unsigned char>(int, int, int, const unsigned char*,
                                                                        int, int, int, unsigned char*, int,
                                                                        int);

}  // namespace HPC::fastcv
