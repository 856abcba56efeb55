// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

#include "frame.h"

#include <algorithm>
#include <cmath>
#include <cstddef>

#include "failure.h"

namespace kyengine {
namespace {

int pixelBytes(int pixelFormat) {
  switch (pixelFormat) {
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
unsigned char lumaOf(int red, int green, int blue) {
  return static_cast<unsigned char>((77 * red + 150 * green + 29 * blue + 128) >> 8);
}

}  // namespace

Frame::Frame(const unsigned char* image, int pixelFormat, int width, int height, int stride, int orientation)
    : image_(image),
      format_(pixelFormat),
      width_(width),
      height_(height),
      stride_(stride),
      orientation_(orientation) {
  require(image != nullptr, KY_ERROR_NULL_POINTER);
  const int bytesPerPixel = pixelBytes(pixelFormat);
  const bool chromaHalved = pixelFormat == KY_PIXEL_NV21 || pixelFormat == KY_PIXEL_NV12;
  const auto sideFits = [chromaHalved](int side) {
    return side >= 1 && side <= KY_MAX_FRAME_SIDE && !(chromaHalved && side % 2 != 0);
  };
  require(sideFits(width) && sideFits(height), KY_ERROR_SIZE);
  require(stride >= width * bytesPerPixel, KY_ERROR_STRIDE);
  require(orientation == KY_ORIENTATION_0 || orientation == KY_ORIENTATION_90 ||
              orientation == KY_ORIENTATION_180 || orientation == KY_ORIENTATION_270,
          KY_ERROR_ORIENTATION);
}

template <typename Luma>
void Frame::turn(int bytesPerPixel, Luma luma, GrayImage& gray) const {
  gray.set_size(uprightHeight(), uprightWidth());
  // Where the frame's first pixel goes, and by how much its destination moves with a row and with a column.
  const ptrdiff_t row = gray.nc();
  const ptrdiff_t lastRow = (gray.nr() - 1) * row;
  const ptrdiff_t lastColumn = row - 1;
  ptrdiff_t start = 0;
  ptrdiff_t perRow = 0;
  ptrdiff_t perColumn = 0;
  switch (orientation_) {
    case KY_ORIENTATION_90:
      start = lastColumn, perRow = -1, perColumn = row;
      break;
    case KY_ORIENTATION_180:
      start = lastRow + lastColumn, perRow = -row, perColumn = -1;
      break;
    case KY_ORIENTATION_270:
      start = lastRow, perRow = 1, perColumn = -row;
      break;
    default:
      perRow = row, perColumn = 1;
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
        const ptrdiff_t line = start + y * perRow;
        for (int x = left; x < right; ++x) {
          destination[line + x * perColumn] = luma(source + static_cast<ptrdiff_t>(x) * bytesPerPixel);
        }
      }
    }
  }
}

void Frame::toUprightGray(GrayImage& gray) const {
  const int bytesPerPixel = pixelBytes(format_);
  switch (format_) {
    case KY_PIXEL_BGR:
    case KY_PIXEL_BGRA:
      turn(bytesPerPixel, [](const unsigned char* p) { return lumaOf(p[2], p[1], p[0]); }, gray);
      break;
    case KY_PIXEL_RGB:
    case KY_PIXEL_RGBA:
      turn(bytesPerPixel, [](const unsigned char* p) { return lumaOf(p[0], p[1], p[2]); }, gray);
      break;
    default:
      turn(bytesPerPixel, [](const unsigned char* p) { return *p; }, gray);
      break;
  }
}

void Frame::toRgb(int left, int top, int width, int height, uint8_t* rgb) const {
  const auto convert = [&](auto colours) {
    for (int y = top; y < top + height; ++y) {
      for (int x = left; x < left + width; ++x, rgb += 3) {
        colours(x, y);
      }
    }
  };
  const auto bytesPerPixel = static_cast<size_t>(pixelBytes(format_));
  const auto pixel = [this, bytesPerPixel](int x, int y) {
    return image_ + static_cast<size_t>(y) * static_cast<size_t>(stride_) +
           static_cast<size_t>(x) * bytesPerPixel;
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
        const bool vFirst = format_ == KY_PIXEL_NV21;
        const int u = chroma[vFirst ? 1 : 0] - 128;
        const int v = chroma[vFirst ? 0 : 1] - 128;
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

ky_pointf_t Frame::toFrame(const dlib::dpoint& upright) const {
  const double lastX = width_ - 1;
  const double lastY = height_ - 1;
  dlib::dpoint p = upright;
  switch (orientation_) {
    case KY_ORIENTATION_90:
      p = {upright.y(), lastY - upright.x()};
      break;
    case KY_ORIENTATION_180:
      p = {lastX - upright.x(), lastY - upright.y()};
      break;
    case KY_ORIENTATION_270:
      p = {lastX - upright.y(), upright.x()};
      break;
    default:
      break;
  }
  return {static_cast<float>(p.x()), static_cast<float>(p.y())};
}

ky_rect_t Frame::toFrame(const dlib::drectangle& upright) const {
  // dlib's rectangles hold their last row and column.
  const ky_pointf_t a = toFrame(upright.tl_corner());
  const ky_pointf_t b = toFrame(upright.br_corner());
  const auto edge = [](float coordinate, int last) {
    return static_cast<int>(std::lround(std::clamp(coordinate, 0.0F, static_cast<float>(last))));
  };
  return {edge(std::min(a.x, b.x), width_), edge(std::min(a.y, b.y), height_),
          edge(std::max(a.x, b.x) + 1, width_), edge(std::max(a.y, b.y) + 1, height_)};
}

}  // namespace kyengine
