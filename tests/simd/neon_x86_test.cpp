// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// Every intrinsic that neon_x86.h takes over, against SIMDe's own; against a plain loop where SIMDe has none.

#include <gtest/gtest.h>

#include <array>
#include <cmath>
#include <cstring>
#include <random>
#include <type_traits>

#include "simd/neon.h"

namespace {

using HPC::fastcv::arm::roundingShiftToBytes;

constexpr int kTimes = 20000;

template <typename V>
using Element = std::remove_cvref_t<decltype(std::declval<V&>()[0])>;

std::mt19937 generator(1);

template <typename V>
V randomBits() {
  std::array<uint32_t, sizeof(V) / sizeof(uint32_t)> words;
  for (uint32_t& word : words) {
    word = static_cast<uint32_t>(generator());
  }
  V v;
  std::memcpy(&v, words.data(), sizeof(v));
  return v;
}

// A random vector; half of the time with lanes at the ends of their range, where things saturate and round.
template <typename V>
V random() {
  auto v = randomBits<V>();
  if constexpr (std::is_integral_v<Element<V>>) {
    if (generator() % 2 == 0) {
      constexpr int kHalf = 4 * sizeof(Element<V>);
      for (size_t i = 0; i < sizeof(V) / sizeof(Element<V>); ++i) {
        v[i] = static_cast<Element<V>>((v[i] >> kHalf) ^ (generator() % 2 << (2 * kHalf - 1)));
      }
    }
  }
  return v;
}

template <typename V>
std::array<uint8_t, sizeof(V)> bytes(const V& v) {
  std::array<uint8_t, sizeof(V)> result;
  std::memcpy(result.data(), &v, sizeof(v));
  return result;
}

// Memory around what is loaded or stored, to see what else is touched.
constexpr size_t kMemory = 128;
using Memory = std::array<uint8_t, kMemory>;
static_assert(sizeof(float32x4x4_t) <= kMemory);

#define EXPECT_SAME(ours, theirs) ASSERT_EQ(bytes(ours), bytes(theirs)) << #ours

#define LOAD(name, T)                                         \
  TEST(Loads, name) {                                         \
    for (int i = 0; i < kTimes; ++i) {                        \
      alignas(64) const auto memory = randomBits<Memory>();   \
      const T* p = reinterpret_cast<const T*>(memory.data()); \
      EXPECT_SAME(name(p), simde_##name(p));                  \
    }                                                         \
  }

#define STORE(name, T, Vectors)                             \
  TEST(Stores, name) {                                      \
    for (int i = 0; i < kTimes; ++i) {                      \
      alignas(64) auto ours = randomBits<Memory>();         \
      alignas(64) Memory theirs = ours;                     \
      const auto v = randomBits<Vectors>();                 \
      name(reinterpret_cast<T*>(ours.data()), v);           \
      simde_##name(reinterpret_cast<T*>(theirs.data()), v); \
      ASSERT_EQ(ours, theirs);                              \
    }                                                       \
  }

LOAD(vld2_u8, uint8_t)
LOAD(vld2q_u8, uint8_t)
LOAD(vld3_u8, uint8_t)
LOAD(vld3q_u8, uint8_t)
LOAD(vld3q_f32, float)
LOAD(vld4_u8, uint8_t)
LOAD(vld4q_u8, uint8_t)
LOAD(vld4q_f32, float)
LOAD(vld1q_u8_x2, uint8_t)
LOAD(vld1q_u8_x3, uint8_t)
LOAD(vld1q_u8_x4, uint8_t)
LOAD(vld1q_f32_x2, float)
LOAD(vld1q_f32_x3, float)
LOAD(vld1q_f32_x4, float)
STORE(vst2_u8, uint8_t, uint8x8x2_t)
STORE(vst2q_u8, uint8_t, uint8x16x2_t)
STORE(vst3_u8, uint8_t, uint8x8x3_t)
STORE(vst3q_u8, uint8_t, uint8x16x3_t)
STORE(vst3q_f32, float, float32x4x3_t)
STORE(vst4_u8, uint8_t, uint8x8x4_t)
STORE(vst4q_u8, uint8_t, uint8x16x4_t)
STORE(vst4q_f32, float, float32x4x4_t)

// SIMDe has no stores of registers one after the other; in memory they are as in the structure.
#define STORE_ROW(name, T, Vectors)               \
  TEST(Stores, name) {                            \
    alignas(64) auto ours = randomBits<Memory>(); \
    Memory expected = ours;                       \
    const auto v = randomBits<Vectors>();         \
    name(reinterpret_cast<T*>(ours.data()), v);   \
    std::memcpy(expected.data(), &v, sizeof(v));  \
    EXPECT_EQ(ours, expected);                    \
  }

STORE_ROW(vst1q_u8_x2, uint8_t, uint8x16x2_t)
STORE_ROW(vst1q_u8_x3, uint8_t, uint8x16x3_t)
STORE_ROW(vst1q_u8_x4, uint8_t, uint8x16x4_t)
STORE_ROW(vst1q_f32_x2, float, float32x4x2_t)
STORE_ROW(vst1q_f32_x3, float, float32x4x3_t)
STORE_ROW(vst1q_f32_x4, float, float32x4x4_t)

// SIMDe's own stores of a lane want an aligned address.
#define STORE_LANE(name, T, Vectors, lane)                                      \
  TEST(Stores, name##_##lane) {                                                 \
    alignas(64) auto ours = randomBits<Memory>();                               \
    alignas(64) Memory theirs = ours;                                           \
    const auto v = randomBits<Vectors>();                                       \
    name(reinterpret_cast<T*>(ours.data() + 1), v, lane);                       \
    std::memmove(theirs.data(), theirs.data() + 1, theirs.size() - 1);          \
    simde_##name(reinterpret_cast<T*>(theirs.data()), v, lane);                 \
    EXPECT_EQ(0, std::memcmp(ours.data() + 1, theirs.data(), ours.size() - 1)); \
  }

STORE_LANE(vst2q_lane_u64, uint64_t, uint64x2x2_t, 0)
STORE_LANE(vst2q_lane_u64, uint64_t, uint64x2x2_t, 1)
STORE_LANE(vst3q_lane_u32, uint32_t, uint32x4x3_t, 0)
STORE_LANE(vst3q_lane_u32, uint32_t, uint32x4x3_t, 3)

#define WIDENING(t, V, H, W)                                               \
  TEST(Widening, t) {                                                      \
    for (int i = 0; i < kTimes; ++i) {                                     \
      const auto c = random<W>();                                          \
      const auto a = random<H>();                                          \
      const auto b = random<H>();                                          \
      const auto p = random<V>();                                          \
      const auto q = random<V>();                                          \
      EXPECT_SAME(vmovl_##t(a), simde_vmovl_##t(a));                       \
      EXPECT_SAME(vshll_n_##t(a, 3), simde_vshll_n_##t(a, 3));             \
      EXPECT_SAME(vcombine_##t(a, b), simde_vcombine_##t(a, b));           \
      EXPECT_SAME(vget_high_##t(p), simde_vget_high_##t(p));               \
      EXPECT_SAME(vmull_##t(a, b), simde_vmull_##t(a, b));                 \
      EXPECT_SAME(vmlal_##t(c, a, b), simde_vmlal_##t(c, a, b));           \
      EXPECT_SAME(vmlsl_##t(c, a, b), simde_vmlsl_##t(c, a, b));           \
      EXPECT_SAME(vaddl_##t(a, b), simde_vaddl_##t(a, b));                 \
      EXPECT_SAME(vsubl_##t(a, b), simde_vsubl_##t(a, b));                 \
      EXPECT_SAME(vaddw_##t(c, a), simde_vaddw_##t(c, a));                 \
      EXPECT_SAME(vsubw_##t(c, a), simde_vsubw_##t(c, a));                 \
      EXPECT_SAME(vmovl_high_##t(p), simde_vmovl_high_##t(p));             \
      EXPECT_SAME(vmull_high_##t(p, q), simde_vmull_high_##t(p, q));       \
      EXPECT_SAME(vmlal_high_##t(c, p, q), simde_vmlal_high_##t(c, p, q)); \
      EXPECT_SAME(vmlsl_high_##t(c, p, q), simde_vmlsl_high_##t(c, p, q)); \
      EXPECT_SAME(vaddl_high_##t(p, q), simde_vaddl_high_##t(p, q));       \
      EXPECT_SAME(vsubl_high_##t(p, q), simde_vsubl_high_##t(p, q));       \
      EXPECT_SAME(vaddw_high_##t(c, p), simde_vaddw_high_##t(c, p));       \
      EXPECT_SAME(vsubw_high_##t(c, p), simde_vsubw_high_##t(c, p));       \
    }                                                                      \
  }

WIDENING(u8, uint8x16_t, uint8x8_t, uint16x8_t)
WIDENING(s8, int8x16_t, int8x8_t, int16x8_t)
WIDENING(u16, uint16x8_t, uint16x4_t, uint32x4_t)
WIDENING(s16, int16x8_t, int16x4_t, int32x4_t)

#define WIDENING_BY_SCALAR(t, V, H, W)                                                         \
  TEST(Widening, ByScalar_##t) {                                                               \
    for (int i = 0; i < kTimes; ++i) {                                                         \
      const auto c = random<W>();                                                              \
      const auto a = random<H>();                                                              \
      const auto p = random<V>();                                                              \
      const auto b = random<H>()[0];                                                           \
      EXPECT_SAME(vmull_n_##t(a, b), simde_vmull_n_##t(a, b));                                 \
      EXPECT_SAME(vmlal_n_##t(c, a, b), simde_vmlal_n_##t(c, a, b));                           \
      EXPECT_SAME(vmlsl_n_##t(c, a, b), simde_vmlsl_n_##t(c, a, b));                           \
      EXPECT_SAME(vmull_high_n_##t(p, b), simde_vmull_n_##t(simde_vget_high_##t(p), b));       \
      EXPECT_SAME(vmlal_high_n_##t(c, p, b), simde_vmlal_n_##t(c, simde_vget_high_##t(p), b)); \
    }                                                                                          \
  }

WIDENING_BY_SCALAR(u16, uint16x8_t, uint16x4_t, uint32x4_t)
WIDENING_BY_SCALAR(s16, int16x8_t, int16x4_t, int32x4_t)

TEST(Products, Doubled) {
  for (int i = 0; i < kTimes; ++i) {
    auto a = random<int16x8_t>();
    auto b = random<int16x8_t>();
    // The one product that is limited.
    a[i % 8] = b[i % 8] = INT16_MIN;
    EXPECT_SAME(vqdmulhq_s16(a, b), simde_vqdmulhq_s16(a, b));
    EXPECT_SAME(vqdmulhq_n_s16(a, b[0]), simde_vqdmulhq_n_s16(a, b[0]));
  }
}

#define PRODUCTS(t, V)                                               \
  TEST(Products, t) {                                                \
    for (int i = 0; i < kTimes; ++i) {                               \
      const auto c = random<V>();                                    \
      const auto a = random<V>();                                    \
      const auto b = random<V>()[0];                                 \
      EXPECT_SAME(vmulq_n_##t(a, b), simde_vmulq_n_##t(a, b));       \
      EXPECT_SAME(vmlaq_n_##t(c, a, b), simde_vmlaq_n_##t(c, a, b)); \
    }                                                                \
  }

PRODUCTS(u16, uint16x8_t)
PRODUCTS(s16, int16x8_t)

// The functions of neon.h that narrow two vectors into one, of lanes whose results are about a byte.
#define NARROWING_PAIRS(t, V, narrow, n)                                                         \
  TEST(NarrowingPairs, t##_by_##n) {                                                             \
    forEachVector<V>([](V wide) {                                                                \
      const V a = wide >> (8 - n);                                                               \
      const V b = random<V>() >> (8 - n);                                                        \
      EXPECT_SAME(roundingShiftToBytes<n>(a, b), simde_vcombine_u8(narrow(a, n), narrow(b, n))); \
    });                                                                                          \
  }

// Vectors to narrow: with 16-bit lanes every value that there is, with wider ones random ones.
template <typename V, typename F>
void forEachVector(const F& f) {
  constexpr int kLanes = 16 / sizeof(Element<V>);
  constexpr int kValues = 1 << 16;
  for (int i = 0; i < kValues; i += kLanes) {
    auto v = random<V>();
    if (sizeof(Element<V>) == 2) {
      for (int lane = 0; lane < kLanes; ++lane) {
        v[lane] = static_cast<Element<V>>(i + lane);
      }
    }
    f(v);
  }
}

// A lane-by-lane function, for what SIMDe lacks.
template <typename H, typename V, typename F>
H lanewise(V a, V b, const F& f) {
  H result;
  for (size_t i = 0; i < sizeof(V) / sizeof(Element<V>); ++i) {
    result[i] = static_cast<Element<H>>(f(static_cast<int64_t>(a[i]), static_cast<int64_t>(b[i])));
  }
  return result;
}

// ours and its "high" form, of a type t, against what it should be.
#define EXPECT_NARROWED(ours, oursHigh, joined, expected) \
  EXPECT_SAME(ours, expected);                            \
  EXPECT_SAME(oursHigh, joined(low, expected))

#define NARROWING(t, V, H, bits, n_)                                                                        \
  TEST(Narrowing, t) {                                                                                      \
    constexpr int64_t kHalf = int64_t{1} << (bits / 2 - 1);                                                 \
    forEachVector<V>([](V a) {                                                                              \
      const auto b = random<V>();                                                                           \
      const auto low = random<H>();                                                                         \
      EXPECT_NARROWED(vmovn_##t(a), vmovn_high_##t(low, a), vcombine_##n_, simde_vmovn_##t(a));             \
      EXPECT_NARROWED(vqmovn_##t(a), vqmovn_high_##t(low, a), vcombine_##n_, simde_vqmovn_##t(a));          \
      EXPECT_NARROWED(vaddhn_##t(a, b), vaddhn_high_##t(low, a, b), vcombine_##n_, simde_vaddhn_##t(a, b)); \
      EXPECT_NARROWED(vsubhn_##t(a, b), vsubhn_high_##t(low, a, b), vcombine_##n_, simde_vsubhn_##t(a, b)); \
      const H sums = lanewise<H>(a, b, [](int64_t x, int64_t y) { return (x + y + kHalf) >> (bits / 2); }); \
      EXPECT_NARROWED(vraddhn_##t(a, b), vraddhn_high_##t(low, a, b), vcombine_##n_, sums);                 \
      const H differences =                                                                                 \
          lanewise<H>(a, b, [](int64_t x, int64_t y) { return (x - y + kHalf) >> (bits / 2); });            \
      EXPECT_NARROWED(vrsubhn_##t(a, b), vrsubhn_high_##t(low, a, b), vcombine_##n_, differences);          \
    });                                                                                                     \
  }

NARROWING(u16, uint16x8_t, uint8x8_t, 16, u8)
NARROWING(s16, int16x8_t, int8x8_t, 16, s8)
NARROWING(u32, uint32x4_t, uint16x4_t, 32, u16)
NARROWING(s32, int32x4_t, int16x4_t, 32, s16)

// The shifts by `n` of a vector; `n` is from 1 to half the lanes' width.
#define EXPECT_SHIFTS(t, n, narrow)                                                      \
  EXPECT_NARROWED(vshrn_n_##t(a, n), vshrn_high_n_##t(low, a, n), vcombine_##narrow,     \
                  simde_vshrn_n_##t(a, n));                                              \
  EXPECT_NARROWED(vrshrn_n_##t(a, n), vrshrn_high_n_##t(low, a, n), vcombine_##narrow,   \
                  simde_vrshrn_n_##t(a, n));                                             \
  EXPECT_NARROWED(vqshrn_n_##t(a, n), vqshrn_high_n_##t(low, a, n), vcombine_##narrow,   \
                  simde_vqshrn_n_##t(a, n));                                             \
  EXPECT_NARROWED(vqrshrn_n_##t(a, n), vqrshrn_high_n_##t(low, a, n), vcombine_##narrow, \
                  simde_vqrshrn_n_##t(a, n))

#define NARROWING_SHIFTS(t, V, H, narrow, n) \
  TEST(NarrowingShifts, t##_by_##n) {        \
    forEachVector<V>([](V a) {               \
      const auto low = random<H>();          \
      EXPECT_SHIFTS(t, n, narrow);           \
    });                                      \
  }

#define NARROWING_SHIFTS_TO_UNSIGNED(t, V, H, narrow, n)                                                  \
  TEST(NarrowingShifts, t##_to_unsigned_by_##n) {                                                         \
    forEachVector<V>([](V a) {                                                                            \
      const auto low = random<H>();                                                                       \
      EXPECT_NARROWED(vqmovun_##t(a), vqmovun_high_##t(low, a), vcombine_##narrow, simde_vqmovun_##t(a)); \
      EXPECT_NARROWED(vqshrun_n_##t(a, n), vqshrun_high_n_##t(low, a, n), vcombine_##narrow,              \
                      simde_vqshrun_n_##t(a, n));                                                         \
      EXPECT_NARROWED(vqrshrun_n_##t(a, n), vqrshrun_high_n_##t(low, a, n), vcombine_##narrow,            \
                      simde_vqrshrun_n_##t(a, n));                                                        \
    });                                                                                                   \
  }

#define BY_1_TO_8(X, ...) \
  X(__VA_ARGS__, 1)       \
  X(__VA_ARGS__, 2)       \
  X(__VA_ARGS__, 3) X(__VA_ARGS__, 4) X(__VA_ARGS__, 5) X(__VA_ARGS__, 6) X(__VA_ARGS__, 7) X(__VA_ARGS__, 8)
#define BY_9_TO_15(X, ...) \
  X(__VA_ARGS__, 9)        \
  X(__VA_ARGS__, 10)       \
  X(__VA_ARGS__, 11) X(__VA_ARGS__, 12) X(__VA_ARGS__, 13) X(__VA_ARGS__, 14) X(__VA_ARGS__, 15)
#define BY_9_TO_16(X, ...) BY_9_TO_15(X, __VA_ARGS__) X(__VA_ARGS__, 16)

BY_1_TO_8(NARROWING_SHIFTS, u16, uint16x8_t, uint8x8_t, u8)
BY_1_TO_8(NARROWING_SHIFTS, s16, int16x8_t, int8x8_t, s8)
BY_1_TO_8(NARROWING_SHIFTS, u32, uint32x4_t, uint16x4_t, u16)
BY_9_TO_16(NARROWING_SHIFTS, u32, uint32x4_t, uint16x4_t, u16)
BY_1_TO_8(NARROWING_SHIFTS, s32, int32x4_t, int16x4_t, s16)
BY_9_TO_16(NARROWING_SHIFTS, s32, int32x4_t, int16x4_t, s16)
BY_1_TO_8(NARROWING_SHIFTS_TO_UNSIGNED, s16, int16x8_t, uint8x8_t, u8)
BY_1_TO_8(NARROWING_SHIFTS_TO_UNSIGNED, s32, int32x4_t, uint16x4_t, u16)
BY_9_TO_16(NARROWING_SHIFTS_TO_UNSIGNED, s32, int32x4_t, uint16x4_t, u16)

BY_1_TO_8(NARROWING_PAIRS, s16, int16x8_t, simde_vqrshrun_n_s16)
BY_1_TO_8(NARROWING_PAIRS, u16, uint16x8_t, simde_vqrshrn_n_u16)

#define ROUNDING_SHIFTS(t, V, n)                                       \
  TEST(RoundingShifts, t##_by_##n) {                                   \
    forEachVector<V>([](V a) {                                         \
      const auto c = random<V>();                                      \
      EXPECT_SAME(vrshrq_n_##t(a, n), simde_vrshrq_n_##t(a, n));       \
      EXPECT_SAME(vrsraq_n_##t(c, a, n), simde_vrsraq_n_##t(c, a, n)); \
    });                                                                \
  }

BY_1_TO_8(ROUNDING_SHIFTS, u8, uint8x16_t)
BY_1_TO_8(ROUNDING_SHIFTS, u16, uint16x8_t)
BY_9_TO_16(ROUNDING_SHIFTS, u16, uint16x8_t)
BY_1_TO_8(ROUNDING_SHIFTS, s16, int16x8_t)
BY_9_TO_15(ROUNDING_SHIFTS, s16, int16x8_t)
BY_1_TO_8(ROUNDING_SHIFTS, u32, uint32x4_t)
BY_9_TO_16(ROUNDING_SHIFTS, u32, uint32x4_t)
BY_1_TO_8(ROUNDING_SHIFTS, s32, int32x4_t)
BY_9_TO_16(ROUNDING_SHIFTS, s32, int32x4_t)

#define HALVES(t, V, H)                                          \
  TEST(Halves, t) {                                              \
    for (int i = 0; i < kTimes; ++i) {                           \
      const auto a = random<H>();                                \
      const auto b = random<H>();                                \
      const auto c = random<V>();                                \
      EXPECT_SAME(vcombine_##t(a, b), simde_vcombine_##t(a, b)); \
      EXPECT_SAME(vget_high_##t(c), simde_vget_high_##t(c));     \
    }                                                            \
  }

HALVES(u32, uint32x4_t, uint32x2_t)
HALVES(s32, int32x4_t, int32x2_t)

#define TRANSPOSES(t, V)                                     \
  TEST(Transposes, t) {                                      \
    for (int i = 0; i < kTimes; ++i) {                       \
      const auto a = random<V>();                            \
      const auto b = random<V>();                            \
      EXPECT_SAME(vtrn1q_##t(a, b), simde_vtrn1q_##t(a, b)); \
      EXPECT_SAME(vtrn2q_##t(a, b), simde_vtrn2q_##t(a, b)); \
    }                                                        \
  }

TRANSPOSES(u8, uint8x16_t)
TRANSPOSES(s8, int8x16_t)
TRANSPOSES(u16, uint16x8_t)
TRANSPOSES(s16, int16x8_t)
TRANSPOSES(u32, uint32x4_t)
TRANSPOSES(s32, int32x4_t)
TRANSPOSES(f32, float32x4_t)

// What neon.h has on every platform.

TEST(WeightedBytes, AreRoundedSums) {
  using HPC::fastcv::arm::weightedBytes;
  constexpr int kShift = 8;
  constexpr uint8_t kWeights[][3] = {{29, 150, 77}, {1, 0, 255}, {0, 0, 0}, {85, 86, 85}};
  for (int i = 0; i < kTimes; ++i) {
    const auto a = random<uint8x16_t>();
    const auto b = random<uint8x16_t>();
    const auto c = random<uint8x16_t>();
    for (const auto& w : kWeights) {
      const uint8x16_t sums = weightedBytes<kShift>(a, w[0], b, w[1], c, w[2]);
      for (int lane = 0; lane < 16; ++lane) {
        ASSERT_EQ(sums[lane], (a[lane] * w[0] + b[lane] * w[1] + c[lane] * w[2] + 128) >> kShift);
      }
    }
  }
}

TEST(Products, FusedAndSubtracted) {
  for (int i = 0; i < kTimes; ++i) {
    float32x4_t a, b, c;
    for (int lane = 0; lane < 4; ++lane) {
      a[lane] = static_cast<float>(generator()) - 0x1p31f;
      b[lane] = static_cast<float>(generator() >> 16) - 0x1p15f;
      c[lane] = static_cast<float>(generator() >> 16);
    }
    const float32x4_t difference = vfmsq_f32(a, b, c);
    for (int lane = 0; lane < 4; ++lane) {
      ASSERT_EQ(difference[lane], std::fma(-b[lane], c[lane], a[lane]));
    }
  }
}

}  // namespace
