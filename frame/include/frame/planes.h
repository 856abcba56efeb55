// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// The picture of a camera (YUV_420_888: a luma plane and two chroma planes, with strides) as the picture
/// that an app shows or analyses: any rectangle of it, upright, mirrored, in its pixel format, in one pass.
#pragma once

#include <cstddef>
#include <cstdint>

namespace kyface {

/// A plane in caller memory: its first sample, and how many bytes from there on may be read. The last row may
/// end with its last sample, however long the row stride is.
struct Plane {
  const unsigned char* data = nullptr;
  std::int64_t size = 0;       ///< bytes from `data` on
  std::int64_t rowStride = 0;  ///< bytes from one row to the next; at least a row's samples
  int pixelStride = 1;         ///< bytes from one sample to the next, at least 1
};

/// A picture in three planes; chroma samples belong to 2 x 2 pixels. Planes with the same row stride and a
/// pixel stride of 2 whose addresses are one apart are views of the same chroma pairs and are read once.
struct PlanarPicture {
  int width = 0;   ///< pixels, even
  int height = 0;  ///< pixels, even
  Plane y;         ///< its pixel stride is 1
  Plane u;         ///< `width / 2` by `height / 2` samples
  Plane v;         ///< the same
};

/// A rectangle, in pixels of the picture.
struct Rectangle {
  int left = 0;
  int top = 0;
  int width = 0;
  int height = 0;
};

/// The smallest rectangle of whole chroma samples around `part`: left and top edge move to the even position
/// before, right and bottom edge to the one behind. Sizes that wrap are those of a rectangle inside no
/// picture.
Rectangle wholePairs(const Rectangle& part);

/// How a picture is shown: first turned clockwise, then mirrored left to right.
struct Orientation {
  int degrees = 0;  ///< 0, 90, 180 or 270
  bool mirrored = false;
};

/// A size in pixels.
struct Size {
  int width = 0;
  int height = 0;
};

/// The size of what `convertPlanes` makes of `part`: that of `wholePairs(part)`, with the sides exchanged
/// by 90 and 270 degrees.
Size sizeOfView(const Rectangle& part, const Orientation& orientation);

/// Layouts of a result. A fourth byte is opaque alpha, 255.
enum class PixelLayout : int {
  kRgba = 0,
  kBgra = 1,
  kRgb = 2,
  kBgr = 3,
  kNv21 = 4,  ///< luma rows, then half as many rows of V, U pairs
  kNv12 = 5,  ///< luma rows, then half as many rows of U, V pairs
  kGray = 6,  ///< the luma
};

/// Where a result goes. All rows, those of chroma pairs too, are `stride` bytes apart; the padding between
/// them is not written, and behind the last row there need not be any.
struct Target {
  unsigned char* data = nullptr;
  std::int64_t size = 0;    ///< bytes from `data` on
  std::int64_t stride = 0;  ///< bytes from one row to the next; at least a row's pixels
  PixelLayout layout = PixelLayout::kRgba;
};

/// What `convertPlanes` answers. On anything but success nothing is written.
enum class PlanesStatus : int {
  kSuccess = 0,
  kPicture = 1,      ///< a width or height that is odd or below 1
  kLuma = 2,         ///< the luma plane: no address, a stride that is too short, too few bytes
  kChroma = 3,       ///< the same of a chroma plane
  kRectangle = 4,    ///< empty or not inside the picture
  kOrientation = 5,  ///< an angle other than 0, 90, 180 and 270
  kLayout = 6,       ///< no layout
  kTarget = 7,       ///< no address, a stride that is too short, too few bytes
  kOverlap = 8,      ///< the result would overwrite what it is made of
};

/// Converts the rectangle `wholePairs(part)` of `picture` to pixels of `sizeOfView(part, orientation)`.
/// Colours are, bit for bit, those of the NV21 and NV12 conversions of the image library.
///
/// Takes no memory but some kilobytes of the stack, and keeps no state; threads may call it on distinct
/// targets.
PlanesStatus convertPlanes(const PlanarPicture& picture, const Rectangle& part,
                           const Orientation& orientation, const Target& target);

}  // namespace kyface
