// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// Where the chroma of a planar YUV 4:2:0 frame (I420) lies.
///
/// A frame of H luma rows has one stride for everything. Its chroma rows are half a luma row wide and lie two
/// to a stride row, half a width apart, first those of one plane, from below the luma on, then those of the
/// other. Where H / 2 is odd, the second plane starts in the second half of the stride row in which the first
/// ends. With a stride of the width that is plain contiguous I420.
#pragma once

#include <cstddef>

namespace HPC::fastcv::arm {

/// The rows of an image: row r + 1 begins `afterEven` bytes behind row r where r is even, `afterOdd` where it
/// is odd. Both are the stride of an ordinary image.
template <typename Byte>
struct Rows {
  Byte* data;
  ptrdiff_t afterEven;
  ptrdiff_t afterOdd;

  Byte* at(ptrdiff_t r) const { return data + r / 2 * (afterEven + afterOdd) + r % 2 * afterEven; }
};

/// The chroma planes of a frame. A step says in which half of a stride row, 0 or 1, a plane starts.
template <typename Byte>
struct ChromaPlanes {
  Byte* u;
  Byte* v;
  int uStep;
  int vStep;
};

/// `height` and `width` are those of the luma; `uIdx` is the place of the U plane.
template <int uIdx, typename Byte>
ChromaPlanes<Byte> chromaPlanesOf(Byte* frame, ptrdiff_t height, ptrdiff_t width, ptrdiff_t stride) {
  static_assert(uIdx == 0 || uIdx == 1);
  const int step = height % 4 / 2 != 0 ? 1 : 0;
  Byte* const first = frame + height * stride;
  Byte* const second = first + height / 4 * stride + step * (width / 2);
  return uIdx == 0 ? ChromaPlanes<Byte>{first, second, 0, step} : ChromaPlanes<Byte>{second, first, step, 0};
}

/// Row `j` of a chroma plane.
template <typename Byte>
Byte* chromaRow(Byte* plane, int step, ptrdiff_t j, ptrdiff_t stride, ptrdiff_t width) {
  const ptrdiff_t half = step + j;
  return plane + half / 2 * stride + (half % 2 - step) * (width / 2);
}

/// The rows of a chroma plane.
template <typename Byte>
Rows<Byte> chromaRowsOf(Byte* plane, int step, ptrdiff_t stride, ptrdiff_t width) {
  Byte* const second = chromaRow(plane, step, 1, stride, width);
  return {plane, second - plane, chromaRow(plane, step, 2, stride, width) - second};
}

}  // namespace HPC::fastcv::arm
