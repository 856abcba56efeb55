// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// BGR and BGRA to YCrCb and back: full-range BT.601 weights, chroma around 128, or 0.5 in float.
//
//   8-bit:  Y  = (1868 B + 9617 G + 4899 R + 8192) >> 14
//           Cr = (((R - Y) * 11682 + 8192) >> 14) + 128, clamped to a byte
//           Cb = (((B - Y) * 9241 + 8192) >> 14) + 128, clamped
//   back:   R  = Y + ((22987 (Cr - 128) + 8192) >> 14), clamped
//           G  = Y + ((-11698 (Cr - 128) - 5636 (Cb - 128) + 8192) >> 14), clamped
//           B  = Y + ((29049 (Cb - 128) + 8192) >> 14), clamped
//   float:  Y  = fma(R, 0.299, fma(B, 0.114, G * 0.587))
//           Cr = fma(R - Y, 0.713, 0.5), Cb = fma(B - Y, 0.564, 0.5)
//   back:   R  = fma(Cr - 0.5, 1.403, Y)
//           G  = fma(Cb - 0.5, -0.344, fma(Cr - 0.5, -0.714, Y))
//           B  = fma(Cb - 0.5, 1.773, Y)
//
// Shifts floor. Float is not clamped.

#include <cmath>

#include "entry.h"
#include "simd/loop.h"

namespace HPC::fastcv {
namespace {

using namespace arm;

constexpr int kShift = 14;
constexpr int kHalf = 1 << (kShift - 1);
constexpr int kYB = 1868, kYG = 9617, kYR = 4899;
constexpr int kCrR = 11682, kCbB = 9241;
constexpr int kRCr = 22987;
constexpr int kGCr = -11698, kGCb = -5636;
constexpr int kBCb = 29049;

// A weight as 256 * high + low, each part a byte: products then stay in 16 bits. For sums S_high and S_low of
// such products and a shift by 8 + n, floor((256 S_high + S_low) / 2^(8 + n)) is
// floor((S_high + floor(S_low / 256)) / 2^n), as a floor of a floor is the floor.
constexpr signed char lowByte(int weight) { return static_cast<signed char>(weight & 0xff); }
constexpr int16_t highByte(int weight) { return static_cast<int16_t>((weight - lowByte(weight)) / 256); }

template <int ncSrc>
struct BgrToYCrCb8 {
  using Src = unsigned char;
  using Dst = unsigned char;
  static constexpr int kSrcChannels = ncSrc;
  static constexpr int kDstChannels = 3;
  static constexpr int kInFlight = 2;
  static constexpr bool kUniform = true;

  Pixels<unsigned char, 3> vector(const Pixels<unsigned char, ncSrc>& p) const {
    // The rounding half, 8192, is a multiple of 256: it is the rounding half of what remains to be shifted.
    uint8x16_t y = roundingShiftToBytes<kShift - 8>(
        lumaSum(vget_low_u8(p.c[0]), vget_low_u8(p.c[1]), vget_low_u8(p.c[2])),
        lumaSum(vget_high_u8(p.c[0]), vget_high_u8(p.c[1]), vget_high_u8(p.c[2])));
    forget(y);  // made of two halves, it would be taken apart again below
    return {{y, chromaOf(p.c[2], y, kCrR), chromaOf(p.c[0], y, kCbB)}};
  }

  void scalar(const unsigned char* in, unsigned char* out) const {
    const int b = in[0];
    const int r = in[2];
    const int y = (kYB * b + kYG * in[1] + kYR * r + kHalf) >> kShift;
    const int cr = (((r - y) * kCrR + kHalf) >> kShift) + 128;
    const int cb = (((b - y) * kCbB + kHalf) >> kShift) + 128;
    storePixel<3>(out, static_cast<unsigned char>(y), clampToByte(cr), clampToByte(cb));
  }

 private:
  // floor(sum / 256). With unsigned parts the low sum is at most 256 * 255, the high one with the carried 255
  // at most 16320.
  static uint16x8_t lumaSum(uint8x8_t b, uint8x8_t g, uint8x8_t r) {
    uint16x8_t low = vmull_u8(b, vdup_n_u8(kYB % 256));
    low = vmlal_u8(low, g, vdup_n_u8(kYG % 256));
    low = vmlal_u8(low, r, vdup_n_u8(kYR % 256));
    uint16x8_t high = vmull_u8(b, vdup_n_u8(kYB / 256));
    high = vmlal_u8(high, g, vdup_n_u8(kYG / 256));
    high = vmlal_u8(high, r, vdup_n_u8(kYR / 256));
    return vsraq_n_u16(high, low, 8);
  }

  // vqrdmulh gives (2 a b + 2^15) >> 16: with b = 2 weight that is (a weight + 2^13) >> 14. The result, -211
  // to 211, saturates to a signed byte; 128 more is the clamped sum.
  static uint8x16_t chromaOf(uint8x16_t colour, uint8x16_t y, int weight) {
    const int8x8_t low = chromaOf(vsubl_u8(vget_low_u8(colour), vget_low_u8(y)), weight);
    const int8x8_t high = chromaOf(vsubl_u8(vget_high_u8(colour), vget_high_u8(y)), weight);
    return veorq_u8(vreinterpretq_u8_s8(vcombine_s8(low, high)), vdupq_n_u8(0x80));
  }
  static int8x8_t chromaOf(uint16x8_t difference, int weight) {
    return vqmovn_s16(vqrdmulhq_n_s16(vreinterpretq_s16_u16(difference), static_cast<int16_t>(2 * weight)));
  }
};

template <int ncDst>
struct YCrCbToBgr8 {
  using Src = unsigned char;
  using Dst = unsigned char;
  static constexpr int kSrcChannels = 3;
  static constexpr int kDstChannels = ncDst;
  // A block has six independent parts; two blocks would run out of registers.
  static constexpr int kInFlight = 1;
  static constexpr bool kUniform = true;

  Pixels<unsigned char, 3> vector(const Pixels<unsigned char, 3>& p) const {
    const int8x16_t cr = centred(p.c[1]);
    const int8x16_t cb = centred(p.c[2]);
    const Half low = half(vget_low_u8(p.c[0]), vget_low_s8(cr), vget_low_s8(cb));
    const Half high = half(vget_high_u8(p.c[0]), vget_high_s8(cr), vget_high_s8(cb));
    return {{vcombine_u8(low.b, high.b), roundingShiftToBytes<kShift - 8>(low.greenSum, high.greenSum),
             vcombine_u8(low.r, high.r)}};
  }

  void scalar(const unsigned char* in, unsigned char* out) const {
    const int y = in[0];
    const int cr = in[1] - 128;
    const int cb = in[2] - 128;
    storePixel<ncDst>(out, clampToByte(y + ((kBCb * cb + kHalf) >> kShift)),
                      clampToByte(y + ((kGCr * cr + kGCb * cb + kHalf) >> kShift)),
                      clampToByte(y + ((kRCr * cr + kHalf) >> kShift)));
  }

 private:
  struct Half {
    uint8x8_t b, r;
    int16x8_t greenSum;
  };

  static int8x16_t centred(uint8x16_t stored) {
    return vreinterpretq_s8_u8(veorq_u8(stored, vdupq_n_u8(0x80)));
  }

  static Half half(uint8x8_t y, int8x8_t cr, int8x8_t cb) {
    return {blueOrRed(y, cb, kBCb), blueOrRed(y, cr, kRCr), greenSum(y, cr, cb)};
  }

  // vqrdmulh gives (2 a b + 2^15) >> 16: with a = 2 chroma that is (chroma b + 2^13) >> 14.
  static uint8x8_t blueOrRed(uint8x8_t y, int8x8_t chroma, int weight) {
    const int16x8_t term = vqrdmulhq_n_s16(vshll_n_s8(chroma, 1), static_cast<int16_t>(weight));
    return vqmovun_s16(vreinterpretq_s16_u16(vaddw_u8(vreinterpretq_u16_s16(term), y)));
  }

  // Green's two terms are rounded together, so their weights are split. Y joins as 64 Y, which leaves the
  // shift by 14 - 8 to round and clamp the whole: 64 * 255 + 68 * 128 + 41 is still a 16-bit number.
  static int16x8_t greenSum(uint8x8_t y, int8x8_t cr, int8x8_t cb) {
    const int16x8_t low = vmlal_s8(vmull_s8(cr, vdup_n_s8(lowByte(kGCr))), cb, vdup_n_s8(lowByte(kGCb)));
    const int16x8_t luma = vreinterpretq_s16_u16(vshll_n_u8(y, kShift - 8));
    const int16x8_t high =
        vmlal_s8(vmlal_s8(luma, cr, vdup_n_s8(highByte(kGCr))), cb, vdup_n_s8(highByte(kGCb)));
    return vsraq_n_s16(high, low, 8);
  }
};

template <int ncSrc>
struct BgrToYCrCbFloat {
  using Src = float;
  using Dst = float;
  static constexpr int kSrcChannels = ncSrc;
  static constexpr int kDstChannels = 3;
  static constexpr int kInFlight = 3;
  static constexpr bool kUniform = true;

  static constexpr float kYB = 0.114f, kYG = 0.587f, kYR = 0.299f;
  static constexpr float kCr = 0.713f, kCb = 0.564f;
  static constexpr float kOffset = 0.5f;

  Pixels<float, 3> vector(const Pixels<float, ncSrc>& p) const {
    const float32x4_t blueGreen = vfmaq_f32(vmulq_f32(p.c[1], vdupq_n_f32(kYG)), p.c[0], vdupq_n_f32(kYB));
    const float32x4_t y = vfmaq_f32(blueGreen, p.c[2], vdupq_n_f32(kYR));
    const float32x4_t offset = vdupq_n_f32(kOffset);
    return {{y, vfmaq_f32(offset, vsubq_f32(p.c[2], y), vdupq_n_f32(kCr)),
             vfmaq_f32(offset, vsubq_f32(p.c[0], y), vdupq_n_f32(kCb))}};
  }

  void scalar(const float* in, float* out) const {
    const float b = in[0];
    const float r = in[2];
    const float y = std::fma(r, kYR, std::fma(b, kYB, in[1] * kYG));
    storePixel<3, float>(out, y, std::fma(r - y, kCr, kOffset), std::fma(b - y, kCb, kOffset));
  }
};

template <int ncDst>
struct YCrCbToBgrFloat {
  using Src = float;
  using Dst = float;
  static constexpr int kSrcChannels = 3;
  static constexpr int kDstChannels = ncDst;
  static constexpr int kInFlight = ncDst == 3 ? 3 : 2;
  static constexpr bool kUniform = true;

  static constexpr float kR = 1.403f, kGCr = -0.714f, kGCb = -0.344f, kB = 1.773f;
  static constexpr float kOffset = 0.5f;

  Pixels<float, 3> vector(const Pixels<float, 3>& p) const {
    const float32x4_t cr = vsubq_f32(p.c[1], vdupq_n_f32(kOffset));
    const float32x4_t cb = vsubq_f32(p.c[2], vdupq_n_f32(kOffset));
    return {{vfmaq_f32(p.c[0], cb, vdupq_n_f32(kB)),
             vfmaq_f32(vfmaq_f32(p.c[0], cr, vdupq_n_f32(kGCr)), cb, vdupq_n_f32(kGCb)),
             vfmaq_f32(p.c[0], cr, vdupq_n_f32(kR))}};
  }

  void scalar(const float* in, float* out) const {
    const float y = in[0];
    const float cr = in[1] - kOffset;
    const float cb = in[2] - kOffset;
    storePixel<ncDst, float>(out, std::fma(cb, kB, y), std::fma(cb, kGCb, std::fma(cr, kGCr, y)),
                             std::fma(cr, kR, y));
  }
};

// The workers, told apart by channel counts.
template <int ncSrc, int ncDst>
constexpr auto cvt_color_bgr2ycrcb_uchar = convertImage<BgrToYCrCb8<ncSrc>>;
template <int ncSrc, int ncDst>
constexpr auto cvt_color_ycrcb2bgr_uchar = convertImage<YCrCbToBgr8<ncDst>>;
template <int ncSrc, int ncDst>
constexpr auto cvt_color_bgr2ycrcb_f32 = convertImage<BgrToYCrCbFloat<ncSrc>>;
template <int ncSrc, int ncDst>
constexpr auto cvt_color_ycrcb2bgr_f32 = convertImage<YCrCbToBgrFloat<ncDst>>;

}  // namespace

FASTCV_ENTRY(armBGR2YCrCbImage, unsigned char, 3, 3, cvt_color_bgr2ycrcb_uchar<3, 3>)
FASTCV_ENTRY(armBGR2YCrCbImage, unsigned char, 4, 3, cvt_color_bgr2ycrcb_uchar<4, 3>)
FASTCV_ENTRY(armYCrCb2BGRImage, unsigned char, 3, 3, cvt_color_ycrcb2bgr_uchar<3, 3>)
FASTCV_ENTRY(armYCrCb2BGRImage, unsigned char, 3, 4, cvt_color_ycrcb2bgr_uchar<3, 4>)
FASTCV_ENTRY(armBGR2YCrCbImage, float, 3, 3, cvt_color_bgr2ycrcb_f32<3, 3>)
FASTCV_ENTRY(armBGR2YCrCbImage, float, 4, 3, cvt_color_bgr2ycrcb_f32<4, 3>)
FASTCV_ENTRY(armYCrCb2BGRImage, float, 3, 3, cvt_color_ycrcb2bgr_f32<3, 3>)
FASTCV_ENTRY(armYCrCb2BGRImage, float, 3, 4, cvt_color_ycrcb2bgr_f32<3, 4>)

}  // namespace HPC::fastcv
