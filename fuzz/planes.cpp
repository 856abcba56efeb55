// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// A camera's planes of any description, in memory that ends where the description says, into a target of any
// description: the pixels that the formulas give or, where anything does not fit, a status and no byte
// touched.

#include "frame/planes.h"

#include <algorithm>
#include <climits>
#include <vector>

#include "fuzz_input.h"
#include "tests/support/frame_reference.h"
#include "tests/support/guarded_image.h"
#include "tests/support/pixel_layout.h"

namespace {

using kyface::Orientation;
using kyface::PixelLayout;
using kyface::PlanarPicture;
using kyface::Plane;
using kyface::PlanesStatus;
using kyface::Rectangle;
using kyface::Target;
using kyface::fuzz::Input;
using kyface::test::GuardedImage;
using kyface::test::is_semi_planar;
using kyface::test::pixel_bytes_of;
using Bytes = std::vector<unsigned char>;

/// Bytes that end at a protected page.
class Memory : public GuardedImage<unsigned char> {
 public:
  explicit Memory(int bytes) : GuardedImage(1, bytes, bytes) {}
};

int64_t bytes_of(int64_t rows, int64_t stride, int64_t row) { return (rows - 1) * stride + row; }

/// The column and row of the picture that pixel (`x`, `y`) of the view shows. `part` is even.
struct Place {
  int column;
  int row;
};
Place source_of(const Rectangle& part, const Orientation& orientation, int x, int y) {
  const bool sideways = orientation.degrees % 180 != 0;
  const int width = sideways ? part.height : part.width;
  x = orientation.mirrored ? width - 1 - x : x;
  switch (orientation.degrees) {
    case 90:
      return {part.left + y, part.top + part.height - 1 - x};
    case 180:
      return {part.left + part.width - 1 - x, part.top + part.height - 1 - y};
    case 270:
      return {part.left + part.width - 1 - y, part.top + x};
    default:
      return {part.left + x, part.top + y};
  }
}

unsigned char sample(const Plane& plane, int column, int row) {
  return plane.data[int64_t{row} * plane.rowStride + int64_t{column} * plane.pixelStride];
}

/// The rows of the view, without padding.
Bytes expected(const PlanarPicture& picture, const Rectangle& part, const Orientation& orientation,
               PixelLayout layout) {
  const bool sideways = orientation.degrees % 180 != 0;
  const int width = sideways ? part.height : part.width;
  const int height = sideways ? part.width : part.height;
  Bytes frame;
  for (int y = 0; y < height; ++y) {
    for (int x = 0; x < width; ++x) {
      const Place at = source_of(part, orientation, x, y);
      frame.push_back(sample(picture.y, at.column, at.row));
    }
  }
  if (layout == PixelLayout::kGray) {
    return frame;
  }
  for (int y = 0; y < height; y += 2) {
    for (int x = 0; x < width; x += 2) {
      const Place at = source_of(part, orientation, x, y);
      const unsigned char u = sample(picture.u, at.column / 2, at.row / 2);
      const unsigned char v = sample(picture.v, at.column / 2, at.row / 2);
      frame.push_back(layout == PixelLayout::kNv12 ? u : v);
      frame.push_back(layout == PixelLayout::kNv12 ? v : u);
    }
  }
  if (is_semi_planar(layout)) {
    return frame;
  }
  const bool rgb = layout == PixelLayout::kRgba || layout == PixelLayout::kRgb;
  return reference::to_pixels(frame, width, height, reference::kNv21,
                              {rgb ? 2 : 0, rgb ? 0 : 2, pixel_bytes_of(layout)});
}

int even(int value) { return value & ~1; }

/// A few of the numbers become others, of which most do not fit.
void disturb(Input& input, PlanarPicture& picture, Rectangle& part, Orientation& orientation,
             Target& target) {
  Plane* const planes[] = {&picture.y, &picture.u, &picture.v};
  Plane& plane = *planes[input.in(0, 2)];
  switch (input.in(0, 13)) {
    case 0:
      picture.width = input.any();
      break;
    case 1:
      picture.height = input.any();
      break;
    case 2:
      plane.rowStride = input.any();
      break;
    case 3:
      plane.pixelStride = input.any();
      break;
    case 4:
      // Never more than there is.
      plane.size = std::min<int64_t>(plane.size, input.any());
      break;
    case 5:
      plane.data = nullptr;
      break;
    case 6:
      part.left = input.any();
      break;
    case 7:
      part.top = input.any();
      break;
    case 8:
      part.width = input.any();
      break;
    case 9:
      part.height = input.any();
      break;
    case 10:
      orientation.degrees = input.any();
      break;
    case 11:
      target.stride = input.any();
      break;
    case 12:
      target.size = std::min<int64_t>(target.size, input.any());
      break;
    default:
      target.layout = PixelLayout{input.any()};
      break;
  }
}

/// Whether everything fits, by the words of the header. No product of two ints is beyond 64 bits.
bool fits(const PlanarPicture& picture, const Rectangle& part, const Orientation& orientation,
          const Target& target) {
  using Wide = int64_t;
  const auto holds = [](const void* data, Wide size, Wide stride, Wide rows, Wide row) {
    return data != nullptr && stride >= row && (rows - 1) * stride + row <= size;
  };
  const auto plane_holds = [&](const Plane& plane, Wide width, Wide height) {
    return plane.pixelStride >= 1 &&
           holds(plane.data, plane.size, plane.rowStride, height, (width - 1) * plane.pixelStride + 1);
  };
  const Wide width = picture.width;
  const Wide height = picture.height;
  if (width < 1 || height < 1 || width % 2 != 0 || height % 2 != 0 || picture.y.pixelStride != 1 ||
      !plane_holds(picture.y, width, height) || !plane_holds(picture.u, width / 2, height / 2) ||
      !plane_holds(picture.v, width / 2, height / 2)) {
    return false;
  }
  const Wide right = Wide{part.left} + part.width;
  const Wide bottom = Wide{part.top} + part.height;
  if (part.left < 0 || part.top < 0 || part.width < 1 || part.height < 1 || right > width ||
      bottom > height) {
    return false;
  }
  const int degrees = orientation.degrees;
  if (degrees != 0 && degrees != 90 && degrees != 180 && degrees != 270) {
    return false;
  }
  const int layout = static_cast<int>(target.layout);
  if (layout < 0 || layout > static_cast<int>(PixelLayout::kGray)) {
    return false;
  }
  const Wide across = (right + 1) / 2 * 2 - even(part.left);
  const Wide down = (bottom + 1) / 2 * 2 - even(part.top);
  const bool sideways = degrees % 180 != 0;
  const Wide rows = sideways ? across : down;
  return holds(target.data, target.size, target.stride, is_semi_planar(target.layout) ? rows * 3 / 2 : rows,
               (sideways ? down : across) * pixel_bytes_of(target.layout));
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  Input input(data, size);
  const int width = 2 * input.in(1, 80);
  const int height = 2 * input.in(1, 50);
  const auto pixel = [&] { return input.pixel(); };

  // Planes, or pairs that both chroma planes are views of.
  const int pairs = input.in(0, 2);
  const int pixelStride = pairs > 0 ? 2 : input.in(1, 3);
  const int luma_stride = width + input.in(0, 5);
  const int chroma_row = (width / 2 - 1) * pixelStride + 1;
  const int chroma_stride = chroma_row + (pairs > 0 ? 1 : 0) + input.in(0, 5);
  const auto luma_bytes = static_cast<int>(bytes_of(height, luma_stride, width));
  const auto chroma_bytes = static_cast<int>(bytes_of(height / 2, chroma_stride, chroma_row));
  Memory luma(luma_bytes);
  Memory first(chroma_bytes + (pairs > 0 ? 1 : 0));
  Memory second(chroma_bytes);

  PlanarPicture picture = {width,
                           height,
                           {luma.data(), luma_bytes, luma_stride, 1},
                           {first.data(), chroma_bytes, chroma_stride, pixelStride},
                           {second.data(), chroma_bytes, chroma_stride, pixelStride}};
  if (pairs > 0) {
    picture.u.data = first.data() + (pairs - 1);
    picture.v.data = first.data() + (2 - pairs);
  }

  Rectangle part;
  part.left = input.in(0, width - 1);
  part.top = input.in(0, height - 1);
  part.width = input.in(1, width - part.left);
  part.height = input.in(1, height - part.top);
  if (input.seldom(2)) {
    part = {0, 0, width, height};
  }
  const Orientation chosen = {90 * input.in(0, 3), input.seldom(2)};
  const auto layout = PixelLayout{input.in(0, static_cast<int>(PixelLayout::kGray))};
  const kyface::Size shown = kyface::sizeOfView(part, chosen);
  const int row = shown.width * pixel_bytes_of(layout);
  const int rows = is_semi_planar(layout) ? shown.height * 3 / 2 : shown.height;
  GuardedImage<unsigned char> out(rows, row, row + input.in(0, 9));
  Target target = {out.data(), bytes_of(rows, out.stride(), row), out.stride(), layout};

  Orientation orientation = chosen;
  const bool disturbed = input.seldom(3);
  if (disturbed) {
    disturb(input, picture, part, orientation, target);
  }
  luma.fill(pixel);
  first.fill(pixel);
  second.fill(pixel);

  const Bytes before(target.data, target.data + bytes_of(rows, out.stride(), row));
  const PlanesStatus status = kyface::convertPlanes(picture, part, orientation, target);
  const bool fit = fits(picture, part, orientation, target);
  FUZZ_CHECK((status == PlanesStatus::kSuccess) == fit);
  Bytes want = before;
  if (fit) {
    const Rectangle whole = kyface::wholePairs(part);
    FUZZ_CHECK(whole.left == even(part.left) && whole.top == even(part.top));
    const Bytes view = expected(picture, whole, orientation, target.layout);
    const kyface::Size view_size = kyface::sizeOfView(part, orientation);
    const int64_t view_row = int64_t{view_size.width} * pixel_bytes_of(target.layout);
    for (size_t i = 0; i < view.size(); ++i) {
      const auto at = static_cast<int64_t>(i);
      want[static_cast<size_t>(at / view_row * target.stride + at % view_row)] = view[i];
    }
  }
  FUZZ_CHECK(std::equal(want.begin(), want.end(), out.data()));
  return 0;
}
