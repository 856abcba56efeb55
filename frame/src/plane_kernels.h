// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// The pixel work behind `convertPlanes`. Everything is trusted here, and pictures are not small.
#pragma once

#include <cstddef>

namespace kyface {

/// The smallest width (and, of a picture that is turned, height) that the kernels can do.
inline constexpr int kKernelSide = 32;

/// A rectangle of a picture, with its chroma in pairs or in two planes. Strides are signed: the rows may
/// follow each other upwards.
struct PlanesView {
  int width;   ///< even, at least kKernelSide
  int height;  ///< even; at least kKernelSide where the view is turned
  const unsigned char* luma;
  std::ptrdiff_t lumaStride;
  const unsigned char* first;  ///< the pairs, or the plane of the samples that are called first
  std::ptrdiff_t firstStride;
  const unsigned char* second;  ///< null with pairs
  std::ptrdiff_t secondStride;
  bool firstIsV;  ///< whether the pairs' or planes' first samples are V, not U
};

/// Rows to write; signed as well.
struct PixelRows {
  unsigned char* data;
  std::ptrdiff_t stride;
};

/// How a colour is written.
struct ColourOrder {
  bool redFirst;
  bool alpha;  ///< a fourth byte of 255
};

/// Decodes a view, with its rows as they are or mirrored left to right.
void decodeRows(const PlanesView& view, bool mirrored, ColourOrder order, const PixelRows& out);

/// Decodes a view transposed: its columns become rows.
void decodeTransposed(const PlanesView& view, ColourOrder order, const PixelRows& out);

/// Copies a view's luma.
void copyLuma(const PlanesView& view, bool mirrored, const PixelRows& out);
void transposeLuma(const PlanesView& view, const PixelRows& out);

/// Copies a view's chroma as pairs, V first or U first.
void copyChroma(const PlanesView& view, bool mirrored, bool vFirst, const PixelRows& out);
void transposeChroma(const PlanesView& view, bool vFirst, const PixelRows& out);

}  // namespace kyface
