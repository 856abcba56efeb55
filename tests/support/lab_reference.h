// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// The tables of Lab and lightness, entry by entry from their formulas, with the platform's own math library
/// and every rounding written out.
#pragma once

#include <array>
#include <cmath>
#include <cstdint>
#include <cstring>
#include <vector>

namespace kyface::test {

/// sRGB to linear light at a float, and back.
inline float expanded(float x) {
  if (x <= 0.04045f) {
    return x * 0.07739938f;
  }
  return static_cast<float>(std::pow((static_cast<double>(x) + 0.055) * 0.9478672985781991, 2.4));
}
inline float compressed(float x) {
  if (x <= 0.0031308f) {
    return x * 12.92f;
  }
  return static_cast<float>(std::fma(1.055, std::pow(static_cast<double>(x), 0.4166666666666667), -0.055));
}

inline int entryOf(float scaled) {
  const double rounded = static_cast<double>(scaled) + 0.5;
  return rounded >= 65536.0 ? 65535 : static_cast<int>(rounded);
}

inline int gammaEntry(int i) {
  const float x = static_cast<float>(i) * 0.003921569f;
  return entryOf(expanded(x) * 2040.0f);
}

inline float cubeRoot(float x) {
  const int32_t one = 0x3f800000;
  int32_t bits;
  memcpy(&bits, &x, sizeof(bits));
  const int32_t magnitude = bits & 0x7fffffff;
  const int32_t sign = bits - magnitude;
  const int32_t difference = magnitude - one;
  const int32_t floored = difference >= 0 ? difference / 1024 : -((1023 - difference) / 1024);
  const int32_t estimate = sign | (floored * 341 + one);
  float y;
  memcpy(&y, &estimate, sizeof(y));
  for (int step = 0; step < 3; ++step) {
    const float square = y * y;
    const float quotient = x / square;
    const float bracket = y - quotient;
    y = static_cast<float>(std::fma(-static_cast<double>(bracket), 0.333333333333, static_cast<double>(y)));
  }
  return y;
}

inline int cubeRootEntry(int i) {
  const float x = static_cast<float>(i) * 0.0004901961f;
  const float y = x < 0.008856f ? std::fma(7.787f, x, 0.13793103f) : cubeRoot(x);
  return entryOf(y * 32768.0f);
}

/// The four numbers of each of the 1024 intervals of the spline through `curve`.
inline std::vector<std::array<float, 4>> splineThrough(float (*curve)(float)) {
  constexpr int kIntervals = 1024;
  std::vector<float> f, l(1, 0.0f), z(1, 0.0f);
  for (int i = 0; i <= kIntervals; ++i) {
    f.push_back(curve(static_cast<float>(i) * 0.0009765625f));
  }
  for (int i = 1; i < kIntervals; ++i) {
    const float left = f[i - 1], middle = f[i], right = f[i + 1];
    l.push_back(1.0f / (4.0f - l[i - 1]));
    z.push_back(l[i] * (3.0f * ((right - 2.0f * middle) + left) - z[i - 1]));
  }
  std::vector<float> c(kIntervals + 1, 0.0f);
  std::vector<std::array<float, 4>> pieces(kIntervals);
  for (int i = kIntervals - 1; i >= 0; --i) {
    c[i] = z[i] - l[i] * c[i + 1];
    pieces[i] = {f[i], (f[i + 1] - f[i]) - (2.0f * c[i] + c[i + 1]) * 0.33333334f, c[i],
                 (c[i + 1] - c[i]) * 0.33333334f};
  }
  return pieces;
}

/// Lightness, 0..255, of a colour.
class LightnessReference {
 public:
  LightnessReference() {
    for (int i = 0; i < 256; ++i) {
      gamma_.push_back(gammaEntry(i));
    }
    for (int i = 0; i <= 2040; ++i) {
      root_.push_back(cubeRootEntry(i));
    }
  }
  int operator()(int b, int g, int r) const {
    const int y = (gamma_[g] * 2929 + gamma_[b] * 296 + gamma_[r] * 871 + 2048) / 4096;
    const int scaled = root_[y] * 296 - 1320550;
    const int lightness = scaled < 0 ? 0 : scaled / 32768;
    return lightness > 255 ? 255 : lightness;
  }

 private:
  std::vector<int> gamma_;
  std::vector<int> root_;
};

}  // namespace kyface::test
