// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// The sum behind the lightness metrics, for regions of any size.
#pragma once

#include <cstddef>
#include <cstdint>

namespace kyface::brightness {

/// The lightness (L* of CIE Lab scaled to 0..255, as calcLuminance_RGBA and calcLuminance_BGRA have it) of
/// `columns` by `rows` 4-byte pixels, summed up. `first` is the first pixel's first byte, `stride` the bytes
/// from one row to the next. With `rgba` red is a pixel's first byte, else blue.
std::uint64_t totalLightness(const unsigned char* first, std::ptrdiff_t stride, int columns, int rows,
                             bool rgba);

}  // namespace kyface::brightness
