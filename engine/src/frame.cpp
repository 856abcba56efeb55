// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

#include "frame.h"

#include <algorithm>
#include <cmath>
#include <cstddef>

#include "failure.h"

namespace kyengine {
namespace {

int BytesPerPixel(int pixel_format) {
  switch (pixel_format) {
    case KY_PIXEL_GRAY:
    case KY_PIXEL_NV21:
    case KY_PIXEL_NV12:
      return 1;
    case KY_PIXEL_BGR:
    case KY_PIXEL_RGB:
      return 3;
    case KY_PIXEL_BGRA:
    case KY_PIXEL_RGBA:
      return 4;
    default:
      throw Failure{KY_ERROR_PIXEL_FORMAT};
  }
}

/// 0.299 R + 0.587 G + 0.114 B in 256ths, rounded to nearest.
unsigned char LumaOf(int red, int green, int blue) {
  return static_cast<unsigned char>((77 * red + 150 * green + 29 * blue + 128) >> 8);
}

}  // namespace

Frame::Frame(const unsigned char* image, int pixel_format, int width, int height, int stride, int orientation)
    : image_(image),
      format_(pixel_format),
      width_(width),
      height_(height),
      stride_(stride),
      orientation_(orientation) {
  Require(image != nullptr, KY_ERROR_NULL_POINTER);
  const int bytes_per_pixel = BytesPerPixel(pixel_format);
  const bool chroma_halved = pixel_format == KY_PIXEL_NV21 || pixel_format == KY_PIXEL_NV12;
  const auto side_fits = [chroma_halved](int side) {
    return side >= 1 && side <= KY_MAX_FRAME_SIDE && !(chroma_halved && side % 2 != 0);
  };
  Require(side_fits(width) && side_fits(height), KY_ERROR_SIZE);
  Require(stride >= width * bytes_per_pixel, KY_ERROR_STRIDE);
  Require(orientation == KY_ORIENTATION_0 || orientation == KY_ORIENTATION_90 ||
              orientation == KY_ORIENTATION_180 || orientation == KY_ORIENTATION_270,
          KY_ERROR_ORIENTATION);
}

template <typename Luma>
void Frame::Turn(int bytes_per_pixel, Luma luma, GrayImage& gray) const {
  gray.set_size(upright_height(), upright_width());
  // Where the frame's first pixel goes, and by how much its destination moves with a row and with a column.
  const ptrdiff_t row = gray.nc();
  const ptrdiff_t last_row = (gray.nr() - 1) * row;
  const ptrdiff_t last_column = row - 1;
  ptrdiff_t start = 0;
  ptrdiff_t per_row = 0;
  ptrdiff_t per_column = 0;
  switch (orientation_) {
    case KY_ORIENTATION_90:
      start = last_column, per_row = -1, per_column = row;
      break;
    case KY_ORIENTATION_180:
      start = last_row + last_column, per_row = -row, per_column = -1;
      break;
    case KY_ORIENTATION_270:
      start = last_row, per_row = 1, per_column = -row;
      break;
    default:
      per_row = row, per_column = 1;
      break;
  }

  // Tile by tile, so that a quarter turn meets each cache line of the destination once.
  constexpr int kTile = 64;
  unsigned char* const destination = &gray[0][0];
  for (int top = 0; top < height_; top += kTile) {
    const int bottom = std::min(top + kTile, height_);
    for (int left = 0; left < width_; left += kTile) {
      const int right = std::min(left + kTile, width_);
      for (int y = top; y < bottom; ++y) {
        const unsigned char* const source = image_ + static_cast<size_t>(y) * static_cast<size_t>(stride_);
        const ptrdiff_t line = start + y * per_row;
        for (int x = left; x < right; ++x) {
          destination[line + x * per_column] = luma(source + static_cast<ptrdiff_t>(x) * bytes_per_pixel);
        }
      }
    }
  }
}

void Frame::ToUprightGray(GrayImage& gray) const {
  const int bytes_per_pixel = BytesPerPixel(format_);
  switch (format_) {
    case KY_PIXEL_BGR:
    case KY_PIXEL_BGRA:
      Turn(bytes_per_pixel, [](const unsigned char* p) { return LumaOf(p[2], p[1], p[0]); }, gray);
      break;
    case KY_PIXEL_RGB:
    case KY_PIXEL_RGBA:
      Turn(bytes_per_pixel, [](const unsigned char* p) { return LumaOf(p[0], p[1], p[2]); }, gray);
      break;
    default:
      Turn(bytes_per_pixel, [](const unsigned char* p) { return *p; }, gray);
      break;
  }
}

void Frame::ToRgb(int left, int top, int width, int height, uint8_t* rgb) const {
  const auto convert = [&](auto colours) {
    for (int y = top; y < top + height; ++y) {
      for (int x = left; x < left + width; ++x, rgb += 3) {
        colours(x, y);
      }
    }
  };
  const auto bytes_per_pixel = static_cast<size_t>(BytesPerPixel(format_));
  const auto pixel = [this, bytes_per_pixel](int x, int y) {
    return image_ + static_cast<size_t>(y) * static_cast<size_t>(stride_) +
           static_cast<size_t>(x) * bytes_per_pixel;
  };
  const auto copy = [&](int red, int green, int blue) {
    convert([&](int x, int y) {
      const unsigned char* const p = pixel(x, y);
      rgb[0] = p[red];
      rgb[1] = p[green];
      rgb[2] = p[blue];
    });
  };
  switch (format_) {
    case KY_PIXEL_BGR:
    case KY_PIXEL_BGRA:
      return copy(2, 1, 0);
    case KY_PIXEL_RGB:
    case KY_PIXEL_RGBA:
      return copy(0, 1, 2);
    case KY_PIXEL_NV21:
    case KY_PIXEL_NV12:
      return convert([&](int x, int y) {
        // The rows of chroma follow those of luma.
        const unsigned char* const chroma = pixel(x / 2 * 2, height_ + y / 2);
        const bool v_first = format_ == KY_PIXEL_NV21;
        const int u = chroma[v_first ? 1 : 0] - 128;
        const int v = chroma[v_first ? 0 : 1] - 128;
        const int luma = 256 * *pixel(x, y) + 128;
        const auto byte = [](int scaled) { return static_cast<uint8_t>(std::clamp(scaled >> 8, 0, 255)); };
        rgb[0] = byte(luma + 359 * v);
        rgb[1] = byte(luma - 88 * u - 183 * v);
        rgb[2] = byte(luma + 454 * u);
      });
    default:
      return copy(0, 0, 0);
  }
}

ky_pointf_t Frame::ToFrame(const dlib::dpoint& upright) const {
  const double last_x = width_ - 1;
  const double last_y = height_ - 1;
  dlib::dpoint p = upright;
  switch (orientation_) {
    case KY_ORIENTATION_90:
      p = {upright.y(), last_y - upright.x()};
      break;
    case KY_ORIENTATION_180:
      p = {last_x - upright.x(), last_y - upright.y()};
      break;
    case KY_ORIENTATION_270:
      p = {last_x - upright.y(), upright.x()};
      break;
    default:
      break;
  }
  return {static_cast<float>(p.x()), static_cast<float>(p.y())};
}

ky_rect_t Frame::ToFrame(const dlib::drectangle& upright) const {
  // dlib's rectangles hold their last row and column.
  const ky_pointf_t a = ToFrame(upright.tl_corner());
  const ky_pointf_t b = ToFrame(upright.br_corner());
  const auto edge = [](float coordinate, int last) {
    return static_cast<int>(std::lround(std::clamp(coordinate, 0.0F, static_cast<float>(last))));
  };
  return {edge(std::min(a.x, b.x), width_), edge(std::min(a.y, b.y), height_),
          edge(std::max(a.x, b.x) + 1, width_), edge(std::max(a.y, b.y) + 1, height_)};
}

}  // namespace kyengine
