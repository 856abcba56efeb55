// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// Semi-planar 4:2:0 conversions pixel by pixel, from the formulas: what the frame helpers are compared with.
#pragma once

#include <algorithm>
#include <random>
#include <vector>

namespace reference {

using Bytes = std::vector<unsigned char>;

/// Where the colours are in a pixel, and how many bytes it has.
struct Layout {
  int blue;
  int red;
  int channels;
};
constexpr Layout kBgr = {0, 2, 3};
constexpr Layout kBgra = {0, 2, 4};
constexpr Layout kRgb = {2, 0, 3};
constexpr Layout kRgba = {2, 0, 4};

/// Where V is in a chroma pair.
enum Chroma { kNv21 = 0, kNv12 = 1 };

inline unsigned char clamp(int value) { return static_cast<unsigned char>(std::clamp(value, 0, 255)); }

inline size_t frameSize(int width, int height) { return static_cast<size_t>(width) * height * 3 / 2; }

inline Bytes randomBytes(size_t size, unsigned seed) {
  std::mt19937 generator(seed);
  Bytes bytes(size);
  for (unsigned char& byte : bytes) {
    byte = static_cast<unsigned char>(generator());
  }
  return bytes;
}

/// A frame as pixels; a fourth channel is opaque.
inline Bytes toPixels(const Bytes& frame, int width, int height, Chroma chroma, Layout layout) {
  Bytes pixels(static_cast<size_t>(width) * height * layout.channels, 255);
  for (int y = 0; y < height; ++y) {
    for (int x = 0; x < width; ++x) {
      const unsigned char* pair = &frame[static_cast<size_t>(width) * (height + y / 2) + x / 2 * 2];
      const int luma = 64 * frame[static_cast<size_t>(width) * y + x] + 32;
      const int v = pair[chroma] - 128;
      const int u = pair[1 - chroma] - 128;
      unsigned char* pixel = &pixels[(static_cast<size_t>(width) * y + x) * layout.channels];
      pixel[layout.blue] = clamp((luma + 110 * u) >> 6);
      pixel[1] = clamp((luma - 24 * u - 44 * v) >> 6);
      pixel[layout.red] = clamp((luma + 86 * v) >> 6);
    }
  }
  return pixels;
}

/// Pixels as a frame; the chroma of a 2 x 2 block is that of its top-left pixel.
inline Bytes toFrame(const Bytes& pixels, int width, int height, Chroma chroma, Layout layout) {
  Bytes frame(frameSize(width, height));
  for (int y = 0; y < height; ++y) {
    for (int x = 0; x < width; ++x) {
      const unsigned char* pixel = &pixels[(static_cast<size_t>(width) * y + x) * layout.channels];
      const int b = pixel[layout.blue];
      const int g = pixel[1];
      const int r = pixel[layout.red];
      frame[static_cast<size_t>(width) * y + x] =
          static_cast<unsigned char>((16 * b + 74 * g + 38 * r + 64) >> 7);
      if (y % 2 == 0 && x % 2 == 0) {
        unsigned char* pair = &frame[static_cast<size_t>(width) * (height + y / 2) + x];
        pair[chroma] = clamp(((-12 * b - 55 * g + 67 * r + 64) >> 7) + 128);
        pair[1 - chroma] = clamp(((65 * b - 43 * g - 22 * r + 64) >> 7) + 128);
      }
    }
  }
  return frame;
}

}  // namespace reference
