// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

#include "resize.h"

#include <algorithm>
#include <cmath>
#include <cstddef>
#include <cstdint>

#include "simd/neon.h"

namespace kyengine {
namespace {

/// A place in the larger or smaller picture: between a row or column and the next, and how far on the way.
struct Place {
  int first;
  float way;
};

/// Where number `i` of `count` lies among `among`, the first and the last upon the first and the last.
Place PlaceOf(int i, int count, int among) {
  if (among == 1) {
    return {0, 0};
  }
  const double at = static_cast<double>(i) * (among - 1) / std::max(count - 1, 1);
  const int first = std::min(static_cast<int>(at), among - 2);
  return {first, static_cast<float>(at - first)};
}

/// a + (b - a) way of each of `count` bytes. The result has room for whole vectors.
void Blend(const uint8_t* a, const uint8_t* b, float way, int count, float* result) {
  constexpr int kBlock = 8;
  int x = 0;
  for (; x + kBlock <= count; x += kBlock) {
    const uint16x8_t from = vmovl_u8(vld1_u8(a + x));
    const int16x8_t by = vreinterpretq_s16_u16(vsubl_u8(vld1_u8(b + x), vld1_u8(a + x)));
    vst1q_f32(result + x, vfmaq_n_f32(vcvtq_f32_u32(vmovl_u16(vget_low_u16(from))),
                                      vcvtq_f32_s32(vmovl_s16(vget_low_s16(by))), way));
    vst1q_f32(result + x + 4,
              vfmaq_n_f32(vcvtq_f32_u32(vmovl_high_u16(from)), vcvtq_f32_s32(vmovl_high_s16(by)), way));
  }
  for (; x < count; ++x) {
    result[x] = std::fma(static_cast<float>(b[x] - a[x]), way, static_cast<float>(a[x]));
  }
}

/// The same between neighbours of a row, for four results.
uint32x4_t Between4(const float* row, const int* columns, const float* ways) {
  const float32x4_t a = vcombine_f32(vld1_f32(row + columns[0]), vld1_f32(row + columns[1]));
  const float32x4_t b = vcombine_f32(vld1_f32(row + columns[2]), vld1_f32(row + columns[3]));
  const float32x4_t left = vuzp1q_f32(a, b);
  const float32x4_t right = vuzp2q_f32(a, b);
  const float32x4_t value = vfmaq_f32(left, vsubq_f32(right, left), vld1q_f32(ways));
  return vcvtq_u32_f32(vaddq_f32(value, vdupq_n_f32(0.5F)));
}

void Between(const float* row, const int* columns, const float* ways, int count, uint8_t* result) {
  constexpr int kBlock = 8;
  int x = 0;
  for (; x + kBlock <= count; x += kBlock) {
    const uint16x4_t low = vmovn_u32(Between4(row, columns + x, ways + x));
    const uint16x4_t high = vmovn_u32(Between4(row, columns + x + 4, ways + x + 4));
    vst1_u8(result + x, vmovn_u16(vcombine_u16(low, high)));
  }
  for (; x < count; ++x) {
    const float* const left = row + columns[x];
    result[x] = static_cast<uint8_t>(std::fma(left[1] - left[0], ways[x], left[0]) + 0.5F);
  }
}

}  // namespace

void Resizer::Resize(const GrayImage& from, GrayImage& to) {
  const int width_in = static_cast<int>(from.nc());
  const int height_in = static_cast<int>(from.nr());
  const int width = static_cast<int>(to.nc());
  const int height = static_cast<int>(to.nr());
  columns_.resize(static_cast<size_t>(width));
  ways_.resize(static_cast<size_t>(width));
  for (int x = 0; x < width; ++x) {
    const Place place = PlaceOf(x, width, width_in);
    columns_[static_cast<size_t>(x)] = place.first;
    ways_[static_cast<size_t>(x)] = place.way;
  }
  // A column more for a picture of one.
  blended_.assign(static_cast<size_t>(width_in) + 1, 0);
  for (int y = 0; y < height; ++y) {
    const Place place = PlaceOf(y, height, height_in);
    const uint8_t* const upper = &from[place.first][0];
    const uint8_t* const lower = height_in > 1 ? upper + width_in : upper;
    Blend(upper, lower, place.way, width_in, blended_.data());
    Between(blended_.data(), columns_.data(), ways_.data(), width, &to[y][0]);
  }
}

void Halve(const GrayImage& from, GrayImage& to) {
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
