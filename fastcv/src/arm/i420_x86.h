// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// The arithmetic of I420 on x86-64: 32-bit sums of neighbouring products of 16 bits.
#pragma once

#include <immintrin.h>

#include <cstdint>
#include <cstring>

#include "i420_weights.h"
#include "simd/pixel.h"

namespace HPC::fastcv::i420 {

// ---- I420 to BGR

namespace detail {
// Limited sums of the even and of the odd columns, in turn.
inline Bytes narrowedColumns(const Two<SignedWords>& even, const Two<SignedWords>& odd) {
  // The upper halves, of which that of an even column goes where the lower one of its odd column is.
  const auto merged = [](SignedWords e, SignedWords o) {
    return x86::as<SignedHalves>(_mm256_blend_epi16(_mm256_srli_epi32(x86::m(e), 16), x86::m(o), 0xaa));
  };
  return narrowRounded<kShift - 16>(
      Two<SignedHalves>{merged(even.low, odd.low), merged(even.high, odd.high)});
}
}  // namespace detail

/// (luma + chroma + 2^19) >> 20, limited to a byte, of the even and the odd column of each sample.
inline Bytes addNarrowed(const EvenOdd& luma, const Two<SignedWords>& chroma) {
  return detail::narrowedColumns({luma.even.low + chroma.low, luma.even.high + chroma.high},
                                 {luma.odd.low + chroma.low, luma.odd.high + chroma.high});
}
inline Bytes subtractNarrowed(const EvenOdd& luma, const Two<SignedWords>& chroma) {
  return detail::narrowedColumns({luma.even.low - chroma.low, luma.even.high - chroma.high},
                                 {luma.odd.low - chroma.low, luma.odd.high - chroma.high});
}

/// What chroma adds to blue and red and takes from green.
class Decoder {
 public:
  static constexpr int kColumns = 32;  // of a block

  /// `use(part, terms)` is given the terms of the only block.
  template <typename Use>
  void chroma(const unsigned char* u, const unsigned char* v, const Use& use) const {
    const Centred centredU(u), centredV(v);
    const Two<SignedWords> ofU = centredU.times(-kGU), ofV = centredV.times(-kGV);
    use(0, Terms{centredU.times(kBU), {ofU.low + ofV.low, ofU.high + ofV.high}, centredV.times(kRV)});
  }

  EvenOdd luma(Bytes stored) const {
    const __m256i y = x86::m(subtractSaturated(stored, splat<Bytes>(kYZero)));
    return {{scaled<0>(y), scaled<8>(y)}, {scaled<1>(y), scaled<9>(y)}};
  }

 private:
  // 16 stored samples less 128, each as 128 times itself and itself in the halves of 32 bits. A factor is
  // split alike: a multiple of 128 and what is left.
  class Centred {
   public:
    explicit Centred(const unsigned char* p) {
      const __m256i v = _mm256_sub_epi16(_mm256_cvtepu8_epi16(x86::loadHalf(p)), _mm256_set1_epi16(128));
      const __m256i scaled = _mm256_slli_epi16(v, 7);
      low_ = _mm256_unpacklo_epi16(scaled, v);
      high_ = _mm256_unpackhi_epi16(scaled, v);
    }
    Two<SignedWords> times(int factor) const {
      const __m256i halves = _mm256_set1_epi32((factor & 127) << 16 | factor >> 7);
      return {x86::as<SignedWords>(_mm256_madd_epi16(low_, halves)),
              x86::as<SignedWords>(_mm256_madd_epi16(high_, halves))};
    }

   private:
    __m256i low_, high_;
  };

  // Bytes `first`, `first` + 2, ... of each half.
  template <int first>
  static SignedWords scaled(__m256i y) {
    static constexpr x86::Table kLanes = x86::tableOf([](int i) { return i % 4 == 0 ? first + i / 2 : -1; });
    return x86::as<SignedWords>(
        _mm256_mullo_epi32(_mm256_shuffle_epi8(y, kLanes.twice()), _mm256_set1_epi32(kYGain)));
  }
};

// ---- BGR to I420

/// What is stored of pixels.
class Encoder {
 public:
  /// Luma as of weights that are thousandths, see those for Arm: the sum here, of 2^21, lies less than a
  /// thousandth below that, and unless all three colours are 0, below it indeed.
  Bytes luma(const Colours& p) const {
    constexpr int kBlueGreen = 29360, kRed = 22457;
    constexpr int kB = 7, kG = 36, kR = 24;
    constexpr int kLumaShift = kShift + 1;
    static_assert(kBlueGreen * kB == 2 * kYB && kBlueGreen * kG == 2 * kYG - 4 && kRed * kR == 2 * kYR);
    const auto sum = [](__m256i pixels) {
      const __m256i products = multiplied(pixels, kB, kG, kR);
      const __m256i factors = pairOf(kBlueGreen, kRed);
      return shifted<kLumaShift>(_mm256_madd_epi16(products, factors), kYZero);
    };
    const __m256i low = _mm256_packs_epi32(sum(p.v[0]), sum(p.v[1]));
    const __m256i high = _mm256_packs_epi32(sum(p.v[2]), sum(p.v[3]));
    return x86::as<Bytes>(_mm256_packus_epi16(low, high));
  }

  /// U and V of every second pixel, of the second half of the block `apart` samples behind the first one's.
  void storeChroma(const Colours& p, unsigned char* u, unsigned char* v, ptrdiff_t apart) const {
    const EvenColours even = evenColumns(p);
    const auto ofU = [](__m256i pixels) { return sum<kU>(pixels); };
    const auto ofV = [](__m256i pixels) { return sum<kV>(pixels); };
    const __m256i both = _mm256_packus_epi16(_mm256_packs_epi32(ofU(even.v[0]), ofU(even.v[1])),
                                             _mm256_packs_epi32(ofV(even.v[0]), ofV(even.v[1])));
    storeBoth(u, v, _mm256_castsi256_si128(both));
    storeBoth(u + apart, v + apart, _mm256_extracti128_si256(both, 1));
  }

 private:
  static void storeBoth(unsigned char* u, unsigned char* v, __m128i both) {
    _mm_storel_epi64(reinterpret_cast<__m128i*>(u), both);
    const int64_t high = _mm_extract_epi64(both, 1);
    memcpy(v, &high, sizeof(high));
  }

  // Chroma's weights are sums of two products, of which the colours' factors are bytes.
  static constexpr int kFactor0 = 3670, kFactor1 = 1573;
  struct ByteWeights {
    int b[2], g[2], r[2];
    constexpr bool is(int blue, int green, int red) const {
      const auto whole = [](const int(&part)[2]) { return kFactor0 * part[0] + kFactor1 * part[1]; };
      return whole(b) == blue && whole(g) == green && whole(r) == red;
    }
  };
  static constexpr ByteWeights kU = {{122, 8}, {-81, -5}, {-44, 4}};
  static constexpr ByteWeights kV = {{-22, 4}, {-103, -5}, {122, 8}};

  template <const ByteWeights& w>
  static __m256i sum(__m256i pixels) {
    const __m256i sum0 =
        _mm256_madd_epi16(multiplied(pixels, w.b[0], w.g[0], w.r[0]), pairOf(kFactor0, kFactor0));
    const __m256i sum1 =
        _mm256_madd_epi16(multiplied(pixels, w.b[1], w.g[1], w.r[1]), pairOf(kFactor1, kFactor1));
    return shifted<kShift>(_mm256_add_epi32(sum0, sum1), kChromaZero);
  }

  // Sums of neighbouring products: of blue and green, and of red.
  static __m256i multiplied(__m256i pixels, int b, int g, int r) {
    const auto bits = [](int weight) { return static_cast<uint32_t>(static_cast<uint8_t>(weight)); };
    const uint32_t all = bits(b) | bits(g) << 8 | bits(r) << 16;
    return _mm256_maddubs_epi16(pixels, _mm256_set1_epi32(static_cast<int>(all)));
  }
  static __m256i pairOf(int low, int high) { return _mm256_set1_epi32(high << 16 | low); }
  // ((sum + 2^(n-1)) >> n) + offset
  template <int n>
  static __m256i shifted(__m256i sum, int offset) {
    return _mm256_srli_epi32(_mm256_add_epi32(sum, _mm256_set1_epi32((offset << n) + (1 << (n - 1)))), n);
  }
};

}  // namespace HPC::fastcv::i420
