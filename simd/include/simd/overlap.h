// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// Whether places in memory overlap.
#pragma once

#include <cstddef>
#include <cstdint>

namespace HPC::fastcv::arm {

/// Whether `aSize` elements at `a` and `bSize` at `b` share no byte.
template <typename A, typename B>
inline bool areApart(const A* a, ptrdiff_t aSize, const B* b, ptrdiff_t bSize) {
  return reinterpret_cast<uintptr_t>(a + aSize) <= reinterpret_cast<uintptr_t>(b) ||
         reinterpret_cast<uintptr_t>(b + bSize) <= reinterpret_cast<uintptr_t>(a);
}

}  // namespace HPC::fastcv::arm
