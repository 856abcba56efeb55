// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// Semi-planar YUV 4:2:0 (NV21, NV12) to and from BGR, RGB, BGRA and RGBA: the way that every camera frame
// takes.
//
// Full range, integer, with this library's own coefficients. With U and V the stored bytes minus 128:
//
//   Y = (16 B + 74 G + 38 R + 64) >> 7
//   U = ((65 B - 43 G - 22 R + 64) >> 7) + 128, clamped to a byte
//   V = ((-12 B - 55 G + 67 R + 64) >> 7) + 128, clamped to a byte
//
// The way back is in simd/nv_decode.h. Shifts floor. Chroma belongs to a 2 x 2 block and is made from its
// top-left pixel alone.

#include "encoded_rows.h"
#include "entry.h"
#include "simd/loop.h"
#include "simd/nv_decode.h"

namespace HPC::fastcv {
namespace {

using namespace arm;

constexpr int kYB = 16, kYG = 74, kYR = 38;
constexpr int kUB = 65, kUG = -43, kUR = -22;
constexpr int kVB = -12, kVG = -55, kVR = 67;
constexpr int kEncodeShift = 7;

enum class Order { kBGR, kRGB };
enum class Chroma { kVU, kUV };

// One row pair of an encoding.
template <int nc, Order order, Chroma chroma>
struct EncodePair {
  static constexpr int kBlock = kBlockPixels<unsigned char>;

  EncodedRows<nc> rows;
  unsigned char* pairs;

  void block(ptrdiff_t x, Blocks<1>, ptrdiff_t apart = 16) const {
    const Colours top = rows.colours(0, x, apart);
    const Colours bottom = rows.colours(1, x, apart);
    // The weights sum to 128, so the sum is at most 32640 and the rounded luma needs no clamp.
    const Bytes luma[] = {narrowRounded<kEncodeShift>(weighed<weightsOf(kYB, kYG, kYR)>(top)),
                          narrowRounded<kEncodeShift>(weighed<weightsOf(kYB, kYG, kYR)>(bottom))};
    // The weighted sum is at most 67 * 255 = 17085 in magnitude.
    const EvenColours even = evenColumns(top);
    const Halves u = weighed<weightsOf(kUB, kUG, kUR)>(even);
    const Halves v = weighed<weightsOf(kVB, kVG, kVR)>(even);
    const BytePairs both =
        chroma == Chroma::kVU ? centredPairs<kEncodeShift>(v, u) : centredPairs<kEncodeShift>(u, v);
    rows.storeLuma(0, x, apart, luma[0]);
    rows.storeLuma(1, x, apart, luma[1]);
    storePairs(pairs + x, apart, both);
  }

  void step(ptrdiff_t x) const {
    for (ptrdiff_t column = x; column < x + 2; ++column) {
      rows.luma[0][column] = lumaOf(rows.pixel(0, column));
      rows.luma[1][column] = lumaOf(rows.pixel(1, column));
    }
    const unsigned char* pixel = rows.pixel(0, x);
    const unsigned char u = chromaOf(pixel, kUB, kUG, kUR);
    const unsigned char v = chromaOf(pixel, kVB, kVG, kVR);
    pairs[x + (chroma == Chroma::kVU ? 1 : 0)] = u;
    pairs[x + (chroma == Chroma::kVU ? 0 : 1)] = v;
  }

 private:
  static constexpr int kBlue = order == Order::kBGR ? 0 : 2;
  static constexpr int kRed = 2 - kBlue;

  static constexpr Weights weightsOf(int blue, int green, int red) {
    return order == Order::kBGR ? Weights{blue, green, red} : Weights{red, green, blue};
  }

  static unsigned char lumaOf(const unsigned char* p) {
    constexpr int kHalf = 1 << (kEncodeShift - 1);
    return static_cast<unsigned char>((kYB * p[kBlue] + kYG * p[1] + kYR * p[kRed] + kHalf) >> kEncodeShift);
  }

  static unsigned char chromaOf(const unsigned char* p, int wb, int wg, int wr) {
    constexpr int kHalf = 1 << (kEncodeShift - 1);
    return clampToByte(((wb * p[kBlue] + wg * p[1] + wr * p[kRed] + kHalf) >> kEncodeShift) + 128);
  }
};

template <int nc, Order order, Chroma chroma>
inline void decode(int height, int width, int inWidthStride, const unsigned char* inData, int outWidthStride,
                   unsigned char* outData) {
  constexpr bool kFirstIsV = chroma == Chroma::kVU;
  constexpr bool kRgb = order == Order::kRGB;
  const ColourDecoder<nc, kFirstIsV != kRgb> decoder(kFirstIsV);
  const ptrdiff_t inStride = inWidthStride;
  const ptrdiff_t outStride = outWidthStride;
  const ptrdiff_t length = width & ~1;
  if (length < 1) {
    return;
  }
  for (ptrdiff_t row = 0; row + 1 < height; row += 2) {
    const unsigned char* const luma = inData + row * inStride;
    const unsigned char* const pairs = inData + (height + row / 2) * inStride;
    unsigned char* const out = outData + row * outStride;
    if (length >= kDecodeColumns) {
      decodeRowPair<true, false>(decoder, {luma, luma + inStride, pairs, nullptr}, length, out,
                                 out + outStride);
      continue;
    }
    for (ptrdiff_t x = 0; x < length; ++x) {
      const unsigned char* const pair = pairs + (x & ~1);
      const DecodedSample<nc, kRgb> sample(pair[kFirstIsV ? 1 : 0], pair[kFirstIsV ? 0 : 1]);
      sample.store(luma[x], out + x * nc);
      sample.store(luma[inStride + x], out + outStride + x * nc);
    }
  }
}

template <int nc, Order order, Chroma chroma>
inline void encode(int height, int width, int inWidthStride, const unsigned char* inData, int outWidthStride,
                   unsigned char* outData) {
  using Pair = EncodePair<nc, order, chroma>;
  const ptrdiff_t inStride = inWidthStride;
  const ptrdiff_t outStride = outWidthStride;
  forEachRowPair<Pair::kBlock, 1>(height, width, [=](ptrdiff_t row) {
    return Pair{{inData + row * inStride, inStride, outData + row * outStride, outStride},
                outData + (height + row / 2) * outStride};
  });
}

// The workers: one algorithm a direction, told apart by channel count, colour order and chroma order.
template <int ncSrc, int ncDst>
constexpr auto cvt_color_bgr2nv21_uchar = encode<ncSrc, Order::kBGR, Chroma::kVU>;
template <int ncSrc, int ncDst>
constexpr auto cvt_color_bgr2nv12_uchar = encode<ncSrc, Order::kBGR, Chroma::kUV>;
template <int ncSrc, int ncDst>
constexpr auto cvt_color_rgb2nv21_uchar = encode<ncSrc, Order::kRGB, Chroma::kVU>;
template <int ncSrc, int ncDst>
constexpr auto cvt_color_rgb2nv12_uchar = encode<ncSrc, Order::kRGB, Chroma::kUV>;
template <int ncSrc, int ncDst>
constexpr auto cvt_color_nv212bgr_uchar = decode<ncDst, Order::kBGR, Chroma::kVU>;
template <int ncSrc, int ncDst>
constexpr auto cvt_color_nv122bgr_uchar = decode<ncDst, Order::kBGR, Chroma::kUV>;
template <int ncSrc, int ncDst>
constexpr auto cvt_color_nv212rgb_uchar = decode<ncDst, Order::kRGB, Chroma::kVU>;
template <int ncSrc, int ncDst>
constexpr auto cvt_color_nv122rgb_uchar = decode<ncDst, Order::kRGB, Chroma::kUV>;

}  // namespace

FASTCV_ENTRY(armBGR2NV21Image, unsigned char, 3, 1, cvt_color_bgr2nv21_uchar<3, 1>)
FASTCV_ENTRY(armBGR2NV21Image, unsigned char, 4, 1, cvt_color_bgr2nv21_uchar<4, 1>)
FASTCV_ENTRY(armNV212BGRImage, unsigned char, 1, 3, cvt_color_nv212bgr_uchar<1, 3>)
FASTCV_ENTRY(armNV212BGRImage, unsigned char, 1, 4, cvt_color_nv212bgr_uchar<1, 4>)
FASTCV_ENTRY(armRGB2NV21Image, unsigned char, 3, 1, cvt_color_rgb2nv21_uchar<3, 1>)
FASTCV_ENTRY(armRGB2NV21Image, unsigned char, 4, 1, cvt_color_rgb2nv21_uchar<4, 1>)
FASTCV_ENTRY(armNV212RGBImage, unsigned char, 1, 3, cvt_color_nv212rgb_uchar<1, 3>)
FASTCV_ENTRY(armNV212RGBImage, unsigned char, 1, 4, cvt_color_nv212rgb_uchar<1, 4>)
FASTCV_ENTRY(armBGR2NV12Image, unsigned char, 3, 1, cvt_color_bgr2nv12_uchar<3, 1>)
FASTCV_ENTRY(armBGR2NV12Image, unsigned char, 4, 1, cvt_color_bgr2nv12_uchar<4, 1>)
FASTCV_ENTRY(armNV122BGRImage, unsigned char, 1, 3, cvt_color_nv122bgr_uchar<1, 3>)
FASTCV_ENTRY(armNV122BGRImage, unsigned char, 1, 4, cvt_color_nv122bgr_uchar<1, 4>)
FASTCV_ENTRY(armRGB2NV12Image, unsigned char, 3, 1, cvt_color_rgb2nv12_uchar<3, 1>)
FASTCV_ENTRY(armRGB2NV12Image, unsigned char, 4, 1, cvt_color_rgb2nv12_uchar<4, 1>)
FASTCV_ENTRY(armNV122RGBImage, unsigned char, 1, 3, cvt_color_nv122rgb_uchar<1, 3>)
FASTCV_ENTRY(armNV122RGBImage, unsigned char, 1, 4, cvt_color_nv122rgb_uchar<1, 4>)

}  // namespace HPC::fastcv
