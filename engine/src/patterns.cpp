// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

#include "patterns.h"

#include <dlib/image_transforms.h>

#include <algorithm>
#include <bit>
#include <cmath>
#include <cstddef>
#include <vector>

namespace kyengine {
namespace {

// The crop is scaled to a square of kCells x kCells cells of kCellSide pixels with a border for the patterns
// of the outermost pixels. The size, the radius and the smoothing are those that told views of one face
// (moved, scaled, rolled, noisy, with the detector's inexact boxes) from other parts of pictures best.
constexpr int kCells = 8;
constexpr int kCellSide = 10;
constexpr int kSide = kCells * kCellSide;
constexpr int kBorder = 4;
constexpr int kCropSide = kSide + 2 * kBorder;

/// Patterns of the eight neighbours with at most two changes around the circle have a bin each, all others
/// share one.
constexpr int kBins = 59;
constexpr int kHistograms = kCells * kCells * kBins;
static_assert(kHistograms == kPatternBytes);

/// Grays in 256ths. A multiple of one by up to 65536 still fits.
using Patch = std::array<std::array<uint32_t, kCropSide>, kCropSide>;

constexpr std::array<uint8_t, 256> kBinOf = [] {
  std::array<uint8_t, 256> bins = {};
  uint8_t next = 0;
  for (unsigned pattern = 0; pattern < bins.size(); ++pattern) {
    const auto byte = static_cast<uint8_t>(pattern);
    const bool uniform = std::popcount(static_cast<uint8_t>(byte ^ std::rotr(byte, 1))) <= 2;
    bins[pattern] = uniform ? next++ : kBins - 1;
  }
  return bins;
}();

/// The crop, smoothed by the binomial filter 1 4 6 4 1 in both directions, in 256ths. Whole numbers keep
/// areas of one gray exactly even.
Patch smoothed(const GrayImage& picture, const FaceCrop& crop) {
  GrayImage chip;
  dlib::extract_image_chip(picture,
                           dlib::chip_details(dlib::centered_drect(crop.centre, crop.side, crop.side),
                                              dlib::chip_dims(kCropSide, kCropSide), crop.angle),
                           chip);
  const auto filter = [](auto pixel) {
    return pixel(-2) + 4 * pixel(-1) + 6 * pixel(0) + 4 * pixel(1) + pixel(2);
  };
  Patch across = {};
  Patch smoothed = {};
  for (int y = 0; y < kCropSide; ++y) {
    for (int x = 2; x < kCropSide - 2; ++x) {
      across[y][x] = filter([&](int d) { return static_cast<uint32_t>(chip[y][x + d]); });
    }
  }
  for (int y = 2; y < kCropSide - 2; ++y) {
    for (int x = 2; x < kCropSide - 2; ++x) {
      smoothed[y][x] = filter([&](int d) { return across[y + d][x]; });
    }
  }
  return smoothed;
}

/// Which of the eight neighbours on the circle of radius 2 are at least as bright as the pixel.
unsigned patternAt(const Patch& p, int y, int x) {
  // A diagonal neighbour lies sqrt(2) away in both directions, 106 / 256 of the way from the first pixel to
  // the second; in 65536ths.
  const auto diagonal = [&](int dy, int dx) {
    constexpr uint32_t kFar = 106;
    constexpr uint32_t kNear = 256 - kFar;
    return kNear * (kNear * p[y + dy][x + dx] + kFar * p[y + dy][x + 2 * dx]) +
           kFar * (kNear * p[y + 2 * dy][x + dx] + kFar * p[y + 2 * dy][x + 2 * dx]);
  };
  constexpr uint32_t kOne = 256 * 256;
  const std::array<uint32_t, 8> circle = {kOne * p[y][x + 2], diagonal(-1, 1),    kOne * p[y - 2][x],
                                          diagonal(-1, -1),   kOne * p[y][x - 2], diagonal(1, -1),
                                          kOne * p[y + 2][x], diagonal(1, 1)};
  unsigned pattern = 0;
  for (size_t i = 0; i < circle.size(); ++i) {
    pattern |= static_cast<unsigned>(circle[i] >= kOne * p[y][x]) << i;
  }
  return pattern;
}

/// How much of a pixel in column (or row) `at` belongs to the cells before and after it, in 20ths. A pixel
/// counts for the cells whose centres it lies between, so that a small shift changes little.
struct Share {
  int cell;  ///< the cell before, -1 at the border
  int here;
  int next;
};
Share shareOf(int at) {
  constexpr int kParts = 2 * kCellSide;
  const int offset = 2 * at + 1 - kCellSide + kParts;  // from the centre of cell -1, in halves of a pixel
  return {offset / kParts - 1, kParts - offset % kParts, offset % kParts};
}

}  // namespace

Patterns patternsOf(const GrayImage& picture, const FaceCrop& crop) {
  const Patch patch = smoothed(picture, crop);
  std::vector<int> histograms(kHistograms, 0);
  const auto add = [&histograms](int row, int column, int bin, int weight) {
    if (row >= 0 && row < kCells && column >= 0 && column < kCells) {
      const int index = (row * kCells + column) * kBins + bin;
      histograms[static_cast<size_t>(index)] += weight;
    }
  };
  for (int y = 0; y < kSide; ++y) {
    const Share row = shareOf(y);
    for (int x = 0; x < kSide; ++x) {
      const Share column = shareOf(x);
      const int bin = kBinOf[patternAt(patch, y + kBorder, x + kBorder)];
      add(row.cell, column.cell, bin, row.here * column.here);
      add(row.cell, column.cell + 1, bin, row.here * column.next);
      add(row.cell + 1, column.cell, bin, row.next * column.here);
      add(row.cell + 1, column.cell + 1, bin, row.next * column.next);
    }
  }

  // The square roots of the shares that the bins have of their cell, in 255ths: their products measure how
  // much two histograms overlap.
  Patterns patterns = {};
  for (int cell = 0; cell < kCells * kCells; ++cell) {
    const auto first = histograms.begin() + static_cast<ptrdiff_t>(cell) * kBins;
    double total = 0;
    std::for_each(first, first + kBins, [&total](int count) { total += count; });
    std::transform(
        first, first + kBins, patterns.begin() + static_cast<ptrdiff_t>(cell) * kBins,
        [total](int count) { return static_cast<uint8_t>(std::lround(255 * std::sqrt(count / total))); });
  }
  return patterns;
}

float similarity(std::span<const uint8_t, kPatternBytes> a, std::span<const uint8_t, kPatternBytes> b) {
  int64_t ab = 0;
  int64_t aa = 0;
  int64_t bb = 0;
  for (size_t i = 0; i < a.size(); ++i) {
    ab += int64_t{a[i]} * b[i];
    aa += int64_t{a[i]} * a[i];
    bb += int64_t{b[i]} * b[i];
  }
  if (aa == 0 || bb == 0) {
    return 0;
  }
  // Unrelated pictures agree by 0.48 on average and rarely by more than 0.6, the same face in another frame
  // by 0.7 and more.
  constexpr double kUnrelated = 0.4;
  constexpr double kBorderline = 0.66;
  const double agreement =
      static_cast<double>(ab) / std::sqrt(static_cast<double>(aa) * static_cast<double>(bb));
  const double similarity = agreement < kBorderline
                                ? 0.5 * (agreement - kUnrelated) / (kBorderline - kUnrelated)
                                : 0.5 + 0.5 * (agreement - kBorderline) / (1 - kBorderline);
  return static_cast<float>(std::clamp(similarity, 0.0, 1.0));
}

}  // namespace kyengine
