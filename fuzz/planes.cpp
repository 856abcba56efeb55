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
using kyface::test::isSemiPlanar;
using kyface::test::pixelBytesOf;
using Bytes = std::vector<unsigned char>;

/// Bytes that end at a protected page.
class Memory : public GuardedImage<unsigned char> {
 public:
  explicit Memory(int bytes) : GuardedImage(1, bytes, bytes) {}
};

int64_t bytesOf(int64_t rows, int64_t stride, int64_t row) { return (rows - 1) * stride + row; }

/// The column and row of the picture that pixel (`x`, `y`) of the view shows. `part` is even.
struct Place {
  int column;
  int row;
};
Place sourceOf(const Rectangle& part, const Orientation& orientation, int x, int y) {
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
      const Place at = sourceOf(part, orientation, x, y);
      frame.push_back(sample(picture.y, at.column, at.row));
    }
  }
  if (layout == PixelLayout::kGray) {
    return frame;
  }
  for (int y = 0; y < height; y += 2) {
    for (int x = 0; x < width; x += 2) {
      const Place at = sourceOf(part, orientation, x, y);
      const unsigned char u = sample(picture.u, at.column / 2, at.row / 2);
      const unsigned char v = sample(picture.v, at.column / 2, at.row / 2);
      frame.push_back(layout == PixelLayout::kNv12 ? u : v);
      frame.push_back(layout == PixelLayout::kNv12 ? v : u);
    }
  }
  if (isSemiPlanar(layout)) {
    return frame;
  }
  const bool rgb = layout == PixelLayout::kRgba || layout == PixelLayout::kRgb;
  return reference::toPixels(frame, width, height, reference::kNv21,
                             {rgb ? 2 : 0, rgb ? 0 : 2, pixelBytesOf(layout)});
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
  const auto planeHolds = [&](const Plane& plane, Wide width, Wide height) {
    return plane.pixelStride >= 1 &&
           holds(plane.data, plane.size, plane.rowStride, height, (width - 1) * plane.pixelStride + 1);
  };
  const Wide width = picture.width;
  const Wide height = picture.height;
  if (width < 1 || height < 1 || width % 2 != 0 || height % 2 != 0 || picture.y.pixelStride != 1 ||
      !planeHolds(picture.y, width, height) || !planeHolds(picture.u, width / 2, height / 2) ||
      !planeHolds(picture.v, width / 2, height / 2)) {
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
  return holds(target.data, target.size, target.stride, isSemiPlanar(target.layout) ? rows * 3 / 2 : rows,
               (sideways ? down : across) * pixelBytesOf(target.layout));
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
  const int lumaStride = width + input.in(0, 5);
  const int chromaRow = (width / 2 - 1) * pixelStride + 1;
  const int chromaStride = chromaRow + (pairs > 0 ? 1 : 0) + input.in(0, 5);
  const auto lumaBytes = static_cast<int>(bytesOf(height, lumaStride, width));
  const auto chromaBytes = static_cast<int>(bytesOf(height / 2, chromaStride, chromaRow));
  Memory luma(lumaBytes);
  Memory first(chromaBytes + (pairs > 0 ? 1 : 0));
  Memory second(chromaBytes);

  PlanarPicture picture = {width,
                           height,
                           {luma.data(), lumaBytes, lumaStride, 1},
                           {first.data(), chromaBytes, chromaStride, pixelStride},
                           {second.data(), chromaBytes, chromaStride, pixelStride}};
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
  const int row = shown.width * pixelBytesOf(layout);
  const int rows = isSemiPlanar(layout) ? shown.height * 3 / 2 : shown.height;
  GuardedImage<unsigned char> out(rows, row, row + input.in(0, 9));
  Target target = {out.data(), bytesOf(rows, out.stride(), row), out.stride(), layout};

  Orientation orientation = chosen;
  const bool disturbed = input.seldom(3);
  if (disturbed) {
    disturb(input, picture, part, orientation, target);
  }
  luma.fill(pixel);
  first.fill(pixel);
  second.fill(pixel);

  const Bytes before(target.data, target.data + bytesOf(rows, out.stride(), row));
  const PlanesStatus status = kyface::convertPlanes(picture, part, orientation, target);
  const bool fit = fits(picture, part, orientation, target);
  FUZZ_CHECK((status == PlanesStatus::kSuccess) == fit);
  Bytes want = before;
  if (fit) {
    const Rectangle whole = kyface::wholePairs(part);
    FUZZ_CHECK(whole.left == even(part.left) && whole.top == even(part.top));
    const Bytes view = expected(picture, whole, orientation, target.layout);
    const kyface::Size viewSize = kyface::sizeOfView(part, orientation);
    const int64_t viewRow = int64_t{viewSize.width} * pixelBytesOf(target.layout);
    for (size_t i = 0; i < view.size(); ++i) {
      const auto at = static_cast<int64_t>(i);
      want[static_cast<size_t>(at / viewRow * target.stride + at % viewRow)] = view[i];
    }
  }
  FUZZ_CHECK(std::equal(want.begin(), want.end(), out.data()));
  return 0;
}
