// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// Sixteen floats in registers, and what the engine's convolutions do with them. Each operation rounds
/// the same way on both architectures: lanes never meet, and a multiply-add rounds once.
#pragma once

#if defined(__ARM_NEON)
#include <arm_neon.h>
#else
#include <immintrin.h>
#endif

#include <cstddef>
#include <cstdint>
#include <type_traits>

namespace kyengine {

constexpr int kLanes = 16;

#if defined(__ARM_NEON)

struct Lanes {
  float32x4_t v[4];
};

inline Lanes Broadcast(float x) {
  const float32x4_t v = vdupq_n_f32(x);
  return {{v, v, v, v}};
}

inline Lanes Load(const float* p) {
  return {{vld1q_f32(p), vld1q_f32(p + 4), vld1q_f32(p + 8), vld1q_f32(p + 12)}};
}

inline void Store(const Lanes& a, float* p) {
  for (int i = 0; i < 4; ++i) {
    vst1q_f32(p + static_cast<ptrdiff_t>(4) * i, a.v[i]);
  }
}

/// Sixteen bytes less `zero`.
inline Lanes LoadBytes(const uint8_t* p, uint8_t zero) {
  const uint8x16_t bytes = vld1q_u8(p);
  const int16x8_t low = vreinterpretq_s16_u16(vsubl_u8(vget_low_u8(bytes), vdup_n_u8(zero)));
  const int16x8_t high = vreinterpretq_s16_u16(vsubl_high_u8(bytes, vdupq_n_u8(zero)));
  return {{vcvtq_f32_s32(vmovl_s16(vget_low_s16(low))), vcvtq_f32_s32(vmovl_high_s16(low)),
           vcvtq_f32_s32(vmovl_s16(vget_low_s16(high))), vcvtq_f32_s32(vmovl_high_s16(high))}};
}

template <typename Operation>
inline Lanes EachOf(const Lanes& a, const Lanes& b, Operation operation) {
  return {{operation(a.v[0], b.v[0]), operation(a.v[1], b.v[1]), operation(a.v[2], b.v[2]),
           operation(a.v[3], b.v[3])}};
}

inline Lanes Add(const Lanes& a, const Lanes& b) {
  return EachOf(a, b, [](float32x4_t x, float32x4_t y) { return vaddq_f32(x, y); });
}
inline Lanes Subtract(const Lanes& a, const Lanes& b) {
  return EachOf(a, b, [](float32x4_t x, float32x4_t y) { return vsubq_f32(x, y); });
}
inline Lanes Multiply(const Lanes& a, const Lanes& b) {
  return EachOf(a, b, [](float32x4_t x, float32x4_t y) { return vmulq_f32(x, y); });
}
inline Lanes Max(const Lanes& a, const Lanes& b) {
  return EachOf(a, b, [](float32x4_t x, float32x4_t y) { return vmaxq_f32(x, y); });
}

/// sum + a b, rounded once.
inline Lanes MultiplyAdd(const Lanes& sum, const Lanes& a, const Lanes& b) {
  return {{vfmaq_f32(sum.v[0], a.v[0], b.v[0]), vfmaq_f32(sum.v[1], a.v[1], b.v[1]),
           vfmaq_f32(sum.v[2], a.v[2], b.v[2]), vfmaq_f32(sum.v[3], a.v[3], b.v[3])}};
}

/// sum - a b, rounded once.
inline Lanes MultiplySubtract(const Lanes& sum, const Lanes& a, const Lanes& b) {
  return {{vfmsq_f32(sum.v[0], a.v[0], b.v[0]), vfmsq_f32(sum.v[1], a.v[1], b.v[1]),
           vfmsq_f32(sum.v[2], a.v[2], b.v[2]), vfmsq_f32(sum.v[3], a.v[3], b.v[3])}};
}

#else

struct Lanes {
  __m256 v[2];
};

inline Lanes Broadcast(float x) {
  const __m256 v = _mm256_set1_ps(x);
  return {{v, v}};
}

inline Lanes Load(const float* p) { return {{_mm256_loadu_ps(p), _mm256_loadu_ps(p + 8)}}; }

inline void Store(const Lanes& a, float* p) {
  _mm256_storeu_ps(p, a.v[0]);
  _mm256_storeu_ps(p + 8, a.v[1]);
}

inline Lanes LoadBytes(const uint8_t* p, uint8_t zero) {
  const __m128i bytes = _mm_loadu_si128(reinterpret_cast<const __m128i*>(p));
  const __m256i zeros = _mm256_set1_epi32(zero);
  const auto numbers = [zeros](__m128i eight) {
    return _mm256_cvtepi32_ps(_mm256_sub_epi32(_mm256_cvtepu8_epi32(eight), zeros));
  };
  return {{numbers(bytes), numbers(_mm_unpackhi_epi64(bytes, bytes))}};
}

inline Lanes Add(const Lanes& a, const Lanes& b) {
  return {{_mm256_add_ps(a.v[0], b.v[0]), _mm256_add_ps(a.v[1], b.v[1])}};
}
inline Lanes Subtract(const Lanes& a, const Lanes& b) {
  return {{_mm256_sub_ps(a.v[0], b.v[0]), _mm256_sub_ps(a.v[1], b.v[1])}};
}
inline Lanes Multiply(const Lanes& a, const Lanes& b) {
  return {{_mm256_mul_ps(a.v[0], b.v[0]), _mm256_mul_ps(a.v[1], b.v[1])}};
}
inline Lanes Max(const Lanes& a, const Lanes& b) {
  return {{_mm256_max_ps(a.v[0], b.v[0]), _mm256_max_ps(a.v[1], b.v[1])}};
}

inline Lanes MultiplyAdd(const Lanes& sum, const Lanes& a, const Lanes& b) {
  return {{_mm256_fmadd_ps(a.v[0], b.v[0], sum.v[0]), _mm256_fmadd_ps(a.v[1], b.v[1], sum.v[1])}};
}

inline Lanes MultiplySubtract(const Lanes& sum, const Lanes& a, const Lanes& b) {
  return {{_mm256_fnmadd_ps(a.v[0], b.v[0], sum.v[0]), _mm256_fnmadd_ps(a.v[1], b.v[1], sum.v[1])}};
}

#endif

/// sums[i] += weights x[i][at] for the sixteen weights at `weights`.
template <int count>
inline void AddProducts(Lanes (&sums)[count], const float* weights, const float* const (&x)[count],
                        ptrdiff_t at) {
  const Lanes w = Load(weights);
#pragma GCC unroll 8
  for (int i = 0; i < count; ++i) {
    sums[i] = MultiplyAdd(sums[i], w, Broadcast(x[i][at]));
  }
}

/// The same of four consecutive `at`, each with its sixteen weights, one after the other.
template <int count>
inline void AddFourProducts(Lanes (&sums)[count], const float* weights, const float* const (&x)[count]) {
#if defined(__ARM_NEON)
  // The four numbers of a pixel come with one load and are multiplied from their lanes.
  float32x4_t four[count];
#pragma GCC unroll 8
  for (int i = 0; i < count; ++i) {
    four[i] = vld1q_f32(x[i]);
  }
  const auto add = [&]<int lane>(std::integral_constant<int, lane>) {
    const Lanes w = Load(weights + static_cast<ptrdiff_t>(kLanes) * lane);
#pragma GCC unroll 8
    for (int i = 0; i < count; ++i) {
#pragma GCC unroll 4
      for (int k = 0; k < 4; ++k) {
        sums[i].v[k] = vfmaq_laneq_f32(sums[i].v[k], w.v[k], four[i], lane);
      }
    }
  };
  add(std::integral_constant<int, 0>());
  add(std::integral_constant<int, 1>());
  add(std::integral_constant<int, 2>());
  add(std::integral_constant<int, 3>());
#else
#pragma GCC unroll 4
  for (int k = 0; k < 4; ++k) {
    AddProducts(sums, weights + static_cast<ptrdiff_t>(kLanes) * k, x, k);
  }
#endif
}

}  // namespace kyengine
