// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// The kernels of HPC::fastcv: one entry point for each operation, called by the front-ends once their checks
/// have passed.
///
/// Kernels return nothing and trust their arguments, except those that say that they assert. They write only
/// inside the destination's rows (`armLAB2BGRImage` of `unsigned char` excepted), and nothing at all where a
/// size is below what they can work on. All offsets are formed in 64 bits.
#pragma once

#include "fastcv/fastcv.h"

#pragma GCC visibility push(default)

namespace HPC::fastcv {

/// The colour kernels, one for each conversion of FASTCV_CONVERSIONS: `armBGR2NV21Image` is behind
/// CVT_BGR2NV21. Each takes, in this order:
/// - `height`, `width`: size of the picture in pixels; for 4:2:0 buffers `height` is the luma height;
/// - `inWidthStride`, `inData`: source row pitch in elements of `Tsrc` (bytes, or floats), and source pixels;
/// - `outWidthStride`, `outData`: the same of the destination.
///
/// An alpha channel that a kernel creates is 255, or 1.0f for `float`. The kernels work on:
///
/// - Semi-planar 4:2:0, full range (NV_arm.cpp). NV21 has V,U pairs, NV12 U,V pairs; the chroma rows start at
///   height * stride and have the same stride. Only whole 2 x 2 blocks are converted: a last odd row or
///   column is left as it was, and a picture of one row writes nothing.
/// - Planar 4:2:0, limited range (BGR_I420_arm.cpp), and the luma of any Y-first buffer (YUV_GRAY_arm.cpp).
///   These assert: non-null pointers, sizes and strides other than 0, and for the colour kernels even sizes.
///   Chroma rows are packed two to a stride row, U plane first.
/// - Packed images of all sizes. Kernels whose destination has no more channels than the source also work
///   forwards over images that overlap (no row of the destination begins behind that of the source).
/// - Packed images in groups of 8 pixels, each begun below `width` - 3, that do not overlap:
///   `armLAB2BGRImage` of `unsigned char`. Where `width` % 8 is 4 or more, the last group reaches up to 4
///   pixels beyond the row's end: it reads at most 12 bytes of the source there, and writes 12 (3 channels)
///   or 16 (4 channels) of the destination. Padding there loses its contents, the next row is written later;
///   after the last row both buffers must have room.
#define FASTCV_DECLARE_KERNEL(with, name, value, family, instances)                                       \
  template <typename Tsrc, int ncSrc, typename Tdst, int ncDst>                                           \
  void arm##name##Image(int height, int width, int inWidthStride, const Tsrc* inData, int outWidthStride, \
                        Tdst* outData);
FASTCV_CONVERSIONS(FASTCV_DECLARE_KERNEL, )
#undef FASTCV_DECLARE_KERNEL

// ---- geometry

/// Copies the rectangle of `outHeight` by `outWidth` pixels at row `top`, column `left`, each sample
/// multiplied by `ratio` (a plain copy when it is exactly 1). Strides in elements; nothing is checked.
template <typename T, int ncSrc, typename TDst, int ncDst, int nc>
void armImageCrop(int top, int left, int inWidthStride, const T* inData, int outHeight, int outWidth,
                  int outWidthStride, TDst* outData, float ratio);

/// Rotates an image of `nc`-channel pixels clockwise by `degree`, 90, 180 or 270; 1 to 4 channels. Asserts
/// its pointers, its sizes and source stride (not the destination stride) and the angle. Strides in elements;
/// the images do not overlap.
template <typename T, int ncSrc, int ncDst, int nc>
void armRotateNx90degree(int inHeight, int inWidth, int inWidthStride, const T* inData, int outHeight,
                         int outWidth, int outWidthStride, T* outData, int degree);

/// The kernels behind `armRotateNx90degree`. They fill `outHeight` by `outWidth` pixels, each written once;
/// the source sizes enter only the mapping of indices. `blockHeight` and `blockWidth` are the cache blocks,
/// 64 by 64.
template <typename T, int nc, int blockHeight, int blockWidth>
void imgRotate90degree(int inHeight, int inWidth, int inWidthStride, const T* inData, int outHeight,
                       int outWidth, int outWidthStride, T* outData);
template <typename T, int nc, int blockHeight, int blockWidth>
void imgRotate180degree(int inHeight, int inWidth, int inWidthStride, const T* inData, int outHeight,
                        int outWidth, int outWidthStride, T* outData);
template <typename T, int nc, int blockHeight, int blockWidth>
void imgRotate270degree(int inHeight, int inWidth, int inWidthStride, const T* inData, int outHeight,
                        int outWidth, int outWidthStride, T* outData);

/// Rotates a whole 4:2:0 frame. Heights are those of the whole buffers (3/2 of the luma height), strides in
/// bytes. `yuv420_type` is 0 for the semi-planar layouts and 1 for I420; anything else fails an assertion. An
/// angle other than 90, 180 and 270 writes nothing.
template <typename T>
void armRotateNx90degree_YUV420(int inHeight, int inWidth, int inWidthStride, const T* inData, int outHeight,
                                int outWidth, int outWidthStride, T* outData, int degree, int yuv420_type);

/// The kernel for I420 behind `armRotateNx90degree_YUV420`. It takes two scratch chroma planes from the heap;
/// when there is no memory for them, nothing is written.
template <typename T>
void imgRotate_I420(int inHeight, int inWidth, int inWidthStride, const T* inData, int outHeight,
                    int outWidth, int outWidthStride, T* outData, int degree);

}  // namespace HPC::fastcv

#pragma GCC visibility pop
