// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// Mean gray levels: one sum over three pixel layouts.

#include "brightness/brightness.h"
#include "region.h"

namespace kyface::brightness {
namespace {

enum class Layout { kYUV, kBGRA, kRGBA };

// Blue has the larger of the outer weights (C1 in docs/compatibility.md).
constexpr uint8_t kBlueWeight = 77;
constexpr uint8_t kGreenWeight = 150;
constexpr uint8_t kRedWeight = 29;
constexpr int kShift = 8;

template <Layout layout>
class GraySum {
 public:
  static constexpr int kChannels = layout == Layout::kYUV ? 3 : 4;
  static constexpr int kInFlight = 4;

  template <int n>
  void add(const Block<kChannels> (&pixels)[n]) {
    // Each block adds two pixels to a lane: n * 2 * 255 fits.
    uint16x8_t levels = vdupq_n_u16(0);
    for (const Block<kChannels>& block : pixels) {
      if constexpr (layout == Layout::kYUV) {
        levels = vpadalq_u8(levels, block.c[0]);
      } else {
        const uint8x16_t blue = block.c[layout == Layout::kBGRA ? 0 : 2];
        const uint8x16_t red = block.c[layout == Layout::kBGRA ? 2 : 0];
        levels = vrsraq_n_u16(levels, weighted(vget_low_u8(blue), vget_low_u8(block.c[1]), vget_low_u8(red)),
                              kShift);
        levels = vrsraq_n_u16(
            levels, weighted(vget_high_u8(blue), vget_high_u8(block.c[1]), vget_high_u8(red)), kShift);
      }
    }
    lanes_ = vpadalq_u16(lanes_, levels);
  }

  uint32_t total() const { return vaddvq_u32(lanes_); }

 private:
  // At most 256 * 255.
  static uint16x8_t weighted(uint8x8_t blue, uint8x8_t green, uint8x8_t red) {
    uint16x8_t sum = vmull_u8(blue, vdup_n_u8(kBlueWeight));
    sum = vmlal_u8(sum, green, vdup_n_u8(kGreenWeight));
    return vmlal_u8(sum, red, vdup_n_u8(kRedWeight));
  }

  uint32x4_t lanes_ = vdupq_n_u32(0);
};

}  // namespace
}  // namespace kyface::brightness

using kyface::brightness::GraySum;
using kyface::brightness::Layout;
using kyface::brightness::meanOf;

BRIGHTNESS_METRIC(calcGray_YUV, meanOf<GraySum<Layout::kYUV>>)
BRIGHTNESS_METRIC(calcGray_BGRA, meanOf<GraySum<Layout::kBGRA>>)
BRIGHTNESS_METRIC(calcGray_RGBA, meanOf<GraySum<Layout::kRGBA>>)
