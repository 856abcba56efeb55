// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// powf(t, 0.33333334f), the cube root of the float way to Lab, a register at a time.
#pragma once

#include <bit>
#include <cmath>
#include <cstddef>
#include <cstdint>

#include "simd/vector.h"

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

/// The roots of a register of t > 0, to less than 1/1000 of a float's last place: a float and what it lacks.
/// Where rounding is clear enough, the float is that of powf, which errs by little more than the half place
/// of its own rounding (by 0.5017 with the math libraries of both this project's platforms). Elsewhere, in
/// one lane of 256, powf has to be asked. A t of 0, below 0 or NaN gives a meaningless root.
class Roots {
 public:
  Roots(Floats t, const RootFactors& factors) : t_(t) {
    const auto bits = std::bit_cast<SignedWords>(t);
    // z, minus the inverse of the root, off by up to 3.3 %: from minus a third of the bits, exponent and
    // mantissa.
    const auto z = std::bit_cast<Floats>(splat<SignedWords>(kMinusRootOfOne) - doubledHigh(bits, kThird));
    // With e = 1 + t z^3 it is z (1 - e)^(-1/3).
    const Floats e = multiplyAdd(factors.units.at<1>(), t * z, z * z);
    Floats series = multiplyAdd(factors.series.at<1>(), e, factors.series.at<2>());
    series = multiplyAdd(factors.series.at<0>(), e, series);
    const Floats inverse = multiplyAdd(z, z * e, series);
    // The root y = t * inverse^2 is off by 2 d, some 1/30000, where the inverse is by d. t - y^3, its square
    // in two parts so that nothing of it is lost, and minus the inverse of t give e = -6 d - 33 d^2. The root
    // is y (1 + d)^-2, and with the exponent's t^more = 1 + more * ln t: y (1 + e / 3 + 7 e^2 / 18 + more).
    const Floats squared = inverse * inverse;
    const Floats y = t * squared;
    const Floats square = y * y;
    const Floats beyond = multiplySubtract(square, y, y);
    const Floats residual = multiplyAdd(multiplySubtract(t, square, y), beyond, y);
    const Floats minusError = residual * (squared * inverse);
    const Floats slope = multiplySubtract(factors.series.at<0>(), minusError, factors.series.at<3>());
    const Floats lacking = y * multiplySubtract(moreOf(bits, factors), minusError, slope);
    rounded_ = y + lacking;
    const Floats lost = lacking - (rounded_ - y);
    const auto exponent = std::bit_cast<Floats>(std::bit_cast<Words>(rounded_) & splat<Words>(0x7f800000));
    clear_ = exceeds(exponent * factors.units.at<2>(), lost);
  }

  /// Lanes of ones where the rounding is clear: further than 1/512 of a place from the middle.
  Words clear() const { return clear_; }

  /// The roots, rounded.
  Floats rounded() const { return rounded_; }

  /// The same with powf where the rounding is not clear.
  Floats settled() const {
    Floats roots = rounded_;
    for (size_t i = 0; i < sizeof(Floats) / sizeof(float); ++i) {
      if (clear_[i] == 0) {
        roots[i] = std::pow(t_[i], 0.33333334f);
      }
    }
    return roots;
  }

 private:
  // A third, for a doubling multiplication of which the high half is taken.
  static constexpr int32_t kThird = 0x2aaaaaab;
  // Makes the largest error of z, on both sides, as small as it can be.
  static constexpr auto kMinusRootOfOne = static_cast<int32_t>(0xd4a1f400);

  static Floats moreOf(SignedWords bits, const RootFactors& factors) {
    const Floats m = mixedBits(splat<Words>(0x7fffff), std::bit_cast<Floats>(bits), factors.units.at<1>());
    Floats more = multiplyAdd(factors.log2.at<2>(), m, factors.log2.at<3>());
    more = multiplyAdd(factors.log2.at<1>(), m, more);
    more = multiplyAdd(factors.log2.at<0>(), m, more);
    return multiplyAdd(more, floatsOf(bits), factors.units.at<0>());
  }

  Floats t_;
  Floats rounded_;
  Words clear_;
};

}  // namespace HPC::fastcv::arm
