// Semi-planar YUV 4:2:0 (NV21, NV12) to and from BGR, RGB, BGRA and RGBA: the way that every camera frame
// takes.
//
// Full range, integer, with this library's own coefficients. With U and V the stored bytes minus 128:
//
//   Y = (16 B + 74 G + 38 R + 64) >> 7
//   U = ((65 B - 43 G - 22 R + 64) >> 7) + 128, clamped to a byte
//   V = ((-12 B - 55 G + 67 R + 64) >> 7) + 128, clamped to a byte
//
//   B = (64 Y + 110 U + 32) >> 6, clamped to a byte
//   G = (64 Y - 24 U - 44 V + 32) >> 6, clamped
//   R = (64 Y + 86 V + 32) >> 6, clamped
//
// Shifts floor. Chroma belongs to a 2 x 2 block and is made from its top-left pixel alone.

#include "entry.h"
#include "loop.h"

namespace HPC::fastcv {
namespace {

using namespace arm;

constexpr int kYB = 16, kYG = 74, kYR = 38;
constexpr int kUB = 65, kUG = -43, kUR = -22;
constexpr int kVB = -12, kVG = -55, kVR = 67;
constexpr int kBU = 110;
constexpr int kGU = -24, kGV = -44;
constexpr int kRV = 86;
constexpr int kEncodeShift = 7;
constexpr int kDecodeShift = 6;

enum class Order { kBGR, kRGB };
enum class Chroma { kVU, kUV };

// What a chroma sample adds to a colour channel. As 64 Y is a multiple of 64, (64 Y + t + 32) >> 6 is
// Y + ((t + 32) >> 6), and the added term, -220 to 218, splits into two bytes of which one is 0: adding the
// one and subtracting the other, both saturating, is the clamped sum for 16 pixels at once.
struct Term {
  uint8x16_t plus;
  uint8x16_t minus;
};

// The terms of 16 chroma samples from t and -1 - t, their products in 16 bits, which reach at most 110 * 128
// = 14080.
inline Term termOf(int16x8_t low, int16x8_t high, int16x8_t lowComplement, int16x8_t highComplement) {
  // The negative part is -((t + 32) >> 6) = (31 - t) >> 6, which is the rounding shift of -1 - t.
  return {roundingShiftToBytes<kDecodeShift>(low, high),
          roundingShiftToBytes<kDecodeShift>(lowComplement, highComplement)};
}

inline int16x8_t asSigned(uint16x8_t v) { return vreinterpretq_s16_u16(v); }

// weight * (stored - 128): the product with the stored byte, which a core finds faster than with a 16-bit
// difference, less that with 128.
inline Term termOf(uint8x16_t stored, int weight) {
  const uint8x16_t w = vdupq_n_u8(static_cast<unsigned char>(weight));
  const int16x8_t low = asSigned(vmull_u8(vget_low_u8(stored), vget_low_u8(w)));
  const int16x8_t high = asSigned(vmull_high_u8(stored, w));
  const int16x8_t offset = vdupq_n_s16(static_cast<int16_t>(weight * 128));
  const int16x8_t complement = vdupq_n_s16(static_cast<int16_t>(weight * 128 - 1));
  return termOf(vsubq_s16(low, offset), vsubq_s16(high, offset), vsubq_s16(complement, low),
                vsubq_s16(complement, high));
}

// -weight1 * (stored1 - 128) - weight2 * (stored2 - 128)
inline Term negativeTermOf(uint8x16_t stored1, int weight1, uint8x16_t stored2, int weight2) {
  const uint8x16_t w1 = vdupq_n_u8(static_cast<unsigned char>(weight1));
  const uint8x16_t w2 = vdupq_n_u8(static_cast<unsigned char>(weight2));
  const int16x8_t low = asSigned(
      vmlal_u8(vmull_u8(vget_low_u8(stored1), vget_low_u8(w1)), vget_low_u8(stored2), vget_low_u8(w2)));
  const int16x8_t high = asSigned(vmlal_high_u8(vmull_high_u8(stored1, w1), stored2, w2));
  const int16x8_t offset = vdupq_n_s16(static_cast<int16_t>((weight1 + weight2) * 128));
  const int16x8_t complement = vdupq_n_s16(static_cast<int16_t>((weight1 + weight2) * 128 + 1));
  return termOf(vsubq_s16(offset, low), vsubq_s16(offset, high), vsubq_s16(low, complement),
                vsubq_s16(high, complement));
}

// Spreads 16 chroma terms over the 32 pixels of a row: those of the first or of the second 16.
template <bool second>
inline Term spread(const Term& term) {
  if constexpr (second) {
    return {vzip2q_u8(term.plus, term.plus), vzip2q_u8(term.minus, term.minus)};
  } else {
    return {vzip1q_u8(term.plus, term.plus), vzip1q_u8(term.minus, term.minus)};
  }
}

inline uint8x16_t addTerm(uint8x16_t luma, const Term& term) {
  return vqsubq_u8(vqaddq_u8(luma, term.plus), term.minus);
}

template <int nc, Order order, typename T, typename V>
inline auto arranged(V b, V g, V r) {
  return order == Order::kBGR ? pixelsOf<nc, T>(b, g, r) : pixelsOf<nc, T>(r, g, b);
}

// One row pair of a decoding: 32 columns a block.
template <int nc, Order order, Chroma chroma>
struct DecodePair {
  static constexpr int kBlock = 32;

  const unsigned char* luma0;
  const unsigned char* luma1;
  const unsigned char* pairs;
  unsigned char* out0;
  unsigned char* out1;

  template <int n>
  void block(ptrdiff_t x, Blocks<n>) const {
    const uint8x16x2_t stored = vld2q_u8(pairs + x);
    const uint8x16_t u8 = stored.val[chroma == Chroma::kVU ? 1 : 0];
    const uint8x16_t v8 = stored.val[chroma == Chroma::kVU ? 0 : 1];
    const Term b = termOf(u8, kBU);
    const Term g = negativeTermOf(u8, -kGU, v8, -kGV);
    const Term r = termOf(v8, kRV);
    half(x, spread<false>(b), spread<false>(g), spread<false>(r));
    half(x + 16, spread<true>(b), spread<true>(g), spread<true>(r));
  }

  void step(ptrdiff_t x) const {
    const int u = pairs[x + (chroma == Chroma::kVU ? 1 : 0)] - 128;
    const int v = pairs[x + (chroma == Chroma::kVU ? 0 : 1)] - 128;
    const int b = kBU * u;
    const int g = kGU * u + kGV * v;
    const int r = kRV * v;
    for (ptrdiff_t column = x; column < x + 2; ++column) {
      pixel(luma0[column], b, g, r, out0 + column * nc);
      pixel(luma1[column], b, g, r, out1 + column * nc);
    }
  }

 private:
  void half(ptrdiff_t x, const Term& b, const Term& g, const Term& r) const {
    const uint8x16_t y0 = vld1q_u8(luma0 + x);
    const uint8x16_t y1 = vld1q_u8(luma1 + x);
    storePixels(out0 + x * nc,
                arranged<nc, order, unsigned char>(addTerm(y0, b), addTerm(y0, g), addTerm(y0, r)));
    storePixels(out1 + x * nc,
                arranged<nc, order, unsigned char>(addTerm(y1, b), addTerm(y1, g), addTerm(y1, r)));
  }

  static void pixel(int y, int b, int g, int r, unsigned char* out) {
    constexpr int kHalf = 1 << (kDecodeShift - 1);
    const int scaled = (y << kDecodeShift) + kHalf;
    const unsigned char blue = clampToByte((scaled + b) >> kDecodeShift);
    const unsigned char green = clampToByte((scaled + g) >> kDecodeShift);
    const unsigned char red = clampToByte((scaled + r) >> kDecodeShift);
    if constexpr (order == Order::kBGR) {
      storePixel<nc>(out, blue, green, red);
    } else {
      storePixel<nc>(out, red, green, blue);
    }
  }
};

// One row pair of an encoding: 16 columns a block.
template <int nc, Order order, Chroma chroma>
struct EncodePair {
  static constexpr int kBlock = 16;

  const unsigned char* in0;
  const unsigned char* in1;
  unsigned char* luma0;
  unsigned char* luma1;
  unsigned char* pairs;

  template <int n>
  void block(ptrdiff_t x, Blocks<n>) const {
    inFlight<n>(
        [&](int i) {
          const ptrdiff_t at = (x + i * kBlock) * nc;
          return Rows{loadPixels<nc>(in0 + at), loadPixels<nc>(in1 + at)};
        },
        [&](const Rows& rows) { return Planes{lumaOf(rows.top), lumaOf(rows.bottom), chromaOf(rows.top)}; },
        [&](int i, const Planes& planes) {
          const ptrdiff_t at = x + i * kBlock;
          vst1q_u8(luma0 + at, planes.top);
          vst1q_u8(luma1 + at, planes.bottom);
          vst2_u8(pairs + at, planes.chromaPairs);
        });
  }

  void step(ptrdiff_t x) const {
    for (ptrdiff_t column = x; column < x + 2; ++column) {
      luma0[column] = lumaOf(in0 + column * nc);
      luma1[column] = lumaOf(in1 + column * nc);
    }
    const unsigned char* pixel = in0 + x * nc;
    const unsigned char u = chromaOf(pixel, kUB, kUG, kUR);
    const unsigned char v = chromaOf(pixel, kVB, kVG, kVR);
    pairs[x + (chroma == Chroma::kVU ? 1 : 0)] = u;
    pairs[x + (chroma == Chroma::kVU ? 0 : 1)] = v;
  }

 private:
  static constexpr int kBlue = order == Order::kBGR ? 0 : 2;
  static constexpr int kRed = 2 - kBlue;

  struct Rows {
    Pixels<unsigned char, nc> top;
    Pixels<unsigned char, nc> bottom;
  };
  struct Planes {
    uint8x16_t top;
    uint8x16_t bottom;
    uint8x8x2_t chromaPairs;
  };

  // The weights sum to 128, so the sum is at most 32640 and the rounded luma needs no clamp.
  static uint8x16_t lumaOf(const Pixels<unsigned char, nc>& p) {
    const uint8x16_t wb = vdupq_n_u8(kYB);
    const uint8x16_t wg = vdupq_n_u8(kYG);
    const uint8x16_t wr = vdupq_n_u8(kYR);
    uint16x8_t low = vmull_u8(vget_low_u8(p.c[kBlue]), vget_low_u8(wb));
    low = vmlal_u8(low, vget_low_u8(p.c[1]), vget_low_u8(wg));
    low = vmlal_u8(low, vget_low_u8(p.c[kRed]), vget_low_u8(wr));
    uint16x8_t high = vmull_high_u8(p.c[kBlue], wb);
    high = vmlal_high_u8(high, p.c[1], wg);
    high = vmlal_high_u8(high, p.c[kRed], wr);
    return roundingShiftToBytes<kEncodeShift>(low, high);
  }

  static unsigned char lumaOf(const unsigned char* p) {
    constexpr int kHalf = 1 << (kEncodeShift - 1);
    return static_cast<unsigned char>((kYB * p[kBlue] + kYG * p[1] + kYR * p[kRed] + kHalf) >> kEncodeShift);
  }

  // The bytes of the even columns.
  static uint8x8_t evenColumns(uint8x16_t v) { return vmovn_u16(vreinterpretq_u16_u8(v)); }

  // The weighted sum, at most 67 * 255 = 17085 in magnitude, is rounded, shifted and saturated to a signed
  // byte; 128 more, that is the stored byte, clamped on both sides.
  static uint8x8_t chromaOf(int16x8_t sum) {
    return veor_u8(vreinterpret_u8_s8(vqrshrn_n_s16(sum, kEncodeShift)), vdup_n_u8(0x80));
  }

  static uint8x8x2_t chromaOf(const Pixels<unsigned char, nc>& top) {
    const uint8x8_t b = evenColumns(top.c[kBlue]);
    const uint8x8_t g = evenColumns(top.c[1]);
    const uint8x8_t r = evenColumns(top.c[kRed]);
    uint16x8_t u = vmull_u8(b, vdup_n_u8(kUB));
    u = vmlsl_u8(u, g, vdup_n_u8(-kUG));
    u = vmlsl_u8(u, r, vdup_n_u8(-kUR));
    uint16x8_t v = vmull_u8(r, vdup_n_u8(kVR));
    v = vmlsl_u8(v, g, vdup_n_u8(-kVG));
    v = vmlsl_u8(v, b, vdup_n_u8(-kVB));
    const uint8x8_t u8 = chromaOf(vreinterpretq_s16_u16(u));
    const uint8x8_t v8 = chromaOf(vreinterpretq_s16_u16(v));
    return chroma == Chroma::kVU ? uint8x8x2_t{{v8, u8}} : uint8x8x2_t{{u8, v8}};
  }

  static unsigned char chromaOf(const unsigned char* p, int wb, int wg, int wr) {
    constexpr int kHalf = 1 << (kEncodeShift - 1);
    return clampToByte(((wb * p[kBlue] + wg * p[1] + wr * p[kRed] + kHalf) >> kEncodeShift) + 128);
  }
};

template <int nc, Order order, Chroma chroma>
inline void decode(int height, int width, int inWidthStride, const unsigned char* inData, int outWidthStride,
                   unsigned char* outData) {
  using Pair = DecodePair<nc, order, chroma>;
  const ptrdiff_t inStride = inWidthStride;
  const ptrdiff_t outStride = outWidthStride;
  forEachRowPair<Pair::kBlock, 1>(height, width, [=](ptrdiff_t row) {
    const unsigned char* luma = inData + row * inStride;
    unsigned char* out = outData + row * outStride;
    return Pair{luma, luma + inStride, inData + (height + row / 2) * inStride, out, out + outStride};
  });
}

template <int nc, Order order, Chroma chroma>
inline void encode(int height, int width, int inWidthStride, const unsigned char* inData, int outWidthStride,
                   unsigned char* outData) {
  using Pair = EncodePair<nc, order, chroma>;
  const ptrdiff_t inStride = inWidthStride;
  const ptrdiff_t outStride = outWidthStride;
  forEachRowPair<Pair::kBlock, 1>(height, width, [=](ptrdiff_t row) {
    const unsigned char* in = inData + row * inStride;
    unsigned char* luma = outData + row * outStride;
    return Pair{in, in + inStride, luma, luma + outStride, outData + (height + row / 2) * outStride};
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
