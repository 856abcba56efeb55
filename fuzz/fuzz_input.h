// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// A fuzzer's bytes, taken as numbers. When they run out everything is 0, so that every input is a whole one.
#pragma once

#include <bit>
#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <iterator>
#include <limits>

namespace kyface::fuzz {

/// The low 32 bits of a result, as sums and products of ints give them that wrap.
inline int wrap(int64_t value) { return static_cast<int>(static_cast<uint32_t>(value)); }

class Input {
 public:
  Input(const uint8_t* data, size_t size) : data_(data), size_(size) {}

  uint8_t byte() { return next_ < size_ ? data_[next_++] : 0; }

  /// A whole number from `low` to `high`, both included.
  int in(int low, int high) {
    const uint32_t span = static_cast<uint32_t>(high) - static_cast<uint32_t>(low) + 1;
    uint32_t value = byte();
    if (span == 0 || span > 256) {
      value = value << 24 | static_cast<uint32_t>(byte()) << 16 | static_cast<uint32_t>(byte()) << 8 | byte();
    }
    return static_cast<int>(static_cast<uint32_t>(low) + (span == 0 ? value : value % span));
  }

  /// Any 32-bit number, often one at an edge.
  int any() {
    static constexpr int kEdges[] = {0,
                                     1,
                                     2,
                                     3,
                                     -1,
                                     -2,
                                     INT32_MAX,
                                     INT32_MIN,
                                     64,
                                     65,
                                     -3,
                                     INT32_MAX / 2,
                                     INT32_MAX - 1,
                                     INT32_MIN + 1,
                                     1 << 16,
                                     1 << 30};
    const uint8_t choice = byte();
    return choice < 128 ? kEdges[choice % 16] : choice < 192 ? in(-70, 70) : in(INT32_MIN, INT32_MAX);
  }

  /// Any float, often a special one.
  float anyFloat() {
    using Limits = std::numeric_limits<float>;
    static constexpr float kSpecial[] = {0,
                                         -0.0f,
                                         1,
                                         Limits::quiet_NaN(),
                                         Limits::infinity(),
                                         -Limits::infinity(),
                                         Limits::max(),
                                         Limits::lowest(),
                                         Limits::min(),
                                         Limits::denorm_min()};
    const uint8_t choice = byte();
    return choice < 128 ? kSpecial[choice % std::size(kSpecial)]
                        : std::bit_cast<float>(in(INT32_MIN, INT32_MAX));
  }

  /// True once in `often`.
  bool seldom(int often) { return in(1, often) == often; }

  /// Pixels from the rest of the input, and from a generator seeded with it where that ends.
  uint8_t pixel() {
    if (next_ < size_) {
      const uint8_t value = data_[next_++];
      state_ = state_ * 31 + value;
      return value;
    }
    state_ = state_ * 1664525u + 1013904223u;
    return static_cast<uint8_t>(state_ >> 24);
  }

  bool atEnd() const { return next_ >= size_; }
  const uint8_t* rest() const { return data_ + next_; }
  size_t restSize() const { return size_ - next_; }

 private:
  const uint8_t* data_;
  size_t size_;
  size_t next_ = 0;
  uint32_t state_ = 1;
};

/// Ends the run as a finding, in every build.
#define FUZZ_CHECK(condition)                                                              \
  do {                                                                                     \
    if (!(condition)) {                                                                    \
      (void)fprintf(stderr, "%s:%d: does not hold: %s\n", __FILE__, __LINE__, #condition); \
      abort();                                                                             \
    }                                                                                      \
  } while (false)

}  // namespace kyface::fuzz
