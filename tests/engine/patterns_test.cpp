// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
// The features of local binary patterns against their definition, written out.
#include <algorithm>
#include <array>
#include <cmath>
#include <cstdint>
#include <random>
#include <string>
#include <vector>

#include "engine_calls.h"

namespace kyengine::test {
namespace {

constexpr int kCells = 8, kCellSide = 10, kBorder = 4;
constexpr int kSide = kCells * kCellSide;
constexpr int kCropSide = kSide + 2 * kBorder;
constexpr int kBins = 59;
constexpr size_t kMark = 3;  // bytes before the histograms

using Patch = std::array<std::array<int64_t, kCropSide>, kCropSide>;

/// The binomial filter over 5 x 5 pixels, in 256ths.
Patch Smoothed(const Patch& p) {
  constexpr int64_t kBinomial[] = {1, 4, 6, 4, 1};
  Patch out = {};
  for (int y = 2; y < kCropSide - 2; ++y) {
    for (int x = 2; x < kCropSide - 2; ++x) {
      for (int i = 0; i < 25; ++i) {
        out[y][x] += kBinomial[i / 5] * kBinomial[i % 5] * p[y + i / 5 - 2][x + i % 5 - 2];
      }
    }
  }
  return out;
}

/// The bin of a pixel's pattern: its neighbours on a circle of radius 2, counter-clockwise from the right
/// one, each a bit that is set where it is as bright or brighter.
int BinOf(const Patch& p, int y, int x) {
  const int64_t far = std::llround((std::sqrt(2.0) - 1) * 256), near = 256 - far;
  const int steps[8][2] = {{0, 1}, {-1, 1}, {-1, 0}, {-1, -1}, {0, -1}, {1, -1}, {1, 0}, {1, 1}};
  int pattern = 0;
  for (int i = 0; i < 8; ++i) {
    const int dy = steps[i][0], dx = steps[i][1];
    int64_t level = 65536 * p[y + 2 * dy][x + 2 * dx];
    if (dy != 0 && dx != 0) {
      level = near * near * p[y + dy][x + dx] + near * far * (p[y + dy][x + 2 * dx] + p[y + 2 * dy][x + dx]) +
              far * far * p[y + 2 * dy][x + 2 * dx];
    }
    pattern |= (level >= 65536 * p[y][x] ? 1 : 0) << i;
  }
  // Uniform patterns are numbered as they come; all others are the last bin.
  int bin = 0;
  for (int other = 0; other <= pattern; ++other) {
    int changes = 0;
    for (int i = 0; i < 8; ++i) {
      changes += (other >> i & 1) != (other >> ((i + 1) % 8) & 1);
    }
    if (other == pattern) {
      return changes <= 2 ? bin : kBins - 1;
    }
    bin += changes <= 2;
  }
  return -1;
}

/// What a pixel adds to a cell along one axis, in 20ths: it falls off linearly from the cell's centre to the
/// next one's.
int Weight(int at, int cell) {
  const int halfPixels = std::abs(2 * at + 1 - (2 * cell + 1) * kCellSide);
  return std::max(2 * kCellSide - halfPixels, 0);
}

std::vector<uint8_t> Histograms(const Patch& picture) {
  const Patch p = Smoothed(picture);
  std::vector<double> counts(static_cast<size_t>(kCells * kCells * kBins));
  for (int y = 0; y < kSide; ++y) {
    for (int x = 0; x < kSide; ++x) {
      const int bin = BinOf(p, y + kBorder, x + kBorder);
      for (int cell = 0; cell < kCells * kCells; ++cell) {
        counts[static_cast<size_t>(cell * kBins + bin)] +=
            Weight(y, cell / kCells) * Weight(x, cell % kCells);
      }
    }
  }
  std::vector<uint8_t> bytes;
  for (size_t first = 0; first < counts.size(); first += kBins) {
    double total = 0;
    for (size_t i = 0; i < kBins; ++i) {
      total += counts[first + i];
    }
    for (size_t i = 0; i < kBins; ++i) {
      bytes.push_back(static_cast<uint8_t>(std::lround(255 * std::sqrt(counts[first + i] / total))));
    }
  }
  return bytes;
}

std::vector<uint8_t> FromBase64(const std::string& text) {
  const std::string digits = "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/";
  std::vector<uint8_t> bytes;
  unsigned bits = 0;
  for (size_t i = 0; i < text.size(); ++i) {
    bits = bits << 6 | static_cast<unsigned>(digits.find(text[i]));
    if (i % 4 == 3) {
      bytes.insert(bytes.end(), {static_cast<uint8_t>(bits >> 16), static_cast<uint8_t>(bits >> 8),
                                 static_cast<uint8_t>(bits)});
    }
  }
  return bytes;
}

// A square as large as the crop is taken pixel by pixel, so that the definition gives every byte.
TEST(PatternsTest, EveryByteOfAFeature) {
  ky_handle_t verifier = nullptr;
  ASSERT_EQ(KY_SUCCESS, ky_verify_create_handle(&verifier, nullptr));
  constexpr int kLeft = 11, kTop = 7, kWidth = 110, kHeight = 100;
  std::mt19937 random(1);
  for (const int period : {1, 3, 9, 20}) {
    // Blotches of this size: patterns of every kind, and cells of few.
    std::vector<uint8_t> gray(kWidth * kHeight);
    for (int y = 0; y < kHeight; ++y) {
      for (int x = 0; x < kWidth; ++x) {
        const bool first = x % period == 0 && y % period == 0;
        gray[y * kWidth + x] =
            first ? static_cast<uint8_t>(random()) : gray[y / period * period * kWidth + x / period * period];
      }
    }
    Patch patch;
    for (int y = 0; y < kCropSide; ++y) {
      for (int x = 0; x < kCropSide; ++x) {
        patch[y][x] = gray[(kTop + y) * kWidth + kLeft + x];
      }
    }
    ky_face_t face = {};
    face.rect = {kLeft, kTop, kLeft + kCropSide, kTop + kCropSide};
    Feature feature;
    ASSERT_EQ(KY_SUCCESS, ky_verify_get_feature(verifier, gray.data(), KY_PIXEL_GRAY, kWidth, kHeight, kWidth,
                                                &face, &feature.feature, &feature.length));
    std::string text(KY_FEATURE_TEXT_LENGTH, '\0');
    ky_verify_serialize_feature(feature.feature, text.data());
    text.pop_back();
    const std::vector<uint8_t> bytes = FromBase64(text);
    const std::vector<uint8_t> expected = Histograms(patch);
    ASSERT_LE(kMark + expected.size(), bytes.size());
    for (size_t i = 0; i < expected.size(); ++i) {
      ASSERT_EQ(+expected[i], +bytes[kMark + i])
          << "blotches of " << period << ", cell " << i / kBins << ", bin " << i % kBins;
    }
  }
  ky_verify_destroy_handle(verifier);
}

}  // namespace
}  // namespace kyengine::test
