// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// The picture of a face that the descriptor takes: where the eyes come to, and how pixels are resampled.
#include "engine/src/aligned_face.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <complex>
#include <vector>

#include "engine_calls.h"

namespace kyengine::test {
namespace {

constexpr int kSide = 150;
using Point = std::complex<double>;
constexpr Point kLeft = {46.6, 46.4};
constexpr Point kRight = {99.95, 47.1};

/// A similarity, of the aligned picture to the frame: z -> turn z + move.
struct Similarity {
  Point turn;
  Point move;
  Point operator()(Point z) const { return turn * z + move; }
  Point Back(Point z) const { return (z - move) / turn; }
};

std::vector<uint8_t> Aligned(const TestFrame& f, const Similarity& map) {
  const Frame frame(f.bytes.data(), f.format, f.width, f.height, f.stride, KY_ORIENTATION_0);
  const auto point = [](Point z) { return dlib::dpoint(z.real(), z.imag()); };
  return alignedFace(frame, {point(map(kLeft)), point(map(kRight))}, kSide);
}

std::vector<uint8_t> Aligned(const Picture& picture, const Similarity& map) {
  return Aligned(TestFrame(picture, KY_PIXEL_RGB), map);
}

/// A picture whose colours rise evenly: red to the right, green downwards, blue to the left.
Picture Slopes(int width, int height) {
  Picture picture(width, height);
  for (int y = 0; y < height; ++y) {
    for (int x = 0; x < width; ++x) {
      uint8_t* const p = picture.at(x, y);
      p[0] = static_cast<uint8_t>(255 * x / (width - 1));
      p[1] = static_cast<uint8_t>(255 * y / (height - 1));
      p[2] = static_cast<uint8_t>(255 - p[0]);
    }
  }
  return picture;
}

TEST(AlignedFaceTest, AFaceThatIsAlignedStaysAsItIs) {
  const Picture part = Part(Portrait(), 150, 50, kSide, kSide);
  EXPECT_EQ(part.rgb, Aligned(part, {1, 0}));
  const Picture larger = Part(Portrait(), 140, 30, 200, 210);
  EXPECT_EQ(part.rgb, Aligned(larger, {1, {10, 20}}));
}

TEST(AlignedFaceTest, QuarterTurnsMovePixelsAlone) {
  const Picture part = Part(Portrait(), 150, 50, kSide, kSide);
  // The aligned picture's right is the frame's down.
  Picture turned(kSide, kSide);
  for (int y = 0; y < kSide; ++y) {
    for (int x = 0; x < kSide; ++x) {
      std::copy_n(part.at(x, y), 3, turned.at(kSide - 1 - y, x));
    }
  }
  const std::vector<uint8_t> aligned = Aligned(turned, {{0, 1}, {kSide - 1, 0}});
  for (size_t i = 0; i < aligned.size(); ++i) {
    ASSERT_NEAR(part.rgb[i], aligned[i], 1) << i;
  }
}

TEST(AlignedFaceTest, SlopesComeOutWhereTheMapPutsThem) {
  constexpr int kWidth = 700;
  constexpr int kHeight = 640;
  const Picture slopes = Slopes(kWidth, kHeight);
  for (const double scale : {0.3, 0.8, 1.0, 1.1, 1.9, 2.0, 2.7, 3.0}) {
    for (const double degrees : {0.0, 17.0, -33.0, 90.0, 181.0}) {
      const Point turn = std::polar(scale, degrees * M_PI / 180);
      const Similarity map = {turn, Point(350.3, 320.7) - turn * Point(74.5, 74.5)};
      const std::vector<uint8_t> aligned = Aligned(slopes, map);
      for (int y = 0; y < kSide; ++y) {
        for (int x = 0; x < kSide; ++x) {
          const Point at = map(Point(x, y));
          const uint8_t* const p = &aligned[static_cast<size_t>(3 * (y * kSide + x))];
          const double red = 255 * at.real() / (kWidth - 1);
          ASSERT_NEAR(red, p[0], 1.6) << scale << ", " << degrees << ": " << x << ", " << y;
          ASSERT_NEAR(255 * at.imag() / (kHeight - 1), p[1], 1.6);
          ASSERT_NEAR(255 - red, p[2], 1.6);
        }
      }
    }
  }
}

TEST(AlignedFaceTest, FinePatternsAreAveragedAway) {
  for (const int step : {2, 3, 4, 5, 7}) {
    Picture board(kSide * step + 40, kSide * step + 40);
    for (int y = 0; y < board.height; ++y) {
      for (int x = 0; x < board.width; ++x) {
        std::fill_n(board.at(x, y), 3, (x + y) % 2 == 0 ? 255 : 0);
      }
    }
    for (const double scale : {1.0 * step, step + 0.43}) {
      const std::vector<uint8_t> aligned = Aligned(board, {scale * 0.9999, {5, 5}});
      // One pixel more or less of a square is the most that can remain.
      const double most = 128.0 / (step * step - 2);
      for (int y = 1; y < kSide - 20; ++y) {
        for (int x = 1; x < kSide - 20; ++x) {
          ASSERT_NEAR(127.5, aligned[static_cast<size_t>(3 * (y * kSide + x))], most + 1)
              << step << ", " << scale << ": " << x << ", " << y;
        }
      }
    }
  }
}

TEST(AlignedFaceTest, OutsideTheFrameIsBlack) {
  const Picture white(100, 100, 255);
  for (const double scale : {0.5, 1.0, 1.7, 4.0}) {
    const Similarity map = {scale, {-30.0 * scale, 40}};
    const std::vector<uint8_t> aligned = Aligned(white, map);
    for (int y = 0; y < kSide; ++y) {
      for (int x = 0; x < kSide; ++x) {
        const Point at = map(Point(x, y));
        const double inside =
            std::min({at.real() + 0.5, at.imag() + 0.5, 99.5 - at.real(), 99.5 - at.imag()}) /
            std::max(scale, 1.0);
        if (std::fabs(inside) > 2) {
          ASSERT_EQ(inside > 0 ? 255 : 0, aligned[static_cast<size_t>(3 * (y * kSide + x))])
              << scale << ": " << x << ", " << y;
        }
      }
    }
  }
  // Far outside, and a face as large as one may be.
  const std::vector<uint8_t> nothing(static_cast<size_t>(kSide) * kSide * 3, 0);
  EXPECT_EQ(nothing, Aligned(white, {1, {5000, 5000}}));
  EXPECT_EQ(nothing, Aligned(white, {1, {-5000, 20}}));
  EXPECT_EQ(nothing, Aligned(white, {150, {-300000, -300000}}));
}

/// Writes `picture` into a 4:2:0 frame of its size as JFIF defines it.
void EncodeFullRange(const Picture& picture, TestFrame* frame) {
  const auto byte = [](double value) {
    return static_cast<uint8_t>(std::lround(std::clamp(value, 0.0, 255.0)));
  };
  const auto at = [frame](int y, int x) -> uint8_t& {
    return frame->bytes[static_cast<size_t>(y * frame->stride + x)];
  };
  for (int y = 0; y < picture.height; ++y) {
    for (int x = 0; x < picture.width; ++x) {
      const uint8_t* const p = picture.at(x, y);
      const double luma = 0.299 * p[0] + 0.587 * p[1] + 0.114 * p[2];
      at(y, x) = byte(luma);
      const int v_at = frame->format == KY_PIXEL_NV21 ? 0 : 1;
      at(picture.height + y / 2, x / 2 * 2 + v_at) = byte(128 + (p[0] - luma) / 1.402);
      at(picture.height + y / 2, x / 2 * 2 + 1 - v_at) = byte(128 + (p[2] - luma) / 1.772);
    }
  }
}

TEST(AlignedFaceTest, EveryFormatKeepsItsColours) {
  // Areas of one colour, as the 4:2:0 formats have no more.
  Picture areas(200, 200);
  for (int y = 0; y < 200; ++y) {
    for (int x = 0; x < 200; ++x) {
      uint8_t* const p = areas.at(x, y);
      p[0] = x < 100 ? 200 : 60;
      p[1] = y < 100 ? 180 : 90;
      p[2] = (x < 100) == (y < 100) ? 150 : 110;
    }
  }
  const Similarity map = {1, {25, 25}};
  const std::vector<uint8_t> expected = Aligned(areas, map);
  for (const int format : {KY_PIXEL_BGR, KY_PIXEL_BGRA, KY_PIXEL_RGBA}) {
    EXPECT_EQ(expected, Aligned(TestFrame(areas, format, KY_ORIENTATION_0, 10), map)) << format;
  }
  for (const int format : {KY_PIXEL_NV21, KY_PIXEL_NV12}) {
    TestFrame frame(areas, format, KY_ORIENTATION_0, 10);
    EncodeFullRange(areas, &frame);
    const std::vector<uint8_t> aligned = Aligned(frame, map);
    for (size_t i = 0; i < expected.size(); ++i) {
      ASSERT_NEAR(expected[i], aligned[i], 2) << format << ", " << i;
    }
  }
  const std::vector<uint8_t> gray = Aligned(TestFrame(areas, KY_PIXEL_GRAY), map);
  for (size_t i = 0; i < gray.size(); i += 3) {
    ASSERT_EQ(gray[i], gray[i + 1]);
    ASSERT_EQ(gray[i], gray[i + 2]);
  }
}

}  // namespace
}  // namespace kyengine::test
