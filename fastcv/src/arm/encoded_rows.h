// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// What all encodings with chroma for 2 x 2 pixels begin with.
#pragma once

#include <cstddef>

#include "simd/pixel.h"

namespace HPC::fastcv::arm {

/// A pair of rows of `nc`-channel pixels, and the luma that is made of them. Halves of a block are `apart`
/// columns apart, where it has halves.
template <int nc>
struct EncodedRows {
  const unsigned char* in[2];
  unsigned char* luma[2];

  EncodedRows(const unsigned char* pixels, ptrdiff_t inStride, unsigned char* out, ptrdiff_t outStride)
      : in{pixels, pixels + inStride}, luma{out, out + outStride} {}

  const unsigned char* pixel(int row, ptrdiff_t x) const { return in[row] + x * nc; }
  Colours colours(int row, ptrdiff_t x, ptrdiff_t apart) const {
    return loadColours<nc>(pixel(row, x), apart);
  }
  void storeLuma(int row, ptrdiff_t x, ptrdiff_t apart, Bytes v) const {
    storeParts(luma[row] + x, apart, v);
  }
};

}  // namespace HPC::fastcv::arm
