// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// The words of vector.h on x86-64, in registers of 32 bytes. What widens, narrows or shuffles does so in
/// each half of a register. Pixels are loaded half a block to each half of a register, so that their lanes
/// are in the order of memory and nothing has to cross.
#pragma once

#include <immintrin.h>

#include <array>
#include <bit>
#include <cstddef>
#include <cstdint>
#include <cstring>

#include "simd/registers.h"
#include "simd/shuffle.h"

namespace HPC::fastcv::arm {

typedef uint8_t Bytes __attribute__((vector_size(32)));
typedef int8_t SignedBytes __attribute__((vector_size(32)));
typedef uint16_t Halves __attribute__((vector_size(32)));
typedef int16_t SignedHalves __attribute__((vector_size(32)));
typedef uint32_t Words __attribute__((vector_size(32)));
typedef int32_t SignedWords __attribute__((vector_size(32)));
typedef float Floats __attribute__((vector_size(32)));
/// 16 bytes.
typedef uint8_t Part __attribute__((vector_size(16)));

namespace x86 {

// A vector as a register, and back; floats are such of their own.
template <typename V>
inline __m256i raw(V v) {
  return std::bit_cast<__m256i>(v);
}
template <typename V>
inline __m256i m(V v) {
  return raw(v);
}
template <typename V>
inline V as(__m256i v) {
  return std::bit_cast<V>(v);
}
inline __m256 m(Floats v) { return std::bit_cast<__m256>(v); }

inline __m128i loadHalf(const void* p) { return _mm_loadu_si128(static_cast<const __m128i*>(p)); }
// 16 bytes at `low` and 16 at `high`, in the halves of a register.
inline __m256i loadHalves(const void* low, const void* high) {
  return _mm256_inserti128_si256(_mm256_castsi128_si256(loadHalf(low)), loadHalf(high), 1);
}
inline void storeHalves(void* low, void* high, __m256i v) {
  _mm_storeu_si128(static_cast<__m128i*>(low), _mm256_castsi256_si128(v));
  _mm_storeu_si128(static_cast<__m128i*>(high), _mm256_extracti128_si256(v, 1));
}
inline void storeWhole(void* p, __m256i v) { _mm256_storeu_si256(static_cast<__m256i*>(p), v); }

// Byte i of a table is f(i). What is negative makes a 0 where it is a shuffle.
struct alignas(16) Table {
  std::array<int8_t, 16> bytes;
  __m256i twice() const { return _mm256_broadcastsi128_si256(loadHalf(bytes.data())); }
};
template <typename F>
constexpr Table tableOf(F f) {
  Table table{};
  for (int i = 0; i < 16; ++i) {
    table.bytes[static_cast<size_t>(i)] = static_cast<int8_t>(f(i));
  }
  return table;
}

// Lane i, of `size` bytes, from lane i of v[(start + step * i) % 3].
template <int size, int start, int step>
inline __m256i mixed(__m256i v0, __m256i v1, __m256i v2) {
  static constexpr auto kFrom = [](int i) { return (start + step * (i / size)) % 3; };
  if constexpr (size == 1) {
    static constexpr Table kSecond = tableOf([](int i) { return kFrom(i) == 1 ? -1 : 0; });
    static constexpr Table kThird = tableOf([](int i) { return kFrom(i) == 2 ? -1 : 0; });
    return _mm256_blendv_epi8(_mm256_blendv_epi8(v0, v1, kSecond.twice()), v2, kThird.twice());
  } else {
    static constexpr auto kLanes = [](int from) {
      int lanes = 0;
      for (int i = 0; i < 8; ++i) {
        lanes |= kFrom(i % 4 * size) == from ? 1 << i : 0;
      }
      return lanes;
    };
    constexpr int kSecond = kLanes(1), kThird = kLanes(2);
    return _mm256_blend_epi32(_mm256_blend_epi32(v0, v1, kSecond), v2, kThird);
  }
}

// Of three registers with pixels of three lanes, channel c: lane (3 p + c) of all is pixel p's. No two pixels
// have theirs at the same place of their registers, so it is mixed together first, then put in order.
template <int size, int c>
inline __m256i channelOfThree(__m256i v0, __m256i v1, __m256i v2) {
  static constexpr Table kOrder =
      tableOf([](int i) { return (3 * (i / size) + c) % (16 / size) * size + i % size; });
  return _mm256_shuffle_epi8(mixed<size, c, 2>(v0, v1, v2), kOrder.twice());
}
// The way back: a channel's lanes are put where they belong in their registers, to be mixed. 3 * 11 is 1
// modulo 4 and modulo 16.
template <int size, int c>
inline __m256i placedOfThree(__m256i v) {
  constexpr int kLanes = 16 / size;
  static constexpr Table kOrder =
      tableOf([](int i) { return (i / size + kLanes - c) * 11 % kLanes * size + i % size; });
  return _mm256_shuffle_epi8(v, kOrder.twice());
}

template <int size, typename V>
inline void loadThree(const void* p, V (&c)[3]) {
  const auto* bytes = static_cast<const uint8_t*>(p);
  const __m256i v0 = loadHalves(bytes, bytes + 48);
  const __m256i v1 = loadHalves(bytes + 16, bytes + 64);
  const __m256i v2 = loadHalves(bytes + 32, bytes + 80);
  c[0] = as<V>(channelOfThree<size, 0>(v0, v1, v2));
  c[1] = as<V>(channelOfThree<size, 1>(v0, v1, v2));
  c[2] = as<V>(channelOfThree<size, 2>(v0, v1, v2));
}
template <int size, typename V>
inline void storeThree(void* p, const V (&c)[3]) {
  auto* bytes = static_cast<uint8_t*>(p);
  const __m256i v0 = placedOfThree<size, 0>(std::bit_cast<__m256i>(c[0]));
  const __m256i v1 = placedOfThree<size, 1>(std::bit_cast<__m256i>(c[1]));
  const __m256i v2 = placedOfThree<size, 2>(std::bit_cast<__m256i>(c[2]));
  storeHalves(bytes, bytes + 48, mixed<size, 0, 1>(v0, v1, v2));
  storeHalves(bytes + 16, bytes + 64, mixed<size, 1, 1>(v0, v1, v2));
  storeHalves(bytes + 32, bytes + 80, mixed<size, 2, 1>(v0, v1, v2));
}

// 4 by 4 lanes of 4 bytes, transposed in each half.
template <typename V>
inline void transpose(V (&v)[4]) {
  const __m256i low01 = _mm256_unpacklo_epi32(raw(v[0]), raw(v[1]));
  const __m256i low23 = _mm256_unpacklo_epi32(raw(v[2]), raw(v[3]));
  const __m256i high01 = _mm256_unpackhi_epi32(raw(v[0]), raw(v[1]));
  const __m256i high23 = _mm256_unpackhi_epi32(raw(v[2]), raw(v[3]));
  v[0] = as<V>(_mm256_unpacklo_epi64(low01, low23));
  v[1] = as<V>(_mm256_unpackhi_epi64(low01, low23));
  v[2] = as<V>(_mm256_unpacklo_epi64(high01, high23));
  v[3] = as<V>(_mm256_unpackhi_epi64(high01, high23));
}

// Four registers of which one half block lies `apart` behind the other.
template <typename V>
inline void loadFour(const void* p, V (&v)[4], ptrdiff_t apart = 64) {
  const auto* bytes = static_cast<const uint8_t*>(p);
  for (int i = 0; i < 4; ++i) {
    v[i] = as<V>(loadHalves(bytes + 16 * i, bytes + apart + 16 * i));
  }
}
template <typename V>
inline void storeFour(void* p, const V (&v)[4]) {
  auto* bytes = static_cast<uint8_t*>(p);
  storeWhole(bytes, _mm256_permute2x128_si256(raw(v[0]), raw(v[1]), 0x20));
  storeWhole(bytes + 32, _mm256_permute2x128_si256(raw(v[2]), raw(v[3]), 0x20));
  storeWhole(bytes + 64, _mm256_permute2x128_si256(raw(v[0]), raw(v[1]), 0x31));
  storeWhole(bytes + 96, _mm256_permute2x128_si256(raw(v[2]), raw(v[3]), 0x31));
}

inline __m256i zero() { return _mm256_setzero_si256(); }

}  // namespace x86

// ---- made, loaded and stored

inline Bytes load(const unsigned char* p) {
  return x86::as<Bytes>(_mm256_loadu_si256(reinterpret_cast<const __m256i*>(p)));
}
inline Floats load(const float* p) { return std::bit_cast<Floats>(_mm256_loadu_ps(p)); }
inline void load(const unsigned char* p, Bytes& v) { v = load(p); }
inline void load(const float* p, Floats& v) { v = load(p); }
inline void store(unsigned char* p, Bytes v) { x86::storeWhole(p, x86::m(v)); }
inline void store(float* p, Floats v) { _mm256_storeu_ps(p, x86::m(v)); }

/// A block whose second half belongs `apart` bytes behind the first one.
inline void storeParts(unsigned char* p, ptrdiff_t apart, Bytes v) {
  apart == 16 ? store(p, v) : x86::storeHalves(p, p + apart, x86::m(v));
}

inline void loadChannels(const unsigned char* p, Bytes (&c)[3]) { x86::loadThree<1>(p, c); }
inline void loadChannels(const float* p, Floats (&c)[3]) { x86::loadThree<4>(p, c); }
inline void loadChannels(const unsigned char* p, Bytes (&c)[4]) {
  static constexpr x86::Table kSorted = x86::tableOf([](int i) { return i % 4 * 4 + i / 4; });
  x86::loadFour(p, c);
  for (Bytes& each : c) {
    each = x86::as<Bytes>(_mm256_shuffle_epi8(x86::m(each), kSorted.twice()));
  }
  x86::transpose(c);
}
inline void loadChannels(const float* p, Floats (&c)[4]) {
  x86::loadFour(p, c);
  x86::transpose(c);
}
inline void storeChannels(unsigned char* p, const Bytes (&c)[3]) { x86::storeThree<1>(p, c); }
inline void storeChannels(float* p, const Floats (&c)[3]) { x86::storeThree<4>(p, c); }
inline void storeChannels(unsigned char* p, const Bytes (&c)[4]) {
  using x86::m;
  const __m256i low01 = _mm256_unpacklo_epi8(m(c[0]), m(c[1]));
  const __m256i low23 = _mm256_unpacklo_epi8(m(c[2]), m(c[3]));
  const __m256i high01 = _mm256_unpackhi_epi8(m(c[0]), m(c[1]));
  const __m256i high23 = _mm256_unpackhi_epi8(m(c[2]), m(c[3]));
  x86::storeFour(p, {_mm256_unpacklo_epi16(low01, low23), _mm256_unpackhi_epi16(low01, low23),
                     _mm256_unpacklo_epi16(high01, high23), _mm256_unpackhi_epi16(high01, high23)});
}
inline void storeChannels(float* p, const Floats (&c)[4]) {
  Floats v[4] = {c[0], c[1], c[2], c[3]};
  x86::transpose(v);
  x86::storeFour(p, v);
}

/// Four registers as they lie in memory.
template <typename T, typename V>
inline void loadRow(const T* p, V (&v)[4]) {
  for (int i = 0; i < 4; ++i) {
    v[i] = load(p + i * (32 / static_cast<int>(sizeof(T))));
  }
}
template <typename T, typename V>
inline void storeRow(T* p, const V (&v)[4]) {
  for (int i = 0; i < 4; ++i) {
    store(p + i * (32 / static_cast<int>(sizeof(T))), v[i]);
  }
}

/// Pixels of three channels that are all `v`.
template <typename V>
inline void storeThrice(ElementOf<V>* p, V v) {
  constexpr int kSize = sizeof(v[0]);
  const auto store = [=]<int part>(std::integral_constant<int, part>) {
    static constexpr x86::Table kOrder =
        x86::tableOf([](int i) { return (16 * part + i) / (3 * kSize) * kSize + i % kSize; });
    auto* const bytes = reinterpret_cast<unsigned char*>(p) + 16 * part;
    x86::storeHalves(bytes, bytes + 48, _mm256_shuffle_epi8(std::bit_cast<__m256i>(v), kOrder.twice()));
  };
  store(std::integral_constant<int, 0>{});
  store(std::integral_constant<int, 1>{});
  store(std::integral_constant<int, 2>{});
}

// ---- lanes

inline Bytes min(Bytes a, Bytes b) { return x86::as<Bytes>(_mm256_min_epu8(x86::m(a), x86::m(b))); }
inline Bytes max(Bytes a, Bytes b) { return x86::as<Bytes>(_mm256_max_epu8(x86::m(a), x86::m(b))); }

/// Of a NaN in `a` these make one.
inline Floats min(Floats a, Floats b) { return std::bit_cast<Floats>(_mm256_min_ps(x86::m(b), x86::m(a))); }
inline Floats max(Floats a, Floats b) { return std::bit_cast<Floats>(_mm256_max_ps(x86::m(b), x86::m(a))); }

/// `a` where the mask is set, `b` elsewhere.
template <typename Mask, typename V>
inline V select(Mask mask, V a, V b) {
  return mask ? a : b;
}

inline Bytes addSaturated(Bytes a, Bytes b) { return x86::as<Bytes>(_mm256_adds_epu8(x86::m(a), x86::m(b))); }
inline Bytes subtractSaturated(Bytes a, Bytes b) {
  return x86::as<Bytes>(_mm256_subs_epu8(x86::m(a), x86::m(b)));
}

/// c + a b, rounded once.
inline Floats multiplyAdd(Floats c, Floats a, Floats b) {
  return std::bit_cast<Floats>(_mm256_fmadd_ps(x86::m(a), x86::m(b), x86::m(c)));
}
/// |a - b|
inline Floats distance(Floats a, Floats b) {
  return std::bit_cast<Floats>(std::bit_cast<Words>(a - b) & 0x7fffffffu);
}

/// Bytes of each 16 of a block, by the 16 places in `order`.
inline Bytes shuffled(Bytes v, const unsigned char (&order)[16]) {
  return x86::as<Bytes>(_mm256_shuffle_epi8(x86::m(v), _mm256_broadcastsi128_si256(x86::loadHalf(order))));
}

/// Lanes, or pixels of `bytes` bytes, in reverse order.
template <typename V, int bytes = sizeof(ElementOf<V>)>
inline V reversed(V v) {
  constexpr int kSize = bytes < 8 ? bytes : 8, kLanes = bytes / kSize, kAll = sizeof(V) / kSize;
  return arranged<V, kSize, [](int i) { return kAll - kLanes - i / kLanes * kLanes + i % kLanes; }>(v, v);
}

// ---- widening

namespace x86 {
// What a lane of bytes becomes.
template <typename B>
using Wide = std::conditional_t<std::is_same_v<B, Bytes>, Halves, SignedHalves>;
// Bytes of both in turn, as wider lanes or as they are.
template <typename V, typename B>
inline Two<V> inTurn(B a, B b) {
  return {as<V>(_mm256_unpacklo_epi8(m(a), m(b))), as<V>(_mm256_unpackhi_epi8(m(a), m(b)))};
}
}  // namespace x86

inline Two<Halves> widen(Bytes a) { return x86::inTurn<Halves>(a, Bytes{}); }
template <int n, typename B>
inline Two<x86::Wide<B>> widenShifted(B a) {
  // As the upper bytes, they bring their signs along.
  const auto upper = x86::inTurn<x86::Wide<B>>(B{}, a);
  return {upper.low >> (8 - n), upper.high >> (8 - n)};
}
inline Two<SignedHalves> widen(SignedBytes a) { return widenShifted<0>(a); }
inline Two<SignedHalves> asSigned(const Two<Halves>& a) {
  return {(SignedHalves)a.low, (SignedHalves)a.high};
}
inline Two<SignedHalves> difference(Bytes a, Bytes b) {
  // Products of neighbours with 1 and -1.
  const auto weights = x86::m(kept(splat<Halves>(0xff01)));
  const auto pairs = x86::inTurn<Bytes>(a, b);
  return {x86::as<SignedHalves>(_mm256_maddubs_epi16(x86::m(pairs.low), weights)),
          x86::as<SignedHalves>(_mm256_maddubs_epi16(x86::m(pairs.high), weights))};
}
template <typename V>
inline Two<V> add(const Two<V>& a, Bytes b) {
  const Two<Halves> wide = widen(b);
  return {a.low + (V)wide.low, a.high + (V)wide.high};
}

template <typename B>
inline Two<x86::Wide<B>> multiply(B a, ElementOf<B> weight) {
  const auto wide = widen(a);
  const auto weights = kept(splat<x86::Wide<B>>(weight));
  return {wide.low * weights, wide.high * weights};
}
template <typename B>
inline Two<x86::Wide<B>> multiplyAdd(const Two<x86::Wide<B>>& sum, B a, ElementOf<B> weight) {
  const auto products = multiply(a, weight);
  return {sum.low + products.low, sum.high + products.high};
}

// ---- in 16 bits

/// (2 a weight + 2^15) >> 16
inline Two<SignedHalves> multiplyRounded(const Two<SignedHalves>& a, int16_t weight) {
  const __m256i w = kept(_mm256_set1_epi16(weight));
  return {x86::as<SignedHalves>(_mm256_mulhrs_epi16(x86::m(a.low), w)),
          x86::as<SignedHalves>(_mm256_mulhrs_epi16(x86::m(a.high), w))};
}

/// The sum, and those of neighbouring lanes; lanes of 16 bits are less than 2^15.
inline Halves addPairs(Halves sum, Bytes a) {
  return sum + x86::as<Halves>(_mm256_maddubs_epi16(x86::m(a), _mm256_set1_epi8(1)));
}
inline Words addPairs(Words sum, Halves a) {
  return sum + x86::as<Words>(_mm256_madd_epi16(x86::m(a), _mm256_set1_epi16(1)));
}
/// The sum, and (a + 2^(n-1)) >> n of both registers, which is less than 2^16 before the shift.
template <int n>
inline Halves addRounded(Halves sum, const Two<Halves>& a) {
  constexpr uint16_t kHalf = 1 << (n - 1);
  return sum + ((a.low + kHalf) >> n) + ((a.high + kHalf) >> n);
}

/// (a factor - offset) >> 16, from 0 on.
inline Halves multiplySubtractHigh(Halves a, uint16_t factor, uint32_t offset) {
  const Halves factors = kept(splat<Halves>(factor)), low = a * factors;
  const auto borrow = (Halves)(low < splat<Halves>(static_cast<uint16_t>(offset)));
  const auto high = x86::as<Halves>(_mm256_mulhi_epu16(x86::m(a), x86::m(factors)));
  return high + borrow - static_cast<uint16_t>(offset >> 16);
}

// ---- narrowing

/// Limited to a byte, and to a signed one.
inline Bytes narrow(const Two<SignedHalves>& a) {
  return x86::as<Bytes>(_mm256_packus_epi16(x86::m(a.low), x86::m(a.high)));
}
/// Of lanes that are bytes.
inline Bytes narrow(const Two<Halves>& a) { return narrow(asSigned(a)); }
inline SignedBytes narrowSigned(const Two<SignedHalves>& a) {
  return x86::as<SignedBytes>(_mm256_packs_epi16(x86::m(a.low), x86::m(a.high)));
}
/// (a + 2^(n-1)) >> n, limited to a byte.
template <int n>
inline Bytes narrowRounded(const Two<SignedHalves>& a) {
  return narrow(multiplyRounded(a, static_cast<int16_t>(1 << (15 - n))));
}
/// The same of unsigned lanes that need no limit: a + 2^(n-1) is less than 2^16, and the result a byte.
template <int n>
inline Bytes narrowRounded(const Two<Halves>& a) {
  constexpr uint16_t kHalf = 1 << (n - 1);
  return narrow(asSigned({(a.low + kHalf) >> n, (a.high + kHalf) >> n}));
}

// ---- weighed pixels

/// The first three channels of a block of pixels, in the form in which they are best weighed: here pixels of
/// four bytes, pixels 4 k to 4 k + 3 and 16 further in the halves of register k. What stands for a fourth
/// channel does not count.
struct Colours {
  __m256i v[4];
};
/// Those of every second pixel, from the first on: 4 k to 4 k + 3 and 8 further in register k.
struct EvenColours {
  __m256i v[2];
};

/// Loads them, of three channels the first and the third swapped or not. The second half of the block begins
/// `apart` pixels behind the first one.
template <int nc, bool swapped = false>
inline Colours loadColours(const unsigned char* p, ptrdiff_t apart = 16) {
  Colours all;
  if constexpr (nc == 4) {
    static_assert(!swapped);
    x86::loadFour(p, all.v, 4 * apart);
  } else {
    static_assert(nc == 3);
    static constexpr auto kFrom = [](int i) {
      const int channel = i % 4;
      return channel == 3 ? -16 : i / 4 * 3 + (swapped ? 2 - channel : channel);
    };
    static constexpr x86::Table kFirst = x86::tableOf(kFrom);
    static constexpr x86::Table kLast = x86::tableOf([](int i) { return kFrom(i) + 4; });
    for (int i = 0; i < 3; ++i) {
      all.v[i] = _mm256_shuffle_epi8(x86::loadHalves(p + 12 * i, p + 3 * apart + 12 * i), kFirst.twice());
    }
    // The last bytes are the end of what is loaded, so that nothing behind the block is read.
    all.v[3] = _mm256_shuffle_epi8(x86::loadHalves(p + 32, p + 3 * apart + 32), kLast.twice());
  }
  return all;
}
/// The way back, where `swapped` with the first and the third channel swapped. Of four channels the last is
/// 255: what stands for it is 0 or that.
template <int nc, bool swapped>
inline void storeColours(unsigned char* p, const Colours& c, Bytes opaque) {
  __m256i v[4];
  if constexpr (nc == 4) {
    static_assert(!swapped);
    for (int i = 0; i < 4; ++i) {
      v[i] = _mm256_or_si256(c.v[i], _mm256_slli_epi32(x86::m(opaque), 24));
    }
    x86::storeFour(p, v);
  } else {
    // The 12 bytes of register k go to byte 12 k of three registers, those beyond one to the next one's
    // start.
    [&]<int... k>(std::integer_sequence<int, k...>) {
      static constexpr x86::Table kOrder[] = {x86::tableOf([](int i) {
        const int from = (i + 4 * k) % 16;
        return from < 12 ? from / 3 * 4 + (swapped ? 2 - from % 3 : from % 3) : -1;
      })...};
      ((v[k] = _mm256_shuffle_epi8(c.v[k], kOrder[k].twice())), ...);
    }(std::make_integer_sequence<int, 4>{});
    x86::storeHalves(p, p + 48, _mm256_blend_epi32(v[0], v[1], 0x88));
    x86::storeHalves(p + 16, p + 64, _mm256_blend_epi32(v[1], v[2], 0xcc));
    x86::storeHalves(p + 32, p + 80, _mm256_blend_epi32(v[2], v[3], 0xee));
  }
}
/// Those of pixels whose byte in a mask is set, and black.
inline Colours masked(Bytes mask, Colours c) {
  static constexpr x86::Table kFourTimes = x86::tableOf([](int i) { return i / 4; });
  for (int i = 0; i < 4; ++i) {
    const __m256i index = _mm256_add_epi8(kFourTimes.twice(), _mm256_set1_epi8(static_cast<char>(4 * i)));
    c.v[i] &= _mm256_shuffle_epi8(x86::m(mask), index);
  }
  return c;
}
inline EvenColours evenColumns(const Colours& c) {
  const auto even = [](__m256i a, __m256i b) {
    return _mm256_castps_si256(_mm256_shuffle_ps(_mm256_castsi256_ps(a), _mm256_castsi256_ps(b), 0x88));
  };
  return {{even(c.v[0], c.v[1]), even(c.v[2], c.v[3])}};
}

namespace x86 {
// Sums of neighbouring products of bytes and weights, and of neighbouring sums. Weights beyond a signed byte
// are taken as unsigned, and 128 from each byte: the sum is then less by 128 times that of the weights.
template <Weights w>
inline constexpr bool kLarge = w.c0 > 127 || w.c1 > 127 || w.c2 > 127;
template <Weights w>
inline __m256i weighed(__m256i a, __m256i b) {
  const auto bits = [](int weight) { return static_cast<uint32_t>(static_cast<uint8_t>(weight)); };
  const auto all = static_cast<int>(bits(w.c0) | bits(w.c1) << 8 | bits(w.c2) << 16);
  const __m256i weights = _mm256_set1_epi32(all);
  if constexpr (kLarge<w>) {
    static_assert(w.c0 + w.c1 <= 256 && w.c0 >= 0 && w.c1 >= 0 && w.c2 >= 0);
    const __m256i middle = _mm256_set1_epi8(-128);
    return _mm256_hadd_epi16(_mm256_maddubs_epi16(weights, _mm256_xor_si256(a, middle)),
                             _mm256_maddubs_epi16(weights, _mm256_xor_si256(b, middle)));
  } else {
    static_assert((w.c0 > 0 ? w.c0 : 0) + (w.c1 > 0 ? w.c1 : 0) <= 128);
    static_assert((w.c0 < 0 ? w.c0 : 0) + (w.c1 < 0 ? w.c1 : 0) >= -128);
    return _mm256_hadd_epi16(_mm256_maddubs_epi16(a, weights), _mm256_maddubs_epi16(b, weights));
  }
}
template <Weights w>
inline constexpr auto kTaken = static_cast<uint16_t>(kLarge<w> ? 128 * (w.c0 + w.c1 + w.c2) : 0);
}  // namespace x86

/// w.c0 c0 + w.c1 c1 + w.c2 c2 in 16 bits, signed or unsigned; at least one weight is not negative.
template <Weights w>
inline Halves weighed(const EvenColours& c) {
  return x86::as<Halves>(x86::weighed<w>(c.v[0], c.v[1])) + x86::kTaken<w>;
}
template <Weights w>
inline Two<Halves> weighed(const Colours& c) {
  return {x86::as<Halves>(x86::weighed<w>(c.v[0], c.v[1])) + x86::kTaken<w>,
          x86::as<Halves>(x86::weighed<w>(c.v[2], c.v[3])) + x86::kTaken<w>};
}

/// 128 + ((a + 2^(n-1)) >> n), limited to a byte, of each signed lane of two registers, in turn.
using BytePairs = Bytes;
template <int n>
inline BytePairs centredPairs(Halves first, Halves second) {
  static constexpr unsigned char kInTurn[16] = {0, 8, 1, 9, 2, 10, 3, 11, 4, 12, 5, 13, 6, 14, 7, 15};
  const Two<SignedHalves> shifted =
      multiplyRounded(asSigned({first, second}), static_cast<int16_t>(1 << (15 - n)));
  return shuffled(std::bit_cast<Bytes>(narrowSigned(shifted)), kInTurn) ^ 0x80;
}
inline void storePairs(unsigned char* p, ptrdiff_t apart, BytePairs v) { storeParts(p, apart, v); }

// ---- samples of chroma

/// 16 chroma samples, which belong to 32 columns: here in 16 bits, which are the places of their columns.
using Samples = Halves;
/// How many blocks of bytes the 32 columns are.
inline constexpr int kSampleBlocks = 1;

inline Samples loadSamples(const unsigned char* p) {
  return x86::as<Samples>(_mm256_cvtepu8_epi16(x86::loadHalf(p)));
}
inline void loadSamplePairs(const unsigned char* p, Samples& first, Samples& second) {
  const auto both = std::bit_cast<Halves>(load(p));
  first = both & 0xff;
  second = both >> 8;
}
/// The block number `part` of two, of which 16 bytes each lie `step` behind those before: here all of it.
inline Bytes loadParts(const unsigned char* p, ptrdiff_t step, int /*part*/) {
  return x86::as<Bytes>(x86::loadHalves(p, p + step));
}

inline Halves multiply(Samples a, unsigned char weight) { return a * kept(splat<Halves>(weight)); }
inline Halves multiplyAdd(Halves sum, Samples a, unsigned char weight) { return sum + multiply(a, weight); }
inline SignedHalves asSigned(Halves a) { return std::bit_cast<SignedHalves>(a); }

/// What 16 samples add, as bytes, and the bytes of the columns of block `part`. Here limited from below
/// alone.
template <int n>
inline Bytes sampleBytes(SignedHalves a) {
  static constexpr unsigned char kTwice[] = {0, 0, 2, 2, 4, 4, 6, 6, 8, 8, 10, 10, 12, 12, 14, 14};
  const __m256i rounded = _mm256_srai_epi16(x86::m(a + static_cast<int16_t>(1 << (n - 1))), n);
  return shuffled(x86::as<Bytes>(_mm256_max_epi16(rounded, x86::zero())), kTwice);
}
template <int part>
inline Bytes spread(Bytes v) {
  return v;
}

// ---- tables

/// 256 entries of 16 bits, in the form in which vectors of bytes look them up.
struct WideTable {
  uint16_t entry[256];

  constexpr void set(int index, uint16_t value) { entry[index] = value; }
};

/// The entries of a table that lanes name.
template <typename Entry, typename V>
  requires std::is_same_v<Entry, ElementOf<V>>
inline V lookUp(const Entry* table, V index) {
  std::array<Entry, sizeof(V) / sizeof(Entry)> found;
#pragma GCC unroll 16
  for (size_t i = 0; i < found.size(); ++i) {
    found[i] = table[index[i]];
  }
  return std::bit_cast<V>(found);
}
inline Halves lookUp(const uint16_t* table, const Two<Words>& index) {
  return lookUp(table, x86::as<Halves>(_mm256_packus_epi32(x86::m(index.low), x86::m(index.high))));
}
/// Those of each of `n` vectors of bytes.
template <int n>
inline void lookUp(const WideTable& table, const Bytes (&bytes)[n], Two<Halves> (&entries)[n]) {
#pragma GCC unroll 3
  for (int i = 0; i < n; ++i) {
    const Two<Halves> index = widen(bytes[i]);
    entries[i] = {lookUp(table.entry, index.low), lookUp(table.entry, index.high)};
  }
}

/// Three factors of 16 bits.
template <int n>
class WeighedHalves {
 public:
  WeighedHalves(uint16_t f0, uint16_t f1, uint16_t f2)
      : first_(_mm256_set1_epi32(f0 | f1 << 16)), last_(_mm256_set1_epi32(f2 | 1 << (n + 15))) {}

  /// (f0 a + f1 b + f2 c + 2^(n-1)) >> n in 32 bits; all are less than 2^15.
  Two<Words> operator()(Halves a, Halves b, Halves c) const {
    const __m256i one = _mm256_set1_epi16(1);
    return {sum(_mm256_unpacklo_epi16(x86::m(a), x86::m(b)), _mm256_unpacklo_epi16(x86::m(c), one)),
            sum(_mm256_unpackhi_epi16(x86::m(a), x86::m(b)), _mm256_unpackhi_epi16(x86::m(c), one))};
  }

 private:
  Words sum(__m256i ab, __m256i c) const {
    const __m256i all = _mm256_add_epi32(_mm256_madd_epi16(ab, first_), _mm256_madd_epi16(c, last_));
    return x86::as<Words>(all) >> n;
  }

  __m256i first_, last_;
};

// ---- bytes as floats

/// Number `i` of the four quarters of a block of bytes, as floats.
inline Floats quarterOf(Bytes v, unsigned i) {
  // A shuffle gives 0 for indices whose highest bit is set.
  const __m256i first = _mm256_setr_epi32(-256, -255, -254, -253, -256, -255, -254, -253);
  const __m256i index = _mm256_add_epi32(first, _mm256_set1_epi32(static_cast<int>(4 * i)));
  return std::bit_cast<Floats>(_mm256_cvtepi32_ps(_mm256_shuffle_epi8(x86::m(v), index)));
}
/// Four quarters rounded to bytes, halves up, and limited.
inline Bytes bytesOf(const Floats (&q)[4]) {
  const auto rounded = [](Floats x) { return _mm256_cvttps_epi32(x86::m(x + 0.5f)); };
  return x86::as<Bytes>(_mm256_packus_epi16(_mm256_packs_epi32(rounded(q[0]), rounded(q[1])),
                                            _mm256_packs_epi32(rounded(q[2]), rounded(q[3]))));
}

namespace x86 {
// 1 / v: the estimate of 8 bits that Arm's processors make, and two Newton-Raphson steps, each of which
// doubles the bits. `scale` is 1, or 16 where numbers may be large, infinite or 0.
template <int scale>
inline Floats reciprocal(Floats v) {
  // The estimate is the inverse of the middle of the numbers with the same 8 bits of mantissa, rounded to 8
  // bits. That of a large number has fewer bits than a mantissa: all are taken 16 times as large first.
  const auto middle = std::bit_cast<Floats>((std::bit_cast<Words>(v) & 0xffff8000u) | 0x4000u);
  const auto inverse = std::bit_cast<Words>(float{scale} / middle);
  auto estimate = std::bit_cast<Floats>((inverse + 0x4000u) & 0xffff8000u);
  if constexpr (scale > 1) {
    estimate = masked(distance(v, Floats{}) != splat<Floats>(__builtin_inff()), estimate * (1.0f / scale));
  }
  // A step is about 1; that of 0 and infinity is 2 on Arm.
  const auto step = [=](Floats e) {
    const Floats two = splat<Floats>(2.0f);
    const auto rest = std::bit_cast<Floats>(_mm256_fnmadd_ps(m(v), m(e), m(two)));
    return scale > 1 ? std::bit_cast<Floats>(_mm256_min_ps(m(rest), m(two))) : rest;
  };
  estimate = estimate * step(estimate);
  return estimate * step(estimate);
}
}  // namespace x86

/// 1 / v, as exact as two steps make the estimate that Arm's processors have, where infinities have 0 of
/// either sign; and that of numbers that are above 0 and below 2, but not below 2^-100.
inline Floats reciprocal(Floats v) { return x86::reciprocal<16>(v); }
inline Floats reciprocalBelow2(Floats v) { return x86::reciprocal<1>(v); }
/// Whether all of `a` and `b` are above 0 and below 2, where that makes a difference; `b` is not 0.
inline bool areBelow2(Floats a, Floats b) {
  // The sign and the upper bit of the exponent are those that count.
  const __m256i bits = x86::m((std::bit_cast<Words>(a) - 1u) | std::bit_cast<Words>(b));
  return _mm256_testz_si256(bits, _mm256_set1_epi32(static_cast<int>(0xc0000000u))) != 0;
}

/// Square roots of whole numbers.
inline Floats rootOfWhole(Floats v) { return std::bit_cast<Floats>(_mm256_sqrt_ps(x86::m(v))); }

// ---- floats and their bits

/// Of a NaN in `a` these make the number in `b`.
inline Floats minNumber(Floats a, Floats b) {
  return std::bit_cast<Floats>(_mm256_min_ps(x86::m(a), x86::m(b)));
}
inline Floats maxNumber(Floats a, Floats b) {
  return std::bit_cast<Floats>(_mm256_max_ps(x86::m(a), x86::m(b)));
}
inline Words min(Words a, Words b) { return x86::as<Words>(_mm256_min_epu32(x86::m(a), x86::m(b))); }

/// c - a b, rounded once.
inline Floats multiplySubtract(Floats c, Floats a, Floats b) {
  return std::bit_cast<Floats>(_mm256_fnmadd_ps(x86::m(a), x86::m(b), x86::m(c)));
}
/// Whether |a| > |b|.
inline Words exceeds(Floats a, Floats b) {
  return std::bit_cast<Words>(distance(a, Floats{}) > distance(b, Floats{}));
}
/// (2 a factor) >> 32
inline SignedWords doubledHigh(SignedWords a, int32_t factor) {
  const __m256i f = _mm256_set1_epi32(factor);
  const __m256i even = _mm256_srli_epi64(_mm256_mul_epi32(x86::m(a), f), 31);
  const __m256i odd = _mm256_slli_epi64(_mm256_mul_epi32(_mm256_srli_epi64(x86::m(a), 32), f), 1);
  return x86::as<SignedWords>(_mm256_blend_epi32(even, odd, 0xaa));
}

/// The whole part of floats from 0 on, and integers below 2^31 as floats.
inline Words truncated(Floats v) { return x86::as<Words>(_mm256_cvttps_epi32(x86::m(v))); }
inline Floats floatsOf(Words v) { return std::bit_cast<Floats>(_mm256_cvtepi32_ps(x86::m(v))); }
inline Floats floatsOf(SignedWords v) { return std::bit_cast<Floats>(_mm256_cvtepi32_ps(x86::m(v))); }
inline Two<Floats> floatsOf(Halves v) {
  return {floatsOf(x86::as<Words>(_mm256_unpacklo_epi16(x86::m(v), x86::zero()))),
          floatsOf(x86::as<Words>(_mm256_unpackhi_epi16(x86::m(v), x86::zero())))};
}
/// The lowest 16 bits of the whole parts.
inline SignedHalves truncatedHalves(const Two<Floats>& v) {
  const auto lowest = [](Floats each) {
    return x86::m((std::bit_cast<SignedWords>(truncated(each)) << 16) >> 16);
  };
  return x86::as<SignedHalves>(_mm256_packs_epi32(lowest(v.low), lowest(v.high)));
}

inline bool anySet(Words mask) { return _mm256_testz_si256(x86::m(mask), x86::m(mask)) == 0; }

/// Of a table of rows of four, those that `index` names, by columns.
inline void lookUpRows(const float (*rows)[4], Words index, Floats (&columns)[4]) {
  for (int i = 0; i < 4; ++i) {
    columns[i] = x86::as<Floats>(x86::loadHalves(rows[index[i]], rows[index[i + 4]]));
  }
  x86::transpose(columns);
}

/// Four constants.
class Factors {
 public:
  Factors(float f0, float f1, float f2, float f3) : all_{f0, f1, f2, f3} {}

  template <int i>
  Floats at() const {
    return splat<Floats>(all_[i]);
  }

 private:
  float all_[4];
};

// ---- groups of eight pixels

/// Registers of floats that hold a channel of a group.
inline constexpr int kGroupRegisters = 1;

/// Loads a group of three bytes a pixel as floats; of the second and third channel less 128.
inline void loadGroup(const unsigned char* p, Floats (&c)[3][kGroupRegisters]) {
  static constexpr x86::Table kOrder =
      x86::tableOf([](int i) { return i % 4 == 3 ? -1 : i / 4 * 3 + i % 4; });
  // The last 12 bytes are the end of what is loaded, so that nothing behind the group is read.
  const __m128i last = _mm_srli_si128(x86::loadHalf(p + 8), 4);
  const Words all =
      x86::as<Words>(_mm256_shuffle_epi8(_mm256_set_m128i(last, x86::loadHalf(p)), kOrder.twice()));
  for (int i = 0; i < 3; ++i) {
    c[i][0] = floatsOf(all >> (8 * i) & 0xff) - splat<Floats>(i == 0 ? 0.0f : 128.0f);
  }
}
/// Stores bits 16 to 23 of each lane of `words(channel, register)`, whose higher bits are 0, as bytes, with
/// an opaque fourth channel where `nc` is 4.
template <int nc, typename Channels>
inline void storeGroup(unsigned char* p, const Channels& words) {
  const Words pixels = words(0, 0) >> 16 | words(1, 0) >> 16 << 8 | words(2, 0) >> 16 << 16 | 0xff000000u;
  if constexpr (nc == 4) {
    x86::storeWhole(p, x86::m(pixels));
  } else {
    static constexpr x86::Table kOrder = x86::tableOf([](int i) { return i < 12 ? i / 3 * 4 + i % 3 : -1; });
    const __m256i packed = _mm256_shuffle_epi8(x86::m(pixels), kOrder.twice());
    unsigned char bytes[32];
    x86::storeHalves(bytes, bytes + 12, packed);
    memcpy(p, bytes, 24);
  }
}

}  // namespace HPC::fastcv::arm
