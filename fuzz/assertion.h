// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// The platform's assertion report as something that a fuzz target can expect: the target's program defines
/// `__assert2`, which comes back here instead of ending the process.
#pragma once

#include <assert2.h>

#include <csetjmp>

namespace kyface::fuzz {

inline jmp_buf assertionReturn;

/// Whether an assertion failed in `call`, which owns nothing that would have to be destroyed.
template <typename Call>
bool asserted(const Call& call) {
  if (setjmp(assertionReturn) != 0) {
    return true;
  }
  call();
  return false;
}

}  // namespace kyface::fuzz

extern "C" void __assert2(const char* /*file*/, int /*line*/, const char* /*function*/,
                          const char* /*expression*/) {
  longjmp(kyface::fuzz::assertionReturn, 1);
}
