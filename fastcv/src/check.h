// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// What the checks of the front-ends share.
#pragma once

#include "fastcv/fastcv.h"

namespace HPC::fastcv {

/// The step in elements, its low 32 bits: what the checks compare and the kernels are given.
template <typename T, int nc>
inline int elementStride(const Mat<T, nc, ECO_ENV_ARM>& mat) {
  constexpr int kShift = sizeof(T) == 4 ? 2 : 0;
  return static_cast<int>(mat.step >> kShift);
}

/// a * b and a + b in 32 bits, wrapping: the checks are made in that arithmetic whatever a matrix says.
inline int wrappingMultiply(int a, int b) {
  return static_cast<int>(static_cast<unsigned>(a) * static_cast<unsigned>(b));
}
inline int wrappingAdd(int a, int b) {
  return static_cast<int>(static_cast<unsigned>(a) + static_cast<unsigned>(b));
}

}  // namespace HPC::fastcv
