// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// Tiles: small blocks of whole pixels, read along source rows and written along destination rows after a
/// transposition in registers. Rotations by 90 and 270 degrees are made of them.
///
/// A pixel is `bytes` bytes of no type: 1, 2, 3, 4, 8, 12 or 16. A tile of `rows` source rows by `columns`
/// source columns becomes `columns` destination rows of `rows` pixels. It writes exactly its own pixels.
#pragma once

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <type_traits>
#include <utility>

#include "simd/neon.h"
#include "simd/registers.h"

/// For what must not be a call: a tile lives in registers, its indices are constants. An instrumented build,
/// which is in no hurry, lets them be calls.
#ifndef TILE_INLINE
#define TILE_INLINE inline __attribute__((always_inline))
#define TILE_LAMBDA __attribute__((always_inline))
#endif

namespace HPC::fastcv::arm {

/// The destination rows of tiles, in the order in which they are written: rows whose distances alternate
/// between two values, `toSecond` behind a tile's first row and then what is left of `step`.
struct RowPairs {
  unsigned char* first;
  ptrdiff_t toSecond;
  ptrdiff_t step;
  unsigned char* second = nullptr;

  /// The place of row `index` of a tile, to be asked for in order. Of each pair one address is the other's
  /// update and one a sum of its own: in-order cores wait for a chain of updates, and a sum for every row is
  /// an instruction for every row.
  template <int index>
  TILE_INLINE unsigned char* next() {
    if constexpr (index % 2 == 1) {
      return second;
    } else {
      unsigned char* const at = first;
      second = first + toSecond;
      first += step;
      return at;
    }
  }
};

/// Distances in bytes from the first of `count` equally distant source rows to each.
template <int count>
struct RowOffsets {
  ptrdiff_t at[count];

  TILE_INLINE explicit RowOffsets(ptrdiff_t step) {
    for (int r = 0; r < count; ++r) {
      at[r] = r * step;
      forget(at[r]);
    }
  }
};

/// The largest tile of a pixel size: `rows` by `columns`, both powers of two. An even number of
/// columns, so that a tile ends with a pair of rows.
struct TileSize {
  int rows;
  int columns;
};
template <int bytes>
inline constexpr TileSize kLargestTile = {16 / bytes, 16 / bytes};
template <>
inline constexpr TileSize kLargestTile<3> = {4, 4};
template <>
inline constexpr TileSize kLargestTile<12> = {1, 4};
template <>
inline constexpr TileSize kLargestTile<16> = {2, 2};

/// Whether tiles of a pixel size are interleaved in registers, whose size they divide; else they are moved in
/// other ways.
template <int bytes>
inline constexpr bool kInterleaves = bytes < 16 && 16 % bytes == 0;

/// Source columns behind a tile that `moveTile` of the largest size also reads when it may.
template <int bytes>
inline constexpr int kTileReadsPast = bytes == 3 ? 2 : 0;

namespace detail {

template <typename F, int... i>
TILE_INLINE void unrolled(const F& f, std::integer_sequence<int, i...>) {
  (f(std::integral_constant<int, i>{}), ...);
}

/// A loop from 0 to n - 1 whose counter is a constant to its body.
template <int n, typename F>
TILE_INLINE void unrolled(const F& f) {
  unrolled(f, std::make_integer_sequence<int, n>{});
}

template <typename Word>
TILE_INLINE Word loadWord(const unsigned char* p) {
  Word word;
  memcpy(&word, p, sizeof(word));
  return word;
}

template <typename Word>
TILE_INLINE void storeWord(unsigned char* p, Word word) {
  memcpy(p, &word, sizeof(word));
}

}  // namespace detail

/// Loads `bytes` bytes (1, 2, 4, 8 or 16) into the low end of a register.
template <int bytes>
TILE_INLINE uint8x16_t loadBytes(const unsigned char* p) {
  if constexpr (bytes == 16) {
    return vld1q_u8(p);
  } else if constexpr (bytes == 8) {
    return vcombine_u8(vld1_u8(p), vdup_n_u8(0));
  } else if constexpr (bytes == 4) {
    return vreinterpretq_u8_u32(vsetq_lane_u32(detail::loadWord<uint32_t>(p), vdupq_n_u32(0), 0));
  } else if constexpr (bytes == 2) {
    return vreinterpretq_u8_u16(vsetq_lane_u16(detail::loadWord<uint16_t>(p), vdupq_n_u16(0), 0));
  } else {
    static_assert(bytes == 1);
    return vsetq_lane_u8(*p, vdupq_n_u8(0), 0);
  }
}

/// Stores lane `lane` of `bytes` bytes (1, 2, 4, 8 or 16).
template <int bytes, int lane>
TILE_INLINE void storeLane(unsigned char* p, uint8x16_t v) {
  if constexpr (bytes == 16) {
    static_assert(lane == 0);
    vst1q_u8(p, v);
  } else if constexpr (bytes == 8) {
    detail::storeWord(p, vgetq_lane_u64(vreinterpretq_u64_u8(v), lane));
  } else if constexpr (bytes == 4) {
    detail::storeWord(p, vgetq_lane_u32(vreinterpretq_u32_u8(v), lane));
  } else if constexpr (bytes == 2) {
    detail::storeWord(p, vgetq_lane_u16(vreinterpretq_u16_u8(v), lane));
  } else {
    static_assert(bytes == 1);
    *p = vgetq_lane_u8(v, lane);
  }
}

namespace detail {

/// Interleaves the elements of `bytes` bytes of the low, or of the high, halves of two registers.
template <int bytes, bool high>
TILE_INLINE uint8x16_t zip(uint8x16_t a, uint8x16_t b) {
  if constexpr (bytes == 1) {
    return high ? vzip2q_u8(a, b) : vzip1q_u8(a, b);
  } else if constexpr (bytes == 2) {
    const uint16x8_t x = vreinterpretq_u16_u8(a);
    const uint16x8_t y = vreinterpretq_u16_u8(b);
    return vreinterpretq_u8_u16(high ? vzip2q_u16(x, y) : vzip1q_u16(x, y));
  } else {
    static_assert(bytes == 4);
    const uint32x4_t x = vreinterpretq_u32_u8(a);
    const uint32x4_t y = vreinterpretq_u32_u8(b);
    return vreinterpretq_u8_u32(high ? vzip2q_u32(x, y) : vzip1q_u32(x, y));
  }
}

/// A tile half way: `groups` groups of source rows, each in `segments` registers one after the other along
/// the row. The low `used` bytes of a register hold pixels, in elements of `bytes` bytes: the pixels of one
/// group in one column.
template <int bytes, int used, int groups, int segments>
struct Registers {
  uint8x16_t v[groups * segments];
};

/// Interleaves neighbouring groups until an element is half a register or only one group is left.
template <int bytes, int used, int groups, int segments>
TILE_INLINE auto interleaved(const Registers<bytes, used, groups, segments>& in) {
  if constexpr (groups == 1 || bytes == 8) {
    return in;
  } else if constexpr (used == 16) {
    Registers<bytes * 2, used, groups / 2, segments * 2> out;
    unrolled<groups / 2 * segments>([&](auto i) TILE_LAMBDA {
      constexpr int kFrom = i / segments * 2 * segments + i % segments;
      out.v[2 * i] = zip<bytes, false>(in.v[kFrom], in.v[kFrom + segments]);
      out.v[2 * i + 1] = zip<bytes, true>(in.v[kFrom], in.v[kFrom + segments]);
    });
    return interleaved(out);
  } else {
    static_assert(segments == 1);
    Registers<bytes * 2, used * 2, groups / 2, 1> out;
    unrolled<groups / 2>([&](auto i)
                             TILE_LAMBDA { out.v[i] = zip<bytes, false>(in.v[2 * i], in.v[2 * i + 1]); });
    return interleaved(out);
  }
}

/// Writes the columns of an interleaved tile and calls `between(c)` after each. Where two groups are left,
/// the store interleaves them.
template <int columns, int bytes, int used, int groups, int segments, typename Between>
TILE_INLINE void storeColumns(const Registers<bytes, used, groups, segments>& in, RowPairs& out,
                              const Between& between) {
  unrolled<columns>([&](auto c) TILE_LAMBDA {
    constexpr int kInRegister = used / bytes;
    constexpr int kAt = c / kInRegister;
    constexpr int kLane = c % kInRegister;
    unsigned char* const p = out.next<c>();
    if constexpr (groups == 2) {
      const uint64x2x2_t pair = {
          {vreinterpretq_u64_u8(in.v[kAt]), vreinterpretq_u64_u8(in.v[kAt + segments])}};
      vst2q_lane_u64(reinterpret_cast<uint64_t*>(p), pair, kLane);
    } else {
      storeLane<bytes, kLane>(p, in.v[kAt]);
    }
    between(c);
  });
}

/// The 12 bytes of four 3-byte pixels; with `past` also the 4 bytes behind them.
template <bool past>
TILE_INLINE uint8x16_t loadFourPixels(const unsigned char* p) {
  if constexpr (past) {
    return vld1q_u8(p);
  } else {
    const uint32x2_t last = vset_lane_u32(loadWord<uint32_t>(p + 8), vdup_n_u32(0), 0);
    return vcombine_u8(vld1_u8(p), vreinterpret_u8_u32(last));
  }
}

/// Writes lane `lane` of three registers, 12 bytes, one behind the other.
template <int lane>
TILE_INLINE void storeWords(unsigned char* p, uint32x4_t first, uint32x4_t second, uint32x4_t third) {
  const uint32x4x3_t words = {{first, second, third}};
  vst3q_lane_u32(reinterpret_cast<uint32_t*>(p), words, lane);
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
  const uint8x16_t a = loadFourPixels<past>(src + rows.at[0]);
  const uint8x16_t b = loadFourPixels<past>(src + rows.at[1]);
  const uint8x16_t c = loadFourPixels<past>(src + rows.at[2]);
  const uint8x16_t d = loadFourPixels<past>(src + rows.at[3]);
  const uint8x16x2_t ab = {{a, b}};
  const uint8x16x2_t cd = {{c, d}};
  const uint32x4_t first = vreinterpretq_u32_u8(vqtbl2q_u8(ab, vld1q_u8(kFirst)));
  const uint32x4_t second =
      vreinterpretq_u32_u8(vqtbx1q_u8(vqtbl1q_u8(b, vld1q_u8(kSecondFromB)), c, vld1q_u8(kSecondFromC)));
  const uint32x4_t third = vreinterpretq_u32_u8(vqtbl2q_u8(cd, vld1q_u8(kThird)));
  unrolled<4>([&](auto i) TILE_LAMBDA { storeWords<i>(out.next<i>(), first, second, third); });
}

}  // namespace detail

/// Moves the tile at `src`. With `past` it may read kTileReadsPast<bytes> columns behind itself; without, it
/// reads exactly its own pixels.
template <int bytes, int rows, int columns, bool past, int count>
TILE_INLINE void moveTile(const unsigned char* src, const RowOffsets<count>& from, RowPairs& out) {
  static_assert(rows <= kLargestTile<bytes>.rows && columns <= kLargestTile<bytes>.columns);
  if constexpr (bytes == 3 && rows == 4 && columns == 4) {
    detail::moveTripletTile<past>(src, from, out);
  } else if constexpr (bytes == 12 && columns == 4) {
    const uint32x4x3_t v = vld3q_u32(reinterpret_cast<const uint32_t*>(src));
    detail::unrolled<4>(
        [&](auto i) TILE_LAMBDA { detail::storeWords<i>(out.next<i>(), v.val[0], v.val[1], v.val[2]); });
  } else if constexpr (!kInterleaves<bytes>) {
    detail::unrolled<columns>([&](auto c) TILE_LAMBDA {
      unsigned char* const p = out.next<c>();
      detail::unrolled<rows>([&](auto r)
                                 TILE_LAMBDA { memcpy(p + r * bytes, src + from.at[r] + c * bytes, bytes); });
    });
  } else {
    detail::Registers<bytes, bytes * columns, rows, 1> in;
    detail::unrolled<rows>([&](auto r)
                               TILE_LAMBDA { in.v[r] = loadBytes<bytes * columns>(src + from.at[r]); });
    detail::storeColumns<columns>(detail::interleaved(in), out, [](auto) TILE_LAMBDA {});
  }
}

/// Moves `tiles` of the largest tiles, one behind the other along the source rows. Each tile's rows are
/// loaded between the stores of the one before, which gives in-order cores something to do.
template <int bytes, int tiles>
TILE_INLINE void moveTiles(const unsigned char* src, const RowOffsets<kLargestTile<bytes>.rows>& from,
                           RowPairs& out) {
  static_assert(kInterleaves<bytes>);
  constexpr int kSide = kLargestTile<bytes>.rows;
  static_assert(kLargestTile<bytes>.columns == kSide);
  detail::Registers<bytes, 16, kSide, 1> in;
  detail::unrolled<kSide>([&](auto r) TILE_LAMBDA { in.v[r] = loadBytes<16>(src + from.at[r]); });
  detail::unrolled<tiles>([&](auto tile) TILE_LAMBDA {
    const auto current = detail::interleaved(in);
    src += 16;
    forget(src);
    detail::storeColumns<kSide>(current, out, [&](auto r) TILE_LAMBDA {
      if constexpr (tile + 1 < tiles) {
        in.v[r] = loadBytes<16>(src + from.at[r]);
      }
    });
    forget(out.first);
  });
}

}  // namespace HPC::fastcv::arm
