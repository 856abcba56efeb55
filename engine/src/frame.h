// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// A frame of the caller's as the C interface receives it, and its upright gray picture.
#pragma once

// clang-format off
#include "dlib_config.h"
// clang-format on

#include <dlib/array2d.h>
#include <dlib/geometry.h>

#include <cstdint>

#include "c_interface.h"

namespace kyengine {

using GrayImage = dlib::array2d<unsigned char>;

/// A checked view of the caller's pixels. It maps coordinates of the upright picture, which the engine works
/// in, to those of the frame, which the caller sees.
class Frame {
 public:
  /// Throws Failure when an argument is out of its range; reads no pixels.
  Frame(const unsigned char* image, int pixelFormat, int width, int height, int stride, int orientation);

  /// Writes the luma of the frame, turned upright, into `gray`. The 4:2:0 formats carry it; of colours it is
  /// 0.299 R + 0.587 G + 0.114 B.
  void toUprightGray(GrayImage& gray) const;

  /// Writes the colours of a rectangle of the frame as it was handed over, which lies within it, into `rgb`:
  /// packed rows of red, green and blue. Gray has three equal colours; the 4:2:0 formats are full range, as
  /// cameras and JFIF have them (R = Y + 1.402 V, G = Y - 0.344 U - 0.714 V, B = Y + 1.772 U).
  void toRgb(int left, int top, int width, int height, uint8_t* rgb) const;

  int width() const { return width_; }
  int height() const { return height_; }

  /// Size of the upright picture.
  int uprightWidth() const { return quarterTurned() ? height_ : width_; }
  int uprightHeight() const { return quarterTurned() ? width_ : height_; }

  /// The frame's rectangle that covers the pixels of `upright`, cut to the frame. A rectangle outside the
  /// frame comes back empty, on its border.
  ky_rect_t toFrame(const dlib::drectangle& upright) const;

  /// The frame's point that shows `upright`.
  ky_pointf_t toFrame(const dlib::dpoint& upright) const;

 private:
  bool quarterTurned() const { return orientation_ == 90 || orientation_ == 270; }

  template <typename Luma>
  void turn(int bytesPerPixel, Luma luma, GrayImage& gray) const;

  const unsigned char* image_;
  int format_;
  int width_;
  int height_;
  int stride_;
  int orientation_;
};

}  // namespace kyengine
