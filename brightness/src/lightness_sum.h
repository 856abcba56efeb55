// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// The sum of pixels' lightness, over the global tables.
#pragma once

#include <cstdint>

#include "luminance_tables.h"
#include "region.h"
#include "simd/gamma_planes.h"
#include "simd/lab_tables.h"

namespace kyface::brightness {

namespace arm = HPC::fastcv::arm;

/// The sum that `meanOf` asks for, of 4-byte pixels with blue in channel `blue`, 0 or 2. Made when the tables
/// are filled.
template <int blue>
class LightnessSum {
 public:
  static constexpr int kChannels = 4;
  static constexpr int kInFlight = 1;

  LightnessSum() {
#pragma GCC unroll 16
    for (int i = 0; i < 256; ++i) {
      gamma_.set(i, sRGBGammaTab[i].load(std::memory_order_relaxed));
    }
  }

  template <int n>
  void add(const Block<kChannels> (&pixels)[n]) {
    uint8x16_t bytes[3 * n];
    for (int i = 0; i < n; ++i) {
      bytes[3 * i] = pixels[i].c[blue];
      bytes[3 * i + 1] = pixels[i].c[1];
      bytes[3 * i + 2] = pixels[i].c[2 - blue];
    }
    arm::Light light[3 * n];
    arm::lookUp(gamma_, bytes, light);
    uint32_t total = 0;
    for (int i = 0; i < n; ++i) {
      for (int half = 0; half < 2; ++half) {
        const uint16x8_t b = light[3 * i].half[half];
        const uint16x8_t g = light[3 * i + 1].half[half];
        const uint16x8_t r = light[3 * i + 2].half[half];
        total += lightness(luminance(vget_low_u16(b), vget_low_u16(g), vget_low_u16(r)));
        total += lightness(luminance(vget_high_u16(b), vget_high_u16(g), vget_high_u16(r)));
      }
    }
    total_ += total;
  }

  uint32_t total() const { return total_; }

 private:
  // Y in units of 1 / 2040: at most 2040, as the weights sum to 4096.
  static uint32x4_t luminance(uint16x4_t b, uint16x4_t g, uint16x4_t r) {
    uint32x4_t sum = vmull_n_u16(b, arm::kYWeights.b);
    sum = vmlal_n_u16(sum, g, arm::kYWeights.g);
    sum = vmlal_n_u16(sum, r, arm::kYWeights.r);
    return vrshrq_n_u32(sum, arm::kWeightShift);
  }

  // Summed up over four pixels.
  static uint32_t lightness(uint32x4_t y) {
    return lightness(vgetq_lane_u32(y, 0)) + lightness(vgetq_lane_u32(y, 1)) +
           lightness(vgetq_lane_u32(y, 2)) + lightness(vgetq_lane_u32(y, 3));
  }

  // In 0..255 for every Y that occurs: there is nothing to clamp.
  static uint32_t lightness(uint32_t y) {
    return (labCbrtTab[y].load(std::memory_order_relaxed) * arm::kLightnessScale - arm::kLightnessOffset) >>
           arm::kLightnessShift;
  }

  arm::GammaPlanes gamma_;
  uint32_t total_ = 0;
};

}  // namespace kyface::brightness
