// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// The words that kernels are written in. A block is what one register of bytes, or of floats, holds of each
/// channel: 16 pixels of bytes on Arm, 32 on x86-64, a quarter of that of floats.
///
/// Bytes that are widened come as `Two` registers, and are narrowed from two. Which pixels are in the lower
/// and which in the higher one is not said, but the same for all words: on Arm it is the first and the second
/// half of the block, on x86-64 that of each half of the register, where AVX2 neither widens nor narrows
/// across. A kernel that does not ask for places needs none.
///
/// Besides the words here, the operators of the language work on vectors lane by lane: + - * & | ^ ~, shifts
/// by a constant, and comparisons, whose result is a mask for `select`.
#pragma once

#include <cstddef>
#include <type_traits>
#include <utility>

namespace HPC::fastcv::arm {

/// What a vector's lanes are.
template <typename V>
using ElementOf = std::remove_cvref_t<decltype(std::declval<V&>()[0])>;

/// All lanes alike.
template <typename V>
inline V splat(ElementOf<V> value) {
  return value - V{};  // which 0 + value is not, of -0
}

/// Two registers: what a block of bytes is widened to.
template <typename V>
struct Two {
  V low;
  V high;
};

template <typename V>
inline Two<V> operator-(const Two<V>& a, V b) {
  return {a.low - b, a.high - b};
}
template <typename V>
inline Two<V> operator-(V a, const Two<V>& b) {
  return {a - b.low, a - b.high};
}
template <typename V>
inline Two<V> operator~(const Two<V>& a) {
  return {~a.low, ~a.high};
}

/// The pixels whose byte in a mask is set, and black.
template <typename V, typename Block>
  requires requires(Block block) { block.c[0]; }
inline Block masked(V mask, Block pixels) {
  for (V& channel : pixels.c) {
    channel &= mask;
  }
  return pixels;
}

/// The sum of all lanes.
template <typename V>
inline ElementOf<V> total(V v) {
  ElementOf<V> sum = 0;
  for (size_t i = 0; i < sizeof(V) / sizeof(sum); ++i) {
    sum += v[i];
  }
  return sum;
}

/// a + (b >> n)
template <int n, typename V>
inline Two<V> addShifted(const Two<V>& a, const Two<V>& b) {
  return {a.low + (b.low >> n), a.high + (b.high >> n)};
}

/// `a` where the mask is set, 0 elsewhere.
template <typename Mask, typename V>
  requires(sizeof(Mask) == sizeof(V))
inline V masked(Mask mask, V a) {
  return (V)(mask & (Mask)a);
}
/// The bits of `a` where the mask's are set, those of `b` elsewhere.
template <typename Mask, typename V>
inline V mixedBits(Mask mask, V a, V b) {
  return (V)(((Mask)a & mask) | ((Mask)b & ~mask));
}

/// Factors of the first three channels of a pixel.
struct Weights {
  int c0, c1, c2;
};

}  // namespace HPC::fastcv::arm

#if defined(__ARM_NEON)
#include "simd/vector_arm.h"
#else
#include "simd/vector_x86.h"
#endif
