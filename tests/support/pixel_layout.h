// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// What a layout of `convertPlanes` means for the size of a result.
#pragma once

#include "frame/planes.h"

namespace kyface::test {

/// Bytes of a pixel; of a pixel's luma in the 4:2:0 layouts.
inline int pixelBytesOf(PixelLayout layout) {
  switch (layout) {
    case PixelLayout::kRgba:
    case PixelLayout::kBgra:
      return 4;
    case PixelLayout::kRgb:
    case PixelLayout::kBgr:
      return 3;
    default:
      return 1;
  }
}

inline bool isSemiPlanar(PixelLayout layout) {
  return layout == PixelLayout::kNv21 || layout == PixelLayout::kNv12;
}

}  // namespace kyface::test
