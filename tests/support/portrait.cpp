// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// The portrait as a part of the program. The assembler brings it in: as an array in C++ it would be slow to
// compile.

#include <string_view>

#include "tests/support/picture.h"

asm(".section .rodata\n"
    "ky_portrait: .incbin \"" KY_PORTRAIT
    "\"\n"
    "ky_portrait_end:\n"
    ".previous\n");
extern "C" const char ky_portrait[];
extern "C" const char ky_portrait_end[];

namespace kyengine::test {

std::string_view PortraitFile() { return {ky_portrait, ky_portrait_end}; }

}  // namespace kyengine::test
