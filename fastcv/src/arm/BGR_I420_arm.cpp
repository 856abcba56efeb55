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

#include "encoded_rows.h"
#include "entry.h"
#include "i420.h"
#include "kernel_assert.h"
#include "simd/loop.h"

// How sums of 20 bits and more are made of narrow products has nothing in common on the two processors.
#if defined(__ARM_NEON)
#include "i420_arm.h"
#else
#include "i420_x86.h"
#endif

namespace HPC::fastcv {
namespace {

using namespace arm;
using namespace i420;

constexpr char kSource[] = "fastcv/src/arm/BGR_I420_arm";

// ---- I420 to BGR

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
    decoder.chroma(u + x / 2, v + x / 2, [=, this](int part, const Terms& terms) {
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
  void row(const unsigned char* luma, const Terms& terms, unsigned char* out) const {
    const EvenOdd y = decoder.luma(load(luma));
    const Bytes blue = addNarrowed(y, terms.b);
    const Bytes green = subtractNarrowed(y, terms.minusG);
    const Bytes red = addNarrowed(y, terms.r);
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

// One row pair of an encoding.
template <int scn>
struct EncodePair {
  static constexpr int kBlock = kBlockPixels<unsigned char>;

  Encoder encoder;
  EncodedRows<scn> rows;
  unsigned char* u;
  unsigned char* v;

  void block(ptrdiff_t x, Blocks<1>, ptrdiff_t apart = 16) const {
    const Colours top = rows.colours(0, x, apart);
    const Colours bottom = rows.colours(1, x, apart);
    rows.storeLuma(0, x, apart, encoder.luma(top));
    rows.storeLuma(1, x, apart, encoder.luma(bottom));
    encoder.storeChroma(top, u + x / 2, v + x / 2, apart / 2);
  }

  void step(ptrdiff_t x) const {
    for (ptrdiff_t column = x; column < x + 2; ++column) {
      rows.luma[0][column] = lumaOf(rows.pixel(0, column));
      rows.luma[1][column] = lumaOf(rows.pixel(1, column));
    }
    u[x / 2] = chromaOf(rows.pixel(0, x), kUB, kUG, kUR);
    v[x / 2] = chromaOf(rows.pixel(0, x), kVB, kVG, kVR);
  }

 private:
  static unsigned char lumaOf(const unsigned char* p) {
    return static_cast<unsigned char>(((kYB * p[0] + kYG * p[1] + kYR * p[2] + kHalf) >> kShift) + kYZero);
  }
  static unsigned char chromaOf(const unsigned char* p, int wb, int wg, int wr) {
    return static_cast<unsigned char>(((wb * p[0] + wg * p[1] + wr * p[2] + kHalf) >> kShift) + kChromaZero);
  }
};

// Encodes a whole image, with the steps of the chroma planes.
template <int scn, int bIdx>
struct RGB2YUV420p_u8_neon {
  static_assert(bIdx == 0);

  Encoder encoder;

  __attribute__((noinline)) void operator()(int height, int width, const unsigned char* src, unsigned char* y,
                                            unsigned char* u, unsigned char* v, ptrdiff_t srcStride,
                                            int uStep, int vStep, ptrdiff_t dstStride) const {
    using Pair = EncodePair<scn>;
    forEachRowPair<Pair::kBlock, 1>(height, width, [=, copy = encoder](ptrdiff_t row) {
      return Pair{copy,
                  {src + row * srcStride, srcStride, y + row * dstStride, dstStride},
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
