// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// Where a region of an image ends.
#pragma once

#include <cstdint>

namespace kyface::brightness {

/// Whether `extent` samples from `start` on reach beyond an image of `size` samples. In 64 bits: the sum of
/// two ints need not be one.
inline bool reachesBeyond(int start, int extent, int size) { return int64_t{start} + extent > size; }

}  // namespace kyface::brightness
