// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// Cropping, with or without a scale factor.
//
// A factor of exactly 1 copies. With any other, a float sample becomes the product, and an 8-bit sample s
//
//   v = ratio * s + 0.5, fused;  0 if v < 0, 255 if v > 255, else v truncated
//
// which rounds halves up. Rows of 8-bit pixels are worked on in groups of 8 pixels and the rest one by one.
// The groups truncate to 32 bits and keep the low 16 of them before they saturate to a byte, so that from
// 32768 on, which takes a factor above 128, their result wraps where that of a single pixel is 255. Callers
// rely on the difference: no group may take pixels of another row, and with such a factor none may end a row.

#include <cmath>
#include <cstring>
#include <type_traits>

#include "entry.h"
#include "simd/copy.h"
#include "simd/loop.h"
#include "simd/overlap.h"
#include "simd/tile.h"

namespace HPC::fastcv {
namespace {

using namespace arm;

// ---- 8-bit samples

constexpr int kGroupPixels = 8;

// Any factor: samples widened to float and back.
struct ScaleByFloat {
  float ratio;

  Bytes operator()(Bytes samples) const {
    const Two<Halves> wide = widen(samples);
    return narrow(Two<SignedHalves>{scaled(wide.low), scaled(wide.high)});
  }

 private:
  SignedHalves scaled(Halves samples) const {
    const Two<Floats> v = floatsOf(samples);
    return truncatedHalves({scaled(v.low), scaled(v.high)});
  }
  Floats scaled(Floats v) const { return multiplyAdd(splat<Floats>(0.5f), v, splat<Floats>(ratio)); }
};

// A whole factor of 0 to 255, the only ones that the front-end passes: products of at most 65025, of which
// truncating the half away leaves the product, and whose 16 bits are those that are kept.
struct ScaleByByte {
  unsigned char ratio;

  Bytes operator()(Bytes samples) const { return narrow(asSigned(multiply(samples, ratio))); }
};

unsigned char scaleSample(unsigned char sample, float ratio) {
  const float v = std::fmaf(ratio, sample, 0.5f);
  // Not a number is 0, as everywhere when it becomes an integer.
  return v > 255 ? 255 : v >= 0 ? static_cast<unsigned char>(v) : 0;
}

#if defined(__ARM_NEON)

// `count` samples; all are loaded before one is stored, for the cores that work in order.
template <int count, typename Scale>
inline void scaleSamples(const Scale& scale, const unsigned char* src, unsigned char* dst) {
  if constexpr (count == 8) {
    storeLane<8, 0>(dst, scale(loadBytes<8>(src)));
  } else {
    constexpr int kRegisters = count / 16;
    Bytes samples[kRegisters];
    for (int i = 0; i < kRegisters; ++i) {
      samples[i] = load(src + i * 16);
    }
    for (Bytes& v : samples) {
      v = scale(v);
    }
    for (int i = 0; i < kRegisters; ++i) {
      store(dst + i * 16, samples[i]);
    }
    if constexpr (count % 16 != 0) {
      scaleSamples<count % 16>(scale, src + count / 16 * 16, dst + count / 16 * 16);
    }
  }
}

// A row in groups of `group` samples. `alike` says that they give what single samples would give, `apart`
// that they may be done twice.
template <int group, typename Scale>
inline void scaleRow(const Scale& scale, float ratio, bool alike, bool apart, ptrdiff_t length,
                     const unsigned char* src, unsigned char* dst) {
  constexpr int kInFlight = group == kGroupPixels ? 4 : 2;
  walk<group, kInFlight, 1>(
      length, alike && apart ? Tail::kOverlap : Tail::kSteps,
      [&](ptrdiff_t x, auto groups) { scaleSamples<groups * group>(scale, src + x, dst + x); },
      [&](ptrdiff_t x) { dst[x] = scaleSample(src[x], ratio); });
}

#else

// The same, where a register has room for several groups, or for one with others: the last ones go through
// memory of a register's size.
template <int group, typename Scale>
inline void scaleRow(const Scale& scale, float ratio, bool alike, bool apart, ptrdiff_t length,
                     const unsigned char* src, unsigned char* dst) {
  constexpr ptrdiff_t kBlock = sizeof(Bytes);
  const auto block = [&](const unsigned char* from, unsigned char* to) { store(to, scale(load(from))); };
  const ptrdiff_t grouped = alike ? length : length / group * group;
  ptrdiff_t x = 0;
  for (; x <= grouped - kBlock; x += kBlock) {
    block(src + x, dst + x);
  }
  if (x < grouped && apart && grouped >= kBlock) {
    block(src + grouped - kBlock, dst + grouped - kBlock);
  } else if (x < grouped) {
    unsigned char part[kBlock] = {};
    memcpy(part, src + x, static_cast<size_t>(grouped - x));
    block(part, part);
    memcpy(dst + x, part, static_cast<size_t>(grouped - x));
  }
  for (x = grouped; x < length; ++x) {
    dst[x] = scaleSample(src[x], ratio);
  }
}

#endif

template <int nc, typename Scale>
inline void scaleRows(const Scale& scale, float ratio, bool alike, ptrdiff_t height, ptrdiff_t width,
                      ptrdiff_t inStride, const unsigned char* in, ptrdiff_t outStride, unsigned char* out) {
  for (ptrdiff_t row = 0; row < height; ++row) {
    const unsigned char* src = in + row * inStride;
    unsigned char* dst = out + row * outStride;
    scaleRow<kGroupPixels * nc>(scale, ratio, alike, areApart(src, width * nc, dst, width * nc), width * nc,
                                src, dst);
  }
}

template <int nc>
void scaleImage(float ratio, ptrdiff_t height, ptrdiff_t width, ptrdiff_t inStride, const unsigned char* in,
                ptrdiff_t outStride, unsigned char* out) {
  if (ratio >= 0 && ratio <= 255 && ratio == std::floor(ratio)) {
    const ScaleByByte scale = {static_cast<unsigned char>(ratio)};
    scaleRows<nc>(scale, ratio, ratio <= 128, height, width, inStride, in, outStride, out);
  } else {
    scaleRows<nc>(ScaleByFloat{ratio}, ratio, false, height, width, inStride, in, outStride, out);
  }
}

// ---- float samples

struct ScaleFloats {
  using Src = float;
  using Dst = float;
  static constexpr int kSrcChannels = 1;
  static constexpr int kDstChannels = 1;
  static constexpr int kInFlight = sizeof(Floats) == 16 ? 2 : 4;
  static constexpr bool kUniform = true;

  float ratio;

  Pixels<Floats, 1> vector(const Pixels<Floats, 1>& v) const { return {{v.c[0] * splat<Floats>(ratio)}}; }
  void scalar(const float* in, float* out) const { *out = *in * ratio; }
};

template <int nc>
void scaleImage(float ratio, ptrdiff_t height, ptrdiff_t width, ptrdiff_t inStride, const float* in,
                ptrdiff_t outStride, float* out) {
  forEachPixel(ScaleFloats{ratio}, height, width * nc, inStride, in, outStride, out);
}

}  // namespace

template <typename T, int ncSrc, typename TDst, int ncDst, int nc>
void armImageCrop(int top, int left, int inWidthStride, const T* inData, int outHeight, int outWidth,
                  int outWidthStride, TDst* outData, float ratio) {
  static_assert(std::is_same_v<T, TDst> && ncSrc == nc && ncDst == nc);
  if (outHeight < 1 || outWidth < 1) {
    return;
  }
  const T* const first =
      inData + static_cast<ptrdiff_t>(top) * inWidthStride + static_cast<ptrdiff_t>(left) * nc;
  if (ratio == 1.0f) {
    constexpr ptrdiff_t kSize = sizeof(T);
    copyRows(outHeight, kSize * nc * outWidth, reinterpret_cast<const unsigned char*>(first),
             kSize * inWidthStride, reinterpret_cast<unsigned char*>(outData), kSize * outWidthStride);
  } else {
    scaleImage<nc>(ratio, outHeight, outWidth, inWidthStride, first, outWidthStride, outData);
  }
}

#define FASTCV_CROP(T, nc)                                                                                 \
  template FASTCV_EXPORTED void armImageCrop<T, nc, T, nc, nc>(int, int, int, const T*, int, int, int, T*, \
                                                               float);
FASTCV_CROP(unsigned char, 1)
FASTCV_CROP(unsigned char, 3)
FASTCV_CROP(unsigned char, 4)
FASTCV_CROP(float, 1)
FASTCV_CROP(float, 3)
FASTCV_CROP(float, 4)

}  // namespace HPC::fastcv
