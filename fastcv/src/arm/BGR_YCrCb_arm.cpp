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
constexpr signed char highByte(int weight) {
  return static_cast<signed char>((weight - lowByte(weight)) / 256);
}

template <int ncSrc>
struct BgrToYCrCb8 {
  using Src = unsigned char;
  using Dst = unsigned char;
  static constexpr int kSrcChannels = ncSrc;
  static constexpr int kDstChannels = 3;
  static constexpr int kInFlight = 2;
  static constexpr bool kUniform = true;

  Pixels<Bytes, 3> vector(const Pixels<Bytes, ncSrc>& p) const {
    // The rounding half, 8192, is a multiple of 256: it is the rounding half of what remains to be shifted.
    Bytes y = narrowRounded<kShift - 8>(lumaSum(p.c[0], p.c[1], p.c[2]));
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
  static Two<Halves> lumaSum(Bytes b, Bytes g, Bytes r) {
    Two<Halves> high = multiply(b, kYB / 256);
    high = multiplyAdd(high, g, kYG / 256);
    high = multiplyAdd(high, r, kYR / 256);
    Two<Halves> low = multiply(b, kYB % 256);
    low = multiplyAdd(low, g, kYG % 256);
    low = multiplyAdd(low, r, kYR % 256);
    return addShifted<8>(high, low);
  }

  // The rounded product is (2 a b + 2^15) >> 16: with b = 2 weight that is (a weight + 2^13) >> 14. It is
  // -211 to 211, which saturates to a signed byte; 128 more is the clamped sum.
  static Bytes chromaOf(Bytes colour, Bytes y, int weight) {
    Two<SignedHalves> differences = difference(colour, y);
    forget(differences.low);  // in-order cores wait less where both halves are not made at once
    const Two<SignedHalves> terms = multiplyRounded(differences, static_cast<int16_t>(2 * weight));
    return (Bytes)narrowSigned(terms) ^ splat<Bytes>(0x80);
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

  Pixels<Bytes, 3> vector(const Pixels<Bytes, 3>& p) const {
    const Bytes y = p.c[0];
    const SignedBytes cr = centred(p.c[1]);
    const SignedBytes cb = centred(p.c[2]);
    // Green takes longest.
    const Bytes green = narrowRounded<kShift - 8>(greenSum(y, cr, cb));
    const Bytes red = blueOrRed(y, cr, kRCr);
    return {{blueOrRed(y, cb, kBCb), green, red}};
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
  static SignedBytes centred(Bytes stored) { return (SignedBytes)(stored ^ splat<Bytes>(0x80)); }

  // The rounded product is (2 a b + 2^15) >> 16: with a = 2 chroma that is (chroma b + 2^13) >> 14.
  static Bytes blueOrRed(Bytes y, SignedBytes chroma, int weight) {
    return narrow(add(multiplyRounded(widenShifted<1>(chroma), static_cast<int16_t>(weight)), y));
  }

  // Green's two terms are rounded together, so their weights are split. Y joins as 64 Y, which leaves the
  // shift by 14 - 8 to round and clamp the whole: 64 * 255 + 68 * 128 + 41 is still a 16-bit number.
  static Two<SignedHalves> greenSum(Bytes y, SignedBytes cr, SignedBytes cb) {
    const Two<SignedHalves> low = multiplyAdd(multiply(cr, lowByte(kGCr)), cb, lowByte(kGCb));
    Two<SignedHalves> high = asSigned(widenShifted<kShift - 8>(y));
    high = multiplyAdd(multiplyAdd(high, cr, highByte(kGCr)), cb, highByte(kGCb));
    return addShifted<8>(high, low);
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

  Pixels<Floats, 3> vector(const Pixels<Floats, ncSrc>& p) const {
    const Floats blueGreen = multiplyAdd(p.c[1] * splat<Floats>(kYG), p.c[0], splat<Floats>(kYB));
    const Floats y = multiplyAdd(blueGreen, p.c[2], splat<Floats>(kYR));
    const Floats offset = splat<Floats>(kOffset);
    return {{y, multiplyAdd(offset, p.c[2] - y, splat<Floats>(kCr)),
             multiplyAdd(offset, p.c[0] - y, splat<Floats>(kCb))}};
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

  Pixels<Floats, 3> vector(const Pixels<Floats, 3>& p) const {
    const Floats cr = p.c[1] - splat<Floats>(kOffset);
    const Floats cb = p.c[2] - splat<Floats>(kOffset);
    return {{multiplyAdd(p.c[0], cb, splat<Floats>(kB)),
             multiplyAdd(multiplyAdd(p.c[0], cr, splat<Floats>(kGCr)), cb, splat<Floats>(kGCb)),
             multiplyAdd(p.c[0], cr, splat<Floats>(kR))}};
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
