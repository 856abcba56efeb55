// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// The report of a failed assertion. Android declares it in <assert.h>; a desktop's C library has none.
#pragma once

#ifdef __cplusplus
extern "C" {
#endif

/// Prints file, line, function and expression to standard error and ends the process with SIGABRT.
void __assert2(const char* file, int line, const char* function, const char* expression)
    __attribute__((noreturn));

#ifdef __cplusplus
}
#endif
