// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

#include "aligned_face.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <cstddef>

namespace kyengine {
namespace {

/// A map that turns, scales and moves.
struct Map {
  dlib::dpoint origin;  ///< where (0, 0) goes
  dlib::dpoint along;   ///< by how much a step to the right moves; one down moves at a right angle to it

  dlib::dpoint operator()(double x, double y) const {
    return {origin.x() + along.x() * x - along.y() * y, origin.y() + along.y() * x + along.x() * y};
  }
};

/// The map of the aligned picture to the frame.
Map mapToFrame(const Eyes& eyes, int side) {
  const double unit = side / 150.0;
  const dlib::dpoint left(46.6 * unit, 46.4 * unit);
  const dlib::dpoint right(99.95 * unit, 47.1 * unit);
  const dlib::dpoint from = right - left;
  const dlib::dpoint to = eyes.right - eyes.left;
  const double square = from.x() * from.x() + from.y() * from.y();
  const dlib::dpoint along((to.x() * from.x() + to.y() * from.y()) / square,
                           (to.y() * from.x() - to.x() * from.y()) / square);
  const Map turned = {{0, 0}, along};
  return {eyes.left - turned(left.x(), left.y()), along};
}

using Colours = std::array<float, 3>;

/// Means of squares of the frame, `step` pixels wide, black where they lie outside.
class Means {
 public:
  /// Covers the rectangle from (left, top) to (right, bottom).
  Means(const Frame& frame, double left, double top, double right, double bottom, int step)
      : step_(step), left_(floor(left)), top_(floor(top)) {
    columns_ = static_cast<int>((right - left_) / step) + 2;
    rows_ = static_cast<int>((bottom - top_) / step) + 2;
    means_.resize(static_cast<size_t>(rows_) * static_cast<size_t>(columns_));
    const int firstX = std::max(left_, 0);
    const int endX = std::min(left_ + columns_ * step, frame.width());
    const int firstY = std::max(top_, 0);
    const int endY = std::min(top_ + rows_ * step, frame.height());
    if (firstX >= endX) {
      return;
    }
    std::vector<uint8_t> row(3 * static_cast<size_t>(endX - firstX));
    // Sums are whole numbers below 2^24 for any step that a frame has room for: they are exact in any order.
    for (int y = firstY; y < endY; ++y) {
      frame.toRgb(firstX, y, endX - firstX, 1, row.data());
      const uint8_t* next = row.data();
      for (int x = firstX; x < endX; ++x) {
        Colours& sum = at((x - left_) / step, (y - top_) / step);
        for (float& colour : sum) {
          colour += static_cast<float>(*next++);
        }
      }
    }
    const auto pixels = static_cast<float>(step * step);
    for (Colours& mean : means_) {
      for (float& colour : mean) {
        colour /= pixels;
      }
    }
  }

  /// Adds what the frame shows at `place`, interpolated.
  void addAt(const dlib::dpoint& place, Colours* sum) const {
    const double half = (step_ - 1) / 2.0;
    const double x = (place.x() - left_ - half) / step_;
    const double y = (place.y() - top_ - half) / step_;
    const int column = floor(x);
    const int row = floor(y);
    const auto right = static_cast<float>(x - column);
    const auto down = static_cast<float>(y - row);
    const Colours a = or0(column, row);
    const Colours b = or0(column + 1, row);
    const Colours c = or0(column, row + 1);
    const Colours d = or0(column + 1, row + 1);
    for (size_t i = 0; i < a.size(); ++i) {
      const float above = a[i] + (b[i] - a[i]) * right;
      const float below = c[i] + (d[i] - c[i]) * right;
      (*sum)[i] += above + (below - above) * down;
    }
  }

 private:
  static int floor(double x) { return static_cast<int>(std::floor(x)); }

  Colours& at(int column, int row) {
    return means_[static_cast<size_t>(row) * static_cast<size_t>(columns_) + static_cast<size_t>(column)];
  }

  Colours or0(int column, int row) const {
    return column >= 0 && row >= 0 && column < columns_ && row < rows_
               ? means_[static_cast<size_t>(row) * static_cast<size_t>(columns_) +
                        static_cast<size_t>(column)]
               : Colours{};
  }

  int step_;
  int left_;
  int top_;
  int columns_;
  int rows_;
  std::vector<Colours> means_;
};

}  // namespace

std::vector<uint8_t> alignedFace(const Frame& frame, const Eyes& eyes, int side) {
  const Map toFrame = mapToFrame(eyes, side);
  // The frame's pixels for one of the aligned picture's: squares of whole pixels are averaged first, and four
  // places between them where that is not quite a pixel of the aligned picture.
  const double scale =
      std::sqrt(toFrame.along.x() * toFrame.along.x() + toFrame.along.y() * toFrame.along.y());
  const int step = std::max(1, static_cast<int>(scale));
  const double last = side - 0.5;
  const std::array<dlib::dpoint, 4> corners = {toFrame(-0.5, -0.5), toFrame(last, -0.5), toFrame(-0.5, last),
                                               toFrame(last, last)};
  const auto [left, right] = std::minmax({corners[0].x(), corners[1].x(), corners[2].x(), corners[3].x()});
  const auto [top, bottom] = std::minmax({corners[0].y(), corners[1].y(), corners[2].y(), corners[3].y()});
  // An interpolated place needs the squares around it, too.
  const Means means(frame, left - step, top - step, right + step, bottom + step, step);

  std::vector<uint8_t> picture;
  picture.reserve(static_cast<size_t>(side) * static_cast<size_t>(side) * 3);
  for (int y = 0; y < side; ++y) {
    for (int x = 0; x < side; ++x) {
      Colours sum = {};
      float places = 1;
      if (scale <= 1) {
        means.addAt(toFrame(x, y), &sum);
      } else {
        places = 4;
        for (const double dy : {-0.25, 0.25}) {
          for (const double dx : {-0.25, 0.25}) {
            means.addAt(toFrame(x + dx, y + dy), &sum);
          }
        }
      }
      for (const float colour : sum) {
        picture.push_back(static_cast<uint8_t>(std::lround(colour / places)));
      }
    }
  }
  return picture;
}

}  // namespace kyengine
