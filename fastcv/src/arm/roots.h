// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// powf(t, 0.33333334f), the cube root of the float way to Lab, four at a time.
#pragma once

#include <cmath>
#include <cstdint>

#include "simd/factors.h"
#include "simd/neon.h"

namespace HPC::fastcv::arm {

/// What Roots are computed with.
struct RootFactors {
  // The exponent of the root beyond a third, times ln 2.
  static constexpr auto kMore = static_cast<float>((0.33333334f - 1.0 / 3) * 0.6931471805599453);

  // (1 - e)^(-1/3) = 1 + e / 3 + 2 e^2 / 9 + 14 e^3 / 81 + ...
  Factors series{1.0f / 3, 2.0f / 9, 14.0f / 81, 7.0f / 18};
  // log2(m) - m of a mantissa m in [1, 2) within 0.0009, by powers of m, with the 127 of the exponent; times
  // kMore.
  Factors log2{(-1.1362321f - 127) * kMore, 2.0111622f * kMore, -1.0268049f * kMore, 0.15270029f * kMore};
  // A float's bits in units of its exponent, times kMore; one; and 255/256 of half a last place of 1.
  Factors units{0x1p-23f * kMore, 1.0f, 0x1p-24f * 255 / 256, 0};
};

/// The roots of four t > 0, to less than 1/1000 of a float's last place: a float and what it lacks. Where
/// rounding is clear enough, the float is that of powf, which errs by little more than the half place of its
/// own rounding (by 0.5017 with the math libraries of both this project's platforms). Elsewhere, in one lane
/// of 256, powf has to be asked. A t of 0, below 0 or NaN gives a meaningless root.
class Roots {
 public:
  Roots(float32x4_t t, const RootFactors& factors) : t_(t) {
    const int32x4_t bits = vreinterpretq_s32_f32(t);
    // z, minus the inverse of the root, off by up to 3.3 %: from minus a third of the bits, exponent and
    // mantissa.
    const int32x4_t thirds = vqdmulhq_n_s32(bits, kThird);
    const float32x4_t z = vreinterpretq_f32_s32(vsubq_s32(vdupq_n_s32(kMinusRootOfOne), thirds));
    // With e = 1 + t z^3 it is z (1 - e)^(-1/3).
    const float32x4_t e = vfmaq_f32(factors.units.at<1>(), vmulq_f32(t, z), vmulq_f32(z, z));
    float32x4_t series = vfmaq_f32(factors.series.at<1>(), e, factors.series.at<2>());
    series = vfmaq_f32(factors.series.at<0>(), e, series);
    const float32x4_t inverse = vfmaq_f32(z, vmulq_f32(z, e), series);
    // The root y = t * inverse^2 is off by 2 d, some 1/30000, where the inverse is by d. t - y^3, its square
    // in two parts so that nothing of it is lost, and minus the inverse of t give e = -6 d - 33 d^2. The root
    // is y (1 + d)^-2, and with the exponent's t^more = 1 + more * ln t: y (1 + e / 3 + 7 e^2 / 18 + more).
    const float32x4_t squared = vmulq_f32(inverse, inverse);
    const float32x4_t y = vmulq_f32(t, squared);
    const float32x4_t square = vmulq_f32(y, y);
    const float32x4_t beyond = vfmsq_f32(square, y, y);
    const float32x4_t rest = vfmaq_f32(vfmsq_f32(t, square, y), beyond, y);
    const float32x4_t minusError = vmulq_f32(rest, vmulq_f32(squared, inverse));
    const float32x4_t slope = vfmsq_f32(factors.series.at<0>(), minusError, factors.series.at<3>());
    const float32x4_t lacking = vmulq_f32(y, vfmsq_f32(moreOf(bits, factors), minusError, slope));
    rounded_ = vaddq_f32(y, lacking);
    const float32x4_t lost = vsubq_f32(lacking, vsubq_f32(rounded_, y));
    const uint32x4_t exponent = vandq_u32(vreinterpretq_u32_f32(rounded_), vdupq_n_u32(0x7f800000));
    clear_ = vcagtq_f32(vmulq_f32(vreinterpretq_f32_u32(exponent), factors.units.at<2>()), lost);
  }

  /// Lanes of ones where the rounding is clear: further than 1/512 of a place from the middle.
  uint32x4_t clear() const { return clear_; }

  /// The roots, rounded.
  float32x4_t rounded() const { return rounded_; }

  /// The same with powf where the rounding is not clear.
  float32x4_t settled() const {
    float t[4], roots[4];
    uint32_t clear[4];
    vst1q_f32(t, t_);
    vst1q_f32(roots, rounded_);
    vst1q_u32(clear, clear_);
    for (int i = 0; i < 4; ++i) {
      if (clear[i] == 0) {
        roots[i] = std::pow(t[i], 0.33333334f);
      }
    }
    return vld1q_f32(roots);
  }

 private:
  // A third, for a doubling multiplication of which the high half is taken.
  static constexpr int32_t kThird = 0x2aaaaaab;
  // Makes the largest error of z, on both sides, as small as it can be.
  static constexpr auto kMinusRootOfOne = static_cast<int32_t>(0xd4a1f400);

  static float32x4_t moreOf(int32x4_t bits, const RootFactors& factors) {
    const float32x4_t m =
        vbslq_f32(vdupq_n_u32(0x7fffff), vreinterpretq_f32_s32(bits), factors.units.at<1>());
    float32x4_t more = vfmaq_f32(factors.log2.at<2>(), m, factors.log2.at<3>());
    more = vfmaq_f32(factors.log2.at<1>(), m, more);
    more = vfmaq_f32(factors.log2.at<0>(), m, more);
    return vfmaq_f32(more, vcvtq_f32_s32(bits), factors.units.at<0>());
  }

  float32x4_t t_;
  float32x4_t rounded_;
  uint32x4_t clear_;
};

}  // namespace HPC::fastcv::arm
