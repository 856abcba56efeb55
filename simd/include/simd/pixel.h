// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// The pixel vocabulary of the kernels: a block of interleaved pixels in registers, one vector a channel, and
/// how it is loaded and stored. 8-bit blocks hold 16 pixels, float blocks 4.
#pragma once

#include <type_traits>

#include "simd/neon.h"

namespace HPC::fastcv::arm {

namespace detail {
template <typename T>
struct Vector;
template <>
struct Vector<unsigned char> {
  using Type = uint8x16_t;
};
template <>
struct Vector<float> {
  using Type = float32x4_t;
};
}  // namespace detail

/// One register of `T`: uint8x16_t or float32x4_t.
template <typename T>
using VectorOf = typename detail::Vector<T>::Type;

/// Pixels in a block of `T`.
template <typename T>
inline constexpr int kBlockPixels = 16 / static_cast<int>(sizeof(T));

/// A block of pixels: channel `i` of all of them in `c[i]`.
template <typename T, int nc>
struct Pixels {
  VectorOf<T> c[nc];
};

/// The opaque alpha of an element type.
template <typename T>
inline constexpr T kOpaque = 1;
template <>
inline constexpr unsigned char kOpaque<unsigned char> = 255;

inline uint8x16_t splat(unsigned char value) { return vdupq_n_u8(value); }
inline float32x4_t splat(float value) { return vdupq_n_f32(value); }

/// Loads a block of `nc`-channel pixels.
template <int nc>
inline Pixels<unsigned char, nc> loadPixels(const unsigned char* p) {
  static_assert(nc == 1 || nc == 3 || nc == 4);
  if constexpr (nc == 1) {
    return {{vld1q_u8(p)}};
  } else if constexpr (nc == 3) {
    const uint8x16x3_t v = vld3q_u8(p);
    return {{v.val[0], v.val[1], v.val[2]}};
  } else {
    const uint8x16x4_t v = vld4q_u8(p);
    return {{v.val[0], v.val[1], v.val[2], v.val[3]}};
  }
}

template <int nc>
inline Pixels<float, nc> loadPixels(const float* p) {
  static_assert(nc == 1 || nc == 3 || nc == 4);
  if constexpr (nc == 1) {
    return {{vld1q_f32(p)}};
  } else if constexpr (nc == 3) {
    const float32x4x3_t v = vld3q_f32(p);
    return {{v.val[0], v.val[1], v.val[2]}};
  } else {
    const float32x4x4_t v = vld4q_f32(p);
    return {{v.val[0], v.val[1], v.val[2], v.val[3]}};
  }
}

/// Stores a block of pixels, channels interleaved.
template <int nc>
inline void storePixels(unsigned char* p, const Pixels<unsigned char, nc>& v) {
  static_assert(nc == 1 || nc == 3 || nc == 4);
  if constexpr (nc == 1) {
    vst1q_u8(p, v.c[0]);
  } else if constexpr (nc == 3) {
    const uint8x16x3_t all = {{v.c[0], v.c[1], v.c[2]}};
    vst3q_u8(p, all);
  } else {
    const uint8x16x4_t all = {{v.c[0], v.c[1], v.c[2], v.c[3]}};
    vst4q_u8(p, all);
  }
}

template <int nc>
inline void storePixels(float* p, const Pixels<float, nc>& v) {
  static_assert(nc == 1 || nc == 3 || nc == 4);
  if constexpr (nc == 1) {
    vst1q_f32(p, v.c[0]);
  } else if constexpr (nc == 3) {
    const float32x4x3_t all = {{v.c[0], v.c[1], v.c[2]}};
    vst3q_f32(p, all);
  } else {
    const float32x4x4_t all = {{v.c[0], v.c[1], v.c[2], v.c[3]}};
    vst4q_f32(p, all);
  }
}

/// Loads 8 pixels into both halves of a block.
template <int nc>
inline Pixels<unsigned char, nc> loadHalf(const unsigned char* p) {
  static_assert(nc == 3 || nc == 4);
  const auto twice = [](uint8x8_t v) { return vcombine_u8(v, v); };
  if constexpr (nc == 3) {
    const uint8x8x3_t v = vld3_u8(p);
    return {{twice(v.val[0]), twice(v.val[1]), twice(v.val[2])}};
  } else {
    const uint8x8x4_t v = vld4_u8(p);
    return {{twice(v.val[0]), twice(v.val[1]), twice(v.val[2]), twice(v.val[3])}};
  }
}

/// Stores the first 8 pixels of a block.
template <int nc>
inline void storeHalf(unsigned char* p, const Pixels<unsigned char, nc>& v) {
  static_assert(nc == 3 || nc == 4);
  if constexpr (nc == 3) {
    const uint8x8x3_t all = {{vget_low_u8(v.c[0]), vget_low_u8(v.c[1]), vget_low_u8(v.c[2])}};
    vst3_u8(p, all);
  } else {
    const uint8x8x4_t all = {
        {vget_low_u8(v.c[0]), vget_low_u8(v.c[1]), vget_low_u8(v.c[2]), vget_low_u8(v.c[3])}};
    vst4_u8(p, all);
  }
}

/// A block with `nc` channels: `v` itself, or its three channels and `alpha`.
template <int nc, typename T, int channels>
inline Pixels<T, nc> withAlpha(const Pixels<T, channels>& v, VectorOf<T> alpha) {
  if constexpr (nc == channels) {
    return v;
  } else {
    static_assert(nc == 4 && channels == 3);
    return {{v.c[0], v.c[1], v.c[2], alpha}};
  }
}

/// A block of three channels, with an opaque fourth where `nc` is 4.
template <int nc, typename T>
inline Pixels<T, nc> pixelsOf(VectorOf<T> c0, VectorOf<T> c1, VectorOf<T> c2) {
  static_assert(nc == 3 || nc == 4);
  if constexpr (nc == 4) {
    return {{c0, c1, c2, splat(kOpaque<T>)}};
  } else {
    return {{c0, c1, c2}};
  }
}

/// Loads a block of 4-channel pixels as it lies in memory, 16 bytes a register.
inline Pixels<unsigned char, 4> loadPacked(const unsigned char* p) {
  const uint8x16x4_t v = vld1q_u8_x4(p);
  return {{v.val[0], v.val[1], v.val[2], v.val[3]}};
}
inline Pixels<float, 4> loadPacked(const float* p) {
  const float32x4x4_t v = vld1q_f32_x4(p);
  return {{v.val[0], v.val[1], v.val[2], v.val[3]}};
}

/// Stores what `loadPacked` loads.
inline void storePacked(unsigned char* p, const Pixels<unsigned char, 4>& v) {
  const uint8x16x4_t all = {{v.c[0], v.c[1], v.c[2], v.c[3]}};
  vst1q_u8_x4(p, all);
}
inline void storePacked(float* p, const Pixels<float, 4>& v) {
  const float32x4x4_t all = {{v.c[0], v.c[1], v.c[2], v.c[3]}};
  vst1q_f32_x4(p, all);
}

/// Writes one pixel from three channels, with an opaque fourth where `nc` is 4.
template <int nc, typename T>
inline void storePixel(T* p, T c0, T c1, T c2) {
  static_assert(nc == 3 || nc == 4);
  p[0] = c0;
  p[1] = c1;
  p[2] = c2;
  if constexpr (nc == 4) {
    p[3] = kOpaque<T>;
  }
}

/// Limits an integer to a byte.
inline unsigned char clampToByte(int value) {
  return static_cast<unsigned char>(value < 0 ? 0 : value > 255 ? 255 : value);
}

}  // namespace HPC::fastcv::arm
