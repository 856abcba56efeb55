// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// Tiles: small blocks of whole pixels, read along source rows and written along destination rows after a
/// transposition in registers. Rotations by 90 and 270 degrees are made of them.
///
/// A pixel is `bytes` bytes of no type: 1, 2, 3, 4, 8, 12 or 16. A tile of `rows` source rows by `columns`
/// source columns becomes `columns` destination rows of `rows` pixels. It writes exactly its own pixels.
#pragma once

#include <cstddef>
#include <cstring>
#include <type_traits>
#include <utility>

#include "simd/shuffle.h"
#include "simd/vector.h"

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

/// The largest tile of a pixel size: `rows` by `columns`, both powers of two. An even number of
/// columns, so that a tile ends with a pair of rows.
struct TileSize {
  int rows;
  int columns;
};
template <int bytes>
inline constexpr TileSize kLargestTile = {sizeof(Bytes) / bytes, 16 / bytes};
template <>
inline constexpr TileSize kLargestTile<16> = {2, 2};

/// Whether tiles of a pixel size are interleaved in registers, whose size they divide; else they are moved in
/// other ways.
template <int bytes>
inline constexpr bool kInterleaves = bytes < 16 && 16 % bytes == 0;

/// Source columns behind a tile that `moveTile` of the largest size also reads when it may.
template <int bytes>
inline constexpr int kTileReadsPast = bytes == 3                          ? 2
                                      : bytes == 12 && sizeof(Bytes) > 16 ? 1
                                                                          : 0;

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

}  // namespace detail

/// Loads `bytes` bytes (1, 2, 4, 8 or 16) into the low end of a register.
template <int bytes>
TILE_INLINE Part loadBytes(const unsigned char* p) {
  if constexpr (bytes == 16) {
    return loadAs<Part>(p);
  } else if constexpr (bytes == 8) {
    // An integer may come by way of a general register.
    return (Part)detail::VectorOf<double, 16>::Type{loadAs<double>(p)};
  } else {
    return (Part)LanesOf<Part, bytes>{loadAs<detail::Lane<bytes>>(p)};
  }
}

/// Stores lane `lane` of `bytes` bytes (1, 2, 4, 8 or 16).
template <int bytes, int lane>
TILE_INLINE void storeLane(unsigned char* p, Part v) {
  if constexpr (bytes == 16) {
    static_assert(lane == 0);
    storeAs(p, v);
  } else {
    storeAs(p, ((LanesOf<Part, bytes>)v)[lane]);
  }
}

namespace detail {

/// A tile half way: `groups` groups of source rows, each in `segments` registers one after the other along
/// the row. The low `used` bytes of a register's half hold pixels, in elements of `bytes` bytes: the pixels
/// of one group in one column. A second half holds as many rows again.
template <typename V, int bytes, int used, int groups, int segments>
struct Registers {
  V v[groups * segments];
};

/// Interleaves neighbouring groups until an element is half a register's half or only one group is left.
template <typename V, int bytes, int used, int groups, int segments>
TILE_INLINE auto interleaved(const Registers<V, bytes, used, groups, segments>& in) {
  if constexpr (groups == 1 || bytes == 8) {
    return in;
  } else if constexpr (used == 16) {
    Registers<V, bytes * 2, used, groups / 2, segments * 2> out;
    unrolled<groups / 2 * segments>([&](auto i) TILE_LAMBDA {
      constexpr int kFrom = i / segments * 2 * segments + i % segments;
      out.v[2 * i] = zip<bytes, false>(in.v[kFrom], in.v[kFrom + segments]);
      out.v[2 * i + 1] = zip<bytes, true>(in.v[kFrom], in.v[kFrom + segments]);
    });
    return interleaved(out);
  } else {
    static_assert(segments == 1);
    Registers<V, bytes * 2, used * 2, groups / 2, 1> out;
    unrolled<groups / 2>([&](auto i)
                             TILE_LAMBDA { out.v[i] = zip<bytes, false>(in.v[2 * i], in.v[2 * i + 1]); });
    return interleaved(out);
  }
}

}  // namespace detail
}  // namespace HPC::fastcv::arm

#if defined(__ARM_NEON)
#include "simd/tile_arm.h"
#else
#include "simd/tile_x86.h"
#endif

namespace HPC::fastcv::arm {
namespace detail {

/// Writes the columns of an interleaved tile and calls `between(c)` after each. Where two groups are left,
/// the store interleaves them.
template <int columns, typename V, int bytes, int used, int groups, int segments, typename Between>
TILE_INLINE void storeColumns(const Registers<V, bytes, used, groups, segments>& in, RowPairs& out,
                              const Between& between) {
  unrolled<columns>([&](auto c) TILE_LAMBDA {
    constexpr int kInRegister = used / bytes;
    constexpr int kAt = c / kInRegister;
    constexpr int kLane = c % kInRegister;
    unsigned char* const p = out.next<c>();
    if constexpr (groups == 2) {
      storePair<kLane>(p, in.v[kAt], in.v[kAt + segments]);
    } else {
      storeLane<bytes, kLane>(p, in.v[kAt]);
    }
    between(c);
  });
}

}  // namespace detail

/// Moves the tile at `src`. With `past` it may read kTileReadsPast<bytes> columns behind itself; without, it
/// reads exactly its own pixels.
template <int bytes, int rows, int columns, bool past, int count>
TILE_INLINE void moveTile(const unsigned char* src, const RowOffsets<count>& from, RowPairs& out) {
  constexpr TileSize kLargest = kLargestTile<bytes>;
  static_assert(rows <= kLargest.rows && columns <= kLargest.columns);
  if constexpr (bytes == 3 && rows == kLargest.rows && columns == kLargest.columns) {
    detail::moveTripletTile<past>(src, from, out);
#if defined(__ARM_NEON)
  } else if constexpr (bytes == 12 && columns == kLargest.columns) {
    detail::moveWordTriplets(src, out);
#else
  } else if constexpr (bytes == 12 && rows == kLargest.rows && columns == kLargest.columns) {
    detail::moveWordTriplets<past>(src, from, out);
  } else if constexpr (kInterleaves<bytes> && rows * bytes > 16 && columns < kLargest.columns) {
    RowPairs right = out;
    right.first += rows / 2 * bytes;
    moveTile<bytes, rows / 2, columns, past>(src, from, out);
    moveTile<bytes, rows / 2, columns, past>(from.template of<rows / 2>(src), from, right);
  } else if constexpr (kInterleaves<bytes> && rows * bytes > 16) {
    detail::Registers<Bytes, bytes, 16, rows / 2, 1> in;
    detail::unrolled<rows / 2>([&](auto r) TILE_LAMBDA {
      in.v[r] = detail::joined(loadBytes<16>(from.template of<r>(src)),
                               loadBytes<16>(from.template of<r + rows / 2>(src)));
    });
    detail::storeColumns<columns>(detail::interleaved(in), out, [](auto) TILE_LAMBDA {});
#endif
  } else if constexpr (kInterleaves<bytes>) {
    detail::Registers<Part, bytes, bytes * columns, rows, 1> in;
    detail::unrolled<rows>(
        [&](auto r) TILE_LAMBDA { in.v[r] = loadBytes<bytes * columns>(from.template of<r>(src)); });
    detail::storeColumns<columns>(detail::interleaved(in), out, [](auto) TILE_LAMBDA {});
  } else {
    detail::unrolled<columns>([&](auto c) TILE_LAMBDA {
      unsigned char* const p = out.next<c>();
      detail::unrolled<rows>(
          [&](auto r) TILE_LAMBDA { memcpy(p + r * bytes, from.template of<r>(src) + c * bytes, bytes); });
    });
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
  detail::Registers<Part, bytes, 16, kSide, 1> in;
  detail::unrolled<kSide>([&](auto r) TILE_LAMBDA { in.v[r] = loadBytes<16>(from.template of<r>(src)); });
  detail::unrolled<tiles>([&](auto tile) TILE_LAMBDA {
    const auto current = detail::interleaved(in);
    src += 16;
    detail::storeColumns<kSide>(current, out, [&](auto r) TILE_LAMBDA {
      if constexpr (tile + 1 < tiles) {
        in.v[r] = loadBytes<16>(from.template of<r>(src));
      }
    });
  });
}

}  // namespace HPC::fastcv::arm
