// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// Copies of rows of bytes.
#pragma once

#include <cstddef>
#include <cstring>

#include "simd/overlap.h"
#include "simd/shuffle.h"
#include "simd/vector.h"

namespace HPC::fastcv::arm {

inline constexpr ptrdiff_t kCopyBlock = 64;

/// Copies kCopyBlock bytes. Of single registers, which the compiler loads and stores in pairs: two pairs take
/// in-order cores less time than four registers at once.
inline void copyBlock(const unsigned char* src, unsigned char* dst) {
  const auto v0 = loadAs<Part>(src);
  const auto v1 = loadAs<Part>(src + 16);
  const auto v2 = loadAs<Part>(src + 32);
  const auto v3 = loadAs<Part>(src + 48);
  storeAs(dst, v0);
  storeAs(dst + 16, v1);
  storeAs(dst + 32, v2);
  storeAs(dst + 48, v3);
}

/// Whether a loop of its own pays: on Arm the rows of a picture are too short for what a call of `memcpy`
/// decides first. Elsewhere that call has registers of twice the size.
#if defined(__ARM_NEON)
inline constexpr bool kOwnCopyPays = true;
#else
inline constexpr bool kOwnCopyPays = false;
#endif

/// Copies `size` bytes; where the two places overlap, they arrive as they were.
inline void copyRow(const unsigned char* src, unsigned char* dst, ptrdiff_t size) {
  if (!kOwnCopyPays || size < kCopyBlock || !areApart(src, size, dst, size)) {
    memmove(dst, src, static_cast<size_t>(size));
    return;
  }
  const unsigned char* const lastSrc = src + size - kCopyBlock;
  unsigned char* const lastDst = dst + size - kCopyBlock;
  constexpr ptrdiff_t kTurn = 2 * kCopyBlock;
  for (ptrdiff_t n = size / kTurn; n != 0; --n) {
    copyBlock(src, dst);
    copyBlock(src + kCopyBlock, dst + kCopyBlock);
    src += kTurn;
    dst += kTurn;
  }
  if (size % kTurn > kCopyBlock) {
    copyBlock(src, dst);
  }
  if (size % kTurn != 0) {
    // Flush with the end, overlapping the block before.
    copyBlock(lastSrc, lastDst);
  }
}

/// Copies `height` rows of `size` bytes as they are, also over themselves; all at once where nothing lies
/// between them. Strides in bytes.
inline void copyRows(ptrdiff_t height, ptrdiff_t size, const unsigned char* src, ptrdiff_t srcStride,
                     unsigned char* dst, ptrdiff_t dstStride) {
  if (srcStride == size && dstStride == size) {
    size *= height;
    height = 1;
  }
  for (ptrdiff_t row = 0; row < height; ++row) {
    copyRow(src + row * srcStride, dst + row * dstStride, size);
  }
}

}  // namespace HPC::fastcv::arm
