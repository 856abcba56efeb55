// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// Argument checks of the kernels that have them: a failed check is reported through the platform's
/// `__assert2` and ends the process, in every build type.
#pragma once

#include <cstdlib>

#if defined(__ANDROID__)
#include <assert.h>
#else
#include <assert2.h>
#endif

/// Checks `expression`, whose text as written is the message; `path` names the kernel family's source.
#define KERNEL_ASSERT(path, expression)                            \
  do {                                                             \
    if (!(expression)) {                                           \
      __assert2(path, __LINE__, __PRETTY_FUNCTION__, #expression); \
      abort();                                                     \
    }                                                              \
  } while (false)
