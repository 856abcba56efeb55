// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// What kernels hide from the compiler. No instruction comes of it.
#pragma once

#include <type_traits>

namespace HPC::fastcv::arm {

/// Makes the compiler forget what it knows about a value (that it is a constant, how it was made, how far it
/// is from another), where it would use that to a loop's disadvantage: derive the value again at every use,
/// make parts of it a second time, or make it the by-product of a load or store, for which in-order cores
/// wait.
template <typename T>
inline __attribute__((always_inline)) void forget(T& value) {
  if constexpr (std::is_scalar_v<T>) {
    asm("" : "+r"(value));
  } else {
#if defined(__ARM_NEON)
    asm("" : "+w"(value));
#elif defined(__clang__)
    if constexpr (sizeof(T) >= 16) {  // it has no such register for less
      asm("" : "+x"(value));
    }
#else
    asm("" : "+x"(value));
#endif
  }
}

/// A vector of constants, in a register or in memory. With GCC on x86-64 it is forgotten: of products with
/// what it knows GCC makes several shifts and additions, and it makes constants anew, in a loop time and
/// again.
template <typename V>
inline V kept(V v) {
#if !defined(__clang__) && !defined(__ARM_NEON)
  forget(v);
#endif
  return v;
}

}  // namespace HPC::fastcv::arm
