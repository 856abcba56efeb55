// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// The pixel vocabulary of the kernels: a block of interleaved pixels in registers, one vector a channel, and
/// how it is loaded and stored.
#pragma once

#include "simd/vector.h"

namespace HPC::fastcv::arm {

namespace detail {
template <typename T>
struct Block;
template <>
struct Block<unsigned char> {
  using Type = Bytes;
};
template <>
struct Block<float> {
  using Type = Floats;
};
}  // namespace detail

/// One register of `T`: Bytes or Floats.
template <typename T>
using BlockOf = typename detail::Block<T>::Type;

/// Lanes of a vector.
template <typename V>
inline constexpr int kLanes = static_cast<int>(sizeof(V) / sizeof(ElementOf<V>));

/// Pixels in a block of `T`.
template <typename T>
inline constexpr int kBlockPixels = kLanes<BlockOf<T>>;

/// A block of pixels: channel `i` of all of them in `c[i]`.
template <typename V, int nc>
struct Pixels {
  V c[nc];
};

/// The opaque alpha of an element type.
template <typename T>
inline constexpr T kOpaque = 1;
template <>
inline constexpr unsigned char kOpaque<unsigned char> = 255;

/// Loads a block of `nc`-channel pixels.
template <typename V, int nc>
inline Pixels<V, nc> loadPixels(const ElementOf<V>* p) {
  static_assert(nc == 1 || nc == 3 || nc == 4);
  Pixels<V, nc> v;
  if constexpr (nc == 1) {
    load(p, v.c[0]);
  } else {
    loadChannels(p, v.c);
  }
  return v;
}

/// Stores a block of pixels, channels interleaved.
template <typename V, int nc>
inline void storePixels(ElementOf<V>* p, const Pixels<V, nc>& v) {
  static_assert(nc == 1 || nc == 3 || nc == 4);
  if constexpr (nc == 1) {
    store(p, v.c[0]);
  } else {
    storeChannels(p, v.c);
  }
}

/// Four registers of 4-channel pixels as they lie in memory.
template <typename V>
inline Pixels<V, 4> loadPacked(const ElementOf<V>* p) {
  Pixels<V, 4> v;
  loadRow(p, v.c);
  return v;
}
template <typename V>
inline void storePacked(ElementOf<V>* p, const Pixels<V, 4>& v) {
  storeRow(p, v.c);
}

/// A block of three channels that are all `v`.
template <typename V>
struct Gray {
  V v;
};
template <typename V>
inline void storePixels(ElementOf<V>* p, const Gray<V>& gray) {
  storeThrice(p, gray.v);
}

/// A block with `nc` channels: `v` itself, or its three channels, or three times its one, and `alpha`.
template <int nc, typename V, int channels>
inline auto withAlpha(const Pixels<V, channels>& v, V alpha) {
  if constexpr (nc == channels) {
    return v;
  } else if constexpr (channels == 1) {
    if constexpr (nc == 3) {
      return Gray<V>{v.c[0]};
    } else {
      return Pixels<V, nc>{{v.c[0], v.c[0], v.c[0], alpha}};
    }
  } else {
    static_assert(nc == 4 && channels == 3);
    return Pixels<V, nc>{{v.c[0], v.c[1], v.c[2], alpha}};
  }
}

/// A block of three channels, with an opaque fourth where `nc` is 4.
template <int nc, typename V>
inline Pixels<V, nc> pixelsOf(V c0, V c1, V c2) {
  static_assert(nc == 3 || nc == 4);
  if constexpr (nc == 4) {
    return {{c0, c1, c2, splat<V>(kOpaque<ElementOf<V>>)}};
  } else {
    return {{c0, c1, c2}};
  }
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
