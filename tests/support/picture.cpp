// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

#include "picture.h"

#include <algorithm>
#include <cmath>
#include <cstdlib>

#include "engine/ky_engine.h"

namespace kyengine::test {
namespace {

constexpr uint8_t kOutside = 128;

uint8_t ToByte(double value) { return static_cast<uint8_t>(std::lround(std::clamp(value, 0.0, 255.0))); }

/// The turn and scale of a view, as a complex number.
struct Turn {
  double c;
  double s;
  Turn(double zoom, double degrees)
      : c(zoom * std::cos(degrees * M_PI / 180)), s(zoom * std::sin(degrees * M_PI / 180)) {}
};

}  // namespace

const Picture& Portrait() {
  static const Picture portrait = [] {
    Picture picture(512, 512);
    const std::string_view file = PortraitFile();
    const std::string_view header = "P6\n512 512\n255\n";
    if (!file.starts_with(header) || file.size() != header.size() + picture.rgb.size()) {
      std::abort();
    }
    std::copy(file.begin() + header.size(), file.end(), picture.rgb.begin());
    return picture;
  }();
  return portrait;
}

Picture Part(const Picture& picture, int left, int top, int width, int height) {
  Picture part(width, height, kOutside);
  for (int y = std::max(0, -top); y < height && top + y < picture.height; ++y) {
    for (int x = std::max(0, -left); x < width && left + x < picture.width; ++x) {
      std::copy_n(picture.at(left + x, top + y), 3, part.at(x, y));
    }
  }
  return part;
}

ky_pointf_t InView(double px, double py, double x, double y, double zoom, double degrees, int size) {
  const Turn turn(zoom, degrees);
  const double dx = px - x;
  const double dy = py - y;
  const double middle = (size - 1) / 2.0;
  return {static_cast<float>(middle + turn.c * dx - turn.s * dy),
          static_cast<float>(middle + turn.s * dx + turn.c * dy)};
}

Picture View(const Picture& picture, double x, double y, double zoom, double degrees, int size) {
  const Turn back(1 / zoom, -degrees);
  const double middle = (size - 1) / 2.0;
  Picture view(size, size, kOutside);
  for (int v = 0; v < size; ++v) {
    for (int u = 0; u < size; ++u) {
      const double px = x + back.c * (u - middle) - back.s * (v - middle);
      const double py = y + back.s * (u - middle) + back.c * (v - middle);
      const int left = static_cast<int>(std::floor(px));
      const int top = static_cast<int>(std::floor(py));
      if (left < 0 || top < 0 || left + 1 >= picture.width || top + 1 >= picture.height) {
        continue;
      }
      const double fx = px - left;
      const double fy = py - top;
      for (int c = 0; c < 3; ++c) {
        view.at(u, v)[c] =
            ToByte((picture.at(left, top)[c] * (1 - fx) + picture.at(left + 1, top)[c] * fx) * (1 - fy) +
                   (picture.at(left, top + 1)[c] * (1 - fx) + picture.at(left + 1, top + 1)[c] * fx) * fy);
      }
    }
  }
  return view;
}

Picture Turned(const Picture& picture, int orientation) {
  Picture turned = picture;
  for (int turns = 0; turns < orientation / 90; ++turns) {
    Picture next(turned.height, turned.width);
    for (int y = 0; y < next.height; ++y) {
      for (int x = 0; x < next.width; ++x) {
        std::copy_n(turned.at(turned.width - 1 - y, x), 3, next.at(x, y));
      }
    }
    turned = next;
  }
  return turned;
}

ky_rect_t Turned(const ky_rect_t& upright, int width, int height, int orientation) {
  ky_rect_t r = upright;
  for (int turns = 0; turns < orientation / 90; ++turns) {
    r = {r.top, width - r.right, r.bottom, width - r.left};
    std::swap(width, height);
  }
  return r;
}

int RowBytes(int pixel_format, int width) {
  switch (pixel_format) {
    case KY_PIXEL_BGR:
    case KY_PIXEL_RGB:
      return width * 3;
    case KY_PIXEL_BGRA:
    case KY_PIXEL_RGBA:
      return width * 4;
    default:
      return width;
  }
}

int Rows(int pixel_format, int height) {
  return pixel_format == KY_PIXEL_NV21 || pixel_format == KY_PIXEL_NV12 ? height * 3 / 2 : height;
}

std::vector<uint8_t> Encode(const Picture& picture, int pixel_format, int stride, uint8_t padding) {
  const int rows = Rows(pixel_format, picture.height);
  const int row_bytes = RowBytes(pixel_format, picture.width);
  std::vector<uint8_t> bytes(
      static_cast<size_t>(rows - 1) * static_cast<size_t>(stride) + static_cast<size_t>(row_bytes), padding);
  const auto at = [&](int row, int byte) -> uint8_t& {
    return bytes[static_cast<size_t>(row) * static_cast<size_t>(stride) + static_cast<size_t>(byte)];
  };
  for (int y = 0; y < picture.height; ++y) {
    for (int x = 0; x < picture.width; ++x) {
      const uint8_t* const p = picture.at(x, y);
      const double r = p[0];
      const double g = p[1];
      const double b = p[2];
      switch (pixel_format) {
        case KY_PIXEL_GRAY:
          at(y, x) = ToByte(0.299 * r + 0.587 * g + 0.114 * b);
          break;
        case KY_PIXEL_BGR:
        case KY_PIXEL_BGRA:
        case KY_PIXEL_RGB:
        case KY_PIXEL_RGBA: {
          const bool blue_first = pixel_format == KY_PIXEL_BGR || pixel_format == KY_PIXEL_BGRA;
          const int bytes_per_pixel = row_bytes / picture.width;
          for (int c = 0; c < 3; ++c) {
            at(y, x * bytes_per_pixel + c) = p[blue_first ? 2 - c : c];
          }
          if (bytes_per_pixel == 4) {
            at(y, x * 4 + 3) = static_cast<uint8_t>(x * 7 + y * 13);  // alpha is nobody's business
          }
          break;
        }
        default: {
          // BT.601 in studio range.
          at(y, x) = ToByte(16 + (65.481 * r + 128.553 * g + 24.966 * b) / 255);
          const uint8_t cb = ToByte(128 + (-37.797 * r - 74.203 * g + 112 * b) / 255);
          const uint8_t cr = ToByte(128 + (112 * r - 93.786 * g - 18.214 * b) / 255);
          const bool v_first = pixel_format == KY_PIXEL_NV21;
          at(picture.height + y / 2, x / 2 * 2) = v_first ? cr : cb;
          at(picture.height + y / 2, x / 2 * 2 + 1) = v_first ? cb : cr;
          break;
        }
      }
    }
  }
  return bytes;
}

double Overlap(const ky_rect_t& a, const ky_rect_t& b) {
  const auto area = [](double width, double height) { return std::max(0.0, width) * std::max(0.0, height); };
  const double both = area(std::min(a.right, b.right) - std::max(a.left, b.left),
                           std::min(a.bottom, b.bottom) - std::max(a.top, b.top));
  const double all =
      area(a.right - a.left, a.bottom - a.top) + area(b.right - b.left, b.bottom - b.top) - both;
  return all > 0 ? both / all : 0;
}

}  // namespace kyengine::test
