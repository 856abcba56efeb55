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
// circle), and of all 2^24 colours no more than 1 in 2000 do at all, on Arm and on x86-64, whose estimates
// differ. 8-bit hues back get their sector by a multiplication in groups.

#include <algorithm>
#include <cmath>

#include "entry.h"
#include "simd/loop.h"

namespace HPC::fastcv {
namespace {

using namespace arm;

constexpr float kEpsilon = 1.1920929e-7f;
constexpr float kPerByte = 0.003921569f;  // 1 / 255

// 1 / v: the estimate of 8 bits, and two Newton-Raphson steps, each of which doubles the bits.
inline float32x4_t reciprocal(float32x4_t v) {
  float32x4_t estimate = vrecpeq_f32(v);
  estimate = vmulq_f32(estimate, vrecpsq_f32(v, estimate));
  return vmulq_f32(estimate, vrecpsq_f32(v, estimate));
}

// Quarters of a block of 16 bytes as floats.
struct Quarters {
  float32x4_t q[4];
};

// Four bytes of a block, from `first` on, one a lane.
inline float32x4_t widened(uint8x16_t bytes, unsigned first) {
  // A look-up gives 0 for indices beyond the table.
  static constexpr uint32_t kIndex[] = {0xffffff00, 0xffffff01, 0xffffff02, 0xffffff03};
  const uint8x16_t index = vreinterpretq_u8_u32(vaddq_u32(vld1q_u32(kIndex), vdupq_n_u32(first)));
  return vcvtq_f32_u32(vreinterpretq_u32_u8(vqtbl1q_u8(bytes, index)));
}

// Rounded to bytes, halves up, saturated.
inline uint8x16_t bytesOf(const Quarters& v) {
  const auto half = [](float32x4_t low, float32x4_t high) {
    const auto rounded = [](float32x4_t x) {
      return vmovn_s32(vcvtq_s32_f32(vaddq_f32(x, vdupq_n_f32(0.5f))));
    };
    return vqmovun_s16(vcombine_s16(rounded(low), rounded(high)));
  };
  return vcombine_u8(half(v.q[0], v.q[1]), half(v.q[2], v.q[3]));
}

// The same of one value, in double precision.
inline unsigned char byteOf(float value) {
  const double rounded = static_cast<double>(value) + 0.5;
  return rounded > 0 ? static_cast<unsigned char>(static_cast<unsigned>(rounded)) : 0;
}

template <int ncSrc>
struct BgrToHsv8 {
  using Vector = uint8x16_t;
  using Src = unsigned char;
  using Dst = unsigned char;
  static constexpr int kSrcChannels = ncSrc;
  static constexpr int kDstChannels = 3;
  static constexpr int kInFlight = 1;
  static constexpr bool kUniform = false;

  // The compiler finds it too long to inline; called, it would keep nothing in registers from block to block.
  [[gnu::always_inline]] Pixels<uint8x16_t, 3> vector(const Pixels<uint8x16_t, ncSrc>& p) const {
    // Scaling keeps order and equality: which channel is what is settled among the bytes.
    const uint8x16_t b = p.c[0], g = p.c[1], r = p.c[2];
    const uint8x16_t max = vmaxq_u8(vmaxq_u8(b, g), r);
    const uint8x16_t min = vminq_u8(vminq_u8(b, g), r);
    const uint8x16_t isRed = vceqq_u8(max, r);
    const uint8x16_t isGreen = vceqq_u8(max, g);
    const uint8x16_t minuend = vbslq_u8(isRed, g, vbslq_u8(isGreen, b, r));
    const uint8x16_t subtrahend = vbslq_u8(isRed, b, vbslq_u8(isGreen, r, g));
    const uint8x16_t offset = vbicq_u8(vbslq_u8(isGreen, vdupq_n_u8(60), vdupq_n_u8(120)), isRed);
    Quarters hue, saturation;
    for (unsigned i = 0; i < 4; ++i) {
      const unsigned first = 4 * i;
      const auto scaled = [&](uint8x16_t bytes) { return vmulq_n_f32(widened(bytes, first), kPerByte); };
      const float32x4_t vmax = scaled(max);
      const float32x4_t diff = vsubq_f32(vmax, scaled(min));
      const float32x4_t s = vmulq_f32(diff, reciprocal(vaddq_f32(vmax, vdupq_n_f32(kEpsilon))));
      saturation.q[i] = vmulq_n_f32(s, 255.0f);
      const float32x4_t k = vmulq_n_f32(reciprocal(vaddq_f32(diff, vdupq_n_f32(kEpsilon))), 30.0f);
      const float32x4_t h =
          vfmaq_f32(widened(offset, first), vsubq_f32(scaled(minuend), scaled(subtrahend)), k);
      const uint32x4_t wraps = vcltq_f32(h, vdupq_n_f32(-0.5f));
      const uint32x4_t circle = vreinterpretq_u32_f32(vdupq_n_f32(180.0f));
      hue.q[i] = vaddq_f32(h, vreinterpretq_f32_u32(vandq_u32(wraps, circle)));
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
  using Vector = float32x4_t;
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
  Pixels<float32x4_t, 3> vector(const Pixels<float32x4_t, ncSrc>& p) const {
    const float32x4_t b = p.c[0], g = p.c[1], r = p.c[2];
    const float32x4_t lo = vminq_f32(b, g);
    const float32x4_t vmax = vmaxq_f32(vmaxq_f32(b, g), r);
    const float32x4_t diff = vsubq_f32(vmax, vminq_f32(lo, r));
    const float32x4_t s = vmulq_f32(diff, reciprocal(vaddq_f32(vmax, vdupq_n_f32(kEpsilon))));
    const float32x4_t k = vmulq_n_f32(reciprocal(vaddq_f32(diff, vdupq_n_f32(kEpsilon))), 60.0f);
    const uint32x4_t isRed = vceqq_f32(vmax, r);
    const float32x4_t h = vmulq_f32(vbslq_f32(isRed, vsubq_f32(g, b), vsubq_f32(lo, r)), k);
    const uint32x4_t circle = vreinterpretq_u32_f32(vdupq_n_f32(-360.0f));
    float32x4_t red = vreinterpretq_f32_u32(vandq_u32(vcltzq_f32(h), circle));
    forget(red);  // the selection below would become four bitwise operations
    const float32x4_t other = vbslq_f32(vcgtq_f32(b, g), vdupq_n_f32(240.0f), vdupq_n_f32(-120.0f));
    return {{vabdq_f32(h, vbslq_f32(isRed, red, other)), s, vmax}};
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
inline float32x4_t fractionOf(float32x4_t h) {
  const float32x4_t low = vminq_f32(h, vabdq_f32(h, vdupq_n_f32(2.0f)));
  const float32x4_t high = vminq_f32(vabdq_f32(h, vdupq_n_f32(4.0f)), vsubq_f32(vdupq_n_f32(6.0f), h));
  return vminq_f32(low, high);
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
  using Vector = uint8x16_t;
  using Src = unsigned char;
  using Dst = unsigned char;
  static constexpr int kSrcChannels = 3;
  static constexpr int kDstChannels = ncDst;
  static constexpr int kInFlight = 1;
  static constexpr bool kUniform = false;

  Pixels<uint8x16_t, 3> vector(const Pixels<uint8x16_t, 3>& p) const {
    Quarters least, between;
    for (unsigned i = 0; i < 4; ++i) {
      const unsigned first = 4 * i;
      const float32x4_t h = vmulq_n_f32(widened(p.c[0], first), 2.0f * 0.016666668f);
      const float32x4_t v = vmulq_n_f32(widened(p.c[2], first), kPerByte);
      const float32x4_t c = vmulq_f32(vmulq_n_f32(widened(p.c[1], first), kPerByte), v);
      const float32x4_t m = vsubq_f32(v, c);
      least.q[i] = vmulq_n_f32(m, 255.0f);
      between.q[i] = vmulq_n_f32(vaddq_f32(m, vmulq_f32(fractionOf(h), c)), 255.0f);
    }
    const uint8x16_t m = bytesOf(least);
    const uint8x16_t mid = bytesOf(between);
    // V, scaled to 1 and back to a byte, is the byte; and a sector starts at 30 half degrees exactly.
    const uint8x16_t v = p.c[2];
    const auto below = [&](int sector) {
      return vcltq_u8(p.c[0], vdupq_n_u8(static_cast<unsigned char>(30 * sector)));
    };
    const uint8x16_t b = vbslq_u8(below(2), m, vbslq_u8(below(3), mid, vbslq_u8(below(5), v, mid)));
    const uint8x16_t g = vbslq_u8(below(1), mid, vbslq_u8(below(3), v, vbslq_u8(below(4), mid, m)));
    const uint8x16_t r =
        vbslq_u8(below(1), v, vbslq_u8(below(2), mid, vbslq_u8(below(4), m, vbslq_u8(below(5), mid, v))));
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
  using Vector = float32x4_t;
  using Src = float;
  using Dst = float;
  static constexpr int kSrcChannels = 3;
  static constexpr int kDstChannels = ncDst;
  static constexpr int kInFlight = ncDst == 3 ? 2 : 1;  // two blocks and their alphas exceed the registers
  static constexpr bool kUniform = true;

  Pixels<float32x4_t, 3> vector(const Pixels<float32x4_t, 3>& p) const {
    const float32x4_t h = vdivq_f32(p.c[0], vdupq_n_f32(60.0f));
    const float32x4_t v = p.c[2];
    const float32x4_t c = vmulq_f32(v, p.c[1]);
    const float32x4_t m = vsubq_f32(v, c);
    const float32x4_t mid = vaddq_f32(m, vmulq_f32(fractionOf(h), c));
    const auto below = [&](float sector) { return vcltq_f32(h, vdupq_n_f32(sector)); };
    const float32x4_t b = vbslq_f32(below(2), m, vbslq_f32(below(3), mid, vbslq_f32(below(5), v, mid)));
    const float32x4_t g = vbslq_f32(below(1), mid, vbslq_f32(below(3), v, vbslq_f32(below(4), mid, m)));
    const float32x4_t r =
        vbslq_f32(below(1), v, vbslq_f32(below(2), mid, vbslq_f32(below(4), m, vbslq_f32(below(5), mid, v))));
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
