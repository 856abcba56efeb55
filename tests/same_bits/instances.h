// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// Everything that computes pixels, over pictures that are the same in every build.
#pragma once

#include <bit>
#include <cmath>
#include <concepts>
#include <cstddef>
#include <cstdint>
#include <functional>
#include <string>
#include <vector>

namespace same_bits {

struct Size {
  int width;
  int height;
};

/// Below, at and beyond what kernels take at once, and with rows that are a multiple of nothing.
inline constexpr Size kSizes[] = {{1, 1}, {7, 5}, {16, 2}, {33, 3}, {70, 6}, {129, 5}, {278, 4}, {641, 3}};

/// FNV-1a over all that is added to it.
class Checksum {
 public:
  template <std::integral T>
  void add(T value) {
    for (size_t i = 0; i < sizeof(T); ++i) {
      hash_ = (hash_ ^ (static_cast<std::uint64_t>(value) >> (8 * i) & 0xff)) * 0x01000193;
    }
  }
  /// By its bits; what is not a number is one value, as which of its bits come out is the processor's choice.
  void add(float value) { add(std::isnan(value) ? 0x7fc00000u : std::bit_cast<std::uint32_t>(value)); }
  template <typename T>
  void add(const std::vector<T>& values) {
    for (const T value : values) {
      add(value);
    }
  }

  std::uint32_t value() const { return hash_; }

 private:
  std::uint32_t hash_ = 0x811c9dc5;
};

/// An operation on pictures of certain types. `run` adds all that it makes of a picture of a size: the
/// destinations with their padding, in the layouts that it takes.
struct Instance {
  std::string name;
  std::function<void(Size, Checksum&)> run;
};

/// Every conversion, crop, rotation, metric and frame helper.
std::vector<Instance> instances();

}  // namespace same_bits
