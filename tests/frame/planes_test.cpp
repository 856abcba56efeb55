// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// One pass over a camera's planes, against the planes turned and converted step by step.

#include "frame/planes.h"

#include <gtest/gtest.h>

#include <climits>
#include <string>
#include <thread>
#include <vector>

#include "camera_picture.h"

namespace kyface::test {
namespace {

using Bytes = std::vector<unsigned char>;

constexpr std::array<Orientation, 8> kOrientations = {
    {{0, false}, {90, false}, {180, false}, {270, false}, {0, true}, {90, true}, {180, true}, {270, true}}};

Rectangle all_of(const PlanarPicture& picture) { return {0, 0, picture.width, picture.height}; }

/// A target for a view, which ends at a protected page.
class Result : public GuardedImage<unsigned char> {
 public:
  Result(const Rectangle& part, const Orientation& orientation, PixelLayout layout, int padding)
      : Result(sizeOfView(part, orientation), layout, padding) {}

  Target target() { return {data(), std::int64_t{rows() - 1} * stride() + rowElements(), stride(), layout_}; }

 private:
  Result(const Size& size, PixelLayout layout, int padding)
      : GuardedImage(rows_of(layout, size.height), size.width * pixelBytesOf(layout),
                     size.width * pixelBytesOf(layout) + padding),
        layout_(layout) {}

  PixelLayout layout_;
};

/// The rectangle whose edges are those of `part` made even, as the words say it.
Rectangle made_even(const Rectangle& part) {
  Rectangle even = part;
  for (; even.left % 2 != 0; --even.left, ++even.width) {
  }
  for (; even.top % 2 != 0; --even.top, ++even.height) {
  }
  even.width += even.width % 2;
  even.height += even.height % 2;
  return even;
}

/// A difference between the view and its reference, in words; empty when there is none.
std::string difference(const CameraPicture& picture, const Rectangle& part, const Orientation& orientation,
                       PixelLayout layout, int padding) {
  Result out(part, orientation, layout, padding);
  const PlanesStatus status = convertPlanes(picture.planes(), part, orientation, out.target());
  if (status != PlanesStatus::kSuccess) {
    return "status " + std::to_string(static_cast<int>(status));
  }
  const testing::AssertionResult same = out.holds(picture.view(made_even(part), orientation, layout));
  return same ? "" : same.message();
}

void expect_all_views(int width, int height, const Rectangle& part, int padding) {
  for (const Chroma chroma : kChromas) {
    const CameraPicture picture(width, height, chroma, padding, static_cast<unsigned>(width * 131 + height));
    for (const Orientation& orientation : kOrientations) {
      for (const PixelLayout layout : kLayouts) {
        ASSERT_EQ(difference(picture, part, orientation, layout, padding), "")
            << width << " x " << height << ", part " << part.left << ' ' << part.top << ' ' << part.width
            << ' ' << part.height << ", chroma " << static_cast<int>(chroma) << ", degrees "
            << orientation.degrees << (orientation.mirrored ? " mirrored" : "") << ", layout "
            << static_cast<int>(layout);
      }
    }
  }
}

TEST(Planes, EveryWidthOfFewRows) {
  for (int width = 2; width <= 150; width += 2) {
    expect_all_views(width, 2, {0, 0, width, 2}, 0);
    expect_all_views(width, 6, {0, 0, width, 6}, width % 5);
  }
}

TEST(Planes, EveryHeightOfFewColumns) {
  for (int height = 2; height <= 150; height += 2) {
    expect_all_views(2, height, {0, 0, 2, height}, 0);
    expect_all_views(6, height, {0, 0, 6, height}, height % 5);
  }
}

TEST(Planes, LargerPictures) {
  constexpr Size kSizes[] = {{32, 32},  {34, 30},   {62, 66},   {64, 64},  {66, 130}, {128, 34},
                             {130, 66}, {144, 146}, {258, 126}, {320, 18}, {290, 34}};
  for (const Size& size : kSizes) {
    expect_all_views(size.width, size.height, {0, 0, size.width, size.height}, 0);
    expect_all_views(size.width, size.height, {0, 0, size.width, size.height}, 7);
  }
}

TEST(Planes, EveryRectangleOfASmallPicture) {
  constexpr int kWidth = 6;
  constexpr int kHeight = 8;
  const CameraPicture picture(kWidth, kHeight, Chroma::kPairsUv, 3, 1);
  for (int left = 0; left < kWidth; ++left) {
    for (int top = 0; top < kHeight; ++top) {
      for (int width = 1; left + width <= kWidth; ++width) {
        for (int height = 1; top + height <= kHeight; ++height) {
          for (const Orientation& orientation : kOrientations) {
            for (const PixelLayout layout : {PixelLayout::kBgr, PixelLayout::kNv12}) {
              EXPECT_EQ(difference(picture, {left, top, width, height}, orientation, layout, 3), "")
                  << left << ' ' << top << ' ' << width << ' ' << height << ", degrees "
                  << orientation.degrees << (orientation.mirrored ? " mirrored" : "");
            }
          }
        }
      }
    }
  }
}

TEST(Planes, RectanglesOfALargerPicture) {
  constexpr Rectangle kParts[] = {{1, 1, 1, 1},     {13, 7, 97, 71}, {2, 2, 64, 64},  {31, 33, 99, 65},
                                  {130, 97, 14, 3}, {0, 99, 144, 1}, {143, 0, 1, 100}};
  for (const Rectangle& part : kParts) {
    expect_all_views(144, 100, part, 0);
    expect_all_views(144, 100, part, 5);
  }
}

// Every luma with every pair of chroma samples, at whatever place in a block.
TEST(Planes, EveryColour) {
  constexpr int kWidth = 512;
  constexpr int kHeight = 512;
  GuardedImage<unsigned char> luma(kHeight, kWidth, kWidth);
  GuardedImage<unsigned char> pairs(kHeight / 2, kWidth, kWidth);
  for (int row = 0; row < kHeight / 2; ++row) {
    for (int pair = 0; pair < kWidth / 2; ++pair) {
      pairs.row(row)[2 * pair] = static_cast<unsigned char>(row);
      pairs.row(row)[2 * pair + 1] = static_cast<unsigned char>(pair);
    }
  }
  const std::int64_t bytes = std::int64_t{kWidth} * kHeight;
  const PlanarPicture picture = {kWidth,
                                 kHeight,
                                 {luma.data(), bytes, kWidth, 1},
                                 {pairs.data() + 1, bytes / 2 - 1, kWidth, 2},
                                 {pairs.data(), bytes / 2, kWidth, 2}};
  Bytes frame(static_cast<size_t>(bytes) * 3 / 2);
  const Bytes chroma = pairs.contents();
  std::copy(chroma.begin(), chroma.end(), frame.begin() + bytes);
  for (int turn = 0; turn < 64; ++turn) {
    // The four pixels of a chroma sample differ.
    size_t at = 0;
    luma.fill([&] {
      const size_t row = at / kWidth;
      return static_cast<unsigned char>(4 * turn + at++ % 2 + 2 * (row % 2));
    });
    const Bytes now = luma.contents();
    std::copy(now.begin(), now.end(), frame.begin());
    Result out(all_of(picture), {}, PixelLayout::kRgba, 0);
    ASSERT_EQ(convertPlanes(picture, all_of(picture), {}, out.target()), PlanesStatus::kSuccess);
    ASSERT_TRUE(out.holds(reference::toPixels(frame, kWidth, kHeight, reference::kNv21, reference::kRgba)))
        << turn;
  }
}

TEST(Planes, WhatLooksLikePairsIsReadAsItIs) {
  // Planes one byte apart, whose samples or rows are not equally far apart.
  for (const Chroma chroma : {Chroma::kPairsVu, Chroma::kPairsUv}) {
    for (Plane PlanarPicture::* plane : {&PlanarPicture::u, &PlanarPicture::v}) {
      for (const bool samples : {true, false}) {
        CameraPicture picture(36, 8, chroma, 4, 9);
        Plane& other = picture.planes().*plane;
        (samples ? other.pixelStride = 1 : other.rowStride -= 1);
        for (const PixelLayout layout : kLayouts) {
          for (const Orientation& orientation : kOrientations) {
            EXPECT_EQ(difference(picture, all_of(picture.planes()), orientation, layout, 0), "");
          }
        }
      }
    }
  }
}

TEST(Planes, PairsAreMadeWhole) {
  for (int left = 0; left < 4; ++left) {
    for (int width = 1; width < 6; ++width) {
      const Rectangle whole = wholePairs({left, left, width, width});
      const Rectangle expected = made_even({left, left, width, width});
      EXPECT_EQ(whole.left, expected.left);
      EXPECT_EQ(whole.top, expected.top);
      EXPECT_EQ(whole.width, expected.width);
      EXPECT_EQ(whole.height, expected.height);
      const Size upright = sizeOfView({left, 0, width, 2}, {180, true});
      EXPECT_EQ(upright.width, expected.width);
      EXPECT_EQ(upright.height, 2);
      const Size sideways = sizeOfView({left, 0, width, 2}, {270, false});
      EXPECT_EQ(sideways.width, 2);
      EXPECT_EQ(sideways.height, expected.width);
    }
  }
}

// ---- what is refused

class Refusal : public testing::Test {
 protected:
  static constexpr int kWidth = 8;
  static constexpr int kHeight = 6;

  Refusal() : camera_(kWidth, kHeight, Chroma::kPlanes, 2, 5), picture_(camera_.planes()) {}

  void expect(PlanesStatus status) {
    Result out(all_of(camera_.planes()), {}, PixelLayout::kRgba, 4);
    Target target = out.target();
    target.size += target_size_;
    target.stride += target_stride_;
    target.layout = layout_;
    target.data = target_is_null_ ? nullptr : target.data;
    const Bytes before = out.contents();
    EXPECT_EQ(convertPlanes(picture_, part_, orientation_, target), status);
    EXPECT_TRUE(out.holds(before));
    picture_ = camera_.planes();
    part_ = all_of(picture_);
    orientation_ = {};
    target_size_ = target_stride_ = 0;
    layout_ = PixelLayout::kRgba;
    target_is_null_ = false;
  }

  CameraPicture camera_;
  // What the next call is given; as fits unless changed.
  PlanarPicture picture_;
  Rectangle part_ = {0, 0, kWidth, kHeight};
  Orientation orientation_;
  std::int64_t target_size_ = 0;
  std::int64_t target_stride_ = 0;
  PixelLayout layout_ = PixelLayout::kRgba;
  bool target_is_null_ = false;
};

TEST_F(Refusal, OddAndEmptyPictures) {
  for (const int size : {INT_MIN, -2, -1, 0, 1, 7}) {
    picture_.width = size;
    expect(PlanesStatus::kPicture);
    picture_.height = size;
    expect(PlanesStatus::kPicture);
  }
}

TEST_F(Refusal, PlanesThatDoNotHoldThePicture) {
  picture_.y.data = nullptr;
  expect(PlanesStatus::kLuma);
  picture_.y.size -= 1;
  expect(PlanesStatus::kLuma);
  picture_.y.size = -1;
  expect(PlanesStatus::kLuma);
  picture_.y.rowStride = kWidth - 1;
  expect(PlanesStatus::kLuma);
  picture_.y.rowStride += 1;
  expect(PlanesStatus::kLuma);
  picture_.y.rowStride = INT64_MAX;
  expect(PlanesStatus::kLuma);
  picture_.y.rowStride = INT64_MIN;
  expect(PlanesStatus::kLuma);
  picture_.y.pixelStride = 2;
  expect(PlanesStatus::kLuma);
  for (Plane PlanarPicture::* plane : {&PlanarPicture::u, &PlanarPicture::v}) {
    (picture_.*plane).data = nullptr;
    expect(PlanesStatus::kChroma);
    (picture_.*plane).size -= 1;
    expect(PlanesStatus::kChroma);
    (picture_.*plane).rowStride = kWidth / 2 - 1;
    expect(PlanesStatus::kChroma);
    (picture_.*plane).rowStride += 1;
    expect(PlanesStatus::kChroma);
    (picture_.*plane).pixelStride = 2;
    expect(PlanesStatus::kChroma);
    (picture_.*plane).pixelStride = INT_MAX;
    expect(PlanesStatus::kChroma);
    (picture_.*plane).pixelStride = 0;
    expect(PlanesStatus::kChroma);
    (picture_.*plane).pixelStride = -1;
    expect(PlanesStatus::kChroma);
  }
}

TEST_F(Refusal, RectanglesThatAreEmptyOrOutside) {
  constexpr Rectangle kParts[] = {{0, 0, 0, 2},
                                  {0, 0, 2, 0},
                                  {0, 0, -2, 2},
                                  {0, 0, INT_MIN, INT_MIN},
                                  {-1, 0, 2, 2},
                                  {0, -1, 2, 2},
                                  {kWidth, 0, 1, 2},
                                  {0, kHeight, 2, 1},
                                  {kWidth - 1, 0, 2, 2},
                                  {0, kHeight - 1, 2, 2},
                                  {0, 0, kWidth + 1, 2},
                                  {1, 0, INT_MAX, 2},
                                  {INT_MAX, INT_MAX, INT_MAX, INT_MAX},
                                  {INT_MIN, INT_MIN, INT_MAX, INT_MAX}};
  for (const Rectangle& part : kParts) {
    part_ = part;
    expect(PlanesStatus::kRectangle);
  }
}

TEST_F(Refusal, OtherAnglesAndLayouts) {
  for (const int degrees : {1, 45, -90, 360, 450, INT_MIN, INT_MAX}) {
    orientation_.degrees = degrees;
    expect(PlanesStatus::kOrientation);
  }
  for (const int layout : {-1, 7, INT_MIN, INT_MAX}) {
    layout_ = PixelLayout{layout};
    expect(PlanesStatus::kLayout);
  }
}

TEST_F(Refusal, TargetsThatDoNotHoldTheResult) {
  target_is_null_ = true;
  expect(PlanesStatus::kTarget);
  target_size_ = -1;
  expect(PlanesStatus::kTarget);
  target_size_ = INT64_MIN / 2;
  expect(PlanesStatus::kTarget);
  target_stride_ = 1;
  expect(PlanesStatus::kTarget);
  target_stride_ = -5;
  expect(PlanesStatus::kTarget);
  target_stride_ = INT64_MAX / 2;
  expect(PlanesStatus::kTarget);
  // Turned by 90 degrees it has more rows, though shorter ones.
  orientation_.degrees = 90;
  expect(PlanesStatus::kTarget);
  // The chroma is part of the result.
  layout_ = PixelLayout::kNv21;
  target_stride_ = kWidth - (4 * kWidth + 4);
  target_size_ = -((kHeight - 1) * (4 * kWidth + 4) + 4 * kWidth) + kWidth * kHeight * 3 / 2 - 1;
  expect(PlanesStatus::kTarget);
}

TEST(Planes, ATargetOverAPlaneIsRefused) {
  const CameraPicture camera(8, 6, Chroma::kPlanes, 2, 5);
  for (Plane PlanarPicture::* plane : {&PlanarPicture::y, &PlanarPicture::u, &PlanarPicture::v}) {
    const int rows = plane == &PlanarPicture::y ? 6 : 3;
    Bytes memory(400, 7);
    const std::int64_t in_plane = (rows - 1) * 10 + (rows == 6 ? 8 : 4);
    // The target is bytes 100 to 147; what lies beside it is no overlap.
    for (const std::int64_t from :
         {100 - in_plane + 1, std::int64_t{100}, std::int64_t{101}, std::int64_t{147}}) {
      PlanarPicture picture = camera.planes();
      (picture.*plane) = {memory.data() + from, 400 - from, 10, 1};
      const Target target = {memory.data() + 100, 48, 8, PixelLayout::kGray};
      EXPECT_EQ(convertPlanes(picture, {0, 0, 8, 6}, {}, target), PlanesStatus::kOverlap) << from;
      EXPECT_EQ(memory, Bytes(400, 7));
    }
    for (const std::int64_t from : {100 - in_plane, std::int64_t{148}}) {
      PlanarPicture picture = camera.planes();
      (picture.*plane) = {memory.data() + from, 400 - from, 10, 1};
      const Target target = {memory.data() + 100, 48, 8, PixelLayout::kGray};
      EXPECT_EQ(convertPlanes(picture, {0, 0, 8, 6}, {}, target), PlanesStatus::kSuccess) << from;
    }
  }
}

// ---- threads

TEST(Planes, EightThreadsShareAPicture) {
  const CameraPicture picture(70, 66, Chroma::kPairsVu, 3, 9);
  std::array<std::string, 8> found;
  std::vector<std::thread> threads;
  for (size_t i = 0; i < found.size(); ++i) {
    threads.emplace_back([&, i] {
      for (const PixelLayout layout : kLayouts) {
        found[i] += difference(picture, {3, 1, 66, 64}, kOrientations[i], layout, 1);
      }
    });
  }
  for (std::thread& thread : threads) {
    thread.join();
  }
  for (const std::string& difference : found) {
    EXPECT_EQ(difference, "");
  }
}

}  // namespace
}  // namespace kyface::test
