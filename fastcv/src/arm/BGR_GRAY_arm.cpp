// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// Gray of BGR and BGRA, and gray spread over the colour channels.
//
//   8-bit: gray = (29 B + 150 G + 77 R + 128) >> 8
//   float: gray = fma(G, 0.587, fma(R, 0.299, B * 0.114))

#include <cmath>

#include "entry.h"
#include "simd/loop.h"

namespace HPC::fastcv {
namespace {

using namespace arm;

template <typename T, int ncSrc>
struct ToGray;

template <int ncSrc>
struct ToGray<unsigned char, ncSrc> {
  using Src = unsigned char;
  using Dst = unsigned char;
  static constexpr int kSrcChannels = ncSrc;
  static constexpr int kDstChannels = 1;
  static constexpr int kInFlight = 4;
  static constexpr bool kUniform = true;

  static constexpr bool kWeighs = true;

  static constexpr int kB = 29, kG = 150, kR = 77;
  static constexpr int kShift = 8;

  Pixels<Bytes, 1> vector(const Colours& p) const {
    return {{narrowRounded<kShift>(weighed<Weights{kB, kG, kR}>(p))}};
  }

  void scalar(const unsigned char* in, unsigned char* out) const {
    *out = static_cast<unsigned char>((kB * in[0] + kG * in[1] + kR * in[2] + (1 << (kShift - 1))) >> kShift);
  }
};

template <int ncSrc>
struct ToGray<float, ncSrc> {
  using Src = float;
  using Dst = float;
  static constexpr int kSrcChannels = ncSrc;
  static constexpr int kDstChannels = 1;
  static constexpr int kInFlight = 4;
  static constexpr bool kUniform = true;

  static constexpr float kB = 0.114f, kG = 0.587f, kR = 0.299f;

  Pixels<Floats, 1> vector(const Pixels<Floats, ncSrc>& p) const {
    const Floats red = multiplyAdd(p.c[0] * splat<Floats>(kB), p.c[2], splat<Floats>(kR));
    return {{multiplyAdd(red, p.c[1], splat<Floats>(kG))}};
  }

  void scalar(const float* in, float* out) const {
    *out = std::fma(in[1], kG, std::fma(in[2], kR, in[0] * kB));
  }
};

template <typename T, int ncDst>
struct FromGray {
  using Src = T;
  using Dst = T;
  static constexpr int kSrcChannels = 1;
  static constexpr int kDstChannels = ncDst;
  static constexpr int kInFlight = ncDst == 3 ? 8 : 4;
  static constexpr bool kUniform = true;

  Pixels<BlockOf<T>, 1> vector(const Pixels<BlockOf<T>, 1>& p) const { return p; }

  void scalar(const T* in, T* out) const { storePixel<ncDst, T>(out, *in, *in, *in); }
};

using uchar = unsigned char;

}  // namespace

FASTCV_ENTRY(armBGR2GRAYImage, uchar, 3, 1, convertImage<ToGray<uchar, 3>>)
FASTCV_ENTRY(armBGR2GRAYImage, uchar, 4, 1, convertImage<ToGray<uchar, 4>>)
FASTCV_ENTRY(armBGR2GRAYImage, float, 3, 1, convertImage<ToGray<float, 3>>)
FASTCV_ENTRY(armBGR2GRAYImage, float, 4, 1, convertImage<ToGray<float, 4>>)
FASTCV_ENTRY(armGRAY2BGRImage, uchar, 1, 3, convertImage<FromGray<uchar, 3>>)
FASTCV_ENTRY(armGRAY2BGRImage, uchar, 1, 4, convertImage<FromGray<uchar, 4>>)
FASTCV_ENTRY(armGRAY2BGRImage, float, 1, 3, convertImage<FromGray<float, 3>>)
FASTCV_ENTRY(armGRAY2BGRImage, float, 1, 4, convertImage<FromGray<float, 4>>)

}  // namespace HPC::fastcv
