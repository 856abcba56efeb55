// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// The NEON intrinsics: the compiler's own on Arm, SIMDe's on x86-64, some of them in a better form. Kernels
/// include nothing else for them.
#pragma once

#if defined(__ARM_NEON)
#include <arm_neon.h>
#else
#define SIMDE_ENABLE_NATIVE_ALIASES
#include <simde/arm/neon.h>
#include "simd/neon_x86.h"
#ifndef vdivq_f32
inline float32x4_t vdivq_f32(float32x4_t a, float32x4_t b) { return a / b; }
#endif
#ifndef vfmsq_f32
inline float32x4_t vfmsq_f32(float32x4_t a, float32x4_t b, float32x4_t c) { return vfmaq_f32(a, -b, c); }
#endif
#endif

namespace HPC::fastcv::arm {

// Blocks of 16 bytes: all on Arm, on x86-64 those of the kernels that are still written in intrinsics.
inline void load(const unsigned char* p, uint8x16_t& v) { v = vld1q_u8(p); }
inline void load(const float* p, float32x4_t& v) { v = vld1q_f32(p); }
inline void store(unsigned char* p, uint8x16_t v) { vst1q_u8(p, v); }
inline void store(float* p, float32x4_t v) { vst1q_f32(p, v); }
inline void loadChannels(const unsigned char* p, uint8x16_t (&c)[3]) {
  const uint8x16x3_t v = vld3q_u8(p);
  c[0] = v.val[0], c[1] = v.val[1], c[2] = v.val[2];
}
inline void loadChannels(const unsigned char* p, uint8x16_t (&c)[4]) {
  const uint8x16x4_t v = vld4q_u8(p);
  c[0] = v.val[0], c[1] = v.val[1], c[2] = v.val[2], c[3] = v.val[3];
}
inline void loadChannels(const float* p, float32x4_t (&c)[3]) {
  const float32x4x3_t v = vld3q_f32(p);
  c[0] = v.val[0], c[1] = v.val[1], c[2] = v.val[2];
}
inline void loadChannels(const float* p, float32x4_t (&c)[4]) {
  const float32x4x4_t v = vld4q_f32(p);
  c[0] = v.val[0], c[1] = v.val[1], c[2] = v.val[2], c[3] = v.val[3];
}
inline void storeChannels(unsigned char* p, const uint8x16_t (&c)[3]) {
  const uint8x16x3_t v = {{c[0], c[1], c[2]}};
  vst3q_u8(p, v);
}
inline void storeChannels(unsigned char* p, const uint8x16_t (&c)[4]) {
  const uint8x16x4_t v = {{c[0], c[1], c[2], c[3]}};
  vst4q_u8(p, v);
}
inline void storeChannels(float* p, const float32x4_t (&c)[3]) {
  const float32x4x3_t v = {{c[0], c[1], c[2]}};
  vst3q_f32(p, v);
}
inline void storeChannels(float* p, const float32x4_t (&c)[4]) {
  const float32x4x4_t v = {{c[0], c[1], c[2], c[3]}};
  vst4q_f32(p, v);
}

/// Two vectors narrowed into one: (x + 2^(n-1)) >> n of each lane, limited to a byte.
template <int n>
inline uint8x16_t roundingShiftToBytes(int16x8_t low, int16x8_t high) {
#if defined(__ARM_NEON)
  return vqrshrun_high_n_s16(vqrshrun_n_s16(low, n), high, n);
#else
  return neon_x86::packedBytes(neon_x86::roundingShift<n>(low), neon_x86::roundingShift<n>(high));
#endif
}

/// The same of unsigned lanes whose results fit in a byte.
template <int n>
inline uint8x16_t roundingShiftToBytes(uint16x8_t low, uint16x8_t high) {
#if defined(__ARM_NEON)
  return vrshrn_high_n_u16(vrshrn_n_u16(low, n), high, n);
#else
  return neon_x86::packedBytes(neon_x86::roundingShift<n>(low), neon_x86::roundingShift<n>(high));
#endif
}

/// (a wa + b wb + c wc + 2^(n-1)) >> n of each lane, for weights whose sum is at most 2^8 and n of 8: whole
/// sums are 16-bit numbers.
template <int n>
inline uint8x16_t weightedBytes(uint8x16_t a, uint8_t wa, uint8x16_t b, uint8_t wb, uint8x16_t c,
                                uint8_t wc) {
#if defined(__ARM_NEON)
  uint16x8_t low = vmull_u8(vget_low_u8(a), vdup_n_u8(wa));
  uint16x8_t high = vmull_high_u8(a, vdupq_n_u8(wa));
  low = vmlal_u8(low, vget_low_u8(b), vdup_n_u8(wb));
  high = vmlal_high_u8(high, b, vdupq_n_u8(wb));
  low = vmlal_u8(low, vget_low_u8(c), vdup_n_u8(wc));
  high = vmlal_high_u8(high, c, vdupq_n_u8(wc));
  return roundingShiftToBytes<n>(low, high);
#else
  return neon_x86::weightedBytes<n>(a, wa, b, wb, c, wc);
#endif
}

}  // namespace HPC::fastcv::arm
