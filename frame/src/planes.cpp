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
  int pixelBytes;
  bool semiPlanar;
};

/// The size of a layout; no bytes for what is none.
LayoutSize sizeOf(PixelLayout layout) {
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

bool turnsSideways(const Orientation& orientation) {
  return orientation.degrees == 90 || orientation.degrees == 270;
}

/// Whether `rows` rows of `rowBytes` bytes, `stride` apart, are in the memory that `data` and `size` say.
bool holds(const void* data, std::int64_t size, std::int64_t stride, std::int64_t rows,
           std::int64_t rowBytes) {
  return data != nullptr && stride >= rowBytes && size >= rowBytes &&
         (rows == 1 || stride <= (size - rowBytes) / (rows - 1));
}

bool holds(const Plane& plane, int width, int height) {
  return plane.pixelStride >= 1 && holds(plane.data, plane.size, plane.rowStride, height,
                                         (std::int64_t{width} - 1) * plane.pixelStride + 1);
}

bool isInside(const Rectangle& part, int width, int height) {
  return part.width > 0 && part.height > 0 && part.left >= 0 && part.top >= 0 &&
         part.left <= width - part.width && part.top <= height - part.height;
}

/// Bytes from the first to behind the last.
std::int64_t extent(std::int64_t stride, std::int64_t rows, std::int64_t rowBytes) {
  return (rows - 1) * stride + rowBytes;
}

struct Range {
  std::uintptr_t begin;
  std::uintptr_t end;
};

Range rangeOf(const void* data, std::int64_t bytes) {
  const auto begin = reinterpret_cast<std::uintptr_t>(data);
  return {begin, begin + static_cast<std::uintptr_t>(bytes)};
}

Range rangeOf(const Plane& plane, int width, int height) {
  return rangeOf(plane.data,
                 extent(plane.rowStride, height, (std::int64_t{width} - 1) * plane.pixelStride + 1));
}

bool overlap(const Range& a, const Range& b) { return a.begin < b.end && b.begin < a.end; }

PlanesStatus check(const PlanarPicture& picture, const Rectangle& part, const Orientation& orientation,
                   const Target& target) {
  const int width = picture.width;
  const int height = picture.height;
  if (width < 1 || height < 1 || width % 2 != 0 || height % 2 != 0) {
    return PlanesStatus::kPicture;
  }
  if (picture.y.pixelStride != 1 || !holds(picture.y, width, height)) {
    return PlanesStatus::kLuma;
  }
  if (!holds(picture.u, width / 2, height / 2) || !holds(picture.v, width / 2, height / 2)) {
    return PlanesStatus::kChroma;
  }
  if (!isInside(part, width, height)) {
    return PlanesStatus::kRectangle;
  }
  if (orientation.degrees != 0 && orientation.degrees != 180 && !turnsSideways(orientation)) {
    return PlanesStatus::kOrientation;
  }
  const LayoutSize layout = sizeOf(target.layout);
  if (layout.pixelBytes == 0) {
    return PlanesStatus::kLayout;
  }
  const Size size = sizeOfView(part, orientation);
  const std::int64_t rowBytes = std::int64_t{size.width} * layout.pixelBytes;
  const std::int64_t rows = layout.semiPlanar ? std::int64_t{size.height} * 3 / 2 : size.height;
  if (!holds(target.data, target.size, target.stride, rows, rowBytes)) {
    return PlanesStatus::kTarget;
  }
  const Range written = rangeOf(target.data, extent(target.stride, rows, rowBytes));
  if (overlap(written, rangeOf(picture.y, width, height)) ||
      overlap(written, rangeOf(picture.u, width / 2, height / 2)) ||
      overlap(written, rangeOf(picture.v, width / 2, height / 2))) {
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

  Size size() const { return sizeOfView(part, orientation); }
  int pixelBytes() const { return sizeOf(layout).pixelBytes; }
  bool semiPlanar() const { return sizeOf(layout).semiPlanar; }
  bool redFirst() const { return layout == PixelLayout::kRgba || layout == PixelLayout::kRgb; }
  bool vFirst() const { return layout == PixelLayout::kNv21; }
};

// ---- small pictures

/// Where pixel (0, 0) of the result comes from, and how far its neighbours to the right and below come from
/// there, in columns and rows of a grid of `width` by `height`.
struct Walk {
  int column;
  int row;
  int columnRight;
  int rowRight;
  int columnDown;
  int rowDown;
};

Walk walkOf(int width, int height, const Orientation& orientation) {
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
  return plane.data[row * plane.rowStride + column * plane.pixelStride];
}

template <int nc, bool rgb>
void storeColour(unsigned char luma, unsigned char u, unsigned char v, unsigned char* out) {
  HPC::fastcv::arm::DecodedSample<nc, rgb>(u, v).store(luma, out);
}

/// Pixel by pixel.
void convertSmall(const Job& job) {
  const auto& [picture, part, orientation, layout, stride, pixels, pairs] = job;
  const auto [width, height] = job.size();
  const int bytes = job.pixelBytes();
  auto* const store = bytes == 4 ? (job.redFirst() ? storeColour<4, true> : storeColour<4, false>)
                                 : (job.redFirst() ? storeColour<3, true> : storeColour<3, false>);
  const Walk walk = walkOf(part.width, part.height, orientation);
  for (int y = 0; y < height; ++y) {
    for (int x = 0; x < width; ++x) {
      const int column = part.left + walk.column + x * walk.columnRight + y * walk.columnDown;
      const int row = part.top + walk.row + x * walk.rowRight + y * walk.rowDown;
      const unsigned char luma = sample(picture.y, column, row);
      unsigned char* const out = pixels + y * stride + std::int64_t{x} * bytes;
      if (bytes == 1) {
        *out = luma;
      } else {
        store(luma, sample(picture.u, column / 2, row / 2), sample(picture.v, column / 2, row / 2), out);
      }
    }
  }
  if (!job.semiPlanar()) {
    return;
  }
  const Walk chroma = walkOf(part.width / 2, part.height / 2, orientation);
  for (int y = 0; y < height / 2; ++y) {
    for (int x = 0; x < width / 2; ++x) {
      const int column = part.left / 2 + chroma.column + x * chroma.columnRight + y * chroma.columnDown;
      const int row = part.top / 2 + chroma.row + x * chroma.rowRight + y * chroma.rowDown;
      unsigned char* const out = pairs + y * stride + std::int64_t{x} * 2;
      out[job.vFirst() ? 0 : 1] = sample(picture.v, column, row);
      out[job.vFirst() ? 1 : 0] = sample(picture.u, column, row);
    }
  }
}

// ---- by the kernels

/// Whether U and V are views of the same pairs.
bool arePairs(const Plane& u, const Plane& v) {
  const auto distance = reinterpret_cast<std::intptr_t>(u.data) - reinterpret_cast<std::intptr_t>(v.data);
  return u.pixelStride == 2 && v.pixelStride == 2 && u.rowStride == v.rowStride &&
         (distance == 1 || distance == -1);
}

/// Whether the kernels can read the chroma where it is.
bool isDirect(const PlanarPicture& picture) {
  return arePairs(picture.u, picture.v) || (picture.u.pixelStride == 1 && picture.v.pixelStride == 1);
}

/// The first row of `rows` rows and the step to the next, from the last row up where `flipped`.
template <typename Byte>
struct Rows {
  Byte* data;
  std::int64_t stride;
};
template <typename Byte>
Rows<Byte> rowsOf(Byte* data, std::int64_t stride, int rows, bool flipped) {
  return flipped ? Rows<Byte>{data + (rows - 1) * stride, -stride} : Rows<Byte>{data, stride};
}

PlanesView viewOf(const Job& job, bool flipped) {
  const PlanarPicture& picture = job.picture;
  const Rectangle& part = job.part;
  const auto rows = [&](const Plane& plane, int shift) {
    const unsigned char* const data = plane.data + (part.top >> shift) * plane.rowStride +
                                      std::int64_t{part.left >> shift} * plane.pixelStride;
    return rowsOf(data, plane.rowStride, part.height >> shift, flipped);
  };
  const auto luma = rows(picture.y, 0);
  const auto u = rows(picture.u, 1);
  const auto v = rows(picture.v, 1);
  if (arePairs(picture.u, picture.v)) {
    const bool firstIsV = v.data < u.data;
    const auto& pairs = firstIsV ? v : u;
    return {part.width, part.height, luma.data, luma.stride, pairs.data, pairs.stride, nullptr, 0, firstIsV};
  }
  return {part.width, part.height, luma.data, luma.stride, v.data, v.stride, u.data, u.stride, true};
}

void convertDirect(const Job& job) {
  const Orientation& orientation = job.orientation;
  const bool sideways = turnsSideways(orientation);
  // By 180 degrees: the rows from the last, each mirrored. By 90: the rows from the last, then transposed. By
  // 270: transposed, then the rows from the last; mirrored, the source's rows are from the last, too.
  const bool sourceFlipped =
      sideways ? (orientation.degrees == 90) != orientation.mirrored : orientation.degrees == 180;
  const bool rowMirrored = (orientation.degrees == 180) != orientation.mirrored;
  const bool targetFlipped = orientation.degrees == 270;
  const PlanesView view = viewOf(job, sourceFlipped);
  const int height = job.size().height;
  const auto [data, stride] = rowsOf(job.pixels, job.stride, height, targetFlipped);
  const PixelRows pixels = {data, stride};
  if (job.pixelBytes() > 1) {
    const ColourOrder order = {job.redFirst(), job.pixelBytes() == 4};
    if (sideways) {
      decodeTransposed(view, order, pixels);
    } else {
      decodeRows(view, rowMirrored, order, pixels);
    }
    return;
  }
  if (sideways) {
    transposeLuma(view, pixels);
  } else {
    copyLuma(view, rowMirrored, pixels);
  }
  if (job.semiPlanar()) {
    const auto chroma = rowsOf(job.pairs, job.stride, height / 2, targetFlipped);
    const PixelRows pairs = {chroma.data, chroma.stride};
    if (sideways) {
      transposeChroma(view, job.vFirst(), pairs);
    } else {
      copyChroma(view, rowMirrored, job.vFirst(), pairs);
    }
  }
}

/// Where the rectangle `part` of a picture of `whole` is in the result.
Rectangle placeOf(const Rectangle& part, const Size& whole, const Orientation& orientation) {
  const Size turned = sizeOfView({0, 0, whole.width, whole.height}, orientation);
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
    const unsigned char* const from = plane.data + (block.top / 2 + row) * plane.rowStride +
                                      std::int64_t{block.left / 2} * plane.pixelStride;
    for (int column = 0; column < block.width / 2; ++column) {
      samples[row][column] = from[std::int64_t{column} * plane.pixelStride];
    }
  }
  return {samples[0], sizeof samples, columns, 1};
}

/// With chroma as few cameras deliver it: gathered first, that of a block of pixels at a time. The last
/// blocks of rows and columns reach back over their neighbours.
void convertGathered(const Job& job) {
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
      const Rectangle place = placeOf({left, top, block.width, block.height}, whole, job.orientation);
      Job ofBlock = job;
      ofBlock.part = {0, 0, block.width, block.height};
      ofBlock.picture.y.data += source.top * job.picture.y.rowStride + source.left;
      ofBlock.picture.u = gathered(job.picture.u, source, u);
      ofBlock.picture.v = gathered(job.picture.v, source, v);
      ofBlock.pixels += place.top * job.stride + std::int64_t{place.left} * job.pixelBytes();
      if (job.semiPlanar()) {
        ofBlock.pairs += place.top / 2 * job.stride + place.left;
      }
      convertDirect(ofBlock);
    }
  }
}

}  // namespace

Rectangle wholePairs(const Rectangle& part) {
  // Any numbers may come, so the sums are to wrap.
  const auto side = [](int start, int length) {
    const auto from = static_cast<std::uint32_t>(start);
    return static_cast<int>(((from + static_cast<std::uint32_t>(length) + 1) & ~1U) - (from & ~1U));
  };
  return {part.left & ~1, part.top & ~1, side(part.left, part.width), side(part.top, part.height)};
}

Size sizeOfView(const Rectangle& part, const Orientation& orientation) {
  const Rectangle whole = wholePairs(part);
  return turnsSideways(orientation) ? Size{whole.height, whole.width} : Size{whole.width, whole.height};
}

PlanesStatus convertPlanes(const PlanarPicture& picture, const Rectangle& part,
                           const Orientation& orientation, const Target& target) {
  const PlanesStatus status = check(picture, part, orientation, target);
  if (status != PlanesStatus::kSuccess) {
    return status;
  }
  Job job = {picture, wholePairs(part), orientation, target.layout, target.stride, target.data, nullptr};
  if (job.semiPlanar()) {
    job.pairs = target.data + job.size().height * target.stride;
  }
  if (job.part.width < kKernelSide || (turnsSideways(orientation) && job.part.height < kKernelSide)) {
    convertSmall(job);
  } else if (isDirect(picture)) {
    convertDirect(job);
  } else {
    convertGathered(job);
  }
  return PlanesStatus::kSuccess;
}

}  // namespace kyface
