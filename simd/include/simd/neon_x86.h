// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// NEON intrinsics in SSE and AVX: those that SIMDe emulates lane by lane (with GCC all that widen or
/// narrow) or for aligned memory only, and those that it lacks. Included by neon.h after SIMDe; the table at
/// the end says which names are taken over. SIMDe's own stay reachable with their prefix, and the tests
/// compare with them.
#pragma once

#include <immintrin.h>

#include <array>
#include <bit>
#include <cstdint>
#include <cstring>
#include <type_traits>
#include <utility>

#include "simd/registers.h"

namespace neon_x86 {

using HPC::fastcv::arm::kept;

// ---- vectors and registers

template <typename T, int bytes>
struct VectorType {
  typedef T type __attribute__((vector_size(bytes)));
};
template <typename V>
using Element = std::remove_cvref_t<decltype(std::declval<V&>()[0])>;

// The element types of twice and of half the width.
template <typename T>
using WideElement = std::conditional_t<
    std::is_signed_v<T>,
    std::conditional_t<sizeof(T) == 1, int16_t, std::conditional_t<sizeof(T) == 2, int32_t, int64_t>>,
    std::conditional_t<sizeof(T) == 1, uint16_t, std::conditional_t<sizeof(T) == 2, uint32_t, uint64_t>>>;
template <typename T>
using NarrowElement = std::conditional_t<
    std::is_signed_v<T>,
    std::conditional_t<sizeof(T) == 2, int8_t, std::conditional_t<sizeof(T) == 4, int16_t, int32_t>>,
    std::conditional_t<sizeof(T) == 2, uint8_t, std::conditional_t<sizeof(T) == 4, uint16_t, uint32_t>>>;

// What a lower half widens to, what a vector narrows to, and that as unsigned.
template <typename V>
using Wide = typename VectorType<WideElement<Element<V>>, 16>::type;
template <typename V>
using Narrow = typename VectorType<NarrowElement<Element<V>>, 8>::type;
template <typename V>
using NarrowUnsigned = typename VectorType<std::make_unsigned_t<NarrowElement<Element<V>>>, 8>::type;
template <typename H>
using Whole = typename VectorType<Element<H>, 16>::type;

template <typename V>
inline constexpr int kBits = 8 * static_cast<int>(sizeof(Element<V>));
template <typename V>
inline constexpr bool kSigned = std::is_signed_v<Element<V>>;

// A vector as a register. 8-byte vectors lie in the lower half; what is above is not defined.
template <typename V>
inline __m128i m(V v) {
  if constexpr (sizeof(V) == 16) {
    return std::bit_cast<__m128i>(v);
  } else {
#if defined(__clang__)
    return _mm_cvtsi64_si128(std::bit_cast<int64_t>(v));
#else
    // It is in such a register already; GCC would spend an instruction on clearing the upper half.
    __m128i x;
    asm("" : "=x"(x) : "0"(v));
    return x;
#endif
  }
}
// And back: an 8-byte vector is the lower half.
template <typename V>
inline V as(__m128i x) {
  if constexpr (sizeof(V) == 8) {
    return std::bit_cast<V>(_mm_cvtsi128_si64(x));
  } else {
    return std::bit_cast<V>(x);
  }
}
// The upper half.
template <typename V>
inline auto high(V v) {
  const __m128i x = m(v);
  return as<typename VectorType<Element<V>, 8>::type>(_mm_unpackhi_epi64(x, x));
}

inline __m128i load(const void* p) { return _mm_loadu_si128(static_cast<const __m128i*>(p)); }
inline __m128i load8(const void* p) { return _mm_loadl_epi64(static_cast<const __m128i*>(p)); }
inline void store(void* p, __m128i x) { _mm_storeu_si128(static_cast<__m128i*>(p), x); }
inline void store8(void* p, __m128i x) { _mm_storel_epi64(static_cast<__m128i*>(p), x); }

// ---- widening

template <typename H>
inline Wide<H> movl(H a) {
  if constexpr (kBits<H> == 8) {
    return as<Wide<H>>(kSigned<H> ? _mm_cvtepi8_epi16(m(a)) : _mm_cvtepu8_epi16(m(a)));
  } else {
    return as<Wide<H>>(kSigned<H> ? _mm_cvtepi16_epi32(m(a)) : _mm_cvtepu16_epi32(m(a)));
  }
}
// The upper half widened.
template <typename V>
inline Wide<V> movlHigh(V a) {
  const __m128i zero = _mm_setzero_si128();
  if constexpr (!kSigned<V>) {
    return as<Wide<V>>(kBits<V> == 8 ? _mm_unpackhi_epi8(m(a), zero) : _mm_unpackhi_epi16(m(a), zero));
  } else {
    return movl(high(a));
  }
}

// A product. With a known constant, GCC would make several shifts and additions of it.
template <typename V>
inline V product(V a, V b) {
  return a * kept(b);
}
template <typename V>
inline V product(V a, Element<V> b) {
  return product(a, V{} + b);
}

// Products of 16-bit lanes, the lower and the upper four.
template <typename V>
inline __m128i upperProducts(V a, V b) {
  return kSigned<V> ? _mm_mulhi_epi16(m(a), m(b)) : _mm_mulhi_epu16(m(a), m(b));
}
template <typename H>
inline Wide<H> mull(H a, H b) {
  if constexpr (kBits<H> == 8) {
    return product(movl(a), movl(b));
  } else {
    return as<Wide<H>>(_mm_unpacklo_epi16(_mm_mullo_epi16(m(a), m(b)), upperProducts(a, b)));
  }
}
template <typename H>
inline Wide<H> mull(H a, Element<H> b) {
  return mull(a, H{} + b);
}
template <typename V>
inline Wide<V> mullHigh(V a, V b) {
  if constexpr (kBits<V> == 8) {
    return product(movlHigh(a), movlHigh(b));
  } else {
    return as<Wide<V>>(_mm_unpackhi_epi16(_mm_mullo_epi16(m(a), m(b)), upperProducts(a, b)));
  }
}
template <typename V>
inline Wide<V> mullHigh(V a, Element<V> b) {
  return mullHigh(a, V{} + b);
}

// The upper halves of twice the products, limited: only -2^15 squared is too much.
inline int16x8_t doubledProduct(int16x8_t a, int16x8_t b) {
  const __m128i upper = _mm_mulhi_epi16(m(a), m(b));
  const __m128i doubled =
      _mm_add_epi16(_mm_add_epi16(upper, upper), _mm_srli_epi16(_mm_mullo_epi16(m(a), m(b)), 15));
  const __m128i tooMuch = _mm_cmpeq_epi16(doubled, _mm_set1_epi16(INT16_MIN));
  return as<int16x8_t>(_mm_xor_si128(doubled, tooMuch));
}
inline int16x8_t doubledProduct(int16x8_t a, int16_t b) { return doubledProduct(a, int16x8_t{} + b); }

// ---- narrowing

// Lanes that fit in half their width, as unsigned.
template <typename V>
inline __m128i packed(V a) {
  return kBits<V> == 16 ? _mm_packus_epi16(m(a), m(a)) : _mm_packus_epi32(m(a), m(a));
}
// The lower and the upper halves of the lanes.
template <typename V>
inline Narrow<V> lowerHalves(V a) {
  constexpr auto kLower = static_cast<Element<V>>((int64_t{1} << (kBits<V> / 2)) - 1);
  return as<Narrow<V>>(packed(a & kept(V{} + kLower)));
}
template <typename V>
inline Narrow<V> upperHalves(V a) {
  return as<Narrow<V>>(packed(
      as<V>(kBits<V> == 16 ? _mm_srli_epi16(m(a), kBits<V> / 2) : _mm_srli_epi32(m(a), kBits<V> / 2))));
}
// Limited to what half the width holds, signed lanes as signed or as unsigned.
template <typename V>
inline Narrow<V> saturated(V a) {
  if constexpr (kSigned<V>) {
    return as<Narrow<V>>(kBits<V> == 16 ? _mm_packs_epi16(m(a), m(a)) : _mm_packs_epi32(m(a), m(a)));
  } else {
    return as<Narrow<V>>(packed(as<V>(kBits<V> == 16 ? _mm_min_epu16(m(a), _mm_set1_epi16(0xff))
                                                     : _mm_min_epu32(m(a), _mm_set1_epi32(0xffff)))));
  }
}
template <typename V>
inline NarrowUnsigned<V> saturatedUnsigned(V a) {
  return as<NarrowUnsigned<V>>(packed(a));
}

// a / 2^n, halves rounded up, without overflow on the way.
template <int n, typename V>
inline V roundingShift(V a) {
  static_assert(n >= 1 && (n < kBits<V> || (n == kBits<V> && kBits<V> < 32 && !kSigned<V>)));
  if constexpr (kBits<V> == 8) {
    static_assert(!kSigned<V>);
    const __m128i shifted =
        _mm_and_si128(_mm_srli_epi16(m(a), n - 1), _mm_set1_epi8(static_cast<char>(0xff >> (n - 1))));
    return as<V>(_mm_avg_epu8(shifted, _mm_setzero_si128()));
  } else if constexpr (kBits<V> == 16 && kSigned<V>) {
    // (a * 2^(15 - n) + 2^14) >> 15
    return as<V>(_mm_mulhrs_epi16(m(a), kept(_mm_set1_epi16(static_cast<int16_t>(1 << (15 - n))))));
  } else if constexpr (kBits<V> == 16) {
    return as<V>(_mm_avg_epu16(_mm_srli_epi16(m(a), n - 1), _mm_setzero_si128()));
  } else {
    return (a >> n) + ((a >> (n - 1)) & 1);
  }
}
// The same, of which only half the width is kept: what overflows when rounding is not in it.
template <int n, typename V>
inline Narrow<V> roundingShiftToLowerHalves(V a) {
  return lowerHalves(((a + static_cast<Element<V>>(1 << (n - 1))) >> n));
}
// The upper halves, rounded.
template <typename V>
inline Narrow<V> roundedUpperHalves(V a) {
  return upperHalves(a + static_cast<Element<V>>(1 << (kBits<V> / 2 - 1)));
}

// Two vectors in one, limited to unsigned bytes; unsigned lanes below 2^15.
template <typename V>
inline uint8x16_t packedBytes(V low, V high) {
  static_assert(kBits<V> == 16);
  return as<uint8x16_t>(_mm_packus_epi16(m(low), m(high)));
}

// (a wa + b wb + c wc + 2^(n-1)) >> n, in lanes of twice the width all at once.
template <int n>
inline uint8x16_t weightedBytes(uint8x16_t a, uint8_t wa, uint8x16_t b, uint8_t wb, uint8x16_t c,
                                uint8_t wc) {
  const auto product = [](uint8x16_t v, int16_t weight) {
    return _mm256_mullo_epi16(_mm256_cvtepu8_epi16(m(v)), _mm256_set1_epi16(weight));
  };
  const __m256i sum = _mm256_add_epi16(_mm256_add_epi16(product(a, wa), product(b, wb)), product(c, wc));
  const __m256i rounded = _mm256_srli_epi16(_mm256_add_epi16(sum, _mm256_set1_epi16(1 << (n - 1))), n);
  return as<uint8x16_t>(
      _mm_packus_epi16(_mm256_castsi256_si128(rounded), _mm256_extracti128_si256(rounded, 1)));
}

// A narrowed vector behind a lower half: what the "high" forms do.
template <typename H>
inline Whole<H> joined(H low, H narrowed) {
  return as<Whole<H>>(_mm_unpacklo_epi64(m(low), m(narrowed)));
}

// ---- the even and the odd lanes of two vectors, alternating

template <typename V>
inline V evenLanes(V a, V b) {
  if constexpr (kBits<V> == 8) {
    return as<V>(_mm_or_si128(_mm_and_si128(m(a), _mm_set1_epi16(0xff)), _mm_slli_epi16(m(b), 8)));
  } else if constexpr (kBits<V> == 16) {
    return as<V>(_mm_blend_epi16(m(a), _mm_slli_epi32(m(b), 16), 0xaa));
  } else {
    return as<V>(_mm_blend_epi32(m(a), _mm_slli_epi64(m(b), 32), 0xa));
  }
}
template <typename V>
inline V oddLanes(V a, V b) {
  if constexpr (kBits<V> == 8) {
    return as<V>(_mm_or_si128(_mm_srli_epi16(m(a), 8), _mm_andnot_si128(_mm_set1_epi16(0xff), m(b))));
  } else if constexpr (kBits<V> == 16) {
    return as<V>(_mm_blend_epi16(_mm_srli_epi32(m(a), 16), m(b), 0xaa));
  } else {
    return as<V>(_mm_blend_epi32(_mm_srli_epi64(m(a), 32), m(b), 0xa));
  }
}

// ---- interleaved pixels

struct Three {
  __m128i x[3];
};
struct Four {
  __m128i x[4];
};

// A table in memory, byte i of which is f(i).
template <typename F>
constexpr std::array<int8_t, 16> bytesOf(F f) {
  std::array<int8_t, 16> bytes{};
  for (int i = 0; i < 16; ++i) {
    bytes[static_cast<size_t>(i)] = static_cast<int8_t>(f(i));
  }
  return bytes;
}

// Lane i from lane i of v[(start + step * i) % 3].
template <int bits, int start, int step>
inline __m128i mixed(const Three& v) {
  static constexpr auto kFrom = [](int i) { return (start + step * (i * 8 / bits)) % 3; };
  if constexpr (bits == 8) {
    static constexpr auto kSecond = bytesOf([](int i) { return kFrom(i) == 1 ? -1 : 0; });
    static constexpr auto kThird = bytesOf([](int i) { return kFrom(i) == 2 ? -1 : 0; });
    return _mm_blendv_epi8(_mm_blendv_epi8(v.x[0], v.x[1], load(kSecond.data())), v.x[2],
                           load(kThird.data()));
  } else {
    static constexpr auto kLanes = [](int from) {
      int lanes = 0;
      for (int i = 0; i < 4; ++i) {
        lanes |= kFrom(4 * i) == from ? 1 << i : 0;
      }
      return lanes;
    };
    constexpr int kSecond = kLanes(1), kThird = kLanes(2);
    return _mm_blend_epi32(_mm_blend_epi32(v.x[0], v.x[1], kSecond), v.x[2], kThird);
  }
}

// Of three registers with pixels of three lanes, channel `c`: lane (3 p + c) of all is pixel p's. No two
// pixels have theirs at the same place of their registers, so it is mixed together first, then put in order.
template <int bits, int c>
inline __m128i channelOfThree(const Three& v) {
  constexpr int kLanes = 128 / bits;
  static constexpr auto kOrder = bytesOf([](int i) {
    const int lane = (3 * (i * 8 / bits) + c) % kLanes;
    return lane * bits / 8 + i % (bits / 8);
  });
  return _mm_shuffle_epi8(mixed<bits, c, 2>(v), load(kOrder.data()));
}
template <int bits, typename Vectors>
inline Vectors loadThree(const void* p) {
  const auto* bytes = static_cast<const uint8_t*>(p);
  const Three v = {{load(bytes), load(bytes + 16), load(bytes + 32)}};
  return std::bit_cast<Vectors>(
      Three{{channelOfThree<bits, 0>(v), channelOfThree<bits, 1>(v), channelOfThree<bits, 2>(v)}});
}

// The way back: each channel's lanes are put where they belong in their registers, then mixed.
template <int bits, int c>
inline __m128i placedOfThree(__m128i x) {
  constexpr int kLanes = 128 / bits;
  static constexpr auto kOrder = bytesOf([](int i) {
    // The pixel p with (3 p + c) % kLanes == lane; 3 * 11 is 1 modulo 4 and modulo 16.
    const int pixel = ((i * 8 / bits) + kLanes - c) * 11 % kLanes;
    return pixel * bits / 8 + i % (bits / 8);
  });
  return _mm_shuffle_epi8(x, load(kOrder.data()));
}
template <int bits, typename Vectors>
inline void storeThree(void* p, const Vectors& v) {
  auto* bytes = static_cast<uint8_t*>(p);
  const Three placed = {{placedOfThree<bits, 0>(m(v.val[0])), placedOfThree<bits, 1>(m(v.val[1])),
                         placedOfThree<bits, 2>(m(v.val[2]))}};
  store(bytes, mixed<bits, 0, 1>(placed));
  store(bytes + 16, mixed<bits, 1, 1>(placed));
  store(bytes + 32, mixed<bits, 2, 1>(placed));
}

// 4 by 4 lanes of 32 bits, transposed.
inline Four transposed(const Four& v) {
  const __m128i low01 = _mm_unpacklo_epi32(v.x[0], v.x[1]);
  const __m128i low23 = _mm_unpacklo_epi32(v.x[2], v.x[3]);
  const __m128i high01 = _mm_unpackhi_epi32(v.x[0], v.x[1]);
  const __m128i high23 = _mm_unpackhi_epi32(v.x[2], v.x[3]);
  return {{_mm_unpacklo_epi64(low01, low23), _mm_unpackhi_epi64(low01, low23),
           _mm_unpacklo_epi64(high01, high23), _mm_unpackhi_epi64(high01, high23)}};
}

// Bytes of pixels of `n`, sorted by channel.
template <int n>
inline __m128i sorted(__m128i x) {
  static constexpr auto kOrder = bytesOf([](int i) { return i % (16 / n) * n + i / (16 / n); });
  return _mm_shuffle_epi8(x, load(kOrder.data()));
}

inline __m256i load32(const void* p) { return _mm256_loadu_si256(static_cast<const __m256i*>(p)); }
inline __m256i sorted4(__m256i x) {
  static constexpr auto kOrder = bytesOf([](int i) { return i % 4 * 4 + i / 4; });
  return _mm256_shuffle_epi8(x, _mm256_broadcastsi128_si256(load(kOrder.data())));
}

template <int bits, typename Vectors>
inline Vectors loadFour(const void* p) {
  const auto* bytes = static_cast<const uint8_t*>(p);
  if constexpr (bits == 8) {
    // Eight pixels a register: bytes sorted in each half, then double words so that each channel's eight lie
    // together.
    const __m256i order = _mm256_setr_epi32(0, 4, 1, 5, 2, 6, 3, 7);
    const __m256i first = _mm256_permutevar8x32_epi32(sorted4(load32(bytes)), order);
    const __m256i last = _mm256_permutevar8x32_epi32(sorted4(load32(bytes + 32)), order);
    const __m256i c02 = _mm256_unpacklo_epi64(first, last);
    const __m256i c13 = _mm256_unpackhi_epi64(first, last);
    return std::bit_cast<Vectors>(Four{{_mm256_castsi256_si128(c02), _mm256_castsi256_si128(c13),
                                        _mm256_extracti128_si256(c02, 1), _mm256_extracti128_si256(c13, 1)}});
  } else {
    return std::bit_cast<Vectors>(
        transposed({{load(bytes), load(bytes + 16), load(bytes + 32), load(bytes + 48)}}));
  }
}
template <int bits, typename Vectors>
inline void storeFour(void* p, const Vectors& vectors) {
  auto* bytes = static_cast<uint8_t*>(p);
  const auto v = std::bit_cast<Four>(vectors);
  Four out;
  if constexpr (bits == 8) {
    const __m128i low01 = _mm_unpacklo_epi8(v.x[0], v.x[1]);
    const __m128i low23 = _mm_unpacklo_epi8(v.x[2], v.x[3]);
    const __m128i high01 = _mm_unpackhi_epi8(v.x[0], v.x[1]);
    const __m128i high23 = _mm_unpackhi_epi8(v.x[2], v.x[3]);
    out = {{_mm_unpacklo_epi16(low01, low23), _mm_unpackhi_epi16(low01, low23),
            _mm_unpacklo_epi16(high01, high23), _mm_unpackhi_epi16(high01, high23)}};
  } else {
    out = transposed(v);
  }
  for (int i = 0; i < 4; ++i) {
    store(bytes + 16 * i, out.x[i]);
  }
}

// Of 24 bytes with pixels of three, channel `c`.
template <int c>
inline __m128i channelOfEight(__m128i first16, __m128i last8) {
  static constexpr auto kFirst = bytesOf([](int i) { return i < 8 && 3 * i + c < 16 ? 3 * i + c : -1; });
  static constexpr auto kLast = bytesOf([](int i) { return i < 8 && 3 * i + c >= 16 ? 3 * i + c - 16 : -1; });
  return _mm_or_si128(_mm_shuffle_epi8(first16, load(kFirst.data())),
                      _mm_shuffle_epi8(last8, load(kLast.data())));
}
// 16 bytes from `start` on of 8 pixels of three, whose channels 0 and 1 are in the halves of `c01`.
template <int start>
inline __m128i interleavedOfEight(__m128i c01, __m128i c2) {
  static constexpr auto kFirst = bytesOf([](int i) {
    const int k = start + i;
    return k < 24 && k % 3 < 2 ? k % 3 * 8 + k / 3 : -1;
  });
  static constexpr auto kLast = bytesOf([](int i) {
    const int k = start + i;
    return k < 24 && k % 3 == 2 ? k / 3 : -1;
  });
  return _mm_or_si128(_mm_shuffle_epi8(c01, load(kFirst.data())), _mm_shuffle_epi8(c2, load(kLast.data())));
}

inline uint8x8x2_t loadPairs8(const uint8_t* p) {
  const auto v = as<uint8x16_t>(sorted<2>(load(p)));
  return {{as<uint8x8_t>(m(v)), high(v)}};
}
inline uint8x16x2_t loadPairs16(const uint8_t* p) {
  const __m128i v0 = sorted<2>(load(p));
  const __m128i v1 = sorted<2>(load(p + 16));
  return {{as<uint8x16_t>(_mm_unpacklo_epi64(v0, v1)), as<uint8x16_t>(_mm_unpackhi_epi64(v0, v1))}};
}
inline uint8x8x3_t loadThree8(const uint8_t* p) {
  const __m128i first = load(p);
  const __m128i last = load8(p + 16);
  return {{as<uint8x8_t>(channelOfEight<0>(first, last)), as<uint8x8_t>(channelOfEight<1>(first, last)),
           as<uint8x8_t>(channelOfEight<2>(first, last))}};
}
inline uint8x8x4_t loadFour8(const uint8_t* p) {
  const __m128i v0 = sorted<4>(load(p));
  const __m128i v1 = sorted<4>(load(p + 16));
  const auto c01 = as<uint8x16_t>(_mm_unpacklo_epi32(v0, v1));
  const auto c23 = as<uint8x16_t>(_mm_unpackhi_epi32(v0, v1));
  return {{as<uint8x8_t>(m(c01)), high(c01), as<uint8x8_t>(m(c23)), high(c23)}};
}
inline void storePairs8(uint8_t* p, uint8x8x2_t v) { store(p, _mm_unpacklo_epi8(m(v.val[0]), m(v.val[1]))); }
inline void storePairs16(uint8_t* p, uint8x16x2_t v) {
  store(p, _mm_unpacklo_epi8(m(v.val[0]), m(v.val[1])));
  store(p + 16, _mm_unpackhi_epi8(m(v.val[0]), m(v.val[1])));
}
inline void storeThree8(uint8_t* p, uint8x8x3_t v) {
  const __m128i c01 = _mm_unpacklo_epi64(m(v.val[0]), m(v.val[1]));
  store(p, interleavedOfEight<0>(c01, m(v.val[2])));
  store8(p + 16, interleavedOfEight<16>(c01, m(v.val[2])));
}
inline void storeFour8(uint8_t* p, uint8x8x4_t v) {
  const __m128i c01 = _mm_unpacklo_epi8(m(v.val[0]), m(v.val[1]));
  const __m128i c23 = _mm_unpacklo_epi8(m(v.val[2]), m(v.val[3]));
  store(p, _mm_unpacklo_epi16(c01, c23));
  store(p + 16, _mm_unpackhi_epi16(c01, c23));
}

// Registers one after the other in memory.
template <typename Vectors, typename T>
inline Vectors loadRow(const T* p) {
  Vectors v;
  for (auto& vector : v.val) {
    vector = as<std::remove_cvref_t<decltype(vector)>>(load(p));
    p += 16 / sizeof(T);
  }
  return v;
}
template <typename T, typename Vectors>
inline void storeRow(T* p, const Vectors& v) {
  for (const auto& vector : v.val) {
    store(p, m(vector));
    p += 16 / sizeof(T);
  }
}

// One lane of each register, one behind the other, at any address.
template <int lane, typename T, typename Vectors>
inline void storeLanes(T* p, const Vectors& v) {
  auto* bytes = reinterpret_cast<unsigned char*>(p);
  for (const auto& vector : v.val) {
    const T element = vector[lane];
    std::memcpy(bytes, &element, sizeof(T));
    bytes += sizeof(T);
  }
}

}  // namespace neon_x86

// ---- the names taken over

// loads and stores
#undef vld2_u8
#define vld2_u8(p) neon_x86::loadPairs8(p)
#undef vld2q_u8
#define vld2q_u8(p) neon_x86::loadPairs16(p)
#undef vld3_u8
#define vld3_u8(p) neon_x86::loadThree8(p)
#undef vld3q_u8
#define vld3q_u8(p) neon_x86::loadThree<8, uint8x16x3_t>(p)
#undef vld3q_f32
#define vld3q_f32(p) neon_x86::loadThree<32, float32x4x3_t>(p)
#undef vld4_u8
#define vld4_u8(p) neon_x86::loadFour8(p)
#undef vld4q_u8
#define vld4q_u8(p) neon_x86::loadFour<8, uint8x16x4_t>(p)
#undef vld4q_f32
#define vld4q_f32(p) neon_x86::loadFour<32, float32x4x4_t>(p)
#undef vst2_u8
#define vst2_u8(p, ...) neon_x86::storePairs8(p, __VA_ARGS__)
#undef vst2q_u8
#define vst2q_u8(p, ...) neon_x86::storePairs16(p, __VA_ARGS__)
#undef vst3_u8
#define vst3_u8(p, ...) neon_x86::storeThree8(p, __VA_ARGS__)
#undef vst3q_u8
#define vst3q_u8(p, ...) neon_x86::storeThree<8>(p, __VA_ARGS__)
#undef vst3q_f32
#define vst3q_f32(p, ...) neon_x86::storeThree<32>(p, __VA_ARGS__)
#undef vst2q_lane_u64
#define vst2q_lane_u64(p, v, lane) neon_x86::storeLanes<lane>(p, v)
#undef vst3q_lane_u32
#define vst3q_lane_u32(p, v, lane) neon_x86::storeLanes<lane>(p, v)
#undef vst4_u8
#define vst4_u8(p, ...) neon_x86::storeFour8(p, __VA_ARGS__)
#undef vst4q_u8
#define vst4q_u8(p, ...) neon_x86::storeFour<8>(p, __VA_ARGS__)
#undef vst4q_f32
#define vst4q_f32(p, ...) neon_x86::storeFour<32>(p, __VA_ARGS__)
#undef vld1q_u8_x2
#define vld1q_u8_x2(p) neon_x86::loadRow<uint8x16x2_t>(p)
#undef vld1q_u8_x3
#define vld1q_u8_x3(p) neon_x86::loadRow<uint8x16x3_t>(p)
#undef vld1q_u8_x4
#define vld1q_u8_x4(p) neon_x86::loadRow<uint8x16x4_t>(p)
#undef vst1q_u8_x2
#define vst1q_u8_x2(p, ...) neon_x86::storeRow(p, __VA_ARGS__)
#undef vst1q_u8_x3
#define vst1q_u8_x3(p, ...) neon_x86::storeRow(p, __VA_ARGS__)
#undef vst1q_u8_x4
#define vst1q_u8_x4(p, ...) neon_x86::storeRow(p, __VA_ARGS__)
#undef vld1q_f32_x2
#define vld1q_f32_x2(p) neon_x86::loadRow<float32x4x2_t>(p)
#undef vld1q_f32_x3
#define vld1q_f32_x3(p) neon_x86::loadRow<float32x4x3_t>(p)
#undef vld1q_f32_x4
#define vld1q_f32_x4(p) neon_x86::loadRow<float32x4x4_t>(p)
#undef vst1q_f32_x2
#define vst1q_f32_x2(p, ...) neon_x86::storeRow(p, __VA_ARGS__)
#undef vst1q_f32_x3
#define vst1q_f32_x3(p, ...) neon_x86::storeRow(p, __VA_ARGS__)
#undef vst1q_f32_x4
#define vst1q_f32_x4(p, ...) neon_x86::storeRow(p, __VA_ARGS__)

// halves
#undef vcombine_u8
#define vcombine_u8(a, b) neon_x86::joined(a, b)
#undef vget_high_u8
#define vget_high_u8(a) neon_x86::high(a)
#undef vcombine_s8
#define vcombine_s8(a, b) neon_x86::joined(a, b)
#undef vget_high_s8
#define vget_high_s8(a) neon_x86::high(a)
#undef vcombine_u16
#define vcombine_u16(a, b) neon_x86::joined(a, b)
#undef vget_high_u16
#define vget_high_u16(a) neon_x86::high(a)
#undef vcombine_s16
#define vcombine_s16(a, b) neon_x86::joined(a, b)
#undef vget_high_s16
#define vget_high_s16(a) neon_x86::high(a)
#undef vcombine_u32
#define vcombine_u32(a, b) neon_x86::joined(a, b)
#undef vget_high_u32
#define vget_high_u32(a) neon_x86::high(a)
#undef vcombine_s32
#define vcombine_s32(a, b) neon_x86::joined(a, b)
#undef vget_high_s32
#define vget_high_s32(a) neon_x86::high(a)

// widening
#undef vmovl_u8
#define vmovl_u8(a) neon_x86::movl(a)
#undef vmovl_high_u8
#define vmovl_high_u8(a) neon_x86::movlHigh(a)
#undef vshll_n_u8
#define vshll_n_u8(a, n) (neon_x86::movl(a) << (n))
#undef vmull_u8
#define vmull_u8(a, b) neon_x86::mull(a, b)
#undef vmull_high_u8
#define vmull_high_u8(a, b) neon_x86::mullHigh(a, b)
#undef vmlal_u8
#define vmlal_u8(c, a, b) ((c) + neon_x86::mull(a, b))
#undef vmlal_high_u8
#define vmlal_high_u8(c, a, b) ((c) + neon_x86::mullHigh(a, b))
#undef vmlsl_u8
#define vmlsl_u8(c, a, b) ((c) - neon_x86::mull(a, b))
#undef vmlsl_high_u8
#define vmlsl_high_u8(c, a, b) ((c) - neon_x86::mullHigh(a, b))
#undef vaddl_u8
#define vaddl_u8(a, b) (neon_x86::movl(a) + neon_x86::movl(b))
#undef vaddl_high_u8
#define vaddl_high_u8(a, b) (neon_x86::movlHigh(a) + neon_x86::movlHigh(b))
#undef vaddw_u8
#define vaddw_u8(c, b) ((c) + neon_x86::movl(b))
#undef vaddw_high_u8
#define vaddw_high_u8(c, b) ((c) + neon_x86::movlHigh(b))
#undef vsubl_u8
#define vsubl_u8(a, b) (neon_x86::movl(a) - neon_x86::movl(b))
#undef vsubl_high_u8
#define vsubl_high_u8(a, b) (neon_x86::movlHigh(a) - neon_x86::movlHigh(b))
#undef vsubw_u8
#define vsubw_u8(c, b) ((c) - neon_x86::movl(b))
#undef vsubw_high_u8
#define vsubw_high_u8(c, b) ((c) - neon_x86::movlHigh(b))
#undef vmovl_s8
#define vmovl_s8(a) neon_x86::movl(a)
#undef vmovl_high_s8
#define vmovl_high_s8(a) neon_x86::movlHigh(a)
#undef vshll_n_s8
#define vshll_n_s8(a, n) (neon_x86::movl(a) << (n))
#undef vmull_s8
#define vmull_s8(a, b) neon_x86::mull(a, b)
#undef vmull_high_s8
#define vmull_high_s8(a, b) neon_x86::mullHigh(a, b)
#undef vmlal_s8
#define vmlal_s8(c, a, b) ((c) + neon_x86::mull(a, b))
#undef vmlal_high_s8
#define vmlal_high_s8(c, a, b) ((c) + neon_x86::mullHigh(a, b))
#undef vmlsl_s8
#define vmlsl_s8(c, a, b) ((c) - neon_x86::mull(a, b))
#undef vmlsl_high_s8
#define vmlsl_high_s8(c, a, b) ((c) - neon_x86::mullHigh(a, b))
#undef vaddl_s8
#define vaddl_s8(a, b) (neon_x86::movl(a) + neon_x86::movl(b))
#undef vaddl_high_s8
#define vaddl_high_s8(a, b) (neon_x86::movlHigh(a) + neon_x86::movlHigh(b))
#undef vaddw_s8
#define vaddw_s8(c, b) ((c) + neon_x86::movl(b))
#undef vaddw_high_s8
#define vaddw_high_s8(c, b) ((c) + neon_x86::movlHigh(b))
#undef vsubl_s8
#define vsubl_s8(a, b) (neon_x86::movl(a) - neon_x86::movl(b))
#undef vsubl_high_s8
#define vsubl_high_s8(a, b) (neon_x86::movlHigh(a) - neon_x86::movlHigh(b))
#undef vsubw_s8
#define vsubw_s8(c, b) ((c) - neon_x86::movl(b))
#undef vsubw_high_s8
#define vsubw_high_s8(c, b) ((c) - neon_x86::movlHigh(b))
#undef vmovl_u16
#define vmovl_u16(a) neon_x86::movl(a)
#undef vmovl_high_u16
#define vmovl_high_u16(a) neon_x86::movlHigh(a)
#undef vshll_n_u16
#define vshll_n_u16(a, n) (neon_x86::movl(a) << (n))
#undef vmull_u16
#define vmull_u16(a, b) neon_x86::mull(a, b)
#undef vmull_high_u16
#define vmull_high_u16(a, b) neon_x86::mullHigh(a, b)
#undef vmlal_u16
#define vmlal_u16(c, a, b) ((c) + neon_x86::mull(a, b))
#undef vmlal_high_u16
#define vmlal_high_u16(c, a, b) ((c) + neon_x86::mullHigh(a, b))
#undef vmlsl_u16
#define vmlsl_u16(c, a, b) ((c) - neon_x86::mull(a, b))
#undef vmlsl_high_u16
#define vmlsl_high_u16(c, a, b) ((c) - neon_x86::mullHigh(a, b))
#undef vaddl_u16
#define vaddl_u16(a, b) (neon_x86::movl(a) + neon_x86::movl(b))
#undef vaddl_high_u16
#define vaddl_high_u16(a, b) (neon_x86::movlHigh(a) + neon_x86::movlHigh(b))
#undef vaddw_u16
#define vaddw_u16(c, b) ((c) + neon_x86::movl(b))
#undef vaddw_high_u16
#define vaddw_high_u16(c, b) ((c) + neon_x86::movlHigh(b))
#undef vsubl_u16
#define vsubl_u16(a, b) (neon_x86::movl(a) - neon_x86::movl(b))
#undef vsubl_high_u16
#define vsubl_high_u16(a, b) (neon_x86::movlHigh(a) - neon_x86::movlHigh(b))
#undef vsubw_u16
#define vsubw_u16(c, b) ((c) - neon_x86::movl(b))
#undef vsubw_high_u16
#define vsubw_high_u16(c, b) ((c) - neon_x86::movlHigh(b))
#undef vmovl_s16
#define vmovl_s16(a) neon_x86::movl(a)
#undef vmovl_high_s16
#define vmovl_high_s16(a) neon_x86::movlHigh(a)
#undef vshll_n_s16
#define vshll_n_s16(a, n) (neon_x86::movl(a) << (n))
#undef vmull_s16
#define vmull_s16(a, b) neon_x86::mull(a, b)
#undef vmull_high_s16
#define vmull_high_s16(a, b) neon_x86::mullHigh(a, b)
#undef vmlal_s16
#define vmlal_s16(c, a, b) ((c) + neon_x86::mull(a, b))
#undef vmlal_high_s16
#define vmlal_high_s16(c, a, b) ((c) + neon_x86::mullHigh(a, b))
#undef vmlsl_s16
#define vmlsl_s16(c, a, b) ((c) - neon_x86::mull(a, b))
#undef vmlsl_high_s16
#define vmlsl_high_s16(c, a, b) ((c) - neon_x86::mullHigh(a, b))
#undef vaddl_s16
#define vaddl_s16(a, b) (neon_x86::movl(a) + neon_x86::movl(b))
#undef vaddl_high_s16
#define vaddl_high_s16(a, b) (neon_x86::movlHigh(a) + neon_x86::movlHigh(b))
#undef vaddw_s16
#define vaddw_s16(c, b) ((c) + neon_x86::movl(b))
#undef vaddw_high_s16
#define vaddw_high_s16(c, b) ((c) + neon_x86::movlHigh(b))
#undef vsubl_s16
#define vsubl_s16(a, b) (neon_x86::movl(a) - neon_x86::movl(b))
#undef vsubl_high_s16
#define vsubl_high_s16(a, b) (neon_x86::movlHigh(a) - neon_x86::movlHigh(b))
#undef vsubw_s16
#define vsubw_s16(c, b) ((c) - neon_x86::movl(b))
#undef vsubw_high_s16
#define vsubw_high_s16(c, b) ((c) - neon_x86::movlHigh(b))
#undef vmull_n_u16
#define vmull_n_u16(a, b) neon_x86::mull(a, b)
#undef vmull_high_n_u16
#define vmull_high_n_u16(a, b) neon_x86::mullHigh(a, b)
#undef vmlsl_n_u16
#define vmlsl_n_u16(c, a, b) ((c) - neon_x86::mull(a, b))
#undef vmlal_n_u16
#define vmlal_n_u16(c, a, b) ((c) + neon_x86::mull(a, b))
#undef vmlal_high_n_u16
#define vmlal_high_n_u16(c, a, b) ((c) + neon_x86::mullHigh(a, b))
#undef vmull_n_s16
#define vmull_n_s16(a, b) neon_x86::mull(a, b)
#undef vmull_high_n_s16
#define vmull_high_n_s16(a, b) neon_x86::mullHigh(a, b)
#undef vmlsl_n_s16
#define vmlsl_n_s16(c, a, b) ((c) - neon_x86::mull(a, b))
#undef vmlal_n_s16
#define vmlal_n_s16(c, a, b) ((c) + neon_x86::mull(a, b))
#undef vmlal_high_n_s16
#define vmlal_high_n_s16(c, a, b) ((c) + neon_x86::mullHigh(a, b))

// products
#undef vmulq_n_s16
#define vmulq_n_s16(a, b) neon_x86::product(a, b)
#undef vmulq_n_u16
#define vmulq_n_u16(a, b) neon_x86::product(a, b)
#undef vqdmulhq_s16
#define vqdmulhq_s16(a, b) neon_x86::doubledProduct(a, b)
#undef vqdmulhq_n_s16
#define vqdmulhq_n_s16(a, b) neon_x86::doubledProduct(a, b)
#undef vmlaq_n_s16
#define vmlaq_n_s16(c, a, b) ((c) + neon_x86::product(a, b))
#undef vmlaq_n_u16
#define vmlaq_n_u16(c, a, b) ((c) + neon_x86::product(a, b))

// narrowing
#undef vmovn_u16
#define vmovn_u16(a) neon_x86::lowerHalves(a)
#undef vmovn_high_u16
#define vmovn_high_u16(low, a) neon_x86::joined(low, neon_x86::lowerHalves(a))
#undef vqmovn_u16
#define vqmovn_u16(a) neon_x86::saturated(a)
#undef vqmovn_high_u16
#define vqmovn_high_u16(low, a) neon_x86::joined(low, neon_x86::saturated(a))
#undef vshrn_n_u16
#define vshrn_n_u16(a, n) neon_x86::lowerHalves((a) >> (n))
#undef vshrn_high_n_u16
#define vshrn_high_n_u16(low, a, n) neon_x86::joined(low, neon_x86::lowerHalves((a) >> (n)))
#undef vrshrn_n_u16
#define vrshrn_n_u16(a, n) neon_x86::roundingShiftToLowerHalves<n>(a)
#undef vrshrn_high_n_u16
#define vrshrn_high_n_u16(low, a, n) neon_x86::joined(low, neon_x86::roundingShiftToLowerHalves<n>(a))
#undef vqshrn_n_u16
#define vqshrn_n_u16(a, n) neon_x86::saturated((a) >> (n))
#undef vqshrn_high_n_u16
#define vqshrn_high_n_u16(low, a, n) neon_x86::joined(low, neon_x86::saturated((a) >> (n)))
#undef vqrshrn_n_u16
#define vqrshrn_n_u16(a, n) neon_x86::saturated(neon_x86::roundingShift<n>(a))
#undef vqrshrn_high_n_u16
#define vqrshrn_high_n_u16(low, a, n) \
  neon_x86::joined(low, neon_x86::saturated(neon_x86::roundingShift<n>(a)))
#undef vaddhn_u16
#define vaddhn_u16(a, b) neon_x86::upperHalves((a) + (b))
#undef vaddhn_high_u16
#define vaddhn_high_u16(low, a, b) neon_x86::joined(low, neon_x86::upperHalves((a) + (b)))
#undef vsubhn_u16
#define vsubhn_u16(a, b) neon_x86::upperHalves((a) - (b))
#undef vsubhn_high_u16
#define vsubhn_high_u16(low, a, b) neon_x86::joined(low, neon_x86::upperHalves((a) - (b)))
#undef vraddhn_u16
#define vraddhn_u16(a, b) neon_x86::roundedUpperHalves((a) + (b))
#undef vraddhn_high_u16
#define vraddhn_high_u16(low, a, b) neon_x86::joined(low, neon_x86::roundedUpperHalves((a) + (b)))
#undef vrsubhn_u16
#define vrsubhn_u16(a, b) neon_x86::roundedUpperHalves((a) - (b))
#undef vrsubhn_high_u16
#define vrsubhn_high_u16(low, a, b) neon_x86::joined(low, neon_x86::roundedUpperHalves((a) - (b)))
#undef vmovn_s16
#define vmovn_s16(a) neon_x86::lowerHalves(a)
#undef vmovn_high_s16
#define vmovn_high_s16(low, a) neon_x86::joined(low, neon_x86::lowerHalves(a))
#undef vqmovn_s16
#define vqmovn_s16(a) neon_x86::saturated(a)
#undef vqmovn_high_s16
#define vqmovn_high_s16(low, a) neon_x86::joined(low, neon_x86::saturated(a))
#undef vshrn_n_s16
#define vshrn_n_s16(a, n) neon_x86::lowerHalves((a) >> (n))
#undef vshrn_high_n_s16
#define vshrn_high_n_s16(low, a, n) neon_x86::joined(low, neon_x86::lowerHalves((a) >> (n)))
#undef vrshrn_n_s16
#define vrshrn_n_s16(a, n) neon_x86::roundingShiftToLowerHalves<n>(a)
#undef vrshrn_high_n_s16
#define vrshrn_high_n_s16(low, a, n) neon_x86::joined(low, neon_x86::roundingShiftToLowerHalves<n>(a))
#undef vqshrn_n_s16
#define vqshrn_n_s16(a, n) neon_x86::saturated((a) >> (n))
#undef vqshrn_high_n_s16
#define vqshrn_high_n_s16(low, a, n) neon_x86::joined(low, neon_x86::saturated((a) >> (n)))
#undef vqrshrn_n_s16
#define vqrshrn_n_s16(a, n) neon_x86::saturated(neon_x86::roundingShift<n>(a))
#undef vqrshrn_high_n_s16
#define vqrshrn_high_n_s16(low, a, n) \
  neon_x86::joined(low, neon_x86::saturated(neon_x86::roundingShift<n>(a)))
#undef vaddhn_s16
#define vaddhn_s16(a, b) neon_x86::upperHalves((a) + (b))
#undef vaddhn_high_s16
#define vaddhn_high_s16(low, a, b) neon_x86::joined(low, neon_x86::upperHalves((a) + (b)))
#undef vsubhn_s16
#define vsubhn_s16(a, b) neon_x86::upperHalves((a) - (b))
#undef vsubhn_high_s16
#define vsubhn_high_s16(low, a, b) neon_x86::joined(low, neon_x86::upperHalves((a) - (b)))
#undef vraddhn_s16
#define vraddhn_s16(a, b) neon_x86::roundedUpperHalves((a) + (b))
#undef vraddhn_high_s16
#define vraddhn_high_s16(low, a, b) neon_x86::joined(low, neon_x86::roundedUpperHalves((a) + (b)))
#undef vrsubhn_s16
#define vrsubhn_s16(a, b) neon_x86::roundedUpperHalves((a) - (b))
#undef vrsubhn_high_s16
#define vrsubhn_high_s16(low, a, b) neon_x86::joined(low, neon_x86::roundedUpperHalves((a) - (b)))
#undef vqmovun_s16
#define vqmovun_s16(a) neon_x86::saturatedUnsigned(a)
#undef vqmovun_high_s16
#define vqmovun_high_s16(low, a) neon_x86::joined(low, neon_x86::saturatedUnsigned(a))
#undef vqshrun_n_s16
#define vqshrun_n_s16(a, n) neon_x86::saturatedUnsigned((a) >> (n))
#undef vqshrun_high_n_s16
#define vqshrun_high_n_s16(low, a, n) neon_x86::joined(low, neon_x86::saturatedUnsigned((a) >> (n)))
#undef vqrshrun_n_s16
#define vqrshrun_n_s16(a, n) neon_x86::saturatedUnsigned(neon_x86::roundingShift<n>(a))
#undef vqrshrun_high_n_s16
#define vqrshrun_high_n_s16(low, a, n) \
  neon_x86::joined(low, neon_x86::saturatedUnsigned(neon_x86::roundingShift<n>(a)))
#undef vmovn_u32
#define vmovn_u32(a) neon_x86::lowerHalves(a)
#undef vmovn_high_u32
#define vmovn_high_u32(low, a) neon_x86::joined(low, neon_x86::lowerHalves(a))
#undef vqmovn_u32
#define vqmovn_u32(a) neon_x86::saturated(a)
#undef vqmovn_high_u32
#define vqmovn_high_u32(low, a) neon_x86::joined(low, neon_x86::saturated(a))
#undef vshrn_n_u32
#define vshrn_n_u32(a, n) neon_x86::lowerHalves((a) >> (n))
#undef vshrn_high_n_u32
#define vshrn_high_n_u32(low, a, n) neon_x86::joined(low, neon_x86::lowerHalves((a) >> (n)))
#undef vrshrn_n_u32
#define vrshrn_n_u32(a, n) neon_x86::roundingShiftToLowerHalves<n>(a)
#undef vrshrn_high_n_u32
#define vrshrn_high_n_u32(low, a, n) neon_x86::joined(low, neon_x86::roundingShiftToLowerHalves<n>(a))
#undef vqshrn_n_u32
#define vqshrn_n_u32(a, n) neon_x86::saturated((a) >> (n))
#undef vqshrn_high_n_u32
#define vqshrn_high_n_u32(low, a, n) neon_x86::joined(low, neon_x86::saturated((a) >> (n)))
#undef vqrshrn_n_u32
#define vqrshrn_n_u32(a, n) neon_x86::saturated(neon_x86::roundingShift<n>(a))
#undef vqrshrn_high_n_u32
#define vqrshrn_high_n_u32(low, a, n) \
  neon_x86::joined(low, neon_x86::saturated(neon_x86::roundingShift<n>(a)))
#undef vaddhn_u32
#define vaddhn_u32(a, b) neon_x86::upperHalves((a) + (b))
#undef vaddhn_high_u32
#define vaddhn_high_u32(low, a, b) neon_x86::joined(low, neon_x86::upperHalves((a) + (b)))
#undef vsubhn_u32
#define vsubhn_u32(a, b) neon_x86::upperHalves((a) - (b))
#undef vsubhn_high_u32
#define vsubhn_high_u32(low, a, b) neon_x86::joined(low, neon_x86::upperHalves((a) - (b)))
#undef vraddhn_u32
#define vraddhn_u32(a, b) neon_x86::roundedUpperHalves((a) + (b))
#undef vraddhn_high_u32
#define vraddhn_high_u32(low, a, b) neon_x86::joined(low, neon_x86::roundedUpperHalves((a) + (b)))
#undef vrsubhn_u32
#define vrsubhn_u32(a, b) neon_x86::roundedUpperHalves((a) - (b))
#undef vrsubhn_high_u32
#define vrsubhn_high_u32(low, a, b) neon_x86::joined(low, neon_x86::roundedUpperHalves((a) - (b)))
#undef vmovn_s32
#define vmovn_s32(a) neon_x86::lowerHalves(a)
#undef vmovn_high_s32
#define vmovn_high_s32(low, a) neon_x86::joined(low, neon_x86::lowerHalves(a))
#undef vqmovn_s32
#define vqmovn_s32(a) neon_x86::saturated(a)
#undef vqmovn_high_s32
#define vqmovn_high_s32(low, a) neon_x86::joined(low, neon_x86::saturated(a))
#undef vshrn_n_s32
#define vshrn_n_s32(a, n) neon_x86::lowerHalves((a) >> (n))
#undef vshrn_high_n_s32
#define vshrn_high_n_s32(low, a, n) neon_x86::joined(low, neon_x86::lowerHalves((a) >> (n)))
#undef vrshrn_n_s32
#define vrshrn_n_s32(a, n) neon_x86::roundingShiftToLowerHalves<n>(a)
#undef vrshrn_high_n_s32
#define vrshrn_high_n_s32(low, a, n) neon_x86::joined(low, neon_x86::roundingShiftToLowerHalves<n>(a))
#undef vqshrn_n_s32
#define vqshrn_n_s32(a, n) neon_x86::saturated((a) >> (n))
#undef vqshrn_high_n_s32
#define vqshrn_high_n_s32(low, a, n) neon_x86::joined(low, neon_x86::saturated((a) >> (n)))
#undef vqrshrn_n_s32
#define vqrshrn_n_s32(a, n) neon_x86::saturated(neon_x86::roundingShift<n>(a))
#undef vqrshrn_high_n_s32
#define vqrshrn_high_n_s32(low, a, n) \
  neon_x86::joined(low, neon_x86::saturated(neon_x86::roundingShift<n>(a)))
#undef vaddhn_s32
#define vaddhn_s32(a, b) neon_x86::upperHalves((a) + (b))
#undef vaddhn_high_s32
#define vaddhn_high_s32(low, a, b) neon_x86::joined(low, neon_x86::upperHalves((a) + (b)))
#undef vsubhn_s32
#define vsubhn_s32(a, b) neon_x86::upperHalves((a) - (b))
#undef vsubhn_high_s32
#define vsubhn_high_s32(low, a, b) neon_x86::joined(low, neon_x86::upperHalves((a) - (b)))
#undef vraddhn_s32
#define vraddhn_s32(a, b) neon_x86::roundedUpperHalves((a) + (b))
#undef vraddhn_high_s32
#define vraddhn_high_s32(low, a, b) neon_x86::joined(low, neon_x86::roundedUpperHalves((a) + (b)))
#undef vrsubhn_s32
#define vrsubhn_s32(a, b) neon_x86::roundedUpperHalves((a) - (b))
#undef vrsubhn_high_s32
#define vrsubhn_high_s32(low, a, b) neon_x86::joined(low, neon_x86::roundedUpperHalves((a) - (b)))
#undef vqmovun_s32
#define vqmovun_s32(a) neon_x86::saturatedUnsigned(a)
#undef vqmovun_high_s32
#define vqmovun_high_s32(low, a) neon_x86::joined(low, neon_x86::saturatedUnsigned(a))
#undef vqshrun_n_s32
#define vqshrun_n_s32(a, n) neon_x86::saturatedUnsigned((a) >> (n))
#undef vqshrun_high_n_s32
#define vqshrun_high_n_s32(low, a, n) neon_x86::joined(low, neon_x86::saturatedUnsigned((a) >> (n)))
#undef vqrshrun_n_s32
#define vqrshrun_n_s32(a, n) neon_x86::saturatedUnsigned(neon_x86::roundingShift<n>(a))
#undef vqrshrun_high_n_s32
#define vqrshrun_high_n_s32(low, a, n) \
  neon_x86::joined(low, neon_x86::saturatedUnsigned(neon_x86::roundingShift<n>(a)))

// rounding shifts
#undef vrshrq_n_u8
#define vrshrq_n_u8(a, n) neon_x86::roundingShift<n>(a)
#undef vrsraq_n_u8
#define vrsraq_n_u8(c, a, n) ((c) + neon_x86::roundingShift<n>(a))
#undef vrshrq_n_u16
#define vrshrq_n_u16(a, n) neon_x86::roundingShift<n>(a)
#undef vrsraq_n_u16
#define vrsraq_n_u16(c, a, n) ((c) + neon_x86::roundingShift<n>(a))
#undef vrshrq_n_s16
#define vrshrq_n_s16(a, n) neon_x86::roundingShift<n>(a)
#undef vrsraq_n_s16
#define vrsraq_n_s16(c, a, n) ((c) + neon_x86::roundingShift<n>(a))
#undef vrshrq_n_u32
#define vrshrq_n_u32(a, n) neon_x86::roundingShift<n>(a)
#undef vrsraq_n_u32
#define vrsraq_n_u32(c, a, n) ((c) + neon_x86::roundingShift<n>(a))
#undef vrshrq_n_s32
#define vrshrq_n_s32(a, n) neon_x86::roundingShift<n>(a)
#undef vrsraq_n_s32
#define vrsraq_n_s32(c, a, n) ((c) + neon_x86::roundingShift<n>(a))

// lanes of two vectors
#undef vtrn1q_u8
#define vtrn1q_u8(a, b) neon_x86::evenLanes(a, b)
#undef vtrn2q_u8
#define vtrn2q_u8(a, b) neon_x86::oddLanes(a, b)
#undef vtrn1q_s8
#define vtrn1q_s8(a, b) neon_x86::evenLanes(a, b)
#undef vtrn2q_s8
#define vtrn2q_s8(a, b) neon_x86::oddLanes(a, b)
#undef vtrn1q_u16
#define vtrn1q_u16(a, b) neon_x86::evenLanes(a, b)
#undef vtrn2q_u16
#define vtrn2q_u16(a, b) neon_x86::oddLanes(a, b)
#undef vtrn1q_s16
#define vtrn1q_s16(a, b) neon_x86::evenLanes(a, b)
#undef vtrn2q_s16
#define vtrn2q_s16(a, b) neon_x86::oddLanes(a, b)
#undef vtrn1q_u32
#define vtrn1q_u32(a, b) neon_x86::evenLanes(a, b)
#undef vtrn2q_u32
#define vtrn2q_u32(a, b) neon_x86::oddLanes(a, b)
#undef vtrn1q_s32
#define vtrn1q_s32(a, b) neon_x86::evenLanes(a, b)
#undef vtrn2q_s32
#define vtrn2q_s32(a, b) neon_x86::oddLanes(a, b)
#undef vtrn1q_f32
#define vtrn1q_f32(a, b) neon_x86::evenLanes(a, b)
#undef vtrn2q_f32
#define vtrn2q_f32(a, b) neon_x86::oddLanes(a, b)
