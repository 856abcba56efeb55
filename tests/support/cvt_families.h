// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// What the conversions of `cvtColor` are, read off their names: an enumerator is CVT_, the source's layout,
/// a 2, and the destination's.
#pragma once

#include <cstdlib>
#include <set>
#include <string_view>
#include <utility>

#include "fastcv/fastcv.h"

namespace kyface::test {

/// The layouts on both sides of a conversion.
struct Sides {
  std::string_view from;
  std::string_view to;
};

constexpr Sides sidesOf(HPC::fastcv::ColorCvtType type) {
#define NAMED(with, name, value, family, instances)        \
  if (type == HPC::fastcv::CVT_##name) {                   \
    const std::string_view text = #name;                   \
    size_t two = text.find('2');                           \
    while (text[two + 1] >= '0' && text[two + 1] <= '9') { \
      two = text.find('2', two + 1);                       \
    }                                                      \
    return {text.substr(0, two), text.substr(two + 1)};    \
  }
  FASTCV_CONVERSIONS(NAMED, )
#undef NAMED
  abort();
}

/// Whether a layout is 4:2:0. A layout that is in neither list does not compile where this is a constant, and
/// ends the test elsewhere.
constexpr bool is420(std::string_view side) {
  for (const std::string_view yuv : {"NV21", "NV12", "I420", "YUV"}) {
    if (side == yuv) {
      return true;
    }
  }
  for (const std::string_view packed : {"BGR", "RGB", "BGRA", "GRAY", "YCrCb", "HSV", "LAB"}) {
    if (side == packed) {
      return false;
    }
  }
  abort();
}

constexpr bool isTo420(HPC::fastcv::ColorCvtType type) { return is420(sidesOf(type).to); }
constexpr bool isFrom420(HPC::fastcv::ColorCvtType type) { return is420(sidesOf(type).from); }

/// The channel counts that a side may have beside the other. BGR and RGB may carry alpha, unless adding or
/// dropping it is what the conversion does.
inline std::set<int> channelsOf(std::string_view side, std::string_view other) {
  if (side == "BGRA") {
    return {4};
  }
  if (side == "BGR" || side == "RGB") {
    return other == "BGRA" ? std::set{3} : std::set{3, 4};
  }
  return is420(side) || side == "GRAY" ? std::set{1} : std::set{3};
}

/// (source channels, destination channels) of all instances of a conversion.
inline std::set<std::pair<int, int>> channelPairsOf(HPC::fastcv::ColorCvtType type) {
  const Sides sides = sidesOf(type);
  std::set<std::pair<int, int>> pairs;
  for (const int from : channelsOf(sides.from, sides.to)) {
    for (const int to : channelsOf(sides.to, sides.from)) {
      pairs.emplace(from, to);
    }
  }
  return pairs;
}

}  // namespace kyface::test
