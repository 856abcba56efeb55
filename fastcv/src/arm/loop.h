/// The loops that all kernels share: along a row, over rows, over pairs of rows.
///
/// A kernel brings what happens to a block of pixels and to a single one; the loops bring blocks in flight,
/// tails, strides and 64-bit addressing.
#pragma once

#include <cstddef>
#include <type_traits>

#include "pixel.h"

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
  kOverlap,  ///< the last block is done again, flush with the row's end: needs distinct source and
             ///< destination
  kSteps,    ///< step by step
};

/// Walks `length` elements in blocks of `kBlock`, `kInFlight` of them at a time while there are as many, so
/// that in-order cores have independent work; then the tail in steps of `kStep`. `length` is a multiple of
/// `kStep`.
template <int kBlock, int kInFlight, int kStep, typename Block, typename Step>
inline void walk(ptrdiff_t length, Tail tail, const Block& block, const Step& step) {
  ptrdiff_t x = 0;
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
  if constexpr (n == 1) {
    store(0, compute(load(0)));
  } else {
    static_assert(n == 2);
    const auto in0 = load(0);
    const auto in1 = load(1);
    const auto out0 = compute(in0);
    const auto out1 = compute(in1);
    store(0, out0);
    store(1, out1);
  }
}

/// Runs a per-pixel kernel over an image. `Op` has
/// - `Src`, `Dst` (element types), `kSrcChannels`, `kDstChannels`;
/// - `kInFlight`: blocks in flight, 1 or 2;
/// - `kUniform`: whether `vector` and `scalar` give identical results, so that rows may be joined and the
/// last block
///   of a row may overlap its neighbour;
/// - `vector(Pixels<Src, kSrcChannels>)` giving `Pixels<Dst, kDstChannels>`, for a block;
/// - `scalar(const Src*, Dst*)`, for one pixel.
/// Strides count elements. Source and destination are distinct, or the same with equal strides and channels.
template <typename Op>
inline void forEachPixel(const Op& op, int height, int width, int inStride, const typename Op::Src* in,
                         int outStride, typename Op::Dst* out) {
  using Src = typename Op::Src;
  using Dst = typename Op::Dst;
  constexpr int kSrc = Op::kSrcChannels;
  constexpr int kDst = Op::kDstChannels;
  constexpr int kBlock = kBlockPixels<Src>;
  if (height < 1 || width < 1) {
    return;
  }
  ptrdiff_t rows = height;
  ptrdiff_t length = width;
  if (Op::kUniform && inStride == length * kSrc && outStride == length * kDst) {
    length *= rows;
    rows = 1;
  }
  const bool inPlace = static_cast<const void*>(in) == static_cast<const void*>(out);
  const Tail tail = Op::kUniform && !inPlace ? Tail::kOverlap : Tail::kSteps;
  for (ptrdiff_t row = 0; row < rows; ++row) {
    const Src* src = in + row * inStride;
    Dst* dst = out + row * outStride;
    walk<kBlock, Op::kInFlight, 1>(
        length, tail,
        [&](ptrdiff_t x, auto blocks) {
          inFlight<blocks>(
              [&](int i) { return loadPixels<kSrc>(src + (x + i * kBlock) * kSrc); },
              [&](const auto& pixels) { return op.vector(pixels); },
              [&](int i, const auto& pixels) { storePixels(dst + (x + i * kBlock) * kDst, pixels); });
        },
        [&](ptrdiff_t x) { op.scalar(src + x * kSrc, dst + x * kDst); });
  }
}

/// Walks the whole row pairs of a picture and in each its whole column pairs: `pair(row)` is given the even
/// row and returns what handles that pair, an object with `block(x, Blocks<n>)` for `n` blocks of `kBlock`
/// columns and `step(x)` for one column pair. Source and destination are distinct.
template <int kBlock, int kInFlight, typename Pair>
inline void forEachRowPair(int height, int width, const Pair& pair) {
  const ptrdiff_t length = width & ~1;
  for (ptrdiff_t row = 0; row + 1 < height; row += 2) {
    const auto handler = pair(row);
    walk<kBlock, kInFlight, 2>(
        length, Tail::kOverlap, [&](ptrdiff_t x, auto blocks) { handler.block(x, blocks); },
        [&](ptrdiff_t x) { handler.step(x); });
  }
}

}  // namespace HPC::fastcv::arm
