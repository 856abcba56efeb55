// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// Mean gray levels: one sum over three pixel layouts.

#include "brightness/brightness.h"
#include "region.h"

namespace kyface::brightness {
namespace {

using namespace HPC::fastcv::arm;

// Blue has the larger of the outer weights (C1 in docs/compatibility.md).
constexpr int kBlueWeight = 77;
constexpr int kGreenWeight = 150;
constexpr int kRedWeight = 29;
constexpr int kShift = 8;

constexpr Weights kBGRA = {kBlueWeight, kGreenWeight, kRedWeight};
constexpr Weights kRGBA = {kRedWeight, kGreenWeight, kBlueWeight};

// Of pixels of four channels the weighed ones, of others the first.
template <int nc, Weights weights = {}>
class GraySum {
 public:
  static constexpr int kChannels = nc;
  static constexpr int kInFlight = 4;
  static constexpr bool kWeighs = nc == 4;

  template <typename Block, int n>
  void add(const Block (&blocks)[n]) {
    // Each block adds two pixels to a lane: n * 2 * 255 fits.
    Halves levels{};
    for (const Block& block : blocks) {
      if constexpr (kWeighs) {
        levels = addRounded<kShift>(levels, weighed<weights>(block));
      } else {
        levels = addPairs(levels, block.c[0]);
      }
    }
    lanes_ = addPairs(lanes_, levels);
  }

  uint32_t total() const { return HPC::fastcv::arm::total(lanes_); }

 private:
  Words lanes_{};
};

}  // namespace
}  // namespace kyface::brightness

using kyface::brightness::GraySum;
using kyface::brightness::kBGRA;
using kyface::brightness::kRGBA;
using kyface::brightness::meanOf;

BRIGHTNESS_METRIC(calcGray_YUV, meanOf<GraySum<3>>)
BRIGHTNESS_METRIC(calcGray_BGRA, meanOf<GraySum<4, kBGRA>>)
BRIGHTNESS_METRIC(calcGray_RGBA, meanOf<GraySum<4, kRGBA>>)
