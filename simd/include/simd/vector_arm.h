// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// The words of vector.h on Arm: one instruction each, or one for each of two registers.
#pragma once

#include <arm_neon.h>

#include <bit>
#include <cstddef>
#include <cstdint>

#include "simd/registers.h"

namespace HPC::fastcv::arm {

using Bytes = uint8x16_t;
using SignedBytes = int8x16_t;
using Halves = uint16x8_t;
using SignedHalves = int16x8_t;
using Words = uint32x4_t;
using SignedWords = int32x4_t;
using Floats = float32x4_t;
/// 16 bytes.
using Part = Bytes;

// ---- made, loaded and stored

inline Bytes load(const unsigned char* p) { return vld1q_u8(p); }
inline Floats load(const float* p) { return vld1q_f32(p); }
inline SignedHalves load(const short* p) { return vld1q_s16(p); }
inline Halves load(const unsigned short* p) { return vld1q_u16(p); }

inline void load(const unsigned char* p, Bytes& v) { v = vld1q_u8(p); }
inline void load(const float* p, Floats& v) { v = vld1q_f32(p); }
inline void store(unsigned char* p, Bytes v) { vst1q_u8(p, v); }
inline void store(float* p, Floats v) { vst1q_f32(p, v); }
inline void loadChannels(const unsigned char* p, Bytes (&c)[3]) {
  const uint8x16x3_t v = vld3q_u8(p);
  c[0] = v.val[0], c[1] = v.val[1], c[2] = v.val[2];
}
inline void loadChannels(const unsigned char* p, Bytes (&c)[4]) {
  const uint8x16x4_t v = vld4q_u8(p);
  c[0] = v.val[0], c[1] = v.val[1], c[2] = v.val[2], c[3] = v.val[3];
}
inline void loadChannels(const float* p, Floats (&c)[3]) {
  const float32x4x3_t v = vld3q_f32(p);
  c[0] = v.val[0], c[1] = v.val[1], c[2] = v.val[2];
}
inline void loadChannels(const float* p, Floats (&c)[4]) {
  const float32x4x4_t v = vld4q_f32(p);
  c[0] = v.val[0], c[1] = v.val[1], c[2] = v.val[2], c[3] = v.val[3];
}
inline void storeChannels(unsigned char* p, const Bytes (&c)[3]) {
  const uint8x16x3_t v = {{c[0], c[1], c[2]}};
  vst3q_u8(p, v);
}
inline void storeChannels(unsigned char* p, const Bytes (&c)[4]) {
  const uint8x16x4_t v = {{c[0], c[1], c[2], c[3]}};
  vst4q_u8(p, v);
}
inline void storeChannels(float* p, const Floats (&c)[3]) {
  const float32x4x3_t v = {{c[0], c[1], c[2]}};
  vst3q_f32(p, v);
}
inline void storeChannels(float* p, const Floats (&c)[4]) {
  const float32x4x4_t v = {{c[0], c[1], c[2], c[3]}};
  vst4q_f32(p, v);
}

/// Four registers as they lie in memory.
inline void loadRow(const unsigned char* p, Bytes (&v)[4]) {
  const uint8x16x4_t all = vld1q_u8_x4(p);
  v[0] = all.val[0], v[1] = all.val[1], v[2] = all.val[2], v[3] = all.val[3];
}
inline void loadRow(const float* p, Floats (&v)[4]) {
  const float32x4x4_t all = vld1q_f32_x4(p);
  v[0] = all.val[0], v[1] = all.val[1], v[2] = all.val[2], v[3] = all.val[3];
}
inline void storeRow(unsigned char* p, const Bytes (&v)[4]) {
  const uint8x16x4_t all = {{v[0], v[1], v[2], v[3]}};
  vst1q_u8_x4(p, all);
}
inline void storeRow(float* p, const Floats (&v)[4]) {
  const float32x4x4_t all = {{v[0], v[1], v[2], v[3]}};
  vst1q_f32_x4(p, all);
}

/// A block of which no part is apart.
inline void storeParts(unsigned char* p, ptrdiff_t /*apart*/, Bytes v) { store(p, v); }

/// Pixels of three channels that are all `v`.
inline void storeThrice(unsigned char* p, Bytes v) { storeChannels(p, {v, v, v}); }
inline void storeThrice(float* p, Floats v) { storeChannels(p, {v, v, v}); }

/// The channels of half a block, in both halves of their registers; and the first half stored.
inline void loadHalfChannels(const unsigned char* p, Bytes (&c)[3]) {
  const uint8x8x3_t v = vld3_u8(p);
  c[0] = vcombine_u8(v.val[0], v.val[0]), c[1] = vcombine_u8(v.val[1], v.val[1]);
  c[2] = vcombine_u8(v.val[2], v.val[2]);
}
inline void loadHalfChannels(const unsigned char* p, Bytes (&c)[4]) {
  const uint8x8x4_t v = vld4_u8(p);
  c[0] = vcombine_u8(v.val[0], v.val[0]), c[1] = vcombine_u8(v.val[1], v.val[1]);
  c[2] = vcombine_u8(v.val[2], v.val[2]), c[3] = vcombine_u8(v.val[3], v.val[3]);
}
inline void storeHalfChannels(unsigned char* p, const Bytes (&c)[3]) {
  const uint8x8x3_t v = {{vget_low_u8(c[0]), vget_low_u8(c[1]), vget_low_u8(c[2])}};
  vst3_u8(p, v);
}
inline void storeHalfChannels(unsigned char* p, const Bytes (&c)[4]) {
  const uint8x8x4_t v = {{vget_low_u8(c[0]), vget_low_u8(c[1]), vget_low_u8(c[2]), vget_low_u8(c[3])}};
  vst4_u8(p, v);
}

// ---- lanes

inline Bytes min(Bytes a, Bytes b) { return vminq_u8(a, b); }
inline Bytes max(Bytes a, Bytes b) { return vmaxq_u8(a, b); }
/// Of a NaN in `a` these make one.
inline Floats min(Floats a, Floats b) { return vminq_f32(a, b); }
inline Floats max(Floats a, Floats b) { return vmaxq_f32(a, b); }

/// `a` where the mask is set, `b` elsewhere.
template <typename Mask>
inline Bytes select(Mask mask, Bytes a, Bytes b) {
  return vbslq_u8((Bytes)mask, a, b);
}
template <typename Mask>
inline Floats select(Mask mask, Floats a, Floats b) {
  return vbslq_f32((Words)mask, a, b);
}

inline Bytes addSaturated(Bytes a, Bytes b) { return vqaddq_u8(a, b); }
inline Bytes subtractSaturated(Bytes a, Bytes b) { return vqsubq_u8(a, b); }

/// c + a b, rounded once.
inline Floats multiplyAdd(Floats c, Floats a, Floats b) { return vfmaq_f32(c, a, b); }
/// |a - b|
inline Floats distance(Floats a, Floats b) { return vabdq_f32(a, b); }

/// Bytes of each 16 of a block, by the 16 places in `order`.
inline Bytes shuffled(Bytes v, const unsigned char (&order)[16]) { return vqtbl1q_u8(v, vld1q_u8(order)); }

/// Bytes, or pixels of `bytes` bytes, in reverse order.
template <typename V, int bytes = 1>
inline V reversed(V v) {
  if constexpr (bytes == 16) {
    return v;
  } else {
    struct Order {
      unsigned char at[16];
      constexpr Order() : at() {
        for (int i = 0; i < 16; ++i) {
          at[i] = static_cast<unsigned char>(16 - bytes - i / bytes * bytes + i % bytes);
        }
      }
    };
    static constexpr Order kOrder;
    return shuffled(v, kOrder.at);
  }
}

// ---- widening

inline Two<Halves> widen(Bytes a) { return {vmovl_u8(vget_low_u8(a)), vmovl_high_u8(a)}; }
template <int n>
inline Two<Halves> widenShifted(Bytes a) {
  return {vshll_n_u8(vget_low_u8(a), n), vshll_high_n_u8(a, n)};
}
template <int n>
inline Two<SignedHalves> widenShifted(SignedBytes a) {
  return {vshll_n_s8(vget_low_s8(a), n), vshll_high_n_s8(a, n)};
}
inline Two<SignedHalves> difference(Bytes a, Bytes b) {
  return {vreinterpretq_s16_u16(vsubl_u8(vget_low_u8(a), vget_low_u8(b))),
          vreinterpretq_s16_u16(vsubl_high_u8(a, b))};
}
inline Two<Halves> add(const Two<Halves>& a, Bytes b) {
  return {vaddw_u8(a.low, vget_low_u8(b)), vaddw_high_u8(a.high, b)};
}
inline Two<SignedHalves> add(const Two<SignedHalves>& a, Bytes b) {
  return {vreinterpretq_s16_u16(vaddw_u8(vreinterpretq_u16_s16(a.low), vget_low_u8(b))),
          vreinterpretq_s16_u16(vaddw_high_u8(vreinterpretq_u16_s16(a.high), b))};
}

// One register holds a weight, for both halves.
inline Two<Halves> multiply(Bytes a, unsigned char weight) {
  const Bytes w = vdupq_n_u8(weight);
  return {vmull_u8(vget_low_u8(a), vget_low_u8(w)), vmull_high_u8(a, w)};
}
inline Two<Halves> multiplyAdd(const Two<Halves>& sum, Bytes a, unsigned char weight) {
  const Bytes w = vdupq_n_u8(weight);
  return {vmlal_u8(sum.low, vget_low_u8(a), vget_low_u8(w)), vmlal_high_u8(sum.high, a, w)};
}
inline Two<SignedHalves> multiply(SignedBytes a, signed char weight) {
  const SignedBytes w = vdupq_n_s8(weight);
  return {vmull_s8(vget_low_s8(a), vget_low_s8(w)), vmull_high_s8(a, w)};
}
inline Two<SignedHalves> multiplyAdd(const Two<SignedHalves>& sum, SignedBytes a, signed char weight) {
  const SignedBytes w = vdupq_n_s8(weight);
  return {vmlal_s8(sum.low, vget_low_s8(a), vget_low_s8(w)), vmlal_high_s8(sum.high, a, w)};
}

// ---- in 16 bits

inline Two<SignedHalves> asSigned(const Two<Halves>& a) {
  return {vreinterpretq_s16_u16(a.low), vreinterpretq_s16_u16(a.high)};
}
/// (2 a weight + 2^15) >> 16
inline Two<SignedHalves> multiplyRounded(const Two<SignedHalves>& a, int16_t weight) {
  return {vqrdmulhq_n_s16(a.low, weight), vqrdmulhq_n_s16(a.high, weight)};
}

/// The sum, and those of neighbouring lanes.
inline Halves addPairs(Halves sum, Bytes a) { return vpadalq_u8(sum, a); }
inline Words addPairs(Words sum, Halves a) { return vpadalq_u16(sum, a); }
/// The sum, and (a + 2^(n-1)) >> n of both registers.
template <int n>
inline Halves addRounded(Halves sum, const Two<Halves>& a) {
  return vrsraq_n_u16(vrsraq_n_u16(sum, a.low, n), a.high, n);
}

/// (a factor - offset) >> 16
inline Halves multiplySubtractHigh(Halves a, uint16_t factor, uint32_t offset) {
  const uint16x4_t low = vsubhn_u32(vmull_n_u16(vget_low_u16(a), factor), splat<Words>(offset));
  return vsubhn_high_u32(low, vmull_high_n_u16(a, factor), splat<Words>(offset));
}

// ---- narrowing

/// (a + 2^(n-1)) >> n, limited to a byte.
template <int n>
inline Bytes narrowRounded(const Two<SignedHalves>& a) {
  return vqrshrun_high_n_s16(vqrshrun_n_s16(a.low, n), a.high, n);
}
/// The same of unsigned lanes that need no limit: a + 2^(n-1) is less than 2^16, and the result a byte.
template <int n>
inline Bytes narrowRounded(const Two<Halves>& a) {
  return vrshrn_high_n_u16(vrshrn_n_u16(a.low, n), a.high, n);
}
/// Limited to a byte, and to a signed one.
inline Bytes narrow(const Two<SignedHalves>& a) { return vqmovun_high_s16(vqmovun_s16(a.low), a.high); }
/// Of lanes that are bytes.
inline Bytes narrow(const Two<Halves>& a) { return vuzp1q_u8((Bytes)a.low, (Bytes)a.high); }
inline SignedBytes narrowSigned(const Two<SignedHalves>& a) {
  return vqmovn_high_s16(vqmovn_s16(a.low), a.high);
}

// ---- weighed pixels

/// The first three channels of a block of pixels, in the form in which they are best weighed: here a register
/// each.
struct Colours {
  Bytes c[3];
};
/// Those of every second pixel, from the first on.
struct EvenColours {
  uint8x8_t c[3];
};

/// Loads them, of three channels the first and the third swapped or not. A block has no halves that could be
/// apart.
template <int nc, bool swapped = false>
inline Colours loadColours(const unsigned char* p, ptrdiff_t /*apart*/ = 16) {
  Bytes v[nc];
  loadChannels(p, v);
  return {{v[swapped ? 2 : 0], v[1], v[swapped ? 0 : 2]}};
}
/// The way back, where `swapped` with the first and the third channel swapped. Of four channels the last is
/// 255.
template <int nc, bool swapped>
inline void storeColours(unsigned char* p, const Colours& v, Bytes opaque) {
  const Bytes first = v.c[swapped ? 2 : 0], third = v.c[swapped ? 0 : 2];
  if constexpr (nc == 4) {
    storeChannels(p, {first, v.c[1], third, opaque});
  } else {
    storeChannels(p, {first, v.c[1], third});
  }
}
inline EvenColours evenColumns(const Colours& v) {
  const auto even = [](Bytes channel) { return vmovn_u16(vreinterpretq_u16_u8(channel)); };
  return {{even(v.c[0]), even(v.c[1]), even(v.c[2])}};
}

namespace detail {
template <int weight>
inline Halves addWeighed(Halves sum, uint8x8_t v) {
  return weight < 0 ? vmlsl_u8(sum, v, vdup_n_u8(-weight)) : vmlal_u8(sum, v, vdup_n_u8(weight));
}
template <int weight>
inline Halves addWeighedHigh(Halves sum, Bytes v) {
  return weight < 0 ? vmlsl_high_u8(sum, v, vdupq_n_u8(-weight)) : vmlal_high_u8(sum, v, vdupq_n_u8(weight));
}
// The channel to begin with, whose weight is not negative.
constexpr int firstOf(Weights w) { return w.c0 >= 0 ? 0 : w.c1 >= 0 ? 1 : 2; }
constexpr int weightOf(Weights w, int channel) { return channel == 0 ? w.c0 : channel == 1 ? w.c1 : w.c2; }
}  // namespace detail

/// w.c0 c0 + w.c1 c1 + w.c2 c2 in 16 bits, signed or unsigned; at least one weight is not negative.
template <Weights w>
inline Halves weighed(const EvenColours& v) {
  constexpr int kFirst = detail::firstOf(w), kSecond = (kFirst + 1) % 3, kThird = (kFirst + 2) % 3;
  const Halves sum = vmull_u8(v.c[kFirst], vdup_n_u8(detail::weightOf(w, kFirst)));
  return detail::addWeighed<detail::weightOf(w, kThird)>(
      detail::addWeighed<detail::weightOf(w, kSecond)>(sum, v.c[kSecond]), v.c[kThird]);
}
template <Weights w>
inline Two<Halves> weighed(const Colours& v) {
  constexpr int kFirst = detail::firstOf(w), kSecond = (kFirst + 1) % 3, kThird = (kFirst + 2) % 3;
  const EvenColours low = {{vget_low_u8(v.c[0]), vget_low_u8(v.c[1]), vget_low_u8(v.c[2])}};
  const Halves high = vmull_high_u8(v.c[kFirst], vdupq_n_u8(detail::weightOf(w, kFirst)));
  return {weighed<w>(low),
          detail::addWeighedHigh<detail::weightOf(w, kThird)>(
              detail::addWeighedHigh<detail::weightOf(w, kSecond)>(high, v.c[kSecond]), v.c[kThird])};
}

/// 128 + ((a + 2^(n-1)) >> n), limited to a byte, of each signed lane of two registers, in turn.
using BytePairs = uint8x8x2_t;
template <int n>
inline BytePairs centredPairs(Halves first, Halves second) {
  const auto centred = [](Halves v) {
    return veor_u8(vreinterpret_u8_s8(vqrshrn_n_s16(vreinterpretq_s16_u16(v), n)), vdup_n_u8(0x80));
  };
  return {{centred(first), centred(second)}};
}
inline void storePairs(unsigned char* p, ptrdiff_t /*apart*/, const BytePairs& v) { vst2_u8(p, v); }

// ---- samples of chroma

/// 16 chroma samples, which belong to 32 columns.
using Samples = Bytes;
/// How many blocks of bytes the 32 columns are.
inline constexpr int kSampleBlocks = 2;

inline Samples loadSamples(const unsigned char* p) { return vld1q_u8(p); }
inline void loadSamplePairs(const unsigned char* p, Samples& first, Samples& second) {
  const uint8x16x2_t both = vld2q_u8(p);
  first = both.val[0], second = both.val[1];
}
/// The block number `part` of two, of which 16 bytes each lie `step` behind those before.
inline Bytes loadParts(const unsigned char* p, ptrdiff_t step, int part) { return vld1q_u8(p + step * part); }

/// What 16 samples add, as bytes, and the bytes of the columns of block `part`.
template <int n>
inline Bytes sampleBytes(const Two<SignedHalves>& a) {
  return narrowRounded<n>(a);
}
template <int part>
inline Bytes spread(Bytes v) {
  return part == 0 ? vzip1q_u8(v, v) : vzip2q_u8(v, v);
}

// ---- tables

/// 256 entries of 16 bits, in the form in which vectors of bytes look them up: here four quarters of 64, each
/// as low bytes and as high bytes.
struct alignas(64) WideTable {
  static constexpr int kQuarters = 4;
  static constexpr int kEntries = 64;
  unsigned char low[kQuarters][kEntries];
  unsigned char high[kQuarters][kEntries];

  constexpr void set(int index, uint16_t entry) {
    low[index / kEntries][index % kEntries] = static_cast<unsigned char>(entry);
    high[index / kEntries][index % kEntries] = static_cast<unsigned char>(entry >> 8);
  }
};

namespace detail {
inline uint8x16x4_t loadEntries(const unsigned char (&entries)[WideTable::kEntries]) {
  return {{load(entries), load(entries + 16), load(entries + 32), load(entries + 48)}};
}
}  // namespace detail

/// The entries that `n` vectors of bytes name: a quarter is held in registers for all of them.
template <int n>
inline void lookUp(const WideTable& table, const Bytes (&bytes)[n], Two<Halves> (&entries)[n]) {
  Bytes index[n];
  Bytes low[n];
  Bytes high[n];
  for (int i = 0; i < n; ++i) {
    index[i] = bytes[i];
    low[i] = high[i] = splat<Bytes>(0);
  }
  // Unrolled as a whole, all quarters would be loaded ahead of their use: that is more than there are
  // registers.
#pragma GCC unroll 2
  for (int quarter = 0; quarter < WideTable::kQuarters; ++quarter) {
    const uint8x16x4_t lows = detail::loadEntries(table.low[quarter]);
    const uint8x16x4_t highs = detail::loadEntries(table.high[quarter]);
    for (int i = 0; i < n; ++i) {
      // An index outside the quarter leaves what was found before.
      low[i] = vqtbx4q_u8(low[i], lows, index[i]);
      high[i] = vqtbx4q_u8(high[i], highs, index[i]);
      index[i] = index[i] - splat<Bytes>(WideTable::kEntries);
    }
  }
  for (int i = 0; i < n; ++i) {
    entries[i] = {(Halves)vzip1q_u8(low[i], high[i]), (Halves)vzip2q_u8(low[i], high[i])};
  }
}

/// Three factors of 16 bits, here in one register.
template <int n>
class WeighedHalves {
 public:
  WeighedHalves(uint16_t f0, uint16_t f1, uint16_t f2) : factors_{f0, f1, f2} {}

  /// (f0 a + f1 b + f2 c + 2^(n-1)) >> n in 32 bits.
  Two<Words> operator()(Halves a, Halves b, Halves c) const {
    return {sum(vget_low_u16(a), vget_low_u16(b), vget_low_u16(c)),
            sum(vget_high_u16(a), vget_high_u16(b), vget_high_u16(c))};
  }

 private:
  Words sum(uint16x4_t a, uint16x4_t b, uint16x4_t c) const {
    const Words products = vmlal_lane_u16(vmull_lane_u16(a, factors_, 0), b, factors_, 1);
    return vrshrq_n_u32(vmlal_lane_u16(products, c, factors_, 2), n);
  }

  uint16x4_t factors_;
};

// ---- bytes as floats

/// Number `i` of the four quarters of a block of bytes, as floats.
inline Floats quarterOf(Bytes v, unsigned i) {
  // A look-up gives 0 for indices beyond the table.
  static constexpr uint32_t kIndex[] = {0xffffff00, 0xffffff01, 0xffffff02, 0xffffff03};
  const uint8x16_t index = vreinterpretq_u8_u32(vaddq_u32(vld1q_u32(kIndex), vdupq_n_u32(4 * i)));
  return vcvtq_f32_u32(vreinterpretq_u32_u8(vqtbl1q_u8(v, index)));
}
/// Four quarters rounded to bytes, halves up, and limited.
inline Bytes bytesOf(const Floats (&q)[4]) {
  const auto half = [](Floats low, Floats high) {
    const auto rounded = [](Floats x) { return vmovn_s32(vcvtq_s32_f32(vaddq_f32(x, vdupq_n_f32(0.5f)))); };
    return vqmovun_s16(vcombine_s16(rounded(low), rounded(high)));
  };
  return vcombine_u8(half(q[0], q[1]), half(q[2], q[3]));
}

/// 1 / v: the estimate of 8 bits, and two Newton-Raphson steps, each of which doubles the bits.
inline Floats reciprocal(Floats v) {
  Floats estimate = vrecpeq_f32(v);
  estimate = vmulq_f32(estimate, vrecpsq_f32(v, estimate));
  return vmulq_f32(estimate, vrecpsq_f32(v, estimate));
}
/// The same of numbers that are above 0 and below 2, but not below 2^-100.
inline Floats reciprocalBelow2(Floats v) { return reciprocal(v); }
/// Whether all of `a` and `b` are above 0 and below 2, where that makes a difference; `b` is not 0.
inline bool areBelow2(Floats /*a*/, Floats /*b*/) { return true; }

/// Square roots of whole numbers. Two Newton-Raphson steps from the estimate of the reciprocal take an
/// in-order core a fraction of what its instruction for roots takes.
inline Floats rootOfWhole(Floats v) {
  const Floats positive = max(v, vdupq_n_f32(1));  // 0 has no reciprocal
  Floats r = vrsqrteq_f32(positive);
  r = vmulq_f32(r, vrsqrtsq_f32(vmulq_f32(positive, r), r));
  r = vmulq_f32(r, vrsqrtsq_f32(vmulq_f32(positive, r), r));
  return vmulq_f32(v, r);
}

// ---- floats and their bits

/// Of a NaN and a number these make the number.
inline Floats minNumber(Floats a, Floats b) { return vminnmq_f32(a, b); }
inline Floats maxNumber(Floats a, Floats b) { return vmaxnmq_f32(a, b); }
inline Words min(Words a, Words b) { return vminq_u32(a, b); }

/// c - a b, rounded once.
inline Floats multiplySubtract(Floats c, Floats a, Floats b) { return vfmsq_f32(c, a, b); }
/// Whether |a| > |b|.
inline Words exceeds(Floats a, Floats b) { return vcagtq_f32(a, b); }
/// (2 a factor) >> 32
inline SignedWords doubledHigh(SignedWords a, int32_t factor) { return vqdmulhq_n_s32(a, factor); }

/// The whole part of floats from 0 on, and integers as floats.
inline Words truncated(Floats v) { return vcvtq_u32_f32(v); }
inline Floats floatsOf(Words v) { return vcvtq_f32_u32(v); }
inline Floats floatsOf(SignedWords v) { return vcvtq_f32_s32(v); }
inline Two<Floats> floatsOf(Halves v) {
  return {floatsOf(vmovl_u16(vget_low_u16(v))), floatsOf(vmovl_high_u16(v))};
}
/// The lowest 16 bits of the whole parts.
inline SignedHalves truncatedHalves(const Two<Floats>& v) {
  return vmovn_high_s32(vmovn_s32(vcvtq_s32_f32(v.low)), vcvtq_s32_f32(v.high));
}

inline bool anySet(Words mask) { return vmaxvq_u32(mask) != 0; }

// Entries of a table by pairs of indices, as they come out of a vector. Indices are small enough that the
// shift for the high one brings no bit of the low one.
template <typename Entry>
inline const Entry* lowEntry(const Entry* table, uint64_t pair) {
  return table + static_cast<uint32_t>(pair);
}
template <typename Entry>
inline const Entry* highEntry(const Entry* table, uint64_t pair) {
  constexpr int kSizeShift = std::countr_zero(sizeof(Entry));
  return reinterpret_cast<const Entry*>(reinterpret_cast<const char*>(table) + (pair >> (32 - kSizeShift)));
}
inline uint64_t lowPair(Words index) { return vgetq_lane_u64(vreinterpretq_u64_u32(index), 0); }
inline uint64_t highPair(Words index) { return vgetq_lane_u64(vreinterpretq_u64_u32(index), 1); }

/// Of a table of rows of four, those that `index` names, by columns.
inline void lookUpRows(const float (*rows)[4], Words index, Floats (&columns)[4]) {
  float32x4x4_t v = vld4q_dup_f32(*lowEntry(rows, lowPair(index)));
  v = vld4q_lane_f32(*highEntry(rows, lowPair(index)), v, 1);
  v = vld4q_lane_f32(*lowEntry(rows, highPair(index)), v, 2);
  v = vld4q_lane_f32(*highEntry(rows, highPair(index)), v, 3);
  columns[0] = v.val[0], columns[1] = v.val[1], columns[2] = v.val[2], columns[3] = v.val[3];
}
/// Those of a table that `index` names.
inline Words lookUp(const uint32_t* table, Words index) {
  Words entry = vld1q_dup_u32(lowEntry(table, lowPair(index)));
  entry = vld1q_lane_u32(highEntry(table, lowPair(index)), entry, 1);
  entry = vld1q_lane_u32(lowEntry(table, highPair(index)), entry, 2);
  return vld1q_lane_u32(highEntry(table, highPair(index)), entry, 3);
}

inline Halves lookUp(const uint16_t* table, const Two<Words>& index) {
  Halves entry = vld1q_dup_u16(lowEntry(table, lowPair(index.low)));
  entry = vld1q_lane_u16(highEntry(table, lowPair(index.low)), entry, 1);
  entry = vld1q_lane_u16(lowEntry(table, highPair(index.low)), entry, 2);
  entry = vld1q_lane_u16(highEntry(table, highPair(index.low)), entry, 3);
  entry = vld1q_lane_u16(lowEntry(table, lowPair(index.high)), entry, 4);
  entry = vld1q_lane_u16(highEntry(table, lowPair(index.high)), entry, 5);
  entry = vld1q_lane_u16(lowEntry(table, highPair(index.high)), entry, 6);
  entry = vld1q_lane_u16(highEntry(table, highPair(index.high)), entry, 7);
  forget(entry);  // its parts would be made a second time where only those are used
  return entry;
}

/// Four constants, here in one register: a multiplication by `at<i>()` takes its factor from lane i.
class Factors {
 public:
  Factors(float f0, float f1, float f2, float f3) {
    const float all[4] = {f0, f1, f2, f3};
    all_ = load(all);
    // The compiler would make parts of it a second time, one constant to a register.
    asm("" : "+w"(all_));
  }

  template <int i>
  Floats at() const {
    return vdupq_laneq_f32(all_, i);
  }

 private:
  Floats all_;
};

// ---- groups of eight pixels

/// Registers of floats that hold a channel of a group.
inline constexpr int kGroupRegisters = 2;

/// Loads a group of three bytes a pixel as floats; of the second and third channel less 128.
inline void loadGroup(const unsigned char* p, Floats (&c)[3][kGroupRegisters]) {
  const uint8x8x3_t v = vld3_u8(p);
  const Halves first = vmovl_u8(v.val[0]);
  const auto second = (SignedHalves)vsubl_u8(v.val[1], vdup_n_u8(128));
  const auto third = (SignedHalves)vsubl_u8(v.val[2], vdup_n_u8(128));
  c[0][0] = floatsOf(vmovl_u16(vget_low_u16(first)));
  c[1][0] = floatsOf(vmovl_s16(vget_low_s16(second)));
  c[2][0] = floatsOf(vmovl_s16(vget_low_s16(third)));
  c[0][1] = floatsOf(vmovl_u16(vget_high_u16(first)));
  c[1][1] = floatsOf(vmovl_s16(vget_high_s16(second)));
  c[2][1] = floatsOf(vmovl_s16(vget_high_s16(third)));
}
/// Stores bits 16 to 23 of each lane of `words(channel, register)` as bytes, with an opaque fourth channel
/// where `nc` is 4.
template <int nc, typename Channels>
inline void storeGroup(unsigned char* p, const Channels& words) {
  uint8x8_t c[3];
  for (int i = 0; i < 3; ++i) {
    c[i] = vmovn_u16(vcombine_u16(vshrn_n_u32(words(i, 0), 16), vshrn_n_u32(words(i, 1), 16)));
  }
  if constexpr (nc == 4) {
    const uint8x8x4_t all = {{c[0], c[1], c[2], vdup_n_u8(255)}};
    vst4_u8(p, all);
  } else {
    const uint8x8x3_t all = {{c[0], c[1], c[2]}};
    vst3_u8(p, all);
  }
}

}  // namespace HPC::fastcv::arm
