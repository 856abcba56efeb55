// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// The sum of pixels' lightness, over the global tables.
#pragma once

#include <cstdint>

#include "luminance_tables.h"
#include "region.h"
#include "simd/lab_tables.h"
#include "simd/pixel.h"

namespace kyface::brightness {

namespace arm = HPC::fastcv::arm;

/// The sum that `meanOf` asks for, of 4-byte pixels with blue in channel `blue`, 0 or 2. Made when the tables
/// are filled.
template <int blue>
class LightnessSum {
 public:
  static constexpr int kChannels = 4;
  static constexpr int kInFlight = 1;
  static constexpr bool kWeighs = false;

  LightnessSum() {
#pragma GCC unroll 16
    for (int i = 0; i < 256; ++i) {
      gamma_.set(i, sRGBGammaTab[i].load(std::memory_order_relaxed));
    }
  }

  template <int n>
  void add(const arm::Pixels<arm::Bytes, kChannels> (&pixels)[n]) {
    arm::Bytes bytes[3 * n];
    for (int i = 0; i < n; ++i) {
      bytes[3 * i] = pixels[i].c[blue];
      bytes[3 * i + 1] = pixels[i].c[1];
      bytes[3 * i + 2] = pixels[i].c[2 - blue];
    }
    arm::Two<arm::Halves> light[3 * n];
    arm::lookUp(gamma_, bytes, light);
    uint32_t total = 0;
    for (int i = 0; i < n; ++i) {
      const auto &b = light[3 * i], &g = light[3 * i + 1], &r = light[3 * i + 2];
      total += lightness(luminance_(b.low, g.low, r.low));
      total += lightness(luminance_(b.high, g.high, r.high));
    }
    total_ += total;
  }

  uint32_t total() const { return total_; }

 private:
  // Summed up over pixels, of Y in units of 1 / 2040: at most 2040, as the weights sum to 4096.
  static uint32_t lightness(const arm::Two<arm::Words>& y) {
    uint32_t sum = 0;
    for (const arm::Words& each : {y.low, y.high}) {
#pragma GCC unroll 8
      for (int i = 0; i < arm::kLanes<arm::Words>; ++i) {
        sum += lightness(each[i]);
      }
    }
    return sum;
  }

  // In 0..255 for every Y that occurs: there is nothing to clamp.
  static uint32_t lightness(uint32_t y) {
    return (labCbrtTab[y].load(std::memory_order_relaxed) * arm::kLightnessScale - arm::kLightnessOffset) >>
           arm::kLightnessShift;
  }

  arm::WideTable gamma_;
  arm::WeighedHalves<arm::kWeightShift> luminance_{arm::kYWeights.b, arm::kYWeights.g, arm::kYWeights.r};
  uint32_t total_ = 0;
};

}  // namespace kyface::brightness
