/// The NEON intrinsics: the compiler's own on Arm, SIMDe's on x86-64, some of them in a better form. Kernels
/// include nothing else for them.
#pragma once

#if defined(__ARM_NEON)
#include <arm_neon.h>
#else
#define SIMDE_ENABLE_NATIVE_ALIASES
#include <simde/arm/neon.h>
#include "neon_x86.h"
#ifndef vdivq_f32
inline float32x4_t vdivq_f32(float32x4_t a, float32x4_t b) { return a / b; }
#endif
#ifndef vfmsq_f32
inline float32x4_t vfmsq_f32(float32x4_t a, float32x4_t b, float32x4_t c) { return vfmaq_f32(a, -b, c); }
#endif
#endif

namespace HPC::fastcv::arm {

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

}  // namespace HPC::fastcv::arm
