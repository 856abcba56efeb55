// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

#include "frame/planes.h"

#include <algorithm>
#include <cstdint>

#include "plane_kernels.h"
#include "simd/nv_decode.h"

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

/// A rectangle with even edges, and where it goes; everything has been checked.
struct Job {
  PlanarPicture picture;
  Rectangle part;
  Orientation orientation;
  PixelLayout layout;
  std::int64_t stride;    ///< of the result
  unsigned char* pixels;  ///< the result's, or its luma
  unsigned char* pairs;   ///< the result's chroma

  Size size() const { return size_of_view(part, orientation); }
  int pixel_bytes() const { return size_of(layout).pixel_bytes; }
  bool semi_planar() const { return size_of(layout).semi_planar; }
  bool red_first() const { return layout == PixelLayout::kRgba || layout == PixelLayout::kRgb; }
  bool v_first() const { return layout == PixelLayout::kNv21; }
};

// ---- small pictures

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

template <int nc, bool rgb>
void store_colour(unsigned char luma, unsigned char u, unsigned char v, unsigned char* out) {
  HPC::fastcv::arm::DecodedSample<nc, rgb>(u, v).store(luma, out);
}

/// Pixel by pixel.
void convert_small(const Job& job) {
  const auto& [picture, part, orientation, layout, stride, pixels, pairs] = job;
  const auto [width, height] = job.size();
  const int bytes = job.pixel_bytes();
  auto* const store = bytes == 4 ? (job.red_first() ? store_colour<4, true> : store_colour<4, false>)
                                 : (job.red_first() ? store_colour<3, true> : store_colour<3, false>);
  const Walk walk = walk_of(part.width, part.height, orientation);
  for (int y = 0; y < height; ++y) {
    for (int x = 0; x < width; ++x) {
      const int column = part.left + walk.column + x * walk.column_right + y * walk.column_down;
      const int row = part.top + walk.row + x * walk.row_right + y * walk.row_down;
      const unsigned char luma = sample(picture.y, column, row);
      unsigned char* const out = pixels + y * stride + std::int64_t{x} * bytes;
      if (bytes == 1) {
        *out = luma;
      } else {
        store(luma, sample(picture.u, column / 2, row / 2), sample(picture.v, column / 2, row / 2), out);
      }
    }
  }
  if (!job.semi_planar()) {
    return;
  }
  const Walk chroma = walk_of(part.width / 2, part.height / 2, orientation);
  for (int y = 0; y < height / 2; ++y) {
    for (int x = 0; x < width / 2; ++x) {
      const int column = part.left / 2 + chroma.column + x * chroma.column_right + y * chroma.column_down;
      const int row = part.top / 2 + chroma.row + x * chroma.row_right + y * chroma.row_down;
      unsigned char* const out = pairs + y * stride + std::int64_t{x} * 2;
      out[job.v_first() ? 0 : 1] = sample(picture.v, column, row);
      out[job.v_first() ? 1 : 0] = sample(picture.u, column, row);
    }
  }
}

// ---- by the kernels

/// Whether U and V are views of the same pairs.
bool are_pairs(const Plane& u, const Plane& v) {
  const auto distance = reinterpret_cast<std::intptr_t>(u.data) - reinterpret_cast<std::intptr_t>(v.data);
  return u.pixel_stride == 2 && v.pixel_stride == 2 && u.row_stride == v.row_stride &&
         (distance == 1 || distance == -1);
}

/// Whether the kernels can read the chroma where it is.
bool is_direct(const PlanarPicture& picture) {
  return are_pairs(picture.u, picture.v) || (picture.u.pixel_stride == 1 && picture.v.pixel_stride == 1);
}

/// The first row of `rows` rows and the step to the next, from the last row up where `flipped`.
template <typename Byte>
struct Rows {
  Byte* data;
  std::int64_t stride;
};
template <typename Byte>
Rows<Byte> rows_of(Byte* data, std::int64_t stride, int rows, bool flipped) {
  return flipped ? Rows<Byte>{data + (rows - 1) * stride, -stride} : Rows<Byte>{data, stride};
}

PlanesView view_of(const Job& job, bool flipped) {
  const PlanarPicture& picture = job.picture;
  const Rectangle& part = job.part;
  const auto rows = [&](const Plane& plane, int shift) {
    const unsigned char* const data = plane.data + (part.top >> shift) * plane.row_stride +
                                      std::int64_t{part.left >> shift} * plane.pixel_stride;
    return rows_of(data, plane.row_stride, part.height >> shift, flipped);
  };
  const auto luma = rows(picture.y, 0);
  const auto u = rows(picture.u, 1);
  const auto v = rows(picture.v, 1);
  if (are_pairs(picture.u, picture.v)) {
    const bool first_is_v = v.data < u.data;
    const auto& pairs = first_is_v ? v : u;
    return {part.width,   part.height, luma.data, luma.stride, pairs.data,
            pairs.stride, nullptr,     0,         first_is_v};
  }
  return {part.width, part.height, luma.data, luma.stride, v.data, v.stride, u.data, u.stride, true};
}

void convert_direct(const Job& job) {
  const Orientation& orientation = job.orientation;
  const bool sideways = turns_sideways(orientation);
  // By 180 degrees: the rows from the last, each mirrored. By 90: the rows from the last, then transposed. By
  // 270: transposed, then the rows from the last; mirrored, the source's rows are from the last, too.
  const bool source_flipped =
      sideways ? (orientation.degrees == 90) != orientation.mirrored : orientation.degrees == 180;
  const bool row_mirrored = (orientation.degrees == 180) != orientation.mirrored;
  const bool target_flipped = orientation.degrees == 270;
  const PlanesView view = view_of(job, source_flipped);
  const int height = job.size().height;
  const auto [data, stride] = rows_of(job.pixels, job.stride, height, target_flipped);
  const PixelRows pixels = {data, stride};
  if (job.pixel_bytes() > 1) {
    const ColourOrder order = {job.red_first(), job.pixel_bytes() == 4};
    if (sideways) {
      decode_transposed(view, order, pixels);
    } else {
      decode_rows(view, row_mirrored, order, pixels);
    }
    return;
  }
  if (sideways) {
    transpose_luma(view, pixels);
  } else {
    copy_luma(view, row_mirrored, pixels);
  }
  if (job.semi_planar()) {
    const auto chroma = rows_of(job.pairs, job.stride, height / 2, target_flipped);
    const PixelRows pairs = {chroma.data, chroma.stride};
    if (sideways) {
      transpose_chroma(view, job.v_first(), pairs);
    } else {
      copy_chroma(view, row_mirrored, job.v_first(), pairs);
    }
  }
}

/// Where the rectangle `part` of a picture of `whole` is in the result.
Rectangle place_of(const Rectangle& part, const Size& whole, const Orientation& orientation) {
  const Size turned = size_of_view({0, 0, whole.width, whole.height}, orientation);
  const int right = whole.width - part.left - part.width;
  const int below = whole.height - part.top - part.height;
  Rectangle place = {part.left, part.top, part.width, part.height};
  switch (orientation.degrees) {
    case 90:
      place = {below, part.left, part.height, part.width};
      break;
    case 180:
      place = {right, below, part.width, part.height};
      break;
    case 270:
      place = {part.top, right, part.height, part.width};
      break;
    default:
      break;
  }
  if (orientation.mirrored) {
    place.left = turned.width - place.left - place.width;
  }
  return place;
}

/// Gathers a plane's samples of a block of pixels.
template <int rows, int columns>
Plane gathered(const Plane& plane, const Rectangle& block, unsigned char (&samples)[rows][columns]) {
  for (int row = 0; row < block.height / 2; ++row) {
    const unsigned char* const from = plane.data + (block.top / 2 + row) * plane.row_stride +
                                      std::int64_t{block.left / 2} * plane.pixel_stride;
    for (int column = 0; column < block.width / 2; ++column) {
      samples[row][column] = from[std::int64_t{column} * plane.pixel_stride];
    }
  }
  return {samples[0], sizeof samples, columns, 1};
}

/// With chroma as few cameras deliver it: gathered first, that of a block of pixels at a time. The last
/// blocks of rows and columns reach back over their neighbours.
void convert_gathered(const Job& job) {
  constexpr int kWidth = 128;
  constexpr int kHeight = 32;
  unsigned char u[kHeight / 2][kWidth / 2];
  unsigned char v[kHeight / 2][kWidth / 2];
  const Size whole = {job.part.width, job.part.height};
  const Size block = {std::min(kWidth, whole.width), std::min(kHeight, whole.height)};
  for (int y = 0; y < whole.height; y += block.height) {
    const int top = std::min(y, whole.height - block.height);
    for (int x = 0; x < whole.width; x += block.width) {
      const int left = std::min(x, whole.width - block.width);
      const Rectangle source = {job.part.left + left, job.part.top + top, block.width, block.height};
      const Rectangle place = place_of({left, top, block.width, block.height}, whole, job.orientation);
      Job of_block = job;
      of_block.part = {0, 0, block.width, block.height};
      of_block.picture.y.data += source.top * job.picture.y.row_stride + source.left;
      of_block.picture.u = gathered(job.picture.u, source, u);
      of_block.picture.v = gathered(job.picture.v, source, v);
      of_block.pixels += place.top * job.stride + std::int64_t{place.left} * job.pixel_bytes();
      if (job.semi_planar()) {
        of_block.pairs += place.top / 2 * job.stride + place.left;
      }
      convert_direct(of_block);
    }
  }
}

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
  Job job = {picture, whole_pairs(part), orientation, target.layout, target.stride, target.data, nullptr};
  if (job.semi_planar()) {
    job.pairs = target.data + job.size().height * target.stride;
  }
  if (job.part.width < kKernelSide || (turns_sideways(orientation) && job.part.height < kKernelSide)) {
    convert_small(job);
  } else if (is_direct(picture)) {
    convert_direct(job);
  } else {
    convert_gathered(job);
  }
  return PlanesStatus::kSuccess;
}

}  // namespace kyface
