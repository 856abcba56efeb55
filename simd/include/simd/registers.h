// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// How kernels tell the compiler what it is to keep in registers.
#pragma once

namespace HPC::fastcv::arm {

/// Hides where a value comes from. The compiler then keeps it in its register, where it would otherwise
/// derive it again from others at every use, or make it the by-product of a load or store, for which in-order
/// cores wait.
template <typename T>
inline __attribute__((always_inline)) void keepInRegister(T& value) {
  asm("" : "+r"(value));
}

/// Hides how a vector was made. The compiler would make parts of it a second time where only those are used,
/// and constants one to a register.
template <typename V>
inline V opaque(V v) {
#if defined(__ARM_NEON)
  asm("" : "+w"(v));
#endif
  return v;
}

}  // namespace HPC::fastcv::arm
