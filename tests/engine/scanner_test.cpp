// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// The search itself, against dlib's own: gradients, features, resized pictures and detections.
#include "engine/src/scanner.h"

#include <dlib/image_transforms.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <random>
#include <vector>

#include "tests/support/guarded_image.h"
#include "tests/support/picture.h"

namespace kyengine::test {
namespace {

GrayImage Gray(const Picture& picture) {
  GrayImage gray(picture.height, picture.width);
  for (int y = 0; y < picture.height; ++y) {
    for (int x = 0; x < picture.width; ++x) {
      gray[y][x] = picture.at(x, y)[1];
    }
  }
  return gray;
}

GrayImage Noise(int width, int height, unsigned int seed) {
  std::mt19937 random(seed);
  GrayImage gray(height, width);
  for (int y = 0; y < height; ++y) {
    for (int x = 0; x < width; ++x) {
      gray[y][x] = static_cast<unsigned char>(random());
    }
  }
  return gray;
}

GrayImage Copy(const GrayImage& picture) {
  GrayImage copy;
  dlib::assign_image(copy, picture);
  return copy;
}

// ---- gradients
// ---------------------------------------------------------------------------------------------------

/// The first of the directions, then of their opposites, that a gradient's product with is largest.
int DirectionOf(int dx, int dy) {
  constexpr float kVectors[9][2] = {{1.0000F, 0.0000F},  {0.9397F, 0.3420F},  {0.7660F, 0.6428F},
                                    {0.500F, 0.8660F},   {0.1736F, 0.9848F},  {-0.1736F, 0.9848F},
                                    {-0.5000F, 0.8660F}, {-0.7660F, 0.6428F}, {-0.9397F, 0.3420F}};
  double best = 0;
  int direction = 0;
  for (int d = 0; d < 9; ++d) {
    const double product =
        static_cast<double>(kVectors[d][0]) * dx + static_cast<double>(kVectors[d][1]) * dy;
    if (product > best) {
      best = product;
      direction = d;
    } else if (-product > best) {
      best = -product;
      direction = d + 9;
    }
  }
  return direction;
}

TEST(GradientTest, EveryGradientOfBytes) {
  // Pixels two apart from one another differ by what is in turn for each row.
  constexpr int kCount = 511;
  for (int dy = -255; dy <= 255; ++dy) {
    kyface::test::GuardedImage<uint8_t> rows(3, 3 * kCount, 3 * kCount);
    for (int i = 0; i < kCount; ++i) {
      const int dx = i - 255;
      rows.row(0)[3 * i + 1] = static_cast<uint8_t>(dy < 0 ? -dy : 0);
      rows.row(2)[3 * i + 1] = static_cast<uint8_t>(dy < 0 ? 0 : dy);
      rows.row(1)[3 * i] = static_cast<uint8_t>(dx < 0 ? -dx : 0);
      rows.row(1)[3 * i + 2] = static_cast<uint8_t>(dx < 0 ? 0 : dx);
    }
    std::vector<uint8_t> directions(3 * kCount);
    std::vector<float> lengths(3 * kCount);
    findGradients(rows.row(0), rows.row(1), rows.row(2), 1, 3 * kCount - 1, directions.data(),
                  lengths.data());
    for (int i = 0; i < kCount; ++i) {
      const int dx = i - 255;
      const double length = std::sqrt(static_cast<double>(dx * dx + dy * dy));
      ASSERT_NEAR(length, lengths[static_cast<size_t>(3 * i + 1)], 1e-6 * length) << dx << ", " << dy;
      if (dx != 0 || dy != 0) {
        ASSERT_EQ(DirectionOf(dx, dy), directions[static_cast<size_t>(3 * i + 1)]) << dx << ", " << dy;
      }
    }
  }
}

TEST(GradientTest, RowsOfEveryWidth) {
  std::mt19937 random(7);
  for (int width = 3; width <= 3 + 2 * 16 + 5; ++width) {
    kyface::test::GuardedImage<uint8_t> rows(3, width, width);
    rows.fill([&] { return static_cast<uint8_t>(random()); });
    kyface::test::GuardedImage<uint8_t> directions(1, width - 1, width - 1);
    kyface::test::GuardedImage<float> lengths(1, width - 1, width - 1);
    const uint8_t before = directions.row(0)[0];
    findGradients(rows.row(0), rows.row(1), rows.row(2), 1, width - 1, directions.data(), lengths.data());
    EXPECT_EQ(before, directions.row(0)[0]) << "the border has no gradient";
    for (int x = 1; x < width - 1; ++x) {
      const int dx = rows.row(1)[x + 1] - rows.row(1)[x - 1];
      const int dy = rows.row(2)[x] - rows.row(0)[x];
      ASSERT_EQ(DirectionOf(dx, dy), directions.row(0)[x]) << width << ", " << x;
      ASSERT_NEAR(std::sqrt(static_cast<double>(dx * dx + dy * dy)), lengths.row(0)[x], 1e-3);
    }
  }
}

// ---- features
// ---------------------------------------------------------------------------------------------------

void ExpectFeatures(const GrayImage& picture, int cell) {
  constexpr int kTapsDown = 7;
  constexpr int kTapsAcross = 10;
  dlib::array<dlib::array2d<float>> expected;
  dlib::extract_fhog_features(picture, expected, cell, kTapsDown, kTapsAcross);
  const int rows = FeatureMap::cellsOf(static_cast<int>(picture.nr()), cell);
  const int columns = FeatureMap::cellsOf(static_cast<int>(picture.nc()), cell);
  if (expected.size() == 0 || expected[0].size() == 0) {
    EXPECT_TRUE(rows <= 0 || columns <= 0);
    return;
  }
  constexpr int kAbove = (kTapsDown - 1) / 2;
  constexpr int kBefore = (kTapsAcross - 1) / 2;
  ASSERT_EQ(expected[0].nr(), rows + kTapsDown - 1);
  ASSERT_EQ(expected[0].nc(), columns + kTapsAcross - 1);
  // Whole, and in bands of which the last reaches beyond the picture.
  FeatureMap map;
  for (const int band : {rows + kTapsDown - 1, 5}) {
    for (int first = 0; first < rows + kTapsDown - 1; first += band) {
      map.computeCells(picture, cell, first - kAbove, band, kBefore, kTapsAcross - 1 - kBefore);
      for (int feature = 0; feature < kFeatures; ++feature) {
        for (int y = 0; y < band && first + y < rows + kTapsDown - 1; ++y) {
          for (int x = 0; x < columns + kTapsAcross - 1; ++x) {
            ASSERT_NEAR(expected[static_cast<size_t>(feature)][first + y][x], map.row(feature, y)[x], 2e-6)
                << picture.nc() << " x " << picture.nr() << ", cells of " << cell << ", feature " << feature
                << " at " << x << ", " << first + y;
          }
        }
      }
    }
  }
}

TEST(FeatureTest, AreDlibs) {
  ExpectFeatures(Gray(Part(Portrait(), 120, 40, 203, 170)), 8);
  ExpectFeatures(Noise(120, 64, 1), 8);
  ExpectFeatures(Noise(77, 91, 2), 4);
}

TEST(FeatureTest, PicturesOfEverySize) {
  for (int width = 1; width <= 50; ++width) {
    ExpectFeatures(Noise(width, 41, static_cast<unsigned int>(width)), 8);
    ExpectFeatures(Noise(45, width, static_cast<unsigned int>(width)), 8);
  }
}

TEST(FeatureTest, CellsOfEverySize) {
  // Where a cell's size is no power of two, dlib's own rounding differs between a row's pixels.
  for (const int cell : {2, 4, 8, 16, 32}) {
    ExpectFeatures(Noise(6 * cell + 3, 5 * cell + 1, static_cast<unsigned int>(cell)), cell);
  }
}

// ---- sizes
// ---------------------------------------------------------------------------------------------------

TEST(ResizeTest, IsBilinear) {
  for (const auto& [in_width, in_height, width, height] : {std::tuple(1, 1, 5, 3),
                                                           {5, 4, 1, 1},
                                                           {2, 9, 17, 8},
                                                           {61, 33, 61, 33},
                                                           {61, 33, 50, 27},
                                                           {40, 30, 89, 67},
                                                           {64, 48, 35, 26},
                                                           {3, 1, 40, 2},
                                                           {1, 7, 9, 3}}) {
    const GrayImage from = Noise(in_width, in_height, 3);
    GrayImage to(height, width);
    Resizer().resize(from, to);
    for (int y = 0; y < height; ++y) {
      for (int x = 0; x < width; ++x) {
        const double at_x = width > 1 ? static_cast<double>(x) * (in_width - 1) / (width - 1) : 0;
        const double at_y = height > 1 ? static_cast<double>(y) * (in_height - 1) / (height - 1) : 0;
        const int left = static_cast<int>(at_x);
        const int top = static_cast<int>(at_y);
        const int right = std::min(left + 1, in_width - 1);
        const int bottom = std::min(top + 1, in_height - 1);
        const double upper = from[top][left] + (from[top][right] - from[top][left]) * (at_x - left);
        const double lower = from[bottom][left] + (from[bottom][right] - from[bottom][left]) * (at_x - left);
        ASSERT_NEAR(upper + (lower - upper) * (at_y - top), to[y][x], 0.501) << x << ", " << y;
      }
    }
  }
}

TEST(ResizeTest, HalvesByMeans) {
  const GrayImage from = Noise(13, 8, 4);
  GrayImage to;
  halve(from, to);
  ASSERT_EQ(4, to.nr());
  ASSERT_EQ(6, to.nc());
  for (int y = 0; y < 4; ++y) {
    for (int x = 0; x < 6; ++x) {
      const double mean = (from[2 * y][2 * x] + from[2 * y][2 * x + 1] + from[2 * y + 1][2 * x] +
                           from[2 * y + 1][2 * x + 1]) /
                          4.0;
      EXPECT_EQ(std::floor(mean + 0.5), to[y][x]);
    }
  }
}

// ---- detections
// ---------------------------------------------------------------------------------------------------

void ExpectDetections(dlib::frontal_face_detector& detector, const GrayImage& picture, double least,
                      size_t at_least) {
  std::vector<dlib::rect_detection> expected;
  detector(picture, expected, least);
  ASSERT_GE(expected.size(), at_least);
  Scanner scanner(std::make_shared<const Filters>(detector));
  GrayImage copy = Copy(picture);
  const std::vector<dlib::rect_detection> found = scanner.find(copy, least);
  // dlib adds up where a row's pixels are sampled, which drifts off the further the longer the row.
  constexpr double kRounding = 0.02;
  const auto expect_in = [&](const dlib::rect_detection& d, const std::vector<dlib::rect_detection>& others) {
    if (d.detection_confidence < least + kRounding) {
      return;
    }
    const auto same = std::find_if(others.begin(), others.end(), [&](const dlib::rect_detection& other) {
      return other.rect == d.rect && other.weight_index == d.weight_index;
    });
    ASSERT_NE(others.end(), same) << d.rect;
    EXPECT_NEAR(d.detection_confidence, same->detection_confidence, kRounding);
  };
  for (const dlib::rect_detection& d : expected) {
    expect_in(d, found);
  }
  for (const dlib::rect_detection& d : found) {
    expect_in(d, expected);
  }
  for (size_t i = 1; i < found.size(); ++i) {
    EXPECT_GE(found[i - 1].detection_confidence, found[i].detection_confidence);
  }
}

TEST(ScannerTest, FindsWhatDlibFinds) {
  dlib::frontal_face_detector detector = dlib::get_frontal_face_detector();
  ExpectDetections(detector, Gray(Portrait()), 0, 1);
  ExpectDetections(detector, Gray(Portrait()), -0.4, 1);
  ExpectDetections(detector, Gray(Part(Portrait(), 100, 50, 333, 207)), 0, 1);
  for (const double zoom : {0.95, 1.3, 2.1}) {
    for (const double roll : {-20.0, 0.0, 17.0}) {
      ExpectDetections(detector, Gray(View(Portrait(), 222, 126, zoom, roll, 210)), -0.2, 1);
    }
  }
}

TEST(ScannerTest, FindsNothingWhereThereIsNothing) {
  dlib::frontal_face_detector detector = dlib::get_frontal_face_detector();
  ExpectDetections(detector, Noise(150, 120, 5), 0, 0);
  ExpectDetections(detector, Noise(81, 80, 6), 0, 0);
  for (const int side : {1, 2, 7, 15, 23, 64, 79}) {
    Scanner scanner(std::make_shared<const Filters>(detector));
    GrayImage picture = Noise(side, 81 - side, 7);
    EXPECT_TRUE(scanner.find(picture, 0).empty()) << side;
  }
}

TEST(ScannerTest, OtherWindows) {
  // Filters of other sizes, of a few random parts.
  std::mt19937 random(8);
  const auto number = [&] { return static_cast<double>(random()) / 4294967296.0 - 0.5; };
  for (const auto& [width, height, padding] : {std::tuple(40, 64, 1), {72, 32, 0}}) {
    dlib::scan_fhog_pyramid<dlib::pyramid_down<6>> scanner;
    scanner.set_detection_window_size(static_cast<unsigned long>(width), static_cast<unsigned long>(height));
    scanner.set_padding(static_cast<unsigned long>(padding));
    std::vector<dlib::matrix<double, 0, 1>> filters(2);
    for (auto& filter : filters) {
      filter.set_size(scanner.get_num_dimensions() + 1);
      for (double& weight : filter) {
        weight = number();
      }
      filter(filter.size() - 1) = 1.2;
    }
    dlib::frontal_face_detector detector(scanner, dlib::test_box_overlap(0.3, 0.9), filters);
    ExpectDetections(detector, Gray(Part(Portrait(), 150, 60, 150, 130)), 0, 1);
  }
}

}  // namespace
}  // namespace kyengine::test
