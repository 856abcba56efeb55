// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// The loops that all kernels share: along a row, over rows, over pairs of rows.
///
/// A kernel brings what happens to a block of pixels and to a single one; the loops bring blocks in flight,
/// tails, strides and 64-bit addressing.
#pragma once

#include <algorithm>
#include <cstddef>
#include <cstring>
#include <type_traits>
#include <utility>

#include "simd/overlap.h"
#include "simd/pixel.h"
#include "simd/registers.h"

/// Keeps the compiler from unrolling or vectorising the loop that follows.
#if defined(__clang__)
#define KERNEL_ROLLED_LOOP _Pragma("clang loop vectorize(disable) unroll(disable)")
#else
#define KERNEL_ROLLED_LOOP _Pragma("GCC unroll 1")
#endif

namespace HPC::fastcv::arm {

/// Whether several blocks at a time are worth their registers: not with the sixteen of x86-64, whose cores
/// look ahead far enough by themselves.
#if defined(__ARM_NEON)
inline constexpr bool kBlocksInFlightPay = true;
#else
inline constexpr bool kBlocksInFlightPay = false;
#endif

/// A number of blocks, as a type: `block(x, Blocks<2>{})` handles two neighbouring blocks at once.
template <int n>
using Blocks = std::integral_constant<int, n>;

/// How the end of a row that is no whole block is handled.
enum class Tail {
  kOverlap,  ///< the last block is done again, flush with the row's end: the source must not have changed
  kSteps,    ///< step by step
};

/// Walks `length` elements in blocks of `kBlock`, `kInFlight` of them at a time while there are as many, so
/// that in-order cores have independent work; then the tail in steps of `kStep`. `length` is a multiple of
/// `kStep`. Elements before `x` have been done.
template <int kBlock, int kInFlight, int kStep, typename Block, typename Step>
inline void walk(ptrdiff_t length, Tail tail, const Block& block, const Step& step, ptrdiff_t x = 0) {
  if constexpr (kInFlight > 1 && kBlocksInFlightPay) {
    for (; x <= length - kBlock * kInFlight; x += kBlock * kInFlight) {
      block(x, Blocks<kInFlight>{});
    }
  }
  for (; x <= length - kBlock; x += kBlock) {
    block(x, Blocks<1>{});
  }
  if (x < length) {
    if (tail == Tail::kOverlap && length >= kBlock) {
      block(length - kBlock, Blocks<1>{});
    } else {
      // A tail is short: unrolled or vectorised it would only be larger.
      KERNEL_ROLLED_LOOP
      for (; x < length; x += kStep) {
        step(x);
      }
    }
  }
}

/// Loads `n` blocks, computes them, then stores them: the order that lets them overlap in the pipeline and
/// keeps in-place work right.
template <int n, typename Load, typename Compute, typename Store>
inline void inFlight(const Load& load, const Compute& compute, const Store& store) {
  [&]<int... i>(std::integer_sequence<int, i...>) {
    const decltype(load(0)) in[] = {load(i)...};
    const decltype(compute(in[0])) out[] = {compute(in[i])...};
    (store(i, out[i]), ...);
  }(std::make_integer_sequence<int, n>{});
}

namespace detail {

/// Where `n` neighbouring blocks of `nc`-channel pixels are, moved on together with every turn of a loop.
///
/// Interleaved loads and stores take no address offset, so each block has a pointer of its own, advanced by
/// the access itself; the compiler would keep one pointer, and add every distance to it in every turn. But a
/// load of bytes is followed by an addition: an advancing `ld3` costs an in-order core more (9 cycles for 6
/// on Cortex-A55; a store 5 for 4) than the addition, which goes beside another instruction. Float blocks are
/// short, there the additions would weigh more. Blocks of one channel share a pointer, as single registers
/// are loaded and stored with offsets.
template <typename T, int nc, int n, int block>
class Cursor {
 public:
  explicit Cursor(T* start) {
    for (int i = 0; i < kPointers; ++i) {
      at_[i] = start + (i + kShared) * kElements;
      forget(at_[i]);
    }
    if constexpr (nc > 1) {
      forget(step_);
    }
  }

  /// Block `i`.
  T* operator()(int i) const { return nc > 1 ? at_[i] : at_[0] + (i - kShared) * kElements; }

  void next() {
    for (T*& at : at_) {
      if constexpr (std::is_same_v<T, const unsigned char>) {
        forget(at);  // what is advanced is not the address of the load
      }
      at += step_;
      forget(at);
    }
  }

 private:
  static constexpr int kElements = block * nc;
  static constexpr int kPointers = nc > 1 ? n : 1;
  // The block that a shared pointer points to: that of the last pair, whose access can then advance it.
  static constexpr int kShared = nc == 1 && n > 1 ? n - 2 : 0;

  T* at_[kPointers];
  ptrdiff_t step_ = n * kElements;
};

/// One row of a per-pixel kernel.
template <typename Op>
class PixelRow {
 public:
  using Src = typename Op::Src;
  using Dst = typename Op::Dst;

  /// Converts `length` pixels, in a function of its own unless `Op` is better off without: the compiler makes
  /// a copy of the loops for each kind of tail.
  static void convert(const Op& op, ptrdiff_t length, Tail tail, const Src* src, Dst* dst) {
    if constexpr (requires { Op::kInlined; }) {
      convertHere(op, length, tail, src, dst);
    } else {
      convertApart(op, length, tail, src, dst);
    }
  }

 private:
  [[gnu::noinline]] static void convertApart(const Op& op, ptrdiff_t length, Tail tail, const Src* src,
                                             Dst* dst) {
    convertHere(op, length, tail, src, dst);
  }

  static void convertHere(const Op& op, ptrdiff_t length, Tail tail, const Src* src, Dst* dst) {
    const ptrdiff_t turns = length / kTurn;
    convertTurns(op, turns, src, dst);
    if constexpr (kWide) {
      ptrdiff_t x = turns * kTurn;
      if constexpr (kTurn > std::max(kGroup, kBlock)) {
        for (; x <= length - kBlock; x += kBlock) {
          convertGroup(op, src + x * kSrc, dst + x * kDst);
        }
      }
      convertTail(op, length, x, tail, src, dst);
    } else {
      walk<kGroup, 1, 1>(
          length, tail, [&](ptrdiff_t x, Blocks<1>) { convertGroup(op, src + x * kSrc, dst + x * kDst); },
          [&](ptrdiff_t x) { op.scalar(src + x * kSrc, dst + x * kDst); }, turns * kTurn);
    }
  }

  static constexpr int kSrc = Op::kSrcChannels;
  static constexpr int kDst = Op::kDstChannels;
  using SrcBlock = BlockOf<Src>;
  using DstBlock = BlockOf<Dst>;
  static constexpr int kBlock = kLanes<SrcBlock>;
  // Registers of 32 bytes.
  static constexpr bool kWide = sizeof(SrcBlock) > 16;
  static constexpr int kGroup = Op::kUniform ? kBlock : 8;
  // A block of one channel is done so quickly that its store is in the way of the next one's load.
  static constexpr bool kPays = kBlocksInFlightPay || (kSrc == 1 && kDst == 1);
  static constexpr int kInFlight = kPays ? Op::kInFlight : std::max(kGroup / kBlock, 1);
  static constexpr int kTurn = kBlock * kInFlight;
  static_assert(kBlock == kLanes<DstBlock>);
  static_assert(kTurn % kGroup == 0);

  static void convertTurns(const Op& op, ptrdiff_t turns, const Src* src, Dst* dst) {
    if (turns == 0) {
      return;
    }
    Cursor<const Src, kSrc, kInFlight, kBlock> from(src);
    Cursor<Dst, kDst, kInFlight, kBlock> to(dst);
    // An alpha for each block in flight: one register cannot stand behind several blocks' colour registers.
    DstBlock alpha[kInFlight];
    DstBlock opaque = splat<DstBlock>(kOpaque<Dst>);
    for (DstBlock& a : alpha) {
      forget(opaque);
      a = opaque;
    }
    for (; turns != 0; --turns) {
      convertBlocks<kInFlight>(op, from, to, [&](int i) { return alpha[i]; });
      from.next();
      to.next();
    }
  }

  static void convertGroup(const Op& op, const Src* src, Dst* dst) {
    if constexpr (kWide) {
      convertBlocks<1>(
          op, [=](int) { return src; }, [=](int) { return dst; },
          [](int) { return splat<DstBlock>(kOpaque<Dst>); });
    } else if constexpr (kGroup >= kBlock) {
      const DstBlock alpha = splat<DstBlock>(kOpaque<Dst>);
      convertBlocks<kGroup / kBlock>(
          op, [=](int i) { return src + i * (kBlock * kSrc); },
          [=](int i) { return dst + i * (kBlock * kDst); }, [=](int) { return alpha; });
    } else {
      Pixels<SrcBlock, kSrc> half;
      loadHalfChannels(src, half.c);
      storeHalfChannels(dst, withAlpha<kDst>(op.vector(half), splat<DstBlock>(kOpaque<Dst>)).c);
    }
  }

  // What is less than a block goes through memory of a block's size, as a block.
  static void convertTail(const Op& op, ptrdiff_t length, ptrdiff_t x, Tail tail, const Src* src, Dst* dst) {
    if (Op::kUniform && tail == Tail::kOverlap && length >= kBlock) {
      if (x < length) {
        convertGroup(op, src + (length - kBlock) * kSrc, dst + (length - kBlock) * kDst);
      }
      return;
    }
    const ptrdiff_t grouped = Op::kUniform ? length : length / kGroup * kGroup;
    if (x < grouped) {
      const auto pixels = static_cast<size_t>(grouped - x);
      Src in[kBlock * kSrc] = {};
      Dst out[kBlock * kDst];
      memcpy(in, src + x * kSrc, pixels * kSrc * sizeof(Src));
      convertGroup(op, in, out);
      memcpy(dst + x * kDst, out, pixels * kDst * sizeof(Dst));
    }
    for (x = grouped; x < length; ++x) {
      op.scalar(src + x * kSrc, dst + x * kDst);
    }
  }

  template <int n, typename From, typename To, typename Alpha>
  static void convertBlocks(const Op& op, const From& from, const To& to, const Alpha& alpha) {
    const auto compute = [&](const auto& block) {
      if constexpr (requires { Op::kSwaps; }) {
        return block;
      } else {
        return op.vector(block);
      }
    };
    if constexpr (requires { Op::kPacked; }) {
      inFlight<n>([&](int i) { return loadPacked<SrcBlock>(from(i)); }, compute,
                  [&](int i, const auto& block) { storePacked(to(i), block); });
    } else if constexpr (requires { Op::kWeighs; }) {
      inFlight<n>([&](int i) { return loadColours<kSrc>(from(i)); }, compute,
                  [&](int i, const auto& block) { storePixels(to(i), block); });
    } else if constexpr (requires { Op::kSwaps; }) {
      // Three channels are looked up anyway, when they are loaded or when they are stored.
      constexpr bool kEarly = Op::kSwaps && kSrc == 3;
      inFlight<n>([&](int i) { return loadColours<kSrc, kEarly>(from(i)); }, compute,
                  [&](int i, const auto& block) {
                    storeColours<kDst, Op::kSwaps && !kEarly>(to(i), block, alpha(i));
                  });
    } else {
      inFlight<n>([&](int i) { return loadPixels<SrcBlock, kSrc>(from(i)); }, compute,
                  [&](int i, const auto& block) { storePixels(to(i), withAlpha<kDst>(block, alpha(i))); });
    }
  }
};

}  // namespace detail

/// Runs a per-pixel kernel over an image. `Op` has
/// - `Src`, `Dst` (element types of the same size), `kSrcChannels`, `kDstChannels`;
/// - `kInFlight`: blocks in flight;
/// - `kUniform`: whether `vector` and `scalar` give identical results, so that rows may be joined and the
///   last block of a row may overlap its neighbour. Otherwise `vector` does a row's whole groups of 8 pixels
///   and `scalar` the rest;
/// - `vector(Pixels<BlockOf<Src>, kSrcChannels>)` giving `Pixels<BlockOf<Dst>, kDstChannels>`, for a block.
///   Of a destination with four channels it may give three, then alpha is opaque; of one with three or four,
///   one that is all colours;
/// - `scalar(const Src*, Dst*)`, for one pixel;
/// - `kWeighs`, if `vector` takes Colours;
/// - `kSwaps` instead of `vector`, if all that happens to a pixel is that its first and third channel change
///   places, where it is true, and that a fourth one comes, opaque, or goes;
/// - `kInlined`, if the rows' loop is to be where the constants of `vector` are made: it has more of them
/// than
///   registers;
/// - `kPacked`, if `vector` takes and gives blocks of 4-channel pixels as they lie in memory, not a channel a
///   register.
/// Strides count elements. Rows are worked on from their starts, each block read before it is written, so
/// that the images may overlap where no row of the destination begins behind that of the source or has more
/// elements.
template <typename Op>
inline void forEachPixel(const Op& op, ptrdiff_t height, ptrdiff_t width, ptrdiff_t inStride,
                         const typename Op::Src* in, ptrdiff_t outStride, typename Op::Dst* out) {
  if (height < 1 || width < 1) {
    return;
  }
  ptrdiff_t rows = height;
  ptrdiff_t length = width;
  if (Op::kUniform && inStride == length * Op::kSrcChannels && outStride == length * Op::kDstChannels) {
    length *= rows;
    rows = 1;
  }
  for (ptrdiff_t row = 0; row < rows; ++row) {
    const typename Op::Src* const src = in + row * inStride;
    typename Op::Dst* const dst = out + row * outStride;
    const bool redoes =
        Op::kUniform && areApart(src, length * Op::kSrcChannels, dst, length * Op::kDstChannels);
    detail::PixelRow<Op>::convert(op, length, redoes ? Tail::kOverlap : Tail::kSteps, src, dst);
  }
}

/// `forEachPixel` of a kernel without state, as a function of the six arguments of a colour kernel.
template <typename Op>
void convertImage(int height, int width, int inWidthStride, const typename Op::Src* inData,
                  int outWidthStride, typename Op::Dst* outData) {
  forEachPixel(Op(), height, width, inWidthStride, inData, outWidthStride, outData);
}

/// Walks the whole row pairs of a picture and in each its whole column pairs: `pair(row)` is given the even
/// row and returns what handles that pair, an object with `block(x, Blocks<n>)` for `n` blocks of `kBlock`
/// columns and `step(x)` for one column pair. Source and destination are distinct. A block of two registers'
/// halves may take a row of at least half its columns, where its `block` is also given how many columns the
/// second half is behind the first one.
template <int kBlock, int kInFlight, typename Pair>
inline void forEachRowPair(int height, int width, const Pair& pair) {
  const ptrdiff_t length = width & ~1;
  if (length < 1) {
    return;
  }
  for (ptrdiff_t row = 0; row + 1 < height; row += 2) {
    const auto handler = pair(row);
    if constexpr (kBlock > 16 && requires { handler.block(0, Blocks<1>{}, length); }) {
      if (length >= kBlock / 2 && length < kBlock) {
        handler.block(0, Blocks<1>{}, length - kBlock / 2);
        continue;
      }
    }
    walk<kBlock, kInFlight, 2>(
        length, Tail::kOverlap, [&](ptrdiff_t x, auto blocks) { handler.block(x, blocks); },
        [&](ptrdiff_t x) { handler.step(x); });
  }
}

}  // namespace HPC::fastcv::arm
