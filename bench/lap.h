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

/// Calls once to warm up, for what is prepared once or decided at the first call. Between markers it then
/// calls not at all, and `times` times: the difference of these laps is that of the calls alone.
inline void measure(const std::function<void()>& call, int times) {
  call();
  mark();
  for (const int calls : {0, times}) {
    for (int i = 0; i < calls; ++i) {
      call();
    }
    mark();
  }
}

}  // namespace bench
