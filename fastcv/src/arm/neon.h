/// The NEON intrinsics: the compiler's own on Arm, SIMDe's elsewhere. Kernels include nothing else for them.
#pragma once

#if defined(__ARM_NEON)
#include <arm_neon.h>
#else
#define SIMDE_ENABLE_NATIVE_ALIASES
#include <simde/arm/neon.h>
#if defined(__AVX2__)
#include "neon_x86.h"
#endif
#endif
