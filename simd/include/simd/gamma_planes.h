// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// Look-ups in the gamma table for 16 bytes at a time.
#pragma once

#include <cstdint>

#include "simd/lab_tables.h"
#include "simd/loop.h"
#include "simd/neon.h"

namespace HPC::fastcv::arm {

/// The gamma table in the form that vector look-ups take: four quarters of 64 entries, each as low bytes and
/// as high bytes.
struct alignas(64) GammaPlanes {
  static constexpr int kQuarters = 4;
  static constexpr int kEntries = 64;
  uint8_t low[kQuarters][kEntries];
  uint8_t high[kQuarters][kEntries];

  constexpr void set(int index, uint16_t entry) {
    low[index / kEntries][index % kEntries] = static_cast<uint8_t>(entry);
    high[index / kEntries][index % kEntries] = static_cast<uint8_t>(entry >> 8);
  }
};

/// Linear light of 16 pixels: of the first 8, of the others.
struct Light {
  uint16x8_t half[2];
};

inline uint8x16x4_t loadEntries(const uint8_t (&entries)[GammaPlanes::kEntries]) {
  return {{vld1q_u8(entries), vld1q_u8(entries + 16), vld1q_u8(entries + 32), vld1q_u8(entries + 48)}};
}

/// Looks up `n` vectors of bytes at once: a quarter is held in registers for all of them.
template <int n>
inline void lookUp(const GammaPlanes& planes, const uint8x16_t (&bytes)[n], Light (&light)[n]) {
  uint8x16_t index[n];
  uint8x16_t low[n];
  uint8x16_t high[n];
  for (int i = 0; i < n; ++i) {
    index[i] = bytes[i];
    low[i] = high[i] = vdupq_n_u8(0);
  }
  // Unrolled as a whole, all quarters would be loaded ahead of their use: that is more than there are
  // registers.
#pragma GCC unroll 2
  for (int quarter = 0; quarter < GammaPlanes::kQuarters; ++quarter) {
    const uint8x16x4_t lows = loadEntries(planes.low[quarter]);
    const uint8x16x4_t highs = loadEntries(planes.high[quarter]);
    for (int i = 0; i < n; ++i) {
      // An index outside the quarter leaves what was found before.
      low[i] = vqtbx4q_u8(low[i], lows, index[i]);
      high[i] = vqtbx4q_u8(high[i], highs, index[i]);
      index[i] = vsubq_u8(index[i], vdupq_n_u8(GammaPlanes::kEntries));
    }
  }
  for (int i = 0; i < n; ++i) {
    light[i] = {
        {vreinterpretq_u16_u8(vzip1q_u8(low[i], high[i])), vreinterpretq_u16_u8(vzip2q_u8(low[i], high[i]))}};
  }
}

}  // namespace HPC::fastcv::arm
