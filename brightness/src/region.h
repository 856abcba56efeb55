// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// What the metrics share: the rectangle, the walk over its pixels and the mean.
#pragma once

#include <algorithm>
#include <array>
#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstring>
#include <numeric>

#include "brightness/clip.h"
#include "simd/loop.h"
#include "simd/pixel.h"

namespace kyface::brightness {

/// Pixels of a block.
inline constexpr int kBlock = HPC::fastcv::arm::kBlockPixels<unsigned char>;

/// The arguments of a metric.
struct Region {
  const unsigned char* data;
  int width;
  int widthStride;
  int height;
  int rectX;
  int rectY;
  int rectW;
  int rectH;
};

// Counts and sums are 32-bit and wrap, so that every argument has a defined result.
inline int wrapped(uint32_t value) { return static_cast<int>(value); }

/// The part of [start, start + extent) inside [0, size): from `first` to before `end`, none if that is not
/// behind it.
struct Range {
  int64_t first;
  int64_t end;

  Range(int start, int extent, int size)
      : first(std::max(start, 0)), end(reachesBeyond(start, extent, size) ? size : int64_t{start} + extent) {}

  /// Negative where the two ends are the wrong way round.
  int64_t count() const { return end - first; }
};

/// A block of pixels, in the form in which `Sum` takes it.
template <typename Sum>
inline auto loadBlock(const unsigned char* p) {
  using namespace HPC::fastcv::arm;
  if constexpr (Sum::kWeighs) {
    return loadColours<Sum::kChannels>(p);
  } else {
    return loadPixels<Bytes, Sum::kChannels>(p);
  }
}

/// Adds a row of `length` >= 1 pixels to `sum`. The pixels after the last whole block come as one more block,
/// in which those that are not to be counted are black: black adds nothing to any metric.
template <typename Sum>
inline void addRow(Sum& sum, const unsigned char* row, ptrdiff_t length) {
  using namespace HPC::fastcv::arm;
  using Block = decltype(loadBlock<Sum>(row));
  constexpr int nc = Sum::kChannels;
  const ptrdiff_t rest = length % kBlock;
  walk<kBlock, Sum::kInFlight, kBlock>(
      length - rest, Tail::kSteps,
      [&](ptrdiff_t x, auto blocks) {
        Block pixels[blocks];
        for (int i = 0; i < blocks; ++i) {
          pixels[i] = loadBlock<Sum>(row + (x + ptrdiff_t{i} * kBlock) * nc);
        }
        sum.add(pixels);
      },
      [](ptrdiff_t) {});
  if (rest == 0) {
    return;
  }
  Block last[1];
  if (length > kBlock) {
    static constexpr auto kColumns = [] {
      std::array<unsigned char, kBlock> columns{};
      std::iota(columns.begin(), columns.end(), 0);
      return columns;
    }();
    const auto counts = load(kColumns.data()) >= splat<Bytes>(static_cast<unsigned char>(kBlock - rest));
    last[0] = masked((Bytes)counts, loadBlock<Sum>(row + (length - kBlock) * nc));
  } else {
    unsigned char padded[kBlock * nc] = {};
    memcpy(padded, row, static_cast<size_t>(rest * nc));
    last[0] = loadBlock<Sum>(padded);
  }
  sum.add(last);
}

/// The metric over a region. `Sum` adds up the values of pixels:
/// - `kChannels`: bytes of a pixel; `kInFlight`: blocks it is best given at a time;
/// - `kWeighs`: whether it takes blocks as Colours, not a channel a register;
/// - `add(blocks)`: adds an array of blocks; a black pixel adds 0;
/// - `total()`: the sum so far, in 32 bits.
template <typename Sum>
unsigned char meanOf(const Region& region) {
  const uint32_t area = static_cast<uint32_t>(region.rectW) * static_cast<uint32_t>(region.rectH);
  if (region.data == nullptr || region.widthStride < 1 || area == 0) {
    puts("wrong enter\r");
    return 255;
  }
  const Range columns(region.rectX, region.rectW, region.width);
  const Range rows(region.rectY, region.rectH, region.height);
  Sum sum;
  if (columns.count() > 0) {
    const ptrdiff_t start = columns.first * Sum::kChannels;
    for (ptrdiff_t row = rows.first; row < rows.end; ++row) {
      addRow(sum, region.data + row * region.widthStride + start, columns.count());
    }
  }
  const int n = wrapped(static_cast<uint32_t>(columns.count()) * static_cast<uint32_t>(rows.count()));
  if (n == 0) {
    return 0;
  }
  // Divided in 64 bits, for the one quotient that 32 cannot hold: its low byte is that of the wrapped one.
  const int rounded = wrapped(sum.total() + static_cast<uint32_t>(n / 2));
  return static_cast<unsigned char>(static_cast<int64_t>(rounded) / n);
}

}  // namespace kyface::brightness

/// Defines a metric by a function of a `Region`; and once more with a plain pointer, which is another name in
/// a library.
#define BRIGHTNESS_METRIC(name, ...)                                                                   \
  unsigned char name(const unsigned char* data, int width, int widthStride, int height,                \
                     int /*heightStride*/, int rectX, int rectY, int rectW, int rectH) {               \
    return __VA_ARGS__({data, width, widthStride, height, rectX, rectY, rectW, rectH});                \
  }                                                                                                    \
  KYFACE_EXPORT unsigned char name(unsigned char* data, int width, int widthStride, int height,        \
                                   int /*heightStride*/, int rectX, int rectY, int rectW, int rectH) { \
    return __VA_ARGS__({data, width, widthStride, height, rectX, rectY, rectW, rectH});                \
  }
