// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// Mean CIE lightness. Every call rebuilds the global tables; as their contents are known at compile time,
// that is a copy of 3328 entries, a seventh of the time that a 64 x 64 region takes.

#include <array>
#include <atomic>
#include <cstddef>
#include <cstdint>

#include "brightness/brightness.h"
#include "lightness_sum.h"
#include "luminance_tables.h"
#include "region.h"
#include "simd/lab_tables.h"

std::atomic<uint16_t> sRGBGammaTab[256];
std::atomic<uint16_t> labCbrtTab[3072];

namespace kyface::brightness {
namespace {

template <size_t n>
inline void rebuild(std::atomic<uint16_t> (&table)[n], const std::array<uint16_t, n>& values) {
#pragma GCC unroll 16
  for (size_t i = 0; i < n; ++i) {
    table[i].store(values[i], std::memory_order_relaxed);
  }
}

}  // namespace
}  // namespace kyface::brightness

void initLuminanceTables() {
  kyface::brightness::rebuild(sRGBGammaTab, HPC::fastcv::arm::kGammaTable);
  kyface::brightness::rebuild(labCbrtTab, HPC::fastcv::arm::kCubeRootTable);
}

namespace kyface::brightness {
namespace {

/// The metric of pixels with blue in channel `blue`.
template <int blue>
unsigned char meanLightness(const Region& region) {
  initLuminanceTables();
  return meanOf<LightnessSum<blue>>(region);
}

}  // namespace
}  // namespace kyface::brightness

using kyface::brightness::meanLightness;

BRIGHTNESS_METRIC(calcLuminance_BGRA, meanLightness<0>)
BRIGHTNESS_METRIC(calcLuminance_RGBA, meanLightness<2>)
