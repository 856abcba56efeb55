#include "planes.h"

#include <algorithm>
#include <cstdint>

namespace kyface {
namespace {

/// How long rows and pixels of a layout are.
struct LayoutSize {
  int pixel_bytes;
  bool semi_planar;
};

/// The size of a layout; no bytes for what is none.
LayoutSize size_of(PixelLayout layout) {
  switch (layout) {
    case PixelLayout::kRgba:
    case PixelLayout::kBgra:
      return {4, false};
    case PixelLayout::kRgb:
    case PixelLayout::kBgr:
      return {3, false};
    case PixelLayout::kNv21:
    case PixelLayout::kNv12:
      return {1, true};
    case PixelLayout::kGray:
      return {1, false};
  }
  return {0, false};
}

bool turns_sideways(const Orientation& orientation) {
  return orientation.degrees == 90 || orientation.degrees == 270;
}

/// Whether `rows` rows of `row_bytes` bytes, `stride` apart, are in the memory that `data` and `size` say.
bool holds(const void* data, std::int64_t size, std::int64_t stride, std::int64_t rows,
           std::int64_t row_bytes) {
  return data != nullptr && stride >= row_bytes && size >= row_bytes &&
         (rows == 1 || stride <= (size - row_bytes) / (rows - 1));
}

bool holds(const Plane& plane, int width, int height) {
  return plane.pixel_stride >= 1 && holds(plane.data, plane.size, plane.row_stride, height,
                                          (std::int64_t{width} - 1) * plane.pixel_stride + 1);
}

bool is_inside(const Rectangle& part, int width, int height) {
  return part.width > 0 && part.height > 0 && part.left >= 0 && part.top >= 0 &&
         part.left <= width - part.width && part.top <= height - part.height;
}

/// Bytes from the first to behind the last.
std::int64_t extent(std::int64_t stride, std::int64_t rows, std::int64_t row_bytes) {
  return (rows - 1) * stride + row_bytes;
}

struct Range {
  std::uintptr_t begin;
  std::uintptr_t end;
};

Range range_of(const void* data, std::int64_t bytes) {
  const auto begin = reinterpret_cast<std::uintptr_t>(data);
  return {begin, begin + static_cast<std::uintptr_t>(bytes)};
}

Range range_of(const Plane& plane, int width, int height) {
  return range_of(plane.data,
                  extent(plane.row_stride, height, (std::int64_t{width} - 1) * plane.pixel_stride + 1));
}

bool overlap(const Range& a, const Range& b) { return a.begin < b.end && b.begin < a.end; }

PlanesStatus check(const PlanarPicture& picture, const Rectangle& part, const Orientation& orientation,
                   const Target& target) {
  const int width = picture.width;
  const int height = picture.height;
  if (width < 1 || height < 1 || width % 2 != 0 || height % 2 != 0) {
    return PlanesStatus::kPicture;
  }
  if (picture.y.pixel_stride != 1 || !holds(picture.y, width, height)) {
    return PlanesStatus::kLuma;
  }
  if (!holds(picture.u, width / 2, height / 2) || !holds(picture.v, width / 2, height / 2)) {
    return PlanesStatus::kChroma;
  }
  if (!is_inside(part, width, height)) {
    return PlanesStatus::kRectangle;
  }
  if (orientation.degrees != 0 && orientation.degrees != 180 && !turns_sideways(orientation)) {
    return PlanesStatus::kOrientation;
  }
  const LayoutSize layout = size_of(target.layout);
  if (layout.pixel_bytes == 0) {
    return PlanesStatus::kLayout;
  }
  const Size size = size_of_view(part, orientation);
  const std::int64_t row_bytes = std::int64_t{size.width} * layout.pixel_bytes;
  const std::int64_t rows = layout.semi_planar ? std::int64_t{size.height} * 3 / 2 : size.height;
  if (!holds(target.data, target.size, target.stride, rows, row_bytes)) {
    return PlanesStatus::kTarget;
  }
  const Range written = range_of(target.data, extent(target.stride, rows, row_bytes));
  if (overlap(written, range_of(picture.y, width, height)) ||
      overlap(written, range_of(picture.u, width / 2, height / 2)) ||
      overlap(written, range_of(picture.v, width / 2, height / 2))) {
    return PlanesStatus::kOverlap;
  }
  return PlanesStatus::kSuccess;
}

/// Where pixel (0, 0) of the result comes from, and how far its neighbours to the right and below come from
/// there, in columns and rows of a grid of `width` by `height`.
struct Walk {
  int column;
  int row;
  int column_right;
  int row_right;
  int column_down;
  int row_down;
};

Walk walk_of(int width, int height, const Orientation& orientation) {
  const bool mirrored = orientation.mirrored;
  switch (orientation.degrees) {
    case 90:
      return {0, mirrored ? 0 : height - 1, 0, mirrored ? 1 : -1, 1, 0};
    case 180:
      return {mirrored ? 0 : width - 1, height - 1, mirrored ? 1 : -1, 0, 0, -1};
    case 270:
      return {width - 1, mirrored ? height - 1 : 0, 0, mirrored ? -1 : 1, -1, 0};
    default:
      return {mirrored ? width - 1 : 0, 0, mirrored ? -1 : 1, 0, 0, 1};
  }
}

unsigned char sample(const Plane& plane, std::int64_t column, std::int64_t row) {
  return plane.data[row * plane.row_stride + column * plane.pixel_stride];
}

unsigned char clamped(int value) { return static_cast<unsigned char>(std::clamp(value, 0, 255)); }

}  // namespace

Rectangle whole_pairs(const Rectangle& part) {
  // Any numbers may come, so the sums are to wrap.
  const auto side = [](int start, int length) {
    const auto from = static_cast<std::uint32_t>(start);
    return static_cast<int>(((from + static_cast<std::uint32_t>(length) + 1) & ~1U) - (from & ~1U));
  };
  return {part.left & ~1, part.top & ~1, side(part.left, part.width), side(part.top, part.height)};
}

Size size_of_view(const Rectangle& part, const Orientation& orientation) {
  const Rectangle whole = whole_pairs(part);
  return turns_sideways(orientation) ? Size{whole.height, whole.width} : Size{whole.width, whole.height};
}

PlanesStatus convert_planes(const PlanarPicture& picture, const Rectangle& part,
                            const Orientation& orientation, const Target& target) {
  const PlanesStatus status = check(picture, part, orientation, target);
  if (status != PlanesStatus::kSuccess) {
    return status;
  }
  const Rectangle whole = whole_pairs(part);
  const auto [width, height] = size_of_view(part, orientation);
  const LayoutSize layout = size_of(target.layout);
  const bool luma_only = layout.pixel_bytes == 1;
  const bool blue_first = target.layout == PixelLayout::kBgra || target.layout == PixelLayout::kBgr;
  const Walk walk = walk_of(whole.width, whole.height, orientation);
  for (int y = 0; y < height; ++y) {
    for (int x = 0; x < width; ++x) {
      const int column = whole.left + walk.column + x * walk.column_right + y * walk.column_down;
      const int row = whole.top + walk.row + x * walk.row_right + y * walk.row_down;
      const unsigned char luma = sample(picture.y, column, row);
      unsigned char* const out = target.data + y * target.stride + std::int64_t{x} * layout.pixel_bytes;
      if (luma_only) {
        out[0] = luma;
      } else {
        const int u = sample(picture.u, column / 2, row / 2) - 128;
        const int v = sample(picture.v, column / 2, row / 2) - 128;
        out[blue_first ? 0 : 2] = clamped((64 * luma + 110 * u + 32) >> 6);
        out[1] = clamped((64 * luma - 24 * u - 44 * v + 32) >> 6);
        out[blue_first ? 2 : 0] = clamped((64 * luma + 86 * v + 32) >> 6);
        if (layout.pixel_bytes == 4) {
          out[3] = 255;
        }
      }
    }
  }
  if (layout.semi_planar) {
    const Walk pairs = walk_of(whole.width / 2, whole.height / 2, orientation);
    const bool v_first = target.layout == PixelLayout::kNv21;
    for (int y = 0; y < height / 2; ++y) {
      for (int x = 0; x < width / 2; ++x) {
        const int column = whole.left / 2 + pairs.column + x * pairs.column_right + y * pairs.column_down;
        const int row = whole.top / 2 + pairs.row + x * pairs.row_right + y * pairs.row_down;
        unsigned char* const out = target.data + (std::int64_t{height} + y) * target.stride + 2 * x;
        out[v_first ? 0 : 1] = sample(picture.v, column, row);
        out[v_first ? 1 : 0] = sample(picture.u, column, row);
      }
    }
  }
  return PlanesStatus::kSuccess;
}

}  // namespace kyface
