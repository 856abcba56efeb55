/// Copies of rows of bytes.
#pragma once

#include <cstddef>
#include <cstring>

#include "neon.h"
#include "registers.h"

namespace HPC::fastcv::arm {

/// Copies `size` bytes; where the two places overlap, they arrive as they were. A loop of its own: the rows
/// of a picture are too short for what a call of `memcpy` decides first, and what that costs depends on the
/// platform.
inline void copyRow(const unsigned char* src, unsigned char* dst, ptrdiff_t size) {
  constexpr ptrdiff_t kBlock = 64;
  if (size < kBlock || (src < dst + size && dst < src + size)) {
    memmove(dst, src, static_cast<size_t>(size));
    return;
  }
  const ptrdiff_t last = size - kBlock;
  const unsigned char* const lastSrc = src + last;
  unsigned char* const lastDst = dst + last;
  for (ptrdiff_t n = size / kBlock; n != 0; --n) {
    const uint8x16x4_t block = vld1q_u8_x4(src);
    keepInRegister(src);
    src += kBlock;
    vst1q_u8_x4(dst, block);
    keepInRegister(dst);
    dst += kBlock;
  }
  if (size % kBlock != 0) {
    // Flush with the end, overlapping the block before.
    vst1q_u8_x4(lastDst, vld1q_u8_x4(lastSrc));
  }
}

}  // namespace HPC::fastcv::arm
