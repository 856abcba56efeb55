// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// Constants that take no register each.
#pragma once

#include "simd/neon.h"

namespace HPC::fastcv::arm {

/// Hides how a vector was made. The compiler would make parts of it a second time where only those are used,
/// and constants one to a register.
template <typename V>
inline V opaque(V v) {
#if defined(__ARM_NEON)
  asm("" : "+w"(v));
#endif
  return v;
}

/// Four constants in one register: a multiplication by `at<i>()` takes its factor from lane i.
class Factors {
 public:
  Factors(float f0, float f1, float f2, float f3) {
    const float all[4] = {f0, f1, f2, f3};
    all_ = opaque(vld1q_f32(all));
  }

  template <int i>
  float32x4_t at() const {
    return vdupq_laneq_f32(all_, i);
  }

 private:
  float32x4_t all_;
};

}  // namespace HPC::fastcv::arm
