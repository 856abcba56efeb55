// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// BGR and BGRA to HSV and back.
//
// With max, min the largest and smallest of B, G, R, all scaled to 1 in 8 bits, and the epsilon of a float:
//   V = max
//   S = (max - min) / (max + eps)
//   H = (G - B) k where R is the largest, else (B - R) k + 120 degrees where G is, else (R - G) k + 240
//   degrees,
//       with k = 60 degrees / (max - min + eps); a circle is added to a negative hue
// 8-bit hues are half degrees; they join the circle only below -0.5, as what rounds to 0 may stay.
//
// Back, with the sector h = H / 60 degrees, c = V S, m = V - c:
//   h       0 to 1     1 to 2       2 to 3       3 to 4       4 to 5       5 up
//   R       V          m + (2-h)c   m            m            m + (h-4)c   V
//   G       m + h c    V            V            m + (4-h)c   m            m
//   B       m          m            m + (h-2)c   V            V            m - (h-6)c
//
// A row's whole groups of 8 pixels and the pixels after them are not computed alike. To HSV, groups multiply
// by a refined reciprocal estimate where single pixels divide: no byte differs by more than 1 (around the
// circle), and of all 2^24 colours no more than 1 in 2000 do at all. 8-bit hues back get their sector by a
// multiplication in groups.

#include <algorithm>
#include <cmath>

#include "entry.h"
#include "simd/loop.h"

namespace HPC::fastcv {
namespace {

using namespace arm;

constexpr float kEpsilon = 1.1920929e-7f;
constexpr float kPerByte = 0.003921569f;  // 1 / 255

// A value rounded to a byte, halves up, in double precision, and limited.
inline unsigned char byteOf(float value) {
  const double rounded = static_cast<double>(value) + 0.5;
  return rounded > 0 ? static_cast<unsigned char>(static_cast<unsigned>(rounded)) : 0;
}

template <int ncSrc>
struct BgrToHsv8 {
  using Src = unsigned char;
  using Dst = unsigned char;
  static constexpr int kSrcChannels = ncSrc;
  static constexpr int kDstChannels = 3;
  static constexpr int kInFlight = 1;
  static constexpr bool kUniform = false;

  // The compiler finds it too long to inline; called, it would keep nothing in registers from block to block.
  [[gnu::always_inline]] Pixels<Bytes, 3> vector(const Pixels<Bytes, ncSrc>& p) const {
    // Scaling keeps order and equality: which channel is what is settled among the bytes.
    const Bytes b = p.c[0], g = p.c[1], r = p.c[2];
    const Bytes max = arm::max(arm::max(b, g), r);
    const Bytes min = arm::min(arm::min(b, g), r);
    const auto isRed = max == r;
    const auto isGreen = max == g;
    const Bytes minuend = select(isRed, g, select(isGreen, b, r));
    const Bytes subtrahend = select(isRed, b, select(isGreen, r, g));
    const Bytes offset = select(isGreen, splat<Bytes>(60), splat<Bytes>(120)) & ~(Bytes)isRed;
    Floats hue[4], saturation[4];
    for (unsigned i = 0; i < 4; ++i) {
      const auto scaled = [&](Bytes bytes) { return quarterOf(bytes, i) * splat<Floats>(kPerByte); };
      const Floats vmax = scaled(max);
      const Floats diff = vmax - scaled(min);
      const Floats s = diff * reciprocalBelow2(vmax + splat<Floats>(kEpsilon));
      saturation[i] = s * splat<Floats>(255.0f);
      const Floats k = reciprocalBelow2(diff + splat<Floats>(kEpsilon)) * splat<Floats>(30.0f);
      const Floats h = multiplyAdd(quarterOf(offset, i), scaled(minuend) - scaled(subtrahend), k);
      hue[i] = h + masked(h < splat<Floats>(-0.5f), splat<Floats>(180.0f));
    }
    // V, scaled to 1 and back to a byte, is the byte.
    return {{bytesOf(hue), bytesOf(saturation), max}};
  }

  void scalar(const unsigned char* in, unsigned char* out) const {
    const float b = static_cast<float>(in[0]) * kPerByte;
    const float g = static_cast<float>(in[1]) * kPerByte;
    const float r = static_cast<float>(in[2]) * kPerByte;
    const float vmax = std::max(std::max(b, g), r);
    const float diff = vmax - std::min(std::min(b, g), r);
    const float s = diff / (vmax + kEpsilon);
    const float k = 30.0f / (diff + kEpsilon);
    float h = vmax == r ? (g - b) * k : vmax == g ? std::fma(b - r, k, 60.0f) : std::fma(r - g, k, 120.0f);
    if (h < -0.5f) {
      h += 180.0f;
    }
    storePixel<3>(out, byteOf(h), byteOf(s * 255.0f), byteOf(vmax * 255.0f));
  }
};

template <int ncSrc>
struct BgrToHsvFloat {
  using Src = float;
  using Dst = float;
  static constexpr int kSrcChannels = ncSrc;
  static constexpr int kDstChannels = 3;
  static constexpr int kInFlight = 2;
  static constexpr bool kUniform = false;

  // Unlike in 8 bits, the hue's offset is added in an operation of its own.
  //
  // With lo the lesser of B and G, the hue of a blue pixel, (R - G) k + 240, is |(lo - R) k - 240|, and that
  // of a green one, (B - R) k + 120, is |(lo - R) k + 120|; red ones are |(G - B) k + 360| or |(G - B) k|.
  // The sums are rounded alike, and one subtraction to an absolute value serves all.
  Pixels<Floats, 3> vector(const Pixels<Floats, ncSrc>& p) const {
    const Floats b = p.c[0], g = p.c[1], r = p.c[2];
    const Floats lo = min(b, g);
    const Floats vmax = max(max(b, g), r);
    const Floats diff = vmax - min(lo, r);
    const Floats divisorS = vmax + splat<Floats>(kEpsilon);
    const Floats divisorK = diff + splat<Floats>(kEpsilon);
    const bool areSmall = areBelow2(divisorS, divisorK);
    const Floats s = diff * (areSmall ? reciprocalBelow2(divisorS) : reciprocal(divisorS));
    const Floats k = (areSmall ? reciprocalBelow2(divisorK) : reciprocal(divisorK)) * splat<Floats>(60.0f);
    const auto isRed = vmax == r;
    const Floats h = select(isRed, g - b, lo - r) * k;
    Floats red = masked(h < splat<Floats>(0.0f), splat<Floats>(-360.0f));
    forget(red);  // the selection below would become four bitwise operations
    const Floats other = select(b > g, splat<Floats>(240.0f), splat<Floats>(-120.0f));
    return {{distance(h, select(isRed, red, other)), s, vmax}};
  }

  void scalar(const float* in, float* out) const {
    const float b = in[0], g = in[1], r = in[2];
    const float vmax = std::max(std::max(b, g), r);
    const float diff = vmax - std::min(std::min(b, g), r);
    const float s = diff / (vmax + kEpsilon);
    const float k = 60.0f / (diff + kEpsilon);
    float h = vmax == r ? (g - b) * k : vmax == g ? (b - r) * k + 120.0f : (r - g) * k + 240.0f;
    if (h < 0.0f) {
      h += 360.0f;
    }
    storePixel<3, float>(out, h, s, vmax);
  }
};

// The fraction of c that the channel between V and m has above m: in every sector the distance of h to the
// nearest of 0, 2, 4 and 6, but for h beyond 6, where it is negative. All four differences are exact where
// they are the least.
inline Floats fractionOf(Floats h) {
  const Floats low = min(h, distance(h, splat<Floats>(2.0f)));
  const Floats high = min(distance(h, splat<Floats>(4.0f)), splat<Floats>(6.0f) - h);
  return min(low, high);
}

struct Bgr {
  float b, g, r;
};

// One pixel back from sector, V and c.
inline Bgr bgrOf(float h, float v, float c) {
  const float m = v - c;
  if (h < 1.0f) {
    return {m, m + h * c, v};
  }
  if (h < 2.0f) {
    return {m, v, m + (2.0f - h) * c};
  }
  if (h < 3.0f) {
    return {m + (h - 2.0f) * c, v, m};
  }
  if (h < 4.0f) {
    return {v, m + (4.0f - h) * c, m};
  }
  if (h < 5.0f) {
    return {v, m, m + (h - 4.0f) * c};
  }
  return {m - (h - 6.0f) * c, m, v};
}

template <int ncDst>
struct HsvToBgr8 {
  using Src = unsigned char;
  using Dst = unsigned char;
  static constexpr int kSrcChannels = 3;
  static constexpr int kDstChannels = ncDst;
  static constexpr int kInFlight = 1;
  static constexpr bool kUniform = false;

  Pixels<Bytes, 3> vector(const Pixels<Bytes, 3>& p) const {
    Floats least[4], between[4];
    for (unsigned i = 0; i < 4; ++i) {
      const Floats h = quarterOf(p.c[0], i) * splat<Floats>(2.0f * 0.016666668f);
      const Floats v = quarterOf(p.c[2], i) * splat<Floats>(kPerByte);
      const Floats c = quarterOf(p.c[1], i) * splat<Floats>(kPerByte) * v;
      const Floats m = v - c;
      least[i] = m * splat<Floats>(255.0f);
      between[i] = (m + fractionOf(h) * c) * splat<Floats>(255.0f);
    }
    const Bytes m = bytesOf(least);
    const Bytes mid = bytesOf(between);
    // V, scaled to 1 and back to a byte, is the byte; and a sector starts at 30 half degrees exactly.
    const Bytes v = p.c[2];
    const auto below = [&](int sector) {
      return p.c[0] < splat<Bytes>(static_cast<unsigned char>(30 * sector));
    };
    const Bytes b = select(below(2), m, select(below(3), mid, select(below(5), v, mid)));
    const Bytes g = select(below(1), mid, select(below(3), v, select(below(4), mid, m)));
    const Bytes r = select(below(1), v, select(below(2), mid, select(below(4), m, select(below(5), mid, v))));
    return {{b, g, r}};
  }

  void scalar(const unsigned char* in, unsigned char* out) const {
    const float v = static_cast<float>(in[2]) * kPerByte;
    const float c = static_cast<float>(in[1]) * kPerByte * v;
    const Bgr bgr = bgrOf(static_cast<float>(in[0] + in[0]) / 60.0f, v, c);
    storePixel<ncDst>(out, byteOf(bgr.b * 255.0f), byteOf(bgr.g * 255.0f), byteOf(bgr.r * 255.0f));
  }
};

template <int ncDst>
struct HsvToBgrFloat {
  using Src = float;
  using Dst = float;
  static constexpr int kSrcChannels = 3;
  static constexpr int kDstChannels = ncDst;
  static constexpr int kInFlight = ncDst == 3 ? 2 : 1;  // two blocks and their alphas exceed the registers
  static constexpr bool kUniform = true;

  Pixels<Floats, 3> vector(const Pixels<Floats, 3>& p) const {
    const Floats h = p.c[0] / splat<Floats>(60.0f);
    const Floats v = p.c[2];
    const Floats c = v * p.c[1];
    const Floats m = v - c;
    const Floats mid = m + fractionOf(h) * c;
    const auto below = [&](float sector) { return h < splat<Floats>(sector); };
    const Floats b = select(below(2), m, select(below(3), mid, select(below(5), v, mid)));
    const Floats g = select(below(1), mid, select(below(3), v, select(below(4), mid, m)));
    const Floats r =
        select(below(1), v, select(below(2), mid, select(below(4), m, select(below(5), mid, v))));
    return {{b, g, r}};
  }

  void scalar(const float* in, float* out) const {
    const Bgr bgr = bgrOf(in[0] / 60.0f, in[2], in[2] * in[1]);
    storePixel<ncDst, float>(out, bgr.b, bgr.g, bgr.r);
  }
};

// The workers, told apart by channel counts.
template <int ncSrc, int ncDst>
constexpr auto cvt_color_bgr2hsv_uchar = convertImage<BgrToHsv8<ncSrc>>;
template <int ncSrc, int ncDst>
constexpr auto cvt_color_bgr2hsv_f32 = convertImage<BgrToHsvFloat<ncSrc>>;
template <int ncSrc, int ncDst>
constexpr auto cvt_color_hsv2bgr_uchar = convertImage<HsvToBgr8<ncDst>>;
template <int ncSrc, int ncDst>
constexpr auto cvt_color_hsv2bgr_f32 = convertImage<HsvToBgrFloat<ncDst>>;

}  // namespace

FASTCV_ENTRY(armBGR2HSVImage, unsigned char, 3, 3, cvt_color_bgr2hsv_uchar<3, 3>)
FASTCV_ENTRY(armBGR2HSVImage, unsigned char, 4, 3, cvt_color_bgr2hsv_uchar<4, 3>)
FASTCV_ENTRY(armBGR2HSVImage, float, 3, 3, cvt_color_bgr2hsv_f32<3, 3>)
FASTCV_ENTRY(armBGR2HSVImage, float, 4, 3, cvt_color_bgr2hsv_f32<4, 3>)
FASTCV_ENTRY(armHSV2BGRImage, unsigned char, 3, 3, cvt_color_hsv2bgr_uchar<3, 3>)
FASTCV_ENTRY(armHSV2BGRImage, unsigned char, 3, 4, cvt_color_hsv2bgr_uchar<3, 4>)
FASTCV_ENTRY(armHSV2BGRImage, float, 3, 3, cvt_color_hsv2bgr_f32<3, 3>)
FASTCV_ENTRY(armHSV2BGRImage, float, 3, 4, cvt_color_hsv2bgr_f32<3, 4>)

}  // namespace HPC::fastcv
