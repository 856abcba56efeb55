// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// What the metrics share: the rectangle, the walk over its pixels and the mean.
#pragma once

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstring>

#include "brightness/clip.h"
#include "simd/loop.h"
#include "simd/pixel.h"

namespace kyface::brightness {

/// Pixels of a block.
inline constexpr int kBlock = HPC::fastcv::arm::kLanes<uint8x16_t>;

template <int nc>
using Block = HPC::fastcv::arm::Pixels<uint8x16_t, nc>;

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

/// Adds a row of `length` >= 1 pixels to `sum`. The pixels after the last whole block come as one more block,
/// in which those that are not to be counted are black: black adds nothing to any metric.
template <typename Sum>
inline void addRow(Sum& sum, const unsigned char* row, ptrdiff_t length) {
  using namespace HPC::fastcv::arm;
  constexpr int nc = Sum::kChannels;
  const ptrdiff_t rest = length % kBlock;
  walk<kBlock, Sum::kInFlight, kBlock>(
      length - rest, Tail::kSteps,
      [&](ptrdiff_t x, auto blocks) {
        Block<nc> pixels[blocks];
        for (int i = 0; i < blocks; ++i) {
          pixels[i] = loadPixels<uint8x16_t, nc>(row + (x + ptrdiff_t{i} * kBlock) * nc);
        }
        sum.add(pixels);
      },
      [](ptrdiff_t) {});
  if (rest == 0) {
    return;
  }
  Block<nc> last[1];
  if (length > kBlock) {
    static constexpr unsigned char kColumns[kBlock] = {0, 1, 2, 3, 4, 5, 6, 7, 8, 9, 10, 11, 12, 13, 14, 15};
    last[0] = loadPixels<uint8x16_t, nc>(row + (length - kBlock) * nc);
    const uint8x16_t counts =
        vcgeq_u8(vld1q_u8(kColumns), splat<uint8x16_t>(static_cast<unsigned char>(kBlock - rest)));
    for (uint8x16_t& channel : last[0].c) {
      channel = vandq_u8(channel, counts);
    }
  } else {
    unsigned char padded[kBlock * nc] = {};
    memcpy(padded, row, static_cast<size_t>(rest * nc));
    last[0] = loadPixels<uint8x16_t, nc>(padded);
  }
  sum.add(last);
}

/// The metric over a region. `Sum` adds up the values of pixels:
/// - `kChannels`: bytes of a pixel; `kInFlight`: blocks it is best given at a time;
/// - `add(const Block<kChannels> (&)[n])`: adds n blocks; a black pixel adds 0;
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
