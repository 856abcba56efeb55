// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

#include "resize.h"

#include <algorithm>
#include <bit>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <cstring>

#include "lanes.h"
#include "simd/loop.h"

namespace kyengine {
namespace {

/// A place in the larger or smaller picture: between a row or column and the next, and how far on the way.
struct Place {
  int first;
  float way;
};

/// Where number `i` of `count` lies among `among`, the first and the last upon the first and the last.
Place placeOf(int i, int count, int among) {
  if (among == 1) {
    return {0, 0};
  }
  const double at = static_cast<double>(i) * (among - 1) / std::max(count - 1, 1);
  const int first = std::min(static_cast<int>(at), among - 2);
  return {first, static_cast<float>(at - first)};
}

/// Works on blocks of 16 of `count` results, the last of which may be done again, or on single ones where
/// there are fewer.
template <typename Block, typename Single>
void inBlocks(int count, Block block, Single single) {
  simd::walk<kLanes, 1, 1>(
      count, simd::Tail::kOverlap, [&](ptrdiff_t x, simd::Blocks<1>) { block(x); }, single);
}

/// a + (b - a) way of each of `count` bytes.
void blend(const uint8_t* a, const uint8_t* b, float way, int count, float* result) {
  inBlocks(
      count,
      [=](ptrdiff_t x) {
        const Lanes from = loadBytes(a + x);
        store(multiplyAdd(from, loadBytes(b + x) - from, broadcast(way)), result + x);
      },
      [=](ptrdiff_t x) {
        result[x] = std::fma(static_cast<float>(b[x] - a[x]), way, static_cast<float>(a[x]));
      });
}

/// The number of `row` at each of 16 columns, and the one after it.
struct Neighbours {
  Lanes left;
  Lanes right;
};
Neighbours loadNeighbours(const float* row, const int* columns) {
  typedef uint64_t Pairs __attribute__((vector_size(32)));
  typedef float Eight __attribute__((vector_size(32)));
  const auto pair = [=](int i) {
    uint64_t two;
    std::memcpy(&two, row + columns[i], sizeof(two));
    return two;
  };
  Eight left[2];
  Eight right[2];
#pragma GCC unroll 2
  for (int i = 0; i < 2; ++i) {
    const int k = 8 * i;
    const auto a = (Eight)Pairs{pair(k), pair(k + 1), pair(k + 4), pair(k + 5)};
    const auto b = (Eight)Pairs{pair(k + 2), pair(k + 3), pair(k + 6), pair(k + 7)};
    left[i] = __builtin_shufflevector(a, b, 0, 2, 8, 10, 4, 6, 12, 14);
    right[i] = __builtin_shufflevector(a, b, 1, 3, 9, 11, 5, 7, 13, 15);
  }
  return {std::bit_cast<Lanes>(left), std::bit_cast<Lanes>(right)};
}

/// The same between neighbours of a row, rounded to bytes.
void blendColumns(const float* row, const int* columns, const float* ways, int count, uint8_t* result) {
  inBlocks(
      count,
      [=](ptrdiff_t x) {
        const Neighbours of = loadNeighbours(row, columns + x);
        const Lanes value = multiplyAdd(of.left, of.right - of.left, load(ways + x));
        storeBytes(value + broadcast(0.5F), result + x);
      },
      [=](ptrdiff_t x) {
        const float* const left = row + columns[x];
        // NOLINTNEXTLINE(bugprone-incorrect-roundings): never negative, and as the blocks round
        result[x] = static_cast<uint8_t>(std::fma(left[1] - left[0], ways[x], left[0]) + 0.5F);
      });
}

}  // namespace

void Resizer::resize(const GrayImage& from, GrayImage& to) {
  const int widthIn = static_cast<int>(from.nc());
  const int heightIn = static_cast<int>(from.nr());
  const int width = static_cast<int>(to.nc());
  const int height = static_cast<int>(to.nr());
  columns_.resize(static_cast<size_t>(width));
  ways_.resize(static_cast<size_t>(width));
  for (int x = 0; x < width; ++x) {
    const Place place = placeOf(x, width, widthIn);
    columns_[static_cast<size_t>(x)] = place.first;
    ways_[static_cast<size_t>(x)] = place.way;
  }
  // A column more for a picture of one.
  blended_.assign(static_cast<size_t>(widthIn) + 1, 0);
  for (int y = 0; y < height; ++y) {
    const Place place = placeOf(y, height, heightIn);
    const uint8_t* const upper = &from[place.first][0];
    const uint8_t* const lower = heightIn > 1 ? upper + widthIn : upper;
    blend(upper, lower, place.way, widthIn, blended_.data());
    blendColumns(blended_.data(), columns_.data(), ways_.data(), width, &to[y][0]);
  }
}

void halve(const GrayImage& from, GrayImage& to) {
  const int width = static_cast<int>(from.nc() / 2);
  const int height = static_cast<int>(from.nr() / 2);
  to.set_size(height, width);
  for (int y = 0; y < height; ++y) {
    const uint8_t* const upper = &from[2 * static_cast<long>(y)][0];
    const uint8_t* const lower = &from[2 * static_cast<long>(y) + 1][0];
    uint8_t* const result = &to[y][0];
    for (int x = 0; x < width; ++x) {
      const ptrdiff_t i = 2 * static_cast<ptrdiff_t>(x);
      result[x] = static_cast<uint8_t>((upper[i] + upper[i + 1] + lower[i] + lower[i + 1] + 2) / 4);
    }
  }
}

}  // namespace kyengine
