// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// Pictures for the engine's tests: the portrait, parts and views of it, and the frames that a camera makes
/// of them.
#pragma once

#include <cstdint>
#include <string_view>
#include <vector>

#include "kyface_api/kyface_api.h"

namespace kyengine::test {

/// An RGB picture without padding.
struct Picture {
  int width = 0;
  int height = 0;
  std::vector<uint8_t> rgb;

  Picture(int w, int h, uint8_t value = 0)
      : width(w), height(h), rgb(static_cast<size_t>(w) * static_cast<size_t>(h) * 3, value) {}

  uint8_t* at(int x, int y) {
    return &rgb[(static_cast<size_t>(y) * static_cast<size_t>(width) + static_cast<size_t>(x)) * 3];
  }
  const uint8_t* at(int x, int y) const { return const_cast<Picture*>(this)->at(x, y); }
};

/// The portrait, 512 x 512, and the box about its one face. It is part of the program, which so needs no
/// file.
const Picture& Portrait();
constexpr ky_rect_t kPortraitFace = {179, 83, 266, 170};

/// The portrait's file, a portable pixmap.
std::string_view PortraitFile();

/// The part of `picture` from (left, top) on; what lies outside the picture is gray.
Picture Part(const Picture& picture, int left, int top, int width, int height);

/// A view of `size` pixels square centred at (x, y) of `picture`, `zoom` pixels of the view to one of the
/// picture, rolled clockwise by `degrees`. Sampled bilinearly (shrunk pictures alias a little), gray outside
/// the picture.
Picture View(const Picture& picture, double x, double y, double zoom, double degrees, int size);

/// Where the point (px, py) of the picture is seen in that view.
ky_pointf_t InView(double px, double py, double x, double y, double zoom, double degrees, int size);

/// `picture` turned counter-clockwise by 0, 90, 180 or 270 degrees: the frame that `orientation` makes
/// upright.
Picture Turned(const Picture& picture, int orientation);

/// Where `upright`, a rectangle of a picture of this size, lies in the turned picture.
ky_rect_t Turned(const ky_rect_t& upright, int width, int height, int orientation);

/// Bytes of a row, and rows, of a picture in a pixel format.
int RowBytes(int pixel_format, int width);
int Rows(int pixel_format, int height);

/// The picture in a pixel format. Rows are `stride` bytes apart, the bytes between them hold `padding`, and
/// nothing follows the last row's last pixel.
std::vector<uint8_t> Encode(const Picture& picture, int pixel_format, int stride, uint8_t padding = 0xa5);

/// Intersection over union.
double Overlap(const ky_rect_t& a, const ky_rect_t& b);

}  // namespace kyengine::test
