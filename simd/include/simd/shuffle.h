// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// Bytes moved between registers by constants, in the compiler's own vectors: the same code on Arm and
/// x86-64. V is a vector of 16 or 32 bytes; a half is 16 bytes of it, which may be the whole.
#pragma once

#include <cstdint>
#include <cstring>
#include <type_traits>
#include <utility>

/// For what must not be a call: its indices are constants, and its registers its caller's. An instrumented
/// build, which is in no hurry, lets them be calls.
#ifndef TILE_INLINE
#define TILE_INLINE inline __attribute__((always_inline))
#define TILE_LAMBDA __attribute__((always_inline))
#endif

namespace HPC::fastcv::arm {

namespace detail {

template <int bytes>
using Lane = std::conditional_t<
    bytes == 1, uint8_t,
    std::conditional_t<bytes == 2, uint16_t, std::conditional_t<bytes == 4, uint32_t, uint64_t>>>;
template <typename T, int size>
struct VectorOf {
  typedef T Type __attribute__((vector_size(size)));
};

template <auto from, typename V, int... i>
TILE_INLINE auto arrangedBy(V a, V b, std::integer_sequence<int, i...>) {
  return __builtin_shufflevector(a, b, from(i)...);
}

}  // namespace detail

/// The bytes of V in lanes of `bytes` bytes.
template <typename V, int bytes>
using LanesOf = typename detail::VectorOf<detail::Lane<bytes>, sizeof(V)>::Type;

/// Lanes of `bytes` bytes: lane i of the result R is lane from(i) of `a`, and those of `b` behind them.
template <typename R, int bytes, auto from, typename V>
TILE_INLINE R arranged(V a, V b) {
  return (R)detail::arrangedBy<from>((LanesOf<V, bytes>)a, (LanesOf<V, bytes>)b,
                                     std::make_integer_sequence<int, sizeof(R) / bytes>{});
}

/// In each half, the lanes of `bytes` bytes of the low, or of the high, halves of two registers in turn.
template <int bytes, bool high, typename V>
TILE_INLINE V zip(V a, V b) {
  constexpr auto kFrom = [](int i) {
    constexpr int kHalf = 16 / bytes, kAll = sizeof(V) / bytes;
    return i / kHalf * kHalf + (high ? kHalf / 2 : 0) + i % kHalf / 2 + i % 2 * kAll;
  };
  return arranged<V, bytes, kFrom>(a, b);
}

template <typename V>
TILE_INLINE V loadAs(const void* p) {
  V v;
  memcpy(&v, p, sizeof(v));
  return v;
}
template <typename V>
TILE_INLINE void storeAs(void* p, V v) {
  memcpy(p, &v, sizeof(v));
}

}  // namespace HPC::fastcv::arm
