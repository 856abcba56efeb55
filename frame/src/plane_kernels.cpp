// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// A camera's planes decoded and copied row by row, mirrored in registers, or transposed by tiles through a
// scratch block of 6 KB, which is decoded while it is in the first-level cache. Blocks are of 32 columns, the
// 16 chroma samples of a register; the last block of a row is flush with the row's end, over its neighbour.
#include "plane_kernels.h"

#include <algorithm>
#include <array>

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
inline void for_each_block(ptrdiff_t length, ptrdiff_t size, const Block& block) {
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
void decode_rows(const PlanesView& view, const PixelRows& to) {
  const ColourDecoder<nc, swapped> decoder(view.first_is_v);
  for (ptrdiff_t row = 0; row < view.height; row += 2) {
    const Byte* const luma = view.luma + row * view.luma_stride;
    const RowPair from = {luma, luma + view.luma_stride, view.first + row / 2 * view.first_stride,
                          pairs ? nullptr : view.second + row / 2 * view.second_stride};
    Byte* const out = to.data + row * to.stride;
    decodeRowPair<pairs, mirrored>(decoder, from, view.width, out, out + to.stride);
  }
}

// ---- transposed

/// Transposes a tile of 16 bytes by as many rows as pixels of `bytes` bytes are in them: `store(r, v)` is
/// given row r of the result.
template <int bytes, typename Store>
TILE_INLINE void transpose_tile(const Byte* src, const RowOffsets<16 / bytes>& rows, const Store& store) {
  constexpr int kSide = 16 / bytes;
  detail::Registers<bytes, 16, kSide, 1> in;
  detail::unrolled<kSide>([&](auto r) TILE_LAMBDA { in.v[r] = vld1q_u8(src + rows.at[r]); });
  const auto halves = detail::interleaved(in);
  detail::unrolled<kSide / 2>([&](auto i) TILE_LAMBDA {
    const uint64x2_t upper = vreinterpretq_u64_u8(halves.v[i]);
    const uint64x2_t lower = vreinterpretq_u64_u8(halves.v[i + kSide / 2]);
    store(std::integral_constant<int, 2 * i>{}, vreinterpretq_u8_u64(vzip1q_u64(upper, lower)));
    store(std::integral_constant<int, 2 * i + 1>{}, vreinterpretq_u8_u64(vzip2q_u64(upper, lower)));
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
TILE_INLINE void transpose_tiles(const Byte* src, const RowOffsets<16 / bytes>& rows, ptrdiff_t count,
                                 Byte* dst, ptrdiff_t next, const At& at) {
  KERNEL_ROLLED_LOOP
  for (; count != 0; --count) {
    transpose_tile<bytes>(src, rows, [&](auto r, uint8x16_t v) TILE_LAMBDA { vst1q_u8(at(dst, r), v); });
    src += 16;
    keepInRegister(src);
    dst += next;
    keepInRegister(dst);
  }
}

/// Fills the luma of a scratch block: `rows` rows of the result, a multiple of 32, from row `row` and column
/// `column` on, both even.
inline void transpose_luma_block(const PlanesView& view, ptrdiff_t row, ptrdiff_t column, ptrdiff_t rows,
                                 Scratch& scratch) {
  const RowOffsets<16> offsets(view.luma_stride);
  const Byte* src = view.luma + column * view.luma_stride + row;
  KERNEL_ROLLED_LOOP
  for (int side = 0; side < 2; ++side) {
    transpose_tiles<1>(src, offsets, rows / 16, scratch.luma[0][side][0], 8 * 64,
                       [](Byte* dst, int r) TILE_LAMBDA { return dst + r / 2 * 64 + r % 2 * 16; });
    src += 16 * view.luma_stride;
  }
}

/// The same of the chroma.
template <bool pairs>
inline void transpose_chroma_block(const PlanesView& view, ptrdiff_t row, ptrdiff_t column, ptrdiff_t rows,
                                   Scratch& scratch) {
  const auto at = [](Byte* dst, int r) TILE_LAMBDA { return dst + r * kBlock; };
  if constexpr (pairs) {
    const RowOffsets<8> offsets(view.first_stride);
    const Byte* src = view.first + column / 2 * view.first_stride + row;
    KERNEL_ROLLED_LOOP
    for (int side = 0; side < 2; ++side) {
      transpose_tiles<2>(src, offsets, rows / 16, scratch.chroma[0] + 16 * side, 8 * kBlock, at);
      src += 8 * view.first_stride;
    }
  } else {
    const Byte* src = view.first + column / 2 * view.first_stride + row / 2;
    ptrdiff_t stride = view.first_stride;
    KERNEL_ROLLED_LOOP
    for (int side = 0; side < 2; ++side) {
      const RowOffsets<16> offsets(stride);
      transpose_tiles<1>(src, offsets, rows / 32, scratch.chroma[0] + 16 * side, 16 * kBlock, at);
      src = view.second + column / 2 * view.second_stride + row / 2;
      stride = view.second_stride;
    }
  }
}

/// Calls `block(row, rows, column)` for blocks that cover the transposed view: up to 128 rows, a multiple of
/// 32, and 32 columns.
template <typename Block>
inline void for_each_transposed_block(const PlanesView& view, const Block& block) {
  const ptrdiff_t height = view.width;
  for (ptrdiff_t row = 0; row < height;) {
    const ptrdiff_t rows = std::clamp<ptrdiff_t>((height - row) / kBlock * kBlock, kBlock, Scratch::kRows);
    row = std::min(row, height - rows);
    for_each_block(view.height, kBlock, [&](ptrdiff_t column) { block(row, rows, column); });
    row += rows;
  }
}

/// Decodes the first `rows` rows of a scratch block. What is constant belongs to the function: kept elsewhere
/// it would be loaded again after every store.
template <int nc, bool swapped, bool pairs>
inline void decode_block(const Scratch& scratch, ptrdiff_t rows, bool first_is_v, const PixelRows& to) {
  const ColourDecoder<nc, swapped> decoder(first_is_v);
  Byte* out[2] = {to.data, to.data + to.stride};
  const ptrdiff_t step = 2 * to.stride - 16 * nc;
  const Byte* luma_at = scratch.luma[0][0][0];
  const Byte* chroma_at = scratch.chroma[0];
  KERNEL_ROLLED_LOOP
  for (ptrdiff_t n = rows / 2; n != 0; --n) {
    ChromaBlock chroma;
    if constexpr (pairs) {
      loadSamplePairs(chroma_at, chroma.first, chroma.second);
    } else {
      chroma = {loadSamples(chroma_at), loadSamples(chroma_at + 16)};
    }
    chroma_at += kBlock;
    keepInRegister(chroma_at);
    decoder.decode([=](int row, int part) TILE_LAMBDA { return loadParts(luma_at + 16 * row, 32, part); },
                   chroma, out, step);
    luma_at += 64;
    keepInRegister(luma_at);
  }
}

template <int nc, bool swapped, bool pairs>
void decode_transposed(const PlanesView& view, const PixelRows& to) {
  Scratch scratch;
  for_each_transposed_block(view, [&](ptrdiff_t row, ptrdiff_t rows, ptrdiff_t column) {
    transpose_luma_block(view, row, column, rows, scratch);
    transpose_chroma_block<pairs>(view, row, column, rows, scratch);
    decode_block<nc, swapped, pairs>(scratch, rows, view.first_is_v,
                                     {to.data + row * to.stride + column * nc, to.stride});
  });
}

// ---- copies

/// Copies a row of at least 16 bytes in registers, each rearranged by `order`, and their order reversed where
/// `mirrored`.
template <bool mirrored>
void rearrange_row(const Byte* src, Byte* dst, ptrdiff_t size, uint8x16_t order) {
  const auto move = [=](ptrdiff_t x, auto registers) {
    constexpr int kCount = registers;
    const Byte* from = src + (mirrored ? size - x - 16 * kCount : x);
    uint8x16_t v[kCount];
    for (int i = 0; i < kCount; ++i) {
      v[i] = vqtbl1q_u8(vld1q_u8(from + 16 * (mirrored ? kCount - 1 - i : i)), order);
    }
    for (int i = 0; i < kCount; ++i) {
      vst1q_u8(dst + x + 16 * i, v[i]);
    }
  };
  ptrdiff_t x = 0;
  for (; x <= size - 128; x += 128) {
    move(x, std::integral_constant<int, 8>{});
  }
  for (; x <= size - 16; x += 16) {
    move(x, std::integral_constant<int, 1>{});
  }
  if (x < size) {
    move(size - 16, std::integral_constant<int, 1>{});
  }
}

/// The places of a register's bytes: from its end where mirrored, in units of 1 or 2 bytes; with the bytes of
/// each pair exchanged where `swapped`.
uint8x16_t order_of(int bytes, bool mirrored, bool swapped) {
  std::array<Byte, 16> order;
  for (int i = 0; i < 16; ++i) {
    const int unit = mirrored ? 16 / bytes - 1 - i / bytes : i / bytes;
    order[i] = static_cast<Byte>(unit * bytes + (swapped ? 1 - i % bytes : i % bytes));
  }
  return vld1q_u8(order.data());
}

void copy_pixels(int bytes, ptrdiff_t height, ptrdiff_t size, const Byte* src, ptrdiff_t stride,
                 bool mirrored, bool swapped, const PixelRows& to) {
  if (!mirrored && !swapped) {
    copyRows(height, size, src, stride, to.data, to.stride);
    return;
  }
  const uint8x16_t order = order_of(bytes, mirrored, swapped);
  for (ptrdiff_t row = 0; row < height; ++row) {
    (mirrored ? rearrange_row<true> : rearrange_row<false>)(src + row * stride, to.data + row * to.stride,
                                                            size, order);
  }
}

inline uint8x16_t reversedBytes(uint8x16_t v) {
  static constexpr unsigned char kOrder[] = {15, 14, 13, 12, 11, 10, 9, 8, 7, 6, 5, 4, 3, 2, 1, 0};
  return vqtbl1q_u8(v, vld1q_u8(kOrder));
}

/// Interleaves rows of samples of two planes.
template <bool mirrored>
void interleave_row(const Byte* first, const Byte* second, Byte* dst, ptrdiff_t samples) {
  const auto move = [=](ptrdiff_t x) {
    const ptrdiff_t from = mirrored ? samples - x - 16 : x;
    const uint8x16_t a = vld1q_u8(first + from);
    const uint8x16_t b = vld1q_u8(second + from);
    const uint8x16x2_t both = {{mirrored ? reversedBytes(a) : a, mirrored ? reversedBytes(b) : b}};
    vst2q_u8(dst + 2 * x, both);
  };
  for_each_block(samples, 16, move);
}

/// Copies `pairs` row pairs of a scratch block's luma.
inline void copy_luma_block(const Scratch& scratch, ptrdiff_t pairs, Byte* to, ptrdiff_t stride) {
  const Byte* from = scratch.luma[0][0][0];
  KERNEL_ROLLED_LOOP
  for (; pairs != 0; --pairs) {
    const uint8x16_t v[] = {vld1q_u8(from), vld1q_u8(from + 32), vld1q_u8(from + 16), vld1q_u8(from + 48)};
    from += 64;
    for (int row = 0; row < 2; ++row) {
      vst1q_u8(to, v[2 * row]);
      vst1q_u8(to + 16, v[2 * row + 1]);
      to += stride;
      keepInRegister(to);
    }
  }
}

/// Copies rows of a scratch block's chroma as pairs, their bytes in the order of `pair_order` where they are
/// pairs already.
template <bool pairs>
inline void copy_chroma_block(const Scratch& scratch, ptrdiff_t rows, uint8x16_t pair_order, Byte* to,
                              ptrdiff_t stride) {
  const Byte* from = scratch.chroma[0];
  KERNEL_ROLLED_LOOP
  for (; rows != 0; --rows) {
    const uint8x16x2_t both = {{vld1q_u8(from), vld1q_u8(from + 16)}};
    from += kBlock;
    if constexpr (pairs) {
      vst1q_u8(to, vqtbl1q_u8(both.val[0], pair_order));
      vst1q_u8(to + 16, vqtbl1q_u8(both.val[1], pair_order));
    } else {
      vst2q_u8(to, both);
    }
    to += stride;
    keepInRegister(to);
  }
}

/// Calls one of the instances of a kernel for what varies: `kernel` is given the bytes of a pixel, whether
/// the chroma samples change places, and whether they are pairs, as types.
template <typename Kernel>
void with_instance(const PlanesView& view, ColourOrder order, const Kernel& kernel) {
  const auto with_layout = [&](auto nc) {
    if (view.second != nullptr) {
      kernel(nc, std::false_type{}, std::false_type{});
    } else if (view.first_is_v == order.red_first) {
      kernel(nc, std::false_type{}, std::true_type{});
    } else {
      kernel(nc, std::true_type{}, std::true_type{});
    }
  };
  if (order.alpha) {
    with_layout(std::integral_constant<int, 4>{});
  } else {
    with_layout(std::integral_constant<int, 3>{});
  }
}

/// The view with the samples first that are V, or U. Pairs stay as they are.
PlanesView with_first(const PlanesView& view, bool v_first) {
  PlanesView ordered = view;
  if (view.second != nullptr && view.first_is_v != v_first) {
    std::swap(ordered.first, ordered.second);
    std::swap(ordered.first_stride, ordered.second_stride);
    ordered.first_is_v = v_first;
  }
  return ordered;
}

}  // namespace

void decode_rows(const PlanesView& view, bool mirrored, ColourOrder order, const PixelRows& out) {
  const PlanesView ordered = with_first(view, order.red_first);
  with_instance(ordered, order, [&](auto nc, auto swapped, auto pairs) {
    (mirrored ? decode_rows<nc, swapped, pairs, true> : decode_rows<nc, swapped, pairs, false>)(ordered, out);
  });
}

void decode_transposed(const PlanesView& view, ColourOrder order, const PixelRows& out) {
  const PlanesView ordered = with_first(view, order.red_first);
  with_instance(ordered, order, [&](auto nc, auto swapped, auto pairs) {
    decode_transposed<nc, swapped, pairs>(ordered, out);
  });
}

void copy_luma(const PlanesView& view, bool mirrored, const PixelRows& out) {
  copy_pixels(1, view.height, view.width, view.luma, view.luma_stride, mirrored, false, out);
}

void transpose_luma(const PlanesView& view, const PixelRows& out) {
  Scratch scratch;
  for_each_transposed_block(view, [&](ptrdiff_t row, ptrdiff_t rows, ptrdiff_t column) {
    transpose_luma_block(view, row, column, rows, scratch);
    copy_luma_block(scratch, rows / 2, out.data + row * out.stride + column, out.stride);
  });
}

void copy_chroma(const PlanesView& view, bool mirrored, bool v_first, const PixelRows& out) {
  const PlanesView ordered = with_first(view, v_first);
  if (ordered.second == nullptr) {
    copy_pixels(2, view.height / 2, view.width, view.first, view.first_stride, mirrored,
                view.first_is_v != v_first, out);
    return;
  }
  for (ptrdiff_t row = 0; row < view.height / 2; ++row) {
    (mirrored ? interleave_row<true> : interleave_row<false>)(ordered.first + row * ordered.first_stride,
                                                              ordered.second + row * ordered.second_stride,
                                                              out.data + row * out.stride, view.width / 2);
  }
}

void transpose_chroma(const PlanesView& view, bool v_first, const PixelRows& out) {
  const PlanesView ordered = with_first(view, v_first);
  const uint8x16_t pair_order = order_of(2, false, view.first_is_v != v_first);
  const auto transpose = [&](auto pairs) {
    Scratch scratch;
    for_each_transposed_block(ordered, [&](ptrdiff_t row, ptrdiff_t rows, ptrdiff_t column) {
      transpose_chroma_block<pairs>(ordered, row, column, rows, scratch);
      copy_chroma_block<pairs>(scratch, rows / 2, pair_order, out.data + row / 2 * out.stride + column,
                               out.stride);
    });
  };
  if (ordered.second != nullptr) {
    transpose(std::false_type{});
  } else {
    transpose(std::true_type{});
  }
}

}  // namespace kyface
