// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// What tiles are made of on Arm, where stores interleave lanes of several registers.
#pragma once

#include <cstddef>

#include "simd/shuffle.h"
#include "simd/vector.h"

namespace HPC::fastcv::arm {

template <>
inline constexpr TileSize kLargestTile<3> = {4, 4};
template <>
inline constexpr TileSize kLargestTile<12> = {1, 4};

/// Distances in bytes from the first of `count` equally distant source rows to each.
template <int count>
struct RowOffsets {
  ptrdiff_t at[count];

  TILE_INLINE explicit RowOffsets(ptrdiff_t step) {
    for (int r = 0; r < count; ++r) {
      at[r] = r * step;
      // Sixteen are more than there is room for.
      if constexpr (count < 16) {
        forget(at[r]);
      }
    }
  }

  /// The place in row `r` that lies below `p` of the first.
  template <int r>
  TILE_INLINE const unsigned char* of(const unsigned char* p) const {
    return p + at[r];
  }
};

namespace detail {

/// Writes lane `lane` of 8 bytes of two registers, one behind the other.
template <int lane>
TILE_INLINE void storePair(unsigned char* p, Bytes a, Bytes b) {
  const uint64x2x2_t pair = {{vreinterpretq_u64_u8(a), vreinterpretq_u64_u8(b)}};
  vst2q_lane_u64(reinterpret_cast<uint64_t*>(p), pair, lane);
}

/// Writes lane `lane` of 4 bytes of three registers, one behind the other.
template <int lane, typename V>
TILE_INLINE void storeTriple(unsigned char* p, V a, V b, V c) {
  const uint32x4x3_t words = {{(uint32x4_t)a, (uint32x4_t)b, (uint32x4_t)c}};
  vst3q_lane_u32(reinterpret_cast<uint32_t*>(p), words, lane);
}

/// The 12 bytes of four 3-byte pixels; with `past` also the 4 bytes behind them.
template <bool past>
TILE_INLINE Bytes loadFourPixels(const unsigned char* p) {
  if constexpr (past) {
    return vld1q_u8(p);
  } else {
    const uint32x2_t last = vset_lane_u32(loadAs<uint32_t>(p + 8), vdup_n_u32(0), 0);
    return vcombine_u8(vld1_u8(p), vreinterpret_u8_u32(last));
  }
}

/// Four rows by four columns of 3-byte pixels. A destination row, a3b3c3d3 from the source rows a, b, c and
/// d, is three words; each is put together for all four columns at once, from the two rows that it holds
/// bytes of.
template <bool past>
TILE_INLINE void moveTripletTile(const unsigned char* src, const RowOffsets<4>& rows, RowPairs& out) {
  static constexpr unsigned char kFirst[] = {0, 1, 2, 16, 3, 4, 5, 19, 6, 7, 8, 22, 9, 10, 11, 25};
  static constexpr unsigned char kSecondFromB[] = {1, 2, 99, 99, 4, 5, 99, 99, 7, 8, 99, 99, 10, 11, 99, 99};
  static constexpr unsigned char kSecondFromC[] = {99, 99, 0, 1, 99, 99, 3, 4, 99, 99, 6, 7, 99, 99, 9, 10};
  static constexpr unsigned char kThird[] = {2, 16, 17, 18, 5, 19, 20, 21, 8, 22, 23, 24, 11, 25, 26, 27};
  const Bytes a = loadFourPixels<past>(rows.of<0>(src));
  const Bytes b = loadFourPixels<past>(rows.of<1>(src));
  const Bytes c = loadFourPixels<past>(rows.of<2>(src));
  const Bytes d = loadFourPixels<past>(rows.of<3>(src));
  const uint8x16x2_t ab = {{a, b}};
  const uint8x16x2_t cd = {{c, d}};
  const Bytes first = vqtbl2q_u8(ab, vld1q_u8(kFirst));
  const Bytes second = vqtbx1q_u8(vqtbl1q_u8(b, vld1q_u8(kSecondFromB)), c, vld1q_u8(kSecondFromC));
  const Bytes third = vqtbl2q_u8(cd, vld1q_u8(kThird));
  unrolled<4>([&](auto i) TILE_LAMBDA { storeTriple<i>(out.next<i>(), first, second, third); });
}

/// One row of four columns of 12-byte pixels.
TILE_INLINE void moveWordTriplets(const unsigned char* src, RowPairs& out) {
  Floats v[3];
  loadChannels(reinterpret_cast<const float*>(src), v);
  unrolled<4>([&](auto i) TILE_LAMBDA { storeTriple<i>(out.next<i>(), v[0], v[1], v[2]); });
}

}  // namespace detail

/// Writes the bytes of two registers in turn.
TILE_INLINE void storeInTurn(unsigned char* p, Part a, Part b) {
  const uint8x16x2_t both = {{a, b}};
  vst2q_u8(p, both);
}

/// Eight 3-byte pixels in reverse order.
TILE_INLINE void reverseEightTriplets(const unsigned char* src, unsigned char* dst) {
  const uint8x8x3_t v = vld3_u8(src);
  const uint8x8x3_t out = {{vrev64_u8(v.val[0]), vrev64_u8(v.val[1]), vrev64_u8(v.val[2])}};
  vst3_u8(dst, out);
}

}  // namespace HPC::fastcv::arm
