// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// Rotation of images whose pixels are `bytes` bytes of no type: what the rotation workers and the 4:2:0
/// rotations share.
#pragma once

#include <cstddef>

#include "i420.h"

namespace HPC::fastcv::arm {

/// An image to read; `stride` in bytes.
struct SourceImage {
  const unsigned char* data;
  ptrdiff_t stride;
  ptrdiff_t height;
  ptrdiff_t width;
};

/// An image to write.
struct TargetImage {
  Rows<unsigned char> rows;
  ptrdiff_t height;
  ptrdiff_t width;
};

/// How failed assertions of the rotations name their source.
inline constexpr char kRotatePath[] = "fastcv/src/arm/rotate_arm";

/// The luma height of a 4:2:0 buffer, formed in 32 bits that wrap, as the sizes themselves are.
inline int lumaHeightOf(int bufferHeight) {
  return static_cast<int>(static_cast<unsigned>(bufferHeight) * 2u) / 3;
}

/// Side of the blocks in which a quarter turn is done, so that what it touches stays in the cache.
inline constexpr int kRotateBlock = 64;

/// Rotates clockwise by 90, 180 or 270 degrees; by any other angle nothing is done. Every pixel of `out` is
/// written, and nothing else; the size of `in` only says which pixel goes where. Instances: the pixel
/// sizes of the rotation workers.
template <int bytes, int blockHeight, int blockWidth>
void rotatePixels(int degree, const SourceImage& in, const TargetImage& out);

}  // namespace HPC::fastcv::arm
