// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// The arithmetic of I420 on Arm: 32-bit sums of products of 16 bits.
#pragma once

#include "i420_weights.h"
#include "simd/pixel.h"

namespace HPC::fastcv::i420 {

// ---- I420 to BGR

namespace detail {
// Of two results, that of sum s in 32 bits being ((s >> 16) + 8) >> 4, limited to a byte.
inline Bytes narrowedColumns(int16x4_t even0, int16x4_t even1, int16x4_t odd0, int16x4_t odd1) {
  const auto rounded = [](int16x4_t low, int16x4_t high) {
    const uint8x8_t bytes = vqrshrun_n_s16(vcombine_s16(low, high), kShift - 16);
    return vcombine_u8(bytes, bytes);
  };
  return vzip1q_u8(rounded(even0, even1), rounded(odd0, odd1));
}
}  // namespace detail

/// (luma + chroma + 2^19) >> 20, limited to a byte, of the even and the odd column of each sample.
inline Bytes addNarrowed(const EvenOdd& luma, const Two<SignedWords>& chroma) {
  return detail::narrowedColumns(
      vaddhn_s32(luma.even.low, chroma.low), vaddhn_s32(luma.even.high, chroma.high),
      vaddhn_s32(luma.odd.low, chroma.low), vaddhn_s32(luma.odd.high, chroma.high));
}
inline Bytes subtractNarrowed(const EvenOdd& luma, const Two<SignedWords>& chroma) {
  return detail::narrowedColumns(
      vsubhn_s32(luma.even.low, chroma.low), vsubhn_s32(luma.even.high, chroma.high),
      vsubhn_s32(luma.odd.low, chroma.low), vsubhn_s32(luma.odd.high, chroma.high));
}

// A 20-bit multiple of a chroma sample is made of 16-bit products: the sample times a small number, which
// fits 16 bits again, times a factor, plus the sample times what is left.
constexpr int kSmallU = 66, kSmallV = 114;
enum DecodeFactor { kFactorBU, kFactorGU, kFactorGV, kFactorRV, kRestRV };
constexpr short kDecodeFactors[8] = {32061, 6212, 7478, 14680, 7};
static_assert(kSmallU * kDecodeFactors[kFactorBU] == kBU);
static_assert(kSmallU * kDecodeFactors[kFactorGU] + 1 == -kGU);
static_assert(kSmallV * kDecodeFactors[kFactorGV] == -kGV);
static_assert(kSmallV * kDecodeFactors[kFactorRV] + kDecodeFactors[kRestRV] == kRV);

// The bytes that go into the 32-bit lanes of four vectors: the first and the last of the even columns, then
// of the odd ones. 255 makes a 0.
constexpr unsigned char kLanes[4][16] = {
    {0, 255, 255, 255, 2, 255, 255, 255, 4, 255, 255, 255, 6, 255, 255, 255},
    {8, 255, 255, 255, 10, 255, 255, 255, 12, 255, 255, 255, 14, 255, 255, 255},
    {1, 255, 255, 255, 3, 255, 255, 255, 5, 255, 255, 255, 7, 255, 255, 255},
    {9, 255, 255, 255, 11, 255, 255, 255, 13, 255, 255, 255, 15, 255, 255, 255}};

// Eight chroma samples less 128, and times the small numbers.
struct ChromaBlock {
  SignedHalves u, v, smallU, smallV;
};

/// What chroma adds to blue and red and takes from green.
class Decoder {
 public:
  static constexpr int kColumns = 16;  // of a block

  /// `use(part, terms)` is given the terms of the two blocks.
  template <typename Use>
  void chroma(const unsigned char* u, const unsigned char* v, const Use& use) const {
    const SignedBytes u8 = centred(u);
    const SignedBytes v8 = centred(v);
    use(0, terms({vmovl_s8(vget_low_s8(u8)), vmovl_s8(vget_low_s8(v8)),
                  vmull_s8(vget_low_s8(u8), vget_low_s8(smallU_)),
                  vmull_s8(vget_low_s8(v8), vget_low_s8(smallV_))}));
    use(1, terms({vmovl_high_s8(u8), vmovl_high_s8(v8), vmull_high_s8(u8, smallU_),
                  vmull_high_s8(v8, smallV_)}));
  }

  EvenOdd luma(Bytes stored) const {
    const Bytes y = subtractSaturated(stored, yZero_);
    return {{scaled<0>(y), scaled<1>(y)}, {scaled<2>(y), scaled<3>(y)}};
  }

 private:
  SignedBytes centred(const unsigned char* stored) const {
    return vreinterpretq_s8_u8(veorq_u8(vld1q_u8(stored), chromaZero_));
  }

  template <DecodeFactor factor>
  Two<SignedWords> times(SignedHalves a) const {
    return {vmull_n_s16(vget_low_s16(a), vgetq_lane_s16(factors_, factor)),
            vmull_n_s16(vget_high_s16(a), vgetq_lane_s16(factors_, factor))};
  }
  template <DecodeFactor factor>
  Two<SignedWords> plusTimes(const Two<SignedWords>& sum, SignedHalves a) const {
    return {vmlal_n_s16(sum.low, vget_low_s16(a), vgetq_lane_s16(factors_, factor)),
            vmlal_n_s16(sum.high, vget_high_s16(a), vgetq_lane_s16(factors_, factor))};
  }

  Terms terms(const ChromaBlock& c) const {
    const Two<SignedWords> wideU = {vmovl_s16(vget_low_s16(c.u)), vmovl_s16(vget_high_s16(c.u))};
    return {times<kFactorBU>(c.smallU), plusTimes<kFactorGV>(plusTimes<kFactorGU>(wideU, c.smallU), c.smallV),
            plusTimes<kFactorRV>(times<kRestRV>(c.v), c.smallV)};
  }

  template <int lanes>
  SignedWords scaled(Bytes y) const {
    return vmulq_s32(vreinterpretq_s32_u8(vqtbl1q_u8(y, lanes_[lanes])), yGain_);
  }

  Bytes lanes_[4] = {load(kLanes[0]), load(kLanes[1]), load(kLanes[2]), load(kLanes[3])};
  uint8x16_t yZero_ = vdupq_n_u8(kYZero);
  uint8x16_t chromaZero_ = vdupq_n_u8(kChromaZero);
  int32x4_t yGain_ = vdupq_n_s32(kYGain);
  int8x16_t smallU_ = vdupq_n_s8(kSmallU);
  int8x16_t smallV_ = vdupq_n_s8(kSmallV);
  int16x8_t factors_ = load(kDecodeFactors);
};

// ---- BGR to I420

// Luma in 16 bits. The coefficients are 0.098, 0.504 and 0.257 of 2^20, cut: the sum lies less than a
// thousandth below (98 B + 504 G + 257 R + 500) / 1000 and, unless all three are 0, below it indeed. So
//
//   Y - 16 = (98 B + 504 G + 257 R + 499) / 1000 = (m + 62) / 125
//   m = 12 B + 63 G + 32 R + (2 B + R + 3) / 8 <= 27381
//
// in integer divisions, as one of an integer by 1000 is one by 8 and then one by 125. The first is byte
// arithmetic: (B + (R + 1) / 2 + 1) / 2 / 2. In the second, of m = 125 k + r, 64 m / 125 = 64 k + 0.512 r is
// multiplied out to less by up to 0.19 and floored: to at least 64 k + 32 just where r is 63 or more, and
// never below 64 k - 1. Rounded to a multiple of 64 that is (m + 62) / 125.
constexpr int kLumaB = 12, kLumaG = 63, kLumaRShift = 5;
constexpr int kLumaShift = 6;
constexpr unsigned short kLumaScale = 16777;  // of 2^15: 64 / 125

// Chroma in 32 bits, out of unsigned 16-bit products: a colour times a small number, then times a factor.
constexpr int kSmallPlus = 157;  // of the colour that counts positive
constexpr int kSmallUG = 5, kSmallUR = 44;
constexpr int kSmallVB = 9, kSmallVG = 105;
enum EncodeFactor { kFactorPlus, kFactorUG, kFactorUR, kFactorVB, kFactorVG, kFactorLuma };
constexpr unsigned short kEncodeFactors[8] = {2932, 61027, 3527, 8272, 3675, kLumaScale};
static_assert(kSmallPlus * kEncodeFactors[kFactorPlus] == kUB && kVR == kUB);
static_assert(kSmallUG * kEncodeFactors[kFactorUG] == -kUG && kSmallUR * kEncodeFactors[kFactorUR] == -kUR);
static_assert(kSmallVB * kEncodeFactors[kFactorVB] == -kVB && kSmallVG * kEncodeFactors[kFactorVG] == -kVG);

/// What is stored of pixels.
class Encoder {
 public:
  Bytes luma(const Colours& p) const {
    const Bytes b = p.c[0], g = p.c[1], r = p.c[2];
    const uint8x16_t eighths = vshrq_n_u8(vrhaddq_u8(b, vrshrq_n_u8(r, 1)), 1);
    uint16x8_t low = vshll_n_u8(vget_low_u8(r), kLumaRShift);
    uint16x8_t high = vshll_n_u8(vget_high_u8(r), kLumaRShift);
    low = vmlal_u8(low, vget_low_u8(g), vget_low_u8(lumaG_));
    high = vmlal_high_u8(high, g, lumaG_);
    low = vmlal_u8(low, vget_low_u8(b), vget_low_u8(lumaB_));
    high = vmlal_high_u8(high, b, lumaB_);
    low = vaddw_u8(low, vget_low_u8(eighths));
    high = vaddw_high_u8(high, eighths);
    return vaddq_u8(vcombine_u8(thousandths(low), thousandths(high)), yZero_);
  }

  /// U and V of every second pixel.
  void storeChroma(const Colours& p, unsigned char* u, unsigned char* v, ptrdiff_t /*apart*/) const {
    const EvenColours even = evenColumns(p);
    const uint8x8_t b = even.c[0], g = even.c[1], r = even.c[2];
    const uint8x8_t blockU = chromaOf(vmull_u8(b, smallPlus_), Minus<kFactorUG>{vmull_u8(g, smallUG_)},
                                      Minus<kFactorUR>{vmull_u8(r, smallUR_)});
    const uint8x8_t blockV = chromaOf(vmull_u8(r, smallPlus_), Minus<kFactorVB>{vmull_u8(b, smallVB_)},
                                      Minus<kFactorVG>{vmull_u8(g, smallVG_)});
    vst1_u8(u, blockU);
    vst1_u8(v, blockV);
  }

 private:
  uint8x8_t thousandths(uint16x8_t eighths) const {
    const int16x8_t scaled = vqdmulhq_n_s16(vreinterpretq_s16_u16(eighths),
                                            static_cast<short>(vgetq_lane_u16(factors_, kFactorLuma)));
    return vrshrn_n_u16(vreinterpretq_u16_s16(scaled), kLumaShift);
  }

  // A colour that counts negative, times its small number.
  template <EncodeFactor factor>
  struct Minus {
    uint16x8_t small;
  };

  template <EncodeFactor factor0, EncodeFactor factor1>
  uint8x8_t chromaOf(uint16x8_t plus, Minus<factor0> minus0, Minus<factor1> minus1) const {
    const uint16x4_t low = upperHalves<factor0, factor1>(vget_low_u16(plus), vget_low_u16(minus0.small),
                                                         vget_low_u16(minus1.small));
    const uint16x4_t high = upperHalves<factor0, factor1>(vget_high_u16(plus), vget_high_u16(minus0.small),
                                                          vget_high_u16(minus1.small));
    return vshrn_n_u16(vcombine_u16(low, high), kShift - 16);
  }
  // The instruction that narrows to the upper half adds 2^15, which the bias leaves to it.
  template <EncodeFactor factor0, EncodeFactor factor1>
  uint16x4_t upperHalves(uint16x4_t plus, uint16x4_t minus0, uint16x4_t minus1) const {
    uint32x4_t sum = vmull_n_u16(plus, vgetq_lane_u16(factors_, kFactorPlus));
    sum = vmlsl_n_u16(sum, minus0, vgetq_lane_u16(factors_, factor0));
    sum = vmlsl_n_u16(sum, minus1, vgetq_lane_u16(factors_, factor1));
    return vraddhn_u32(sum, chromaBias_);
  }

  static constexpr unsigned kBias = (kChromaZero << kShift) + kHalf - (1 << 15);
  uint8x16_t lumaB_ = vdupq_n_u8(kLumaB);
  uint8x16_t lumaG_ = vdupq_n_u8(kLumaG);
  uint8x16_t yZero_ = vdupq_n_u8(kYZero);
  uint8x8_t smallPlus_ = vdup_n_u8(kSmallPlus);
  uint8x8_t smallUG_ = vdup_n_u8(kSmallUG);
  uint8x8_t smallUR_ = vdup_n_u8(kSmallUR);
  uint8x8_t smallVB_ = vdup_n_u8(kSmallVB);
  uint8x8_t smallVG_ = vdup_n_u8(kSmallVG);
  uint16x8_t factors_ = load(kEncodeFactors);
  uint32x4_t chromaBias_ = vdupq_n_u32(kBias);
};

}  // namespace HPC::fastcv::i420
