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
// A frame of H luma rows has one stride for everything. Its chroma rows are half a luma row wide and lie two
// to a stride row, first one plane, then the other; where H / 2 is odd, the second plane starts in the second
// half of the stride row in which the first ends.
//
// Both loops find their vector constants in an object that their caller fills, and are not inlined there: a
// compiler that sees the values does not keep them in registers but makes them anew in every block.

#include <cstddef>

#include "entry.h"
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

// The chroma planes of a frame. A step says in which half of a stride row, 0 or 1, a plane starts.
template <typename T>
struct ChromaPlanes {
  T* u;
  T* v;
  int uStep;
  int vStep;
};

// `uIdx` is the place of the U plane.
template <int uIdx, typename T>
ChromaPlanes<T> chromaPlanesOf(T* frame, ptrdiff_t height, ptrdiff_t width, ptrdiff_t stride) {
  static_assert(uIdx == 0 || uIdx == 1);
  const int step = height % 4 == 2 ? 1 : 0;
  T* const first = frame + height * stride;
  T* const second = first + height / 4 * stride + step * (width / 2);
  return uIdx == 0 ? ChromaPlanes<T>{first, second, 0, step} : ChromaPlanes<T>{second, first, step, 0};
}

// Row `j` of a chroma plane.
template <typename T>
T* chromaRow(T* plane, int step, ptrdiff_t j, ptrdiff_t stride, ptrdiff_t width) {
  const ptrdiff_t half = step + j;
  return plane + half / 2 * stride + (half % 2 - step) * (width / 2);
}

// ---- I420 to BGR

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

// 32-bit lanes: of eight chroma samples, or of eight even or odd columns.
struct Wide {
  int32x4_t low;
  int32x4_t high;
};

// One row pair of a decoding: 32 columns a block.
template <int dcn, int bIdx>
struct DecodePair {
  static constexpr int kBlock = 32;

  DecodeConstants k;
  const unsigned char* luma0;
  const unsigned char* luma1;
  const unsigned char* u;
  const unsigned char* v;
  unsigned char* out0;
  unsigned char* out1;

  void block(ptrdiff_t x, Blocks<1>) const {
    const int8x16_t u8 = centred(u + x / 2);
    const int8x16_t v8 = centred(v + x / 2);
    half(x, vmovl_s8(vget_low_s8(u8)), vmull_s8(vget_low_s8(u8), vget_low_s8(k.smallU)),
         vmovl_s8(vget_low_s8(v8)), vmull_s8(vget_low_s8(v8), vget_low_s8(k.smallV)));
    half(x + 16, vmovl_high_s8(u8), vmull_high_s8(u8, k.smallU), vmovl_high_s8(v8),
         vmull_high_s8(v8, k.smallV));
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
  int8x16_t centred(const unsigned char* stored) const {
    return vreinterpretq_s8_u8(veorq_u8(vld1q_u8(stored), k.chromaZero));
  }

  template <DecodeFactor factor>
  Wide times(int16x8_t a) const {
    return {vmull_n_s16(vget_low_s16(a), vgetq_lane_s16(k.factors, factor)),
            vmull_n_s16(vget_high_s16(a), vgetq_lane_s16(k.factors, factor))};
  }
  template <DecodeFactor factor>
  Wide plusTimes(const Wide& sum, int16x8_t a) const {
    return {vmlal_n_s16(sum.low, vget_low_s16(a), vgetq_lane_s16(k.factors, factor)),
            vmlal_n_s16(sum.high, vget_high_s16(a), vgetq_lane_s16(k.factors, factor))};
  }

  // Sixteen columns of both rows, from their eight chroma samples and these times the small numbers.
  void half(ptrdiff_t x, int16x8_t u16, int16x8_t smallU, int16x8_t v16, int16x8_t smallV) const {
    const Wide wideU = {vmovl_s16(vget_low_s16(u16)), vmovl_s16(vget_high_s16(u16))};
    const Wide b = times<kFactorBU>(smallU);
    const Wide minusG = plusTimes<kFactorGV>(plusTimes<kFactorGU>(wideU, smallU), smallV);
    const Wide r = plusTimes<kFactorRV>(times<kRestRV>(v16), smallV);
    row(luma0 + x, b, minusG, r, out0 + x * dcn);
    row(luma1 + x, b, minusG, r, out1 + x * dcn);
  }

  void row(const unsigned char* luma, const Wide& b, const Wide& minusG, const Wide& r,
           unsigned char* out) const {
    const uint8x16_t y = vqsubq_u8(vld1q_u8(luma), k.yZero);
    const Wide even = {scaled<0>(y), scaled<1>(y)};
    const Wide odd = {scaled<2>(y), scaled<3>(y)};
    const uint8x16_t blue = joined(sum(even, b), sum(odd, b));
    const uint8x16_t green = joined(difference(even, minusG), difference(odd, minusG));
    const uint8x16_t red = joined(sum(even, r), sum(odd, r));
    storePixels(out, bIdx == 0 ? pixelsOf<dcn>(blue, green, red) : pixelsOf<dcn>(red, green, blue));
  }

  template <int lanes>
  int32x4_t scaled(uint8x16_t y) const {
    return vmulq_s32(vreinterpretq_s32_u8(vqtbl1q_u8(y, k.lanes[lanes])), k.yGain);
  }

  // (luma + chroma + 2^19) >> 20 is (((luma + chroma) >> 16) + 8) >> 4: the sum is narrowed to its upper half
  // at once, which lies between -258 * 16 and 535 * 16, then rounded, shifted and saturated.
  static uint8x8_t sum(const Wide& luma, const Wide& chroma) {
    return rounded(vaddhn_s32(luma.low, chroma.low), vaddhn_s32(luma.high, chroma.high));
  }
  static uint8x8_t difference(const Wide& luma, const Wide& chroma) {
    return rounded(vsubhn_s32(luma.low, chroma.low), vsubhn_s32(luma.high, chroma.high));
  }
  static uint8x8_t rounded(int16x4_t low, int16x4_t high) {
    return vqrshrun_n_s16(vcombine_s16(low, high), kShift - 16);
  }

  static uint8x16_t joined(uint8x8_t even, uint8x8_t odd) {
    return vzip1q_u8(vcombine_u8(even, even), vcombine_u8(odd, odd));
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

  DecodeConstants constants;

  __attribute__((noinline)) void operator()(int height, int width, const unsigned char* y,
                                            const unsigned char* u, const unsigned char* v,
                                            unsigned char* dst, ptrdiff_t srcStride, int uStep, int vStep,
                                            ptrdiff_t dstStride) const {
    using Pair = DecodePair<dcn, bIdx>;
    forEachRowPair<Pair::kBlock, 1>(height, width, [=, k = constants](ptrdiff_t row) {
      const unsigned char* luma = y + row * srcStride;
      unsigned char* out = dst + row * dstStride;
      return Pair{k,
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
  const YUV420p2RGB_u8_neon<dcn, bIdx> convert = {
      {{vld1q_u8(kLanes[0]), vld1q_u8(kLanes[1]), vld1q_u8(kLanes[2]), vld1q_u8(kLanes[3])},
       vdupq_n_u8(kYZero),
       vdupq_n_u8(kChromaZero),
       vdupq_n_s32(kYGain),
       vdupq_n_s8(kSmallU),
       vdupq_n_s8(kSmallV),
       vld1q_s16(kDecodeFactors)}};
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

// Chroma in 32 bits, out of unsigned 16-bit products: a colour times a small number, then times a factor.
constexpr int kSmallPlus = 157;  // of the colour that counts positive
constexpr int kSmallUG = 5, kSmallUR = 44;
constexpr int kSmallVB = 9, kSmallVG = 105;
enum EncodeFactor { kFactorPlus, kFactorUG, kFactorUR, kFactorVB, kFactorVG, kFactorLuma };
constexpr unsigned short kEncodeFactors[8] = {2932, 61027, 3527, 8272, 3675, kLumaScale};
static_assert(kSmallPlus * kEncodeFactors[kFactorPlus] == kUB && kVR == kUB);
static_assert(kSmallUG * kEncodeFactors[kFactorUG] == -kUG && kSmallUR * kEncodeFactors[kFactorUR] == -kUR);
static_assert(kSmallVB * kEncodeFactors[kFactorVB] == -kVB && kSmallVG * kEncodeFactors[kFactorVG] == -kVG);

struct EncodeConstants {
  uint8x16_t lumaB;
  uint8x16_t lumaG;
  uint8x16_t yZero;
  uint8x8_t smallPlus;
  uint8x8_t smallUG;
  uint8x8_t smallUR;
  uint8x8_t smallVB;
  uint8x8_t smallVG;
  uint16x8_t factors;
  uint32x4_t chromaBias;
};

// One row pair of an encoding: 16 columns a block.
template <int scn, int bIdx>
struct EncodePair {
  static constexpr int kBlock = 16;

  EncodeConstants k;
  const unsigned char* in0;
  const unsigned char* in1;
  unsigned char* luma0;
  unsigned char* luma1;
  unsigned char* u;
  unsigned char* v;

  void block(ptrdiff_t x, Blocks<1>) const {
    const Pixels<uint8x16_t, scn> top = loadPixels<uint8x16_t, scn>(in0 + x * scn);
    const Pixels<uint8x16_t, scn> bottom = loadPixels<uint8x16_t, scn>(in1 + x * scn);
    vst1q_u8(luma0 + x, lumaOf(top));
    vst1q_u8(luma1 + x, lumaOf(bottom));
    const uint8x8_t b = evenColumns(top.c[bIdx]);
    const uint8x8_t g = evenColumns(top.c[1]);
    const uint8x8_t r = evenColumns(top.c[kRed]);
    const uint8x8_t blockU = chromaOf(vmull_u8(b, k.smallPlus), Minus<kFactorUG>{vmull_u8(g, k.smallUG)},
                                      Minus<kFactorUR>{vmull_u8(r, k.smallUR)});
    const uint8x8_t blockV = chromaOf(vmull_u8(r, k.smallPlus), Minus<kFactorVB>{vmull_u8(b, k.smallVB)},
                                      Minus<kFactorVG>{vmull_u8(g, k.smallVG)});
    vst1_u8(u + x / 2, blockU);
    vst1_u8(v + x / 2, blockV);
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

  uint8x16_t lumaOf(const Pixels<uint8x16_t, scn>& p) const {
    const uint8x16_t b = p.c[bIdx];
    const uint8x16_t g = p.c[1];
    const uint8x16_t r = p.c[kRed];
    const uint8x16_t eighths = vshrq_n_u8(vrhaddq_u8(b, vrshrq_n_u8(r, 1)), 1);
    uint16x8_t low = vshll_n_u8(vget_low_u8(r), kLumaRShift);
    uint16x8_t high = vshll_n_u8(vget_high_u8(r), kLumaRShift);
    low = vmlal_u8(low, vget_low_u8(g), vget_low_u8(k.lumaG));
    high = vmlal_high_u8(high, g, k.lumaG);
    low = vmlal_u8(low, vget_low_u8(b), vget_low_u8(k.lumaB));
    high = vmlal_high_u8(high, b, k.lumaB);
    low = vaddw_u8(low, vget_low_u8(eighths));
    high = vaddw_high_u8(high, eighths);
    return vaddq_u8(vcombine_u8(thousandths(low), thousandths(high)), k.yZero);
  }
  uint8x8_t thousandths(uint16x8_t eighths) const {
    const int16x8_t scaled = vqdmulhq_n_s16(vreinterpretq_s16_u16(eighths),
                                            static_cast<short>(vgetq_lane_u16(k.factors, kFactorLuma)));
    return vrshrn_n_u16(vreinterpretq_u16_s16(scaled), kLumaShift);
  }

  static uint8x8_t evenColumns(uint8x16_t a) { return vmovn_u16(vreinterpretq_u16_u8(a)); }

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
    uint32x4_t sum = vmull_n_u16(plus, vgetq_lane_u16(k.factors, kFactorPlus));
    sum = vmlsl_n_u16(sum, minus0, vgetq_lane_u16(k.factors, factor0));
    sum = vmlsl_n_u16(sum, minus1, vgetq_lane_u16(k.factors, factor1));
    return vraddhn_u32(sum, k.chromaBias);
  }

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

  EncodeConstants constants;

  __attribute__((noinline)) void operator()(int height, int width, const unsigned char* src, unsigned char* y,
                                            unsigned char* u, unsigned char* v, ptrdiff_t srcStride,
                                            int uStep, int vStep, ptrdiff_t dstStride) const {
    using Pair = EncodePair<scn, bIdx>;
    forEachRowPair<Pair::kBlock, 1>(height, width, [=, k = constants](ptrdiff_t row) {
      const unsigned char* in = src + row * srcStride;
      unsigned char* luma = y + row * dstStride;
      return Pair{k,
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
  constexpr unsigned kBias = (kChromaZero << kShift) + kHalf - (1 << 15);
  const RGB2YUV420p_u8_neon<scn, bIdx> convert = {
      {vdupq_n_u8(kLumaB), vdupq_n_u8(kLumaG), vdupq_n_u8(kYZero), vdup_n_u8(kSmallPlus), vdup_n_u8(kSmallUG),
       vdup_n_u8(kSmallUR), vdup_n_u8(kSmallVB), vdup_n_u8(kSmallVG), vld1q_u16(kEncodeFactors),
       vdupq_n_u32(kBias)}};
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
