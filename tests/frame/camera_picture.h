// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// A camera's picture for tests: planes of every shape, each ending at a protected page, and what any view of
/// it is, step by step.
#pragma once

#include <array>
#include <memory>
#include <vector>

#include "frame/planes.h"
#include "tests/support/frame_reference.h"
#include "tests/support/guarded_image.h"
#include "tests/support/pixel_layout.h"

namespace kyface::test {

/// How U and V lie in memory.
enum class Chroma {
  kPairsVu,  ///< views of pairs, V first
  kPairsUv,  ///< views of pairs, U first
  kPlanes,   ///< two planes, samples side by side
  kSpread,   ///< two planes, every second byte a sample
  kUneven,   ///< U side by side, every third byte of V
};
inline constexpr std::array kChromas = {Chroma::kPairsVu, Chroma::kPairsUv, Chroma::kPlanes, Chroma::kSpread,
                                        Chroma::kUneven};

/// Samples of one kind, `width` a row.
struct Grid {
  int width;
  int height;
  std::vector<unsigned char> samples;

  unsigned char at(int column, int row) const {
    return samples[static_cast<size_t>(row) * static_cast<size_t>(width) + static_cast<size_t>(column)];
  }
};

template <typename At>
Grid grid_of(int width, int height, const At& at) {
  Grid grid{width, height, {}};
  for (int row = 0; row < height; ++row) {
    for (int column = 0; column < width; ++column) {
      grid.samples.push_back(at(column, row));
    }
  }
  return grid;
}

/// The rectangle of a grid, turned clockwise by quarters, then mirrored.
inline Grid view_of(const Grid& whole, const Rectangle& part, const Orientation& orientation) {
  Grid grid =
      grid_of(part.width, part.height, [&](int x, int y) { return whole.at(part.left + x, part.top + y); });
  for (int turned = 0; turned < orientation.degrees; turned += 90) {
    const Grid before = grid;
    // What was at the bottom is at the left now.
    grid = grid_of(before.height, before.width,
                   [&](int x, int y) { return before.at(y, before.height - 1 - x); });
  }
  if (orientation.mirrored) {
    const Grid before = grid;
    grid = grid_of(before.width, before.height,
                   [&](int x, int y) { return before.at(before.width - 1 - x, y); });
  }
  return grid;
}

inline constexpr std::array kLayouts = {PixelLayout::kRgba, PixelLayout::kBgra, PixelLayout::kRgb,
                                        PixelLayout::kBgr,  PixelLayout::kNv21, PixelLayout::kNv12,
                                        PixelLayout::kGray};

/// Rows of a result of `height` pixels, those of chroma pairs among them.
inline int rows_of(PixelLayout layout, int height) { return isSemiPlanar(layout) ? height * 3 / 2 : height; }

/// A picture of random samples, with `padding` bytes between the rows of each plane and none behind the last.
class CameraPicture {
 public:
  CameraPicture(int width, int height, Chroma chroma, int padding, unsigned seed)
      : luma_(height, width, width + padding) {
    ByteSource source(seed);
    luma_.fill(source);
    picture_.width = width;
    picture_.height = height;
    picture_.y = plane(luma_, 0, 1);
    const int pairs = width / 2;
    const auto chroma_plane = [&](int samples_bytes) {
      planes_.push_back(
          std::make_unique<GuardedImage<unsigned char>>(height / 2, samples_bytes, samples_bytes + padding));
      planes_.back()->fill(source);
      return planes_.back().get();
    };
    const auto spread = [&](int pixelStride) {
      return plane(*chroma_plane((pairs - 1) * pixelStride + 1), 0, pixelStride);
    };
    switch (chroma) {
      case Chroma::kPairsVu:
      case Chroma::kPairsUv: {
        const auto* const both = chroma_plane(width);
        picture_.u = plane(*both, chroma == Chroma::kPairsUv ? 0 : 1, 2);
        picture_.v = plane(*both, chroma == Chroma::kPairsUv ? 1 : 0, 2);
        break;
      }
      case Chroma::kPlanes:
        picture_.u = spread(1);
        picture_.v = spread(1);
        break;
      case Chroma::kSpread:
        picture_.u = spread(2);
        picture_.v = spread(2);
        break;
      case Chroma::kUneven:
        picture_.u = spread(1);
        picture_.v = spread(3);
        break;
    }
  }

  const PlanarPicture& planes() const { return picture_; }
  /// To be read in another way.
  PlanarPicture& planes() { return picture_; }

  /// The bytes of a view, row by row without padding: the planes cut, turned and mirrored one by one, then
  /// converted by the formulas. `part` has even edges.
  std::vector<unsigned char> view(const Rectangle& part, const Orientation& orientation,
                                  PixelLayout layout) const {
    const Rectangle chroma = {part.left / 2, part.top / 2, part.width / 2, part.height / 2};
    const auto samples = [](const Plane& plane, int width, int height) {
      return grid_of(width, height, [&](int x, int y) {
        return plane.data[static_cast<ptrdiff_t>(y) * plane.rowStride + x * plane.pixelStride];
      });
    };
    const int width = picture_.width;
    const int height = picture_.height;
    const Grid luma = view_of(samples(picture_.y, width, height), part, orientation);
    if (layout == PixelLayout::kGray) {
      return luma.samples;
    }
    const Grid u = view_of(samples(picture_.u, width / 2, height / 2), chroma, orientation);
    const Grid v = view_of(samples(picture_.v, width / 2, height / 2), chroma, orientation);
    std::vector<unsigned char> frame = luma.samples;
    const bool v_first = layout != PixelLayout::kNv12;
    for (size_t i = 0; i < u.samples.size(); ++i) {
      frame.push_back(v_first ? v.samples[i] : u.samples[i]);
      frame.push_back(v_first ? u.samples[i] : v.samples[i]);
    }
    if (isSemiPlanar(layout)) {
      return frame;
    }
    const bool rgb = layout == PixelLayout::kRgba || layout == PixelLayout::kRgb;
    const reference::Layout colours = {rgb ? 2 : 0, rgb ? 0 : 2, pixelBytesOf(layout)};
    return reference::toPixels(frame, luma.width, luma.height, reference::kNv21, colours);
  }

 private:
  static Plane plane(const GuardedImage<unsigned char>& image, int from, int pixelStride) {
    const std::int64_t size = std::int64_t{image.rows() - 1} * image.stride() + image.rowElements() - from;
    return {image.data() + from, size, image.stride(), pixelStride};
  }

  GuardedImage<unsigned char> luma_;
  std::vector<std::unique_ptr<GuardedImage<unsigned char>>> planes_;
  PlanarPicture picture_;
};

}  // namespace kyface::test
