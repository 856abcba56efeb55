// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

#include <assert2.h>
#include <stdio.h>
#include <stdlib.h>

extern "C" void __assert2(const char* file, int line, const char* function, const char* expression) {
  (void)fprintf(stderr, "%s:%d: %s: assertion \"%s\" failed\n", file, line, function, expression);
  abort();
}
