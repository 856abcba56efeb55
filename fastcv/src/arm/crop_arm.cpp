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
#include <type_traits>

#include "entry.h"
#include "simd/copy.h"
#include "simd/loop.h"
#include "simd/overlap.h"

namespace HPC::fastcv {
namespace {

using namespace arm;

// ---- 8-bit samples

constexpr int kGroupPixels = 8;

// Any factor: 8 samples widened to float and back.
struct ScaleByFloat {
  float ratio;

  uint8x8_t operator()(uint8x8_t samples) const {
    const uint16x8_t wide = vmovl_u8(samples);
    return vqmovun_s16(vcombine_s16(scaled(vget_low_u16(wide)), scaled(vget_high_u16(wide))));
  }

 private:
  int16x4_t scaled(uint16x4_t samples) const {
    const float32x4_t v = vcvtq_f32_u32(vmovl_u16(samples));
    return vmovn_s32(vcvtq_s32_f32(vfmaq_n_f32(vdupq_n_f32(0.5f), v, ratio)));
  }
};

// A whole factor of 0 to 255, the only ones that the front-end passes: products of at most 65025, of which
// truncating the half away leaves the product, and whose 16 bits are those that are kept.
struct ScaleByByte {
  uint8x8_t ratio;

  uint8x8_t operator()(uint8x8_t samples) const {
    return vqmovun_s16(vreinterpretq_s16_u16(vmull_u8(samples, ratio)));
  }
};

unsigned char scaleSample(unsigned char sample, float ratio) {
  const float v = std::fmaf(ratio, sample, 0.5f);
  // Not a number is 0, as everywhere when it becomes an integer.
  return v > 255 ? 255 : v >= 0 ? static_cast<unsigned char>(v) : 0;
}

// `count` samples; all are loaded before one is stored, for the cores that work in order.
template <int count, typename Scale>
inline void scaleSamples(const Scale& scale, const unsigned char* src, unsigned char* dst) {
  if constexpr (count == 8) {
    vst1_u8(dst, scale(vld1_u8(src)));
  } else {
    constexpr int kRegisters = count / 16;
    uint8x16_t samples[kRegisters];
    for (int i = 0; i < kRegisters; ++i) {
      samples[i] = vld1q_u8(src + i * 16);
    }
    for (uint8x16_t& v : samples) {
      v = vcombine_u8(scale(vget_low_u8(v)), scale(vget_high_u8(v)));
    }
    for (int i = 0; i < kRegisters; ++i) {
      vst1q_u8(dst + i * 16, samples[i]);
    }
    if constexpr (count % 16 != 0) {
      scaleSamples<count % 16>(scale, src + count / 16 * 16, dst + count / 16 * 16);
    }
  }
}

// `alike` says that a group gives what its pixels would give singly.
template <int nc, typename Scale>
inline void scaleRows(const Scale& scale, float ratio, bool alike, ptrdiff_t height, ptrdiff_t width,
                      ptrdiff_t inStride, const unsigned char* in, ptrdiff_t outStride, unsigned char* out) {
  constexpr int kGroup = kGroupPixels * nc;
  constexpr int kInFlight = nc == 1 ? 4 : 2;
  for (ptrdiff_t row = 0; row < height; ++row) {
    const unsigned char* src = in + row * inStride;
    unsigned char* dst = out + row * outStride;
    const bool apart = areApart(src, width * nc, dst, width * nc);
    walk<kGroup, kInFlight, 1>(
        width * nc, alike && apart ? Tail::kOverlap : Tail::kSteps,
        [&](ptrdiff_t x, auto groups) { scaleSamples<groups * kGroup>(scale, src + x, dst + x); },
        [&](ptrdiff_t x) { dst[x] = scaleSample(src[x], ratio); });
  }
}

template <int nc>
void scaleImage(float ratio, ptrdiff_t height, ptrdiff_t width, ptrdiff_t inStride, const unsigned char* in,
                ptrdiff_t outStride, unsigned char* out) {
  if (ratio >= 0 && ratio <= 255 && ratio == std::floor(ratio)) {
    const ScaleByByte scale = {vdup_n_u8(static_cast<unsigned char>(ratio))};
    scaleRows<nc>(scale, ratio, ratio <= 128, height, width, inStride, in, outStride, out);
  } else {
    scaleRows<nc>(ScaleByFloat{ratio}, ratio, false, height, width, inStride, in, outStride, out);
  }
}

// ---- float samples

struct ScaleFloats {
  using Vector = float32x4_t;
  using Src = float;
  using Dst = float;
  static constexpr int kSrcChannels = 1;
  static constexpr int kDstChannels = 1;
  static constexpr int kInFlight = 2;
  static constexpr bool kUniform = true;

  float ratio;

  Pixels<float32x4_t, 1> vector(const Pixels<float32x4_t, 1>& v) const {
    return {{vmulq_n_f32(v.c[0], ratio)}};
  }
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
