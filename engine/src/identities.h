// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// The numbers by which a tracker tells faces apart.
#pragma once

#include <cstdint>
#include <limits>

namespace kyengine {

/// Hands out numbers from 1 on. After the largest come those from 1 on again that nobody has.
class Identities {
 public:
  explicit Identities(int32_t last = 0) : last_(last) {}

  /// A number that `taken(number)` is false for; there must be one.
  template <typename Taken>
  int32_t next(const Taken& taken) {
    do {
      last_ = last_ == std::numeric_limits<int32_t>::max() ? 1 : last_ + 1;
    } while (taken(last_));
    return last_;
  }

 private:
  int32_t last_;
};

}  // namespace kyengine
