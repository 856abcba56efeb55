// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// Planar YUV 4:2:0 (I420) to and from BGR and BGRA.
//
// BT.601, limited range, in 20-bit fixed point. Shifts floor; U and V are the stored bytes minus 128:
//
//   B = (1220542 Y' + 2116026 U + 2^19) >> 20, clamped to a byte      Y' = max(0, Y - 16)
//   G = (1220542 Y' - 409993 U - 852492 V + 2^19) >> 20, clamped
//   R = (1220542 Y' + 1673527 V + 2^19) >> 20, clamped
//
//   Y = ((102760 B + 528482 G + 269484 R + 2^19) >> 20) + 16          16 to 235
//   U = (460324 B - 305135 G - 155188 R + 2^19) >> 20                 -112 to 112
//   V = (-74448 B - 385875 G + 460324 R + 2^19) >> 20                 -112 to 112
//
// Chroma belongs to a 2 x 2 block and is made from its top-left pixel alone.
//
// Both loops find their vector constants in an object that their caller fills, and are not inlined there: a
// compiler that sees the values does not keep them in registers but makes them anew in every block.

#include <cstddef>

#include "entry.h"
#include "i420.h"
#include "kernel_assert.h"
#include "simd/loop.h"

namespace HPC::fastcv {
namespace {

using namespace arm;

constexpr char kSource[] = "fastcv/src/arm/BGR_I420_arm";

constexpr int kShift = 20;
constexpr int kHalf = 1 << (kShift - 1);

constexpr int kYZero = 16, kChromaZero = 128;
constexpr int kYGain = 1220542;
constexpr int kBU = 2116026;
constexpr int kGU = -409993, kGV = -852492;
constexpr int kRV = 1673527;

constexpr int kYB = 102760, kYG = 528482, kYR = 269484;
constexpr int kUB = 460324, kUG = -305135, kUR = -155188;
constexpr int kVB = -74448, kVG = -385875, kVR = 460324;

// ---- I420 to BGR

#if defined(__ARM_NEON)

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

struct DecodeConstants {
  uint8x16_t lanes[4];
  uint8x16_t yZero;
  uint8x16_t chromaZero;
  int32x4_t yGain;
  int8x16_t smallU;
  int8x16_t smallV;
  int16x8_t factors;
};

// Eight chroma samples less 128, and times the small numbers.
struct ChromaBlock {
  SignedHalves u, v, smallU, smallV;
};

// What chroma adds to blue and red and takes from green.
class Decoder {
 public:
  static constexpr int kColumns = 16;  // of a block

  // `use(part, chroma)` is given the chroma of the two blocks.
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

  struct Terms {
    Two<SignedWords> b, minusG, r;
  };

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

#else

// What chroma adds to blue and red and takes from green.
class Decoder {
 public:
  static constexpr int kColumns = 32;  // of a block

  struct Terms {
    Two<SignedWords> b, minusG, r;
  };

  template <typename Use>
  void chroma(const unsigned char* u, const unsigned char* v, const Use& use) const {
    const CentredSamples centredU = loadCentredSamples(u);
    const CentredSamples centredV = loadCentredSamples(v);
    const Two<SignedWords> ofU = multiply(centredU, -kGU);
    const Two<SignedWords> ofV = multiply(centredV, -kGV);
    use(0, Terms{multiply(centredU, kBU), {ofU.low + ofV.low, ofU.high + ofV.high}, multiply(centredV, kRV)});
  }

  EvenOdd luma(Bytes stored) const {
    return multiplyWords(subtractSaturated(stored, splat<Bytes>(kYZero)), kYGain);
  }
};

#endif

// One row pair of a decoding: 32 columns at a time.
template <int dcn, int bIdx>
struct DecodePair {
  static constexpr int kBlock = 32;

  Decoder decoder;
  const unsigned char* luma0;
  const unsigned char* luma1;
  const unsigned char* u;
  const unsigned char* v;
  unsigned char* out0;
  unsigned char* out1;

  void block(ptrdiff_t x, Blocks<1>) const {
    decoder.chroma(u + x / 2, v + x / 2, [=, this](int part, const Decoder::Terms& terms) {
      const ptrdiff_t at = x + part * Decoder::kColumns;
      row(luma0 + at, terms, out0 + at * dcn);
      row(luma1 + at, terms, out1 + at * dcn);
    });
  }

  void step(ptrdiff_t x) const {
    const int centredU = u[x / 2] - kChromaZero;
    const int centredV = v[x / 2] - kChromaZero;
    const int b = kHalf + kBU * centredU;
    const int g = kHalf + kGU * centredU + kGV * centredV;
    const int r = kHalf + kRV * centredV;
    for (ptrdiff_t column = x; column < x + 2; ++column) {
      pixel(luma0[column], b, g, r, out0 + column * dcn);
      pixel(luma1[column], b, g, r, out1 + column * dcn);
    }
  }

 private:
  // (luma + chroma + 2^19) >> 20 is (((luma + chroma) >> 16) + 8) >> 4: the sum is narrowed to its upper
  // half, which lies between -258 * 16 and 535 * 16, then rounded, shifted and saturated.
  void row(const unsigned char* luma, const Decoder::Terms& terms, unsigned char* out) const {
    const EvenOdd y = decoder.luma(load(luma));
    const Bytes blue = addNarrowed<kShift>(y, terms.b);
    const Bytes green = subtractNarrowed<kShift>(y, terms.minusG);
    const Bytes red = addNarrowed<kShift>(y, terms.r);
    storePixels(out, bIdx == 0 ? pixelsOf<dcn>(blue, green, red) : pixelsOf<dcn>(red, green, blue));
  }

  static void pixel(int y, int b, int g, int r, unsigned char* out) {
    const int luma = y > kYZero ? (y - kYZero) * kYGain : 0;
    const unsigned char blue = clampToByte((luma + b) >> kShift);
    const unsigned char green = clampToByte((luma + g) >> kShift);
    const unsigned char red = clampToByte((luma + r) >> kShift);
    storePixel<dcn>(out, bIdx == 0 ? blue : red, green, bIdx == 0 ? red : blue);
  }
};

// Decodes a whole image. `bIdx` is the channel of blue.
template <int dcn, int bIdx>
struct YUV420p2RGB_u8_neon {
  static_assert(bIdx == 0 || bIdx == 2);

  Decoder decoder;

  __attribute__((noinline)) void operator()(int height, int width, const unsigned char* y,
                                            const unsigned char* u, const unsigned char* v,
                                            unsigned char* dst, ptrdiff_t srcStride, int uStep, int vStep,
                                            ptrdiff_t dstStride) const {
    using Pair = DecodePair<dcn, bIdx>;
    forEachRowPair<Pair::kBlock, 1>(height, width, [=, copy = decoder](ptrdiff_t row) {
      const unsigned char* luma = y + row * srcStride;
      unsigned char* out = dst + row * dstStride;
      return Pair{copy,
                  luma,
                  luma + srcStride,
                  chromaRow(u, uStep, row / 2, srcStride, width),
                  chromaRow(v, vStep, row / 2, srcStride, width),
                  out,
                  out + dstStride};
    });
  }
};

template <int dcn, int bIdx, int uIdx>
void YUV420ptoRGB(int height, int width, int srcStride, const unsigned char* src, int dstStride,
                  unsigned char* dst) {
  KERNEL_ASSERT(kSource, width % 2 == 0 && height % 2 == 0);
  const YUV420p2RGB_u8_neon<dcn, bIdx> convert;
  const auto chroma = chromaPlanesOf<uIdx>(src, height, width, srcStride);
  convert(height, width, src, chroma.u, chroma.v, dst, srcStride, chroma.uStep, chroma.vStep, dstStride);
}

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

#if defined(__ARM_NEON)

// Chroma in 32 bits, out of unsigned 16-bit products: a colour times a small number, then times a factor.
constexpr int kSmallPlus = 157;  // of the colour that counts positive
constexpr int kSmallUG = 5, kSmallUR = 44;
constexpr int kSmallVB = 9, kSmallVG = 105;
enum EncodeFactor { kFactorPlus, kFactorUG, kFactorUR, kFactorVB, kFactorVG, kFactorLuma };
constexpr unsigned short kEncodeFactors[8] = {2932, 61027, 3527, 8272, 3675, kLumaScale};
static_assert(kSmallPlus * kEncodeFactors[kFactorPlus] == kUB && kVR == kUB);
static_assert(kSmallUG * kEncodeFactors[kFactorUG] == -kUG && kSmallUR * kEncodeFactors[kFactorUR] == -kUR);
static_assert(kSmallVB * kEncodeFactors[kFactorVB] == -kVB && kSmallVG * kEncodeFactors[kFactorVG] == -kVG);

// What is stored of pixels.
template <int bIdx>
class Encoder {
 public:
  Bytes luma(const Colours& p) const {
    const Bytes b = p.c[bIdx], g = p.c[1], r = p.c[2 - bIdx];
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

  // U and V of every second pixel.
  void storeChroma(const Colours& p, unsigned char* u, unsigned char* v) const {
    const EvenColours even = evenColumns(p);
    const uint8x8_t b = even.c[bIdx], g = even.c[1], r = even.c[2 - bIdx];
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

#else

// What is stored of pixels.
template <int bIdx>
class Encoder {
 public:
  Bytes luma(const Colours& p) const {
    const Two<Halves> eighths = weighed<weightsOf(2, 0, 1)>(p);
    const Two<Halves> m = weighed<weightsOf(kLumaB, kLumaG, 1 << kLumaRShift)>(p);
    const auto thousandths = [](Halves whole, Halves part) {
      return multiplyHigh(whole + ((part + 3) >> 3), 2 * kLumaScale);
    };
    return narrowRounded<kLumaShift>(
               Two<Halves>{thousandths(m.low, eighths.low), thousandths(m.high, eighths.high)}) +
           splat<Bytes>(kYZero);
  }

  // U and V of every second pixel.
  void storeChroma(const Colours& p, unsigned char* u, unsigned char* v) const {
    constexpr int kBias = (kChromaZero << kShift) + kHalf;
    const WideColours wide = wideColours(evenColumns(p));
    storeSamples(u, weighedShifted<kShift, weightsOf(kUB, kUG, kUR)>(wide, kBias), v,
                 weighedShifted<kShift, weightsOf(kVB, kVG, kVR)>(wide, kBias));
  }

 private:
  static constexpr Weights weightsOf(int blue, int green, int red) {
    return bIdx == 0 ? Weights{blue, green, red} : Weights{red, green, blue};
  }
};

#endif

// One row pair of an encoding.
template <int scn, int bIdx>
struct EncodePair {
  static constexpr int kBlock = kBlockPixels<unsigned char>;

  Encoder<bIdx> encoder;
  const unsigned char* in0;
  const unsigned char* in1;
  unsigned char* luma0;
  unsigned char* luma1;
  unsigned char* u;
  unsigned char* v;

  void block(ptrdiff_t x, Blocks<1>) const {
    const Colours top = loadColours<scn>(in0 + x * scn);
    const Colours bottom = loadColours<scn>(in1 + x * scn);
    store(luma0 + x, encoder.luma(top));
    store(luma1 + x, encoder.luma(bottom));
    encoder.storeChroma(top, u + x / 2, v + x / 2);
  }

  void step(ptrdiff_t x) const {
    for (ptrdiff_t column = x; column < x + 2; ++column) {
      luma0[column] = lumaOf(in0 + column * scn);
      luma1[column] = lumaOf(in1 + column * scn);
    }
    u[x / 2] = chromaOf(in0 + x * scn, kUB, kUG, kUR);
    v[x / 2] = chromaOf(in0 + x * scn, kVB, kVG, kVR);
  }

 private:
  static constexpr int kRed = 2 - bIdx;

  static unsigned char lumaOf(const unsigned char* p) {
    return static_cast<unsigned char>(((kYB * p[bIdx] + kYG * p[1] + kYR * p[kRed] + kHalf) >> kShift) +
                                      kYZero);
  }
  static unsigned char chromaOf(const unsigned char* p, int wb, int wg, int wr) {
    return static_cast<unsigned char>(((wb * p[bIdx] + wg * p[1] + wr * p[kRed] + kHalf) >> kShift) +
                                      kChromaZero);
  }
};

// Encodes a whole image, with the steps of the chroma planes.
template <int scn, int bIdx>
struct RGB2YUV420p_u8_neon {
  static_assert(bIdx == 0 || bIdx == 2);

  Encoder<bIdx> encoder;

  __attribute__((noinline)) void operator()(int height, int width, const unsigned char* src, unsigned char* y,
                                            unsigned char* u, unsigned char* v, ptrdiff_t srcStride,
                                            int uStep, int vStep, ptrdiff_t dstStride) const {
    using Pair = EncodePair<scn, bIdx>;
    forEachRowPair<Pair::kBlock, 1>(height, width, [=, copy = encoder](ptrdiff_t row) {
      const unsigned char* in = src + row * srcStride;
      unsigned char* luma = y + row * dstStride;
      return Pair{copy,
                  in,
                  in + srcStride,
                  luma,
                  luma + dstStride,
                  chromaRow(u, uStep, row / 2, dstStride, width),
                  chromaRow(v, vStep, row / 2, dstStride, width)};
    });
  }
};

template <int scn, int bIdx, int uIdx>
void RGBtoYUV420p(int height, int width, int srcStride, const unsigned char* src, int dstStride,
                  unsigned char* dst) {
  KERNEL_ASSERT(kSource, width % 2 == 0 && height % 2 == 0);
  const RGB2YUV420p_u8_neon<scn, bIdx> convert;
  const auto chroma = chromaPlanesOf<uIdx>(dst, height, width, dstStride);
  convert(height, width, src, dst, chroma.u, chroma.v, srcStride, chroma.uStep, chroma.vStep, dstStride);
}

}  // namespace

// The messages are the expressions as written.
// NOLINTBEGIN(modernize-use-nullptr)

template <typename Tsrc, int ncSrc, typename Tdst, int ncDst>
void armI4202BGRImage(int height, int width, int inWidthStride, const Tsrc* inData, int outWidthStride,
                      Tdst* outData) {
  KERNEL_ASSERT(kSource, inData != NULL);
  KERNEL_ASSERT(kSource, outData != NULL);
  KERNEL_ASSERT(kSource, height != 0 && width != 0 && inWidthStride != 0 && outWidthStride != 0);
  YUV420ptoRGB<ncDst, 0, 0>(height, width, inWidthStride, inData, outWidthStride, outData);
}

template <typename Tsrc, int ncSrc, typename Tdst, int ncDst>
void armBGR2I420Image(int height, int width, int inWidthStride, const Tsrc* inData, int outWidthStride,
                      Tdst* outData) {
  KERNEL_ASSERT(kSource, inData != NULL);
  KERNEL_ASSERT(kSource, outData != NULL);
  KERNEL_ASSERT(kSource, height != 0 && width != 0 && inWidthStride != 0 && outWidthStride != 0);
  RGBtoYUV420p<ncSrc, 0, 0>(height, width, inWidthStride, inData, outWidthStride, outData);
}

// NOLINTEND(modernize-use-nullptr)

#define INSTANCE(Name, ncSrc, ncDst)                                              \
  template FASTCV_EXPORTED void Name<unsigned char, ncSrc, unsigned char, ncDst>( \
      int, int, int, const unsigned char*, int, unsigned char*);
INSTANCE(armI4202BGRImage, 1, 3)
INSTANCE(armI4202BGRImage, 1, 4)
INSTANCE(armBGR2I420Image, 3, 1)
INSTANCE(armBGR2I420Image, 4, 1)
#undef INSTANCE

}  // namespace HPC::fastcv
