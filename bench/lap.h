// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// How a call is measured under the counting plugin.
#pragma once

#include <functional>

namespace bench {

/// Ends a lap of the counting plugin; nothing without it.
inline void mark() {
#if defined(__aarch64__)
  asm volatile("hint #112" : : : "memory");
#endif
}

/// Calls once to warm up and then, between markers, `repeats` times and three times as often. What is
/// prepared once or decided at the first call cancels out of the difference, which is that of 2 * `repeats`
/// calls.
inline void measure(const std::function<void()>& call, int repeats) {
  call();
  mark();
  for (const int times : {repeats, 3 * repeats}) {
    for (int i = 0; i < times; ++i) {
      call();
    }
    mark();
  }
}

}  // namespace bench
