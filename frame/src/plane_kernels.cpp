// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// A camera's planes decoded and copied row by row, mirrored in registers, or transposed by tiles through a
// scratch block of 6 KB, which is decoded while it is in the first-level cache. Blocks are of 32 columns, the
// 16 chroma samples of a register; the last block of a row is flush with the row's end, over its neighbour.
#include "plane_kernels.h"

#include <algorithm>

#include "simd/copy.h"
#include "simd/loop.h"
#include "simd/nv_decode.h"
#include "simd/registers.h"
#include "simd/tile.h"

namespace kyface {
namespace {

using namespace HPC::fastcv::arm;
using std::ptrdiff_t;
using Byte = unsigned char;

// Columns of a block, and bytes of its chroma pairs.
constexpr int kBlock = kDecodeColumns;
static_assert(kBlock == kKernelSide);

/// Calls `block(x)` for blocks of `size` that cover `length`, which is at least that; the last is flush with
/// the end.
template <typename Block>
inline void forEachBlock(ptrdiff_t length, ptrdiff_t size, const Block& block) {
  ptrdiff_t x = 0;
  for (; x <= length - size; x += size) {
    block(x);
  }
  if (x < length) {
    block(length - size);
  }
}

// ---- rows

template <int nc, bool swapped, bool pairs, bool mirrored>
void decodeRows(const PlanesView& view, const PixelRows& to) {
  const ColourDecoder<nc, swapped> decoder(view.firstIsV);
  for (ptrdiff_t row = 0; row < view.height; row += 2) {
    const Byte* const luma = view.luma + row * view.lumaStride;
    const RowPair from = {luma, luma + view.lumaStride, view.first + row / 2 * view.firstStride,
                          pairs ? nullptr : view.second + row / 2 * view.secondStride};
    Byte* const out = to.data + row * to.stride;
    decodeRowPair<pairs, mirrored>(decoder, from, view.width, out, out + to.stride);
  }
}

// ---- transposed

/// Transposes a tile of 16 bytes by as many rows as pixels of `bytes` bytes are in them: `store(r, v)` is
/// given row r of the result.
template <int bytes, typename Store>
TILE_INLINE void transposeTile(const Byte* src, const RowOffsets<16 / bytes>& rows, const Store& store) {
  constexpr int kSide = 16 / bytes;
  detail::Registers<Part, bytes, 16, kSide, 1> in;
  detail::unrolled<kSide>([&](auto r) TILE_LAMBDA { in.v[r] = loadAs<Part>(rows.template of<r>(src)); });
  const auto halves = detail::interleaved(in);
  detail::unrolled<kSide / 2>([&](auto i) TILE_LAMBDA {
    const Part upper = halves.v[i], lower = halves.v[i + kSide / 2];
    store(std::integral_constant<int, 2 * i>{}, zip<8, false>(upper, lower));
    store(std::integral_constant<int, 2 * i + 1>{}, zip<8, true>(upper, lower));
  });
}

/// A transposed block of 32 columns, as its decoding reads it.
struct Scratch {
  // Two lines of the cache from each source row: with one, pictures beyond the cache take a fifth longer.
  static constexpr int kRows = 128;

  /// Of each row pair the left halves of both rows, then the right halves.
  alignas(64) Byte luma[kRows / 2][2][2][16];
  /// Of each row pair 16 chroma pairs, or 16 first samples and 16 second samples.
  alignas(64) Byte chroma[kRows / 2][kBlock];
};

/// Transposes `count` tiles, one behind the other along source rows that are `stride` apart, to rows of which
/// `at(dst, r)` says where row r of a tile is. The next tile's are `next` bytes behind.
template <int bytes, typename At>
TILE_INLINE void transposeTiles(const Byte* src, const RowOffsets<16 / bytes>& rows, ptrdiff_t count,
                                Byte* dst, ptrdiff_t next, const At& at) {
  KERNEL_ROLLED_LOOP
  for (; count != 0; --count) {
    transposeTile<bytes>(src, rows, [&](auto r, Part v) TILE_LAMBDA { storeAs(at(dst, r), v); });
    src += 16;
    forget(src);
    dst += next;
    forget(dst);
  }
}

/// Fills the luma of a scratch block: `rows` rows of the result, a multiple of 32, from row `row` and column
/// `column` on, both even.
inline void transposeLumaBlock(const PlanesView& view, ptrdiff_t row, ptrdiff_t column, ptrdiff_t rows,
                               Scratch& scratch) {
  const RowOffsets<16> offsets(view.lumaStride);
  const Byte* src = view.luma + column * view.lumaStride + row;
  KERNEL_ROLLED_LOOP
  for (int side = 0; side < 2; ++side) {
    transposeTiles<1>(src, offsets, rows / 16, scratch.luma[0][side][0], 8 * 64,
                      [](Byte* dst, int r) TILE_LAMBDA { return dst + r / 2 * 64 + r % 2 * 16; });
    src += 16 * view.lumaStride;
  }
}

/// The same of the chroma.
template <bool pairs>
inline void transposeChromaBlock(const PlanesView& view, ptrdiff_t row, ptrdiff_t column, ptrdiff_t rows,
                                 Scratch& scratch) {
  const auto at = [](Byte* dst, int r) TILE_LAMBDA { return dst + r * kBlock; };
  if constexpr (pairs) {
    const RowOffsets<8> offsets(view.firstStride);
    const Byte* src = view.first + column / 2 * view.firstStride + row;
    KERNEL_ROLLED_LOOP
    for (int side = 0; side < 2; ++side) {
      transposeTiles<2>(src, offsets, rows / 16, scratch.chroma[0] + 16 * side, 8 * kBlock, at);
      src += 8 * view.firstStride;
    }
  } else {
    const Byte* src = view.first + column / 2 * view.firstStride + row / 2;
    ptrdiff_t stride = view.firstStride;
    KERNEL_ROLLED_LOOP
    for (int side = 0; side < 2; ++side) {
      const RowOffsets<16> offsets(stride);
      transposeTiles<1>(src, offsets, rows / 32, scratch.chroma[0] + 16 * side, 16 * kBlock, at);
      src = view.second + column / 2 * view.secondStride + row / 2;
      stride = view.secondStride;
    }
  }
}

/// Calls `block(row, rows, column)` for blocks that cover the transposed view: up to 128 rows, a multiple of
/// 32, and 32 columns.
template <typename Block>
inline void forEachTransposedBlock(const PlanesView& view, const Block& block) {
  const ptrdiff_t height = view.width;
  for (ptrdiff_t row = 0; row < height;) {
    const ptrdiff_t rows = std::clamp<ptrdiff_t>((height - row) / kBlock * kBlock, kBlock, Scratch::kRows);
    row = std::min(row, height - rows);
    forEachBlock(view.height, kBlock, [&](ptrdiff_t column) { block(row, rows, column); });
    row += rows;
  }
}

/// Decodes the first `rows` rows of a scratch block. What is constant belongs to the function: kept elsewhere
/// it would be loaded again after every store.
template <int nc, bool swapped, bool pairs>
inline void decodeBlock(const Scratch& scratch, ptrdiff_t rows, bool firstIsV, const PixelRows& to) {
  const ColourDecoder<nc, swapped> decoder(firstIsV);
  Byte* out[2] = {to.data, to.data + to.stride};
  const ptrdiff_t step = 2 * to.stride - 16 * nc;
  const Byte* lumaAt = scratch.luma[0][0][0];
  const Byte* chromaAt = scratch.chroma[0];
  KERNEL_ROLLED_LOOP
  for (ptrdiff_t n = rows / 2; n != 0; --n) {
    ChromaBlock chroma;
    if constexpr (pairs) {
      loadSamplePairs(chromaAt, chroma.first, chroma.second);
    } else {
      chroma = {loadSamples(chromaAt), loadSamples(chromaAt + 16)};
    }
    chromaAt += kBlock;
    decoder.decode([=](int row, int part) TILE_LAMBDA { return loadParts(lumaAt + 16 * row, 32, part); },
                   chroma, out, step);
    lumaAt += 64;
  }
}

template <int nc, bool swapped, bool pairs>
void decodeTransposed(const PlanesView& view, const PixelRows& to) {
  Scratch scratch;
  forEachTransposedBlock(view, [&](ptrdiff_t row, ptrdiff_t rows, ptrdiff_t column) {
    transposeLumaBlock(view, row, column, rows, scratch);
    transposeChromaBlock<pairs>(view, row, column, rows, scratch);
    decodeBlock<nc, swapped, pairs>(scratch, rows, view.firstIsV,
                                    {to.data + row * to.stride + column * nc, to.stride});
  });
}

// ---- copies

constexpr ptrdiff_t kRegister = sizeof(Bytes);
static_assert(kRegister <= kKernelSide);

/// Pairs of bytes with their bytes exchanged.
inline Bytes exchanged(Bytes v) {
  static constexpr unsigned char kOrder[] = {1, 0, 3, 2, 5, 4, 7, 6, 9, 8, 11, 10, 13, 12, 15, 14};
  return shuffled(v, kOrder);
}

/// Copies a row of at least a register, each register rearranged, and their order reversed where `mirrored`.
template <bool mirrored, typename Rearranged>
void rearrangeRow(const Byte* src, Byte* dst, ptrdiff_t size, const Rearranged& rearranged) {
  const auto move = [&](ptrdiff_t x, auto registers) {
    constexpr int kCount = registers;
    const Byte* from = src + (mirrored ? size - x - kRegister * kCount : x);
    Bytes v[kCount];
    for (int i = 0; i < kCount; ++i) {
      v[i] = rearranged(load(from + kRegister * (mirrored ? kCount - 1 - i : i)));
    }
    for (int i = 0; i < kCount; ++i) {
      store(dst + x + kRegister * i, v[i]);
    }
  };
  constexpr int kInFlight = 8;
  ptrdiff_t x = 0;
  for (; x <= size - kInFlight * kRegister; x += kInFlight * kRegister) {
    move(x, std::integral_constant<int, kInFlight>{});
  }
  for (; x <= size - kRegister; x += kRegister) {
    move(x, std::integral_constant<int, 1>{});
  }
  if (x < size) {
    move(size - kRegister, std::integral_constant<int, 1>{});
  }
}

/// Copies rows of `size` bytes, pixels of `bytes` bytes, with the bytes of each exchanged where `swapped`.
template <int bytes>
void copyPixels(ptrdiff_t height, ptrdiff_t size, const Byte* src, ptrdiff_t stride, bool mirrored,
                bool swapped, const PixelRows& to) {
  if (!mirrored && !swapped) {
    copyRows(height, size, src, stride, to.data, to.stride);
    return;
  }
  for (ptrdiff_t row = 0; row < height; ++row) {
    const Byte* const from = src + row * stride;
    Byte* const out = to.data + row * to.stride;
    if (!mirrored) {
      rearrangeRow<false>(from, out, size, [](Bytes v) { return exchanged(v); });
    } else if (bytes == 1 || swapped) {
      rearrangeRow<true>(from, out, size, [](Bytes v) { return reversed<Bytes, 1>(v); });
    } else {
      rearrangeRow<true>(from, out, size, [](Bytes v) { return reversed<Bytes, bytes>(v); });
    }
  }
}

/// Interleaves rows of samples of two planes.
template <bool mirrored>
void interleaveRow(const Byte* first, const Byte* second, Byte* dst, ptrdiff_t samples) {
  const auto move = [=](ptrdiff_t x) {
    const ptrdiff_t from = mirrored ? samples - x - 16 : x;
    const Part a = loadAs<Part>(first + from);
    const Part b = loadAs<Part>(second + from);
    storeInTurn(dst + 2 * x, mirrored ? reversed<Part, 1>(a) : a, mirrored ? reversed<Part, 1>(b) : b);
  };
  forEachBlock(samples, 16, move);
}

/// Copies `pairs` row pairs of a scratch block's luma.
inline void copyLumaBlock(const Scratch& scratch, ptrdiff_t pairs, Byte* to, ptrdiff_t stride) {
  const Byte* from = scratch.luma[0][0][0];
  KERNEL_ROLLED_LOOP
  for (; pairs != 0; --pairs) {
    const Part v[] = {loadAs<Part>(from), loadAs<Part>(from + 32), loadAs<Part>(from + 16),
                      loadAs<Part>(from + 48)};
    from += 64;
    for (int row = 0; row < 2; ++row) {
      storeAs(to, v[2 * row]);
      storeAs(to + 16, v[2 * row + 1]);
      to += stride;
      forget(to);
    }
  }
}

/// Copies rows of a scratch block's chroma as pairs, the bytes of those that are pairs already exchanged
/// where `swapped`.
template <bool pairs, bool swapped>
inline void copyChromaBlock(const Scratch& scratch, ptrdiff_t rows, Byte* to, ptrdiff_t stride) {
  const Byte* from = scratch.chroma[0];
  KERNEL_ROLLED_LOOP
  for (; rows != 0; --rows) {
    if constexpr (pairs) {
      for (ptrdiff_t x = 0; x < kBlock; x += kRegister) {
        const Bytes v = load(from + x);
        store(to + x, swapped ? exchanged(v) : v);
      }
    } else {
      storeInTurn(to, loadAs<Part>(from), loadAs<Part>(from + 16));
    }
    from += kBlock;
    to += stride;
    forget(to);
  }
}

/// Calls one of the instances of a kernel for what varies: `kernel` is given the bytes of a pixel, whether
/// the chroma samples change places, and whether they are pairs, as types.
template <typename Kernel>
void withInstance(const PlanesView& view, ColourOrder order, const Kernel& kernel) {
  const auto withLayout = [&](auto nc) {
    if (view.second != nullptr) {
      kernel(nc, std::false_type{}, std::false_type{});
    } else if (view.firstIsV == order.redFirst) {
      kernel(nc, std::false_type{}, std::true_type{});
    } else {
      kernel(nc, std::true_type{}, std::true_type{});
    }
  };
  if (order.alpha) {
    withLayout(std::integral_constant<int, 4>{});
  } else {
    withLayout(std::integral_constant<int, 3>{});
  }
}

/// The view with the samples first that are V, or U. Pairs stay as they are.
PlanesView withFirst(const PlanesView& view, bool vFirst) {
  PlanesView ordered = view;
  if (view.second != nullptr && view.firstIsV != vFirst) {
    std::swap(ordered.first, ordered.second);
    std::swap(ordered.firstStride, ordered.secondStride);
    ordered.firstIsV = vFirst;
  }
  return ordered;
}

}  // namespace

void decodeRows(const PlanesView& view, bool mirrored, ColourOrder order, const PixelRows& out) {
  const PlanesView ordered = withFirst(view, order.redFirst);
  withInstance(ordered, order, [&](auto nc, auto swapped, auto pairs) {
    (mirrored ? decodeRows<nc, swapped, pairs, true> : decodeRows<nc, swapped, pairs, false>)(ordered, out);
  });
}

void decodeTransposed(const PlanesView& view, ColourOrder order, const PixelRows& out) {
  const PlanesView ordered = withFirst(view, order.redFirst);
  withInstance(ordered, order, [&](auto nc, auto swapped, auto pairs) {
    decodeTransposed<nc, swapped, pairs>(ordered, out);
  });
}

void copyLuma(const PlanesView& view, bool mirrored, const PixelRows& out) {
  copyPixels<1>(view.height, view.width, view.luma, view.lumaStride, mirrored, false, out);
}

void transposeLuma(const PlanesView& view, const PixelRows& out) {
  Scratch scratch;
  forEachTransposedBlock(view, [&](ptrdiff_t row, ptrdiff_t rows, ptrdiff_t column) {
    transposeLumaBlock(view, row, column, rows, scratch);
    copyLumaBlock(scratch, rows / 2, out.data + row * out.stride + column, out.stride);
  });
}

void copyChroma(const PlanesView& view, bool mirrored, bool vFirst, const PixelRows& out) {
  const PlanesView ordered = withFirst(view, vFirst);
  if (ordered.second == nullptr) {
    copyPixels<2>(view.height / 2, view.width, view.first, view.firstStride, mirrored,
                  view.firstIsV != vFirst, out);
    return;
  }
  for (ptrdiff_t row = 0; row < view.height / 2; ++row) {
    (mirrored ? interleaveRow<true> : interleaveRow<false>)(ordered.first + row * ordered.firstStride,
                                                            ordered.second + row * ordered.secondStride,
                                                            out.data + row * out.stride, view.width / 2);
  }
}

void transposeChroma(const PlanesView& view, bool vFirst, const PixelRows& out) {
  const PlanesView ordered = withFirst(view, vFirst);
  const auto transpose = [&](auto pairs, auto swapped) {
    Scratch scratch;
    forEachTransposedBlock(ordered, [&](ptrdiff_t row, ptrdiff_t rows, ptrdiff_t column) {
      transposeChromaBlock<pairs>(ordered, row, column, rows, scratch);
      copyChromaBlock<pairs, swapped>(scratch, rows / 2, out.data + row / 2 * out.stride + column,
                                      out.stride);
    });
  };
  if (ordered.second != nullptr) {
    transpose(std::false_type{}, std::false_type{});
  } else if (view.firstIsV == vFirst) {
    transpose(std::true_type{}, std::false_type{});
  } else {
    transpose(std::true_type{}, std::true_type{});
  }
}

}  // namespace kyface
