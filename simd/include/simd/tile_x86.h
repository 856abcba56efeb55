// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// What tiles are made of on x86-64: twice as many source rows as fit in 16 bytes, the second half of them in
/// the upper halves of the registers, so that a destination row is a register. Stores take them whole.
#pragma once

#include <bit>
#include <cstddef>
#include <cstring>

#include "simd/shuffle.h"
#include "simd/vector.h"

namespace HPC::fastcv::arm {

template <>
inline constexpr TileSize kLargestTile<3> = {8, 4};
template <>
inline constexpr TileSize kLargestTile<12> = {4, 2};

/// Equally distant source rows. Addresses have multiples of 1, 2, 4 and 8.
template <int count>
struct RowOffsets {
  ptrdiff_t odd[4];  ///< 1, 3, 5 and 7 times the distance in bytes

  TILE_INLINE explicit RowOffsets(ptrdiff_t step) : odd{step, 3 * step, 5 * step, 7 * step} {
    for (ptrdiff_t& each : odd) {
      forget(each);
    }
  }

  /// The place in row `r` that lies below `p` of the first.
  template <int r>
  TILE_INLINE const unsigned char* of(const unsigned char* p) const {
    constexpr int kRow = r % 8, kTimes = kRow == 0 ? 1 : kRow & -kRow;
    p += r / 8 * 8 * odd[0];
    return kRow == 0 ? p : p + kTimes * odd[kRow / kTimes / 2];
  }
};

namespace detail {

TILE_INLINE Bytes joined(Part low, Part high) {
  return std::bit_cast<Bytes>(_mm256_set_m128i(std::bit_cast<__m128i>(high), std::bit_cast<__m128i>(low)));
}

/// Writes, of both halves, lane `lane` of 8 bytes of two registers, one behind the other.
template <int lane, typename V>
TILE_INLINE void storePair(unsigned char* p, V a, V b) {
  constexpr bool kHigh = lane == 1;
  storeAs(p, zip<8, kHigh>(a, b));
}

/// The 12 bytes of four 3-byte pixels; with `past` also the 4 bytes behind them.
template <bool past>
TILE_INLINE Part loadFourPixels(const unsigned char* p) {
  if constexpr (past) {
    return loadAs<Part>(p);
  } else {
    return (Part)LanesOf<Part, 8>{loadAs<uint64_t>(p), loadAs<uint32_t>(p + 8)};
  }
}

/// Stores eight pixels of three bytes, which are those of four bytes in `v`.
TILE_INLINE void storeEightPixels(unsigned char* p, Bytes v) {
  // Of the lower half the last 4 of its 12 bytes, any, and the first 8; of the upper one any 4, and all.
  constexpr auto kFrom = [](int i) {
    const int byte = (i < 16 ? i + 8 : i - 4) % 16 % 12;
    return i / 16 * 16 + byte / 3 * 4 + byte % 3;
  };
  const Bytes packed = arranged<Bytes, 1, kFrom>(v, v);
  const Part low = arranged<Part, 8, [](int i) { return i; }>(packed, packed);
  const Part high = arranged<Part, 8, [](int i) { return i + 2; }>(packed, packed);
  storeLane<8, 1>(p, low);
  storeAs(p + 8, arranged<Part, 4, [](int i) { return i == 0 ? 0 : i + 4; }>(low, high));
}

/// Eight rows by four columns of 3-byte pixels, which have four bytes on the way.
template <bool past>
TILE_INLINE void moveTripletTile(const unsigned char* src, const RowOffsets<8>& rows, RowPairs& out) {
  constexpr auto kSpread = [](int i) { return i / 16 * 16 + i % 16 / 4 * 3 + i % 4; };
  Registers<Bytes, 4, 16, 4, 1> in;
  unrolled<4>([&](auto r) TILE_LAMBDA {
    const Bytes v = joined(loadFourPixels<past>(rows.of<r>(src)), loadFourPixels<past>(rows.of<r + 4>(src)));
    in.v[r] = arranged<Bytes, 1, kSpread>(v, v);
  });
  const auto columns = interleaved(in);
  unrolled<4>([&](auto c) TILE_LAMBDA {
    constexpr bool kHigh = c % 2 == 1;
    storeEightPixels(out.next<c>(), zip<8, kHigh>(columns.v[c / 2], columns.v[c / 2 + 2]));
  });
}

/// Four rows by two columns of 12-byte pixels, of which all but the last of a row are moved with the four
/// bytes behind them, and the next one over these.
template <bool past>
TILE_INLINE void moveWordTriplets(const unsigned char* src, const RowOffsets<4>& rows, RowPairs& out) {
  unrolled<2>([&](auto c) TILE_LAMBDA {
    unsigned char* const p = out.next<c>();
    unrolled<4>([&](auto r) TILE_LAMBDA {
      constexpr bool kWhole = r < 3 && (past || c < 1);
      memcpy(p + r * 12, rows.of<r>(src) + c * 12, kWhole ? 16 : 12);
    });
  });
}

}  // namespace detail

/// Writes the bytes of two registers in turn.
TILE_INLINE void storeInTurn(unsigned char* p, Part a, Part b) {
  storeAs(p, zip<1, false>(a, b));
  storeAs(p + 16, zip<1, true>(a, b));
}

}  // namespace HPC::fastcv::arm
