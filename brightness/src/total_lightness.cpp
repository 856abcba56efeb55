// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

#include "brightness/total_lightness.h"

#include <algorithm>
#include <limits>

#include "lightness_sum.h"
#include "luminance_tables.h"
#include "region.h"

namespace kyface::brightness {
namespace {

/// Pixels whose sum 32 bits hold.
constexpr std::ptrdiff_t kBand = std::numeric_limits<std::uint32_t>::max() / 255;

template <int blue>
std::uint64_t total(const unsigned char* first, std::ptrdiff_t stride, std::ptrdiff_t columns, int rows) {
  std::uint64_t total = 0;
  LightnessSum<blue> sum;
  std::ptrdiff_t room = kBand;
  const auto flush = [&] {
    total += sum.total();
    sum = LightnessSum<blue>();
    room = kBand;
  };
  for (std::ptrdiff_t row = 0; row < rows; ++row) {
    const unsigned char* pixels = first + row * stride;
    for (std::ptrdiff_t x = 0; x < columns;) {
      const std::ptrdiff_t length = std::min(columns - x, kBand);
      if (length > room) {
        flush();
      }
      addRow(sum, pixels + x * LightnessSum<blue>::kChannels, length);
      room -= length;
      x += length;
    }
  }
  return total + sum.total();
}

}  // namespace

std::uint64_t totalLightness(const unsigned char* first, std::ptrdiff_t stride, int columns, int rows,
                             bool rgba) {
  initLuminanceTables();
  return rgba ? total<2>(first, stride, columns, rows) : total<0>(first, stride, columns, rows);
}

}  // namespace kyface::brightness
