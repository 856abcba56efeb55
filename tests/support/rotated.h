// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// What a rotation shows where.
#pragma once

namespace kyface::test {

struct Place {
  int row;
  int column;
};

/// The source pixel that belongs at destination (r, c) when an image of this size is turned clockwise by
/// `degree`: 90, 180 or 270.
inline Place sourceOf(int degree, int height, int width, int r, int c) {
  switch (degree) {
    case 90:
      return {height - 1 - c, r};
    case 180:
      return {height - 1 - r, width - 1 - c};
    default:
      return {c, width - 1 - r};
  }
}

}  // namespace kyface::test
