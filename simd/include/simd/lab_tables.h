// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// The tables behind Lab and lightness, computed at compile time: immutable, and the same on every platform.
///
/// No math library takes part. The entries are defined through `pow` in double and through fused steps in
/// double, each then rounded to float. `narrowed` makes that rounding and refuses to compile where the double
/// is so close to the middle between two floats that its last 12 bits could decide. So whatever `pow` is off
/// by in its last place, and whether a step is fused or not, gives these same entries.
#pragma once

#include <array>
#include <bit>
#include <cstddef>
#include <cstdint>

namespace HPC::fastcv::arm {

/// Linear light of byte i in units of 1 / kLinearUnit: 0..2040.
inline constexpr int kLinearUnit = 2040;
using GammaTable = std::array<uint16_t, 256>;

/// f(i / kLinearUnit) * 32768, f being the cube root with a linear toe.
using CubeRootTable = std::array<uint16_t, 3072>;

/// Weights of linear B, G and R in a coordinate, in units of 1 / 4096; the sum is rounded and shifted.
struct LinearWeights {
  uint16_t b, g, r;
};
inline constexpr LinearWeights kYWeights = {296, 2929, 871};
inline constexpr int kWeightShift = 12;

/// Lightness as a byte: (f(Y) * 296 - 1320550) >> 15 of the cube root table's entry. That is L * 2.55, with
/// the rounding in the offset: 40.3 * 32768.
inline constexpr uint32_t kLightnessScale = 296;
inline constexpr uint32_t kLightnessOffset = 1320550;
inline constexpr int kLightnessShift = 15;

/// A curve on [0, 1] in intervals of 1 / 1024. Interval k holds a0, a1, a2, a3: with u = v * 1024 - k the
/// curve at v is a0 + u * (a1 + u * (a2 + u * a3)).
inline constexpr int kSplineIntervals = 1024;
struct alignas(64) Spline {
  float piece[kSplineIntervals][4];
};

/// What a byte table of a curve is made of: the byte nearest to the curve at v * 255, for v in [kFloor, 1),
/// from one entry and one addition. As the curve grows, a byte's values begin at a threshold, and no two
/// thresholds lie in the same 128th of an octave: so the upper half of the float's bits names the entry, and
/// adding entry and float as integers carries into bit 16 from the threshold on. (entry + bits) >> 16 is the
/// byte.
struct alignas(64) ByteTable {
  static constexpr int kOctaves = 13;
  static constexpr int kPerOctave = 128;
  static constexpr int kShift = 16;
  static constexpr float kFloor = 0x1p-13f;
  static constexpr uint32_t kFirst = std::bit_cast<uint32_t>(kFloor) >> kShift;
  uint32_t entry[kOctaves * kPerOctave];
};

namespace tables {

// Never defined: calling one makes a computation no compile-time constant, and so an error.
void roundingIsTooCloseToCall();
void thresholdsAreTooClose();

/// `value` rounded to float, if no value within 2^-40 of it (relative) rounds differently.
constexpr float narrowed(double value) {
  const float nearest = static_cast<float>(value);
  const auto bits = std::bit_cast<int32_t>(nearest);
  if (nearest != 0.0f) {
    const double margin = (value < 0 ? -value : value) * 0x1p-40;
    const double towardsZero = (std::bit_cast<float>(bits - 1) + static_cast<double>(nearest)) / 2 - value;
    const double awayFromZero = (std::bit_cast<float>(bits + 1) + static_cast<double>(nearest)) / 2 - value;
    if ((towardsZero < 0 ? -towardsZero : towardsZero) < margin ||
        (awayFromZero < 0 ? -awayFromZero : awayFromZero) < margin) {
      roundingIsTooCloseToCall();
    }
  }
  return nearest;
}

constexpr double integerPower(double base, int exponent) {
  double power = 1;
  for (; exponent > 0; --exponent) {
    power *= base;
  }
  return power;
}

/// base ^ (p / q) for a base in (0, 1], off by a few units in the last place of a double: Newton's iteration
/// for the q-th root falls towards it from 1, until rounding ends the fall.
constexpr double rationalPower(double base, int p, int q) {
  double root = 1;
  for (;;) {
    const double next = root - (root - base / integerPower(root, q - 1)) / q;
    if (!(next < root)) {
      return integerPower(root, p);
    }
    root = next;
  }
}

/// sRGB to linear light.
constexpr float expanded(float x) {
  return x <= 0.04045f ? x * 0.07739938f : narrowed(rationalPower((x + 0.055) * 0.9478672985781991, 12, 5));
}

/// Linear light to sRGB.
constexpr float compressed(float x) {
  return x <= 0.0031308f ? x * 12.92f : narrowed(1.055 * rationalPower(x, 5, 12) - 0.055);
}

constexpr uint16_t entryOf(double scaled) {
  return static_cast<uint16_t>(scaled + 0.5 < 65536 ? scaled + 0.5 : 65535);
}

constexpr GammaTable gammaTable() {
  GammaTable table{};
  for (int i = 0; i < static_cast<int>(table.size()); ++i) {
    table[static_cast<size_t>(i)] = entryOf(expanded(static_cast<float>(i) * 0.003921569f) * kLinearUnit);
  }
  return table;
}

/// The cube root of x > 0 by an estimate on the bits of the float and three steps of Newton's. A step divides
/// by three with this constant of twelve digits, which is not the nearest double to a third: both show in an
/// entry.
constexpr float cubeRoot(float x) {
  constexpr int32_t kOne = std::bit_cast<int32_t>(1.0f);
  float y = std::bit_cast<float>(((std::bit_cast<int32_t>(x) - kOne) >> 10) * 341 + kOne);
  for (int step = 0; step < 3; ++step) {
    const float excess = y - x / (y * y);
    y = narrowed(y - excess * 0.333333333333);
  }
  return y;
}

constexpr CubeRootTable cubeRootTable() {
  CubeRootTable table{};
  for (int i = 0; i < static_cast<int>(table.size()); ++i) {
    const float x = static_cast<float>(i) * 0.0004901961f;
    const float y = x < 0.008856f ? narrowed(static_cast<double>(7.787f) * x + 0.13793103f) : cubeRoot(x);
    table[static_cast<size_t>(i)] = entryOf(y * 32768);
  }
  return table;
}

/// The natural cubic spline through `curve` at i / 1024, solved in float.
constexpr Spline splineOf(float (*curve)(float)) {
  constexpr int n = kSplineIntervals;
  float f[n + 1] = {};
  for (int i = 0; i <= n; ++i) {
    f[i] = curve(static_cast<float>(i) * 0.0009765625f);
  }
  float l[n] = {};
  float z[n] = {};
  for (int i = 1; i < n; ++i) {
    l[i] = 1.0f / (4.0f - l[i - 1]);
    z[i] = l[i] * (3.0f * (f[i + 1] - 2.0f * f[i] + f[i - 1]) - z[i - 1]);
  }
  Spline spline{};
  float next = 0;
  for (int i = n - 1; i >= 0; --i) {
    const float c = z[i] - l[i] * next;
    spline.piece[i][0] = f[i];
    spline.piece[i][1] = (f[i + 1] - f[i]) - (2.0f * c + next) * 0.33333334f;
    spline.piece[i][2] = c;
    spline.piece[i][3] = (next - c) * 0.33333334f;
    next = c;
  }
  return spline;
}

/// a * b + c, rounded once. The product is exact in double; the sum, if it is not, gets an odd last bit, so
/// that rounding it again gives what rounding the exact sum would.
constexpr float fusedMultiplyAdd(float a, float b, float c) {
  const double product = static_cast<double>(a) * b;
  const double sum = product + c;
  const double added = sum - product;
  const double error = (product - (sum - added)) + (c - added);
  const auto bits = std::bit_cast<int64_t>(sum);
  if (error == 0 || bits % 2 != 0) {
    return static_cast<float>(sum);
  }
  return static_cast<float>(std::bit_cast<double>((error > 0) == (sum > 0) ? bits + 1 : bits - 1));
}

/// The curve at v in [0, 1).
constexpr float valueAt(const Spline& spline, float v) {
  const float t = v * kSplineIntervals;
  const int k = static_cast<int>(t);
  const float u = t - static_cast<float>(k);
  const auto& a = spline.piece[k];
  return fusedMultiplyAdd(u, fusedMultiplyAdd(u, fusedMultiplyAdd(u, a[3], a[2]), a[1]), a[0]);
}

/// The table of a curve whose bytes begin at `threshold`s.
constexpr ByteTable byteTable(const Spline& spline) {
  constexpr int kBytes = 256;
  constexpr auto kEnd = std::bit_cast<uint32_t>(1.0f);
  // The bits of the first float of each byte; positive floats are ordered as their bits are.
  uint32_t threshold[kBytes + 1] = {};
  uint32_t below = std::bit_cast<uint32_t>(ByteTable::kFloor);
  for (int byte = 1; byte < kBytes; ++byte) {
    uint32_t from = kEnd;
    while (from - below > 1) {
      const uint32_t middle = below + (from - below) / 2;
      const float value = valueAt(spline, std::bit_cast<float>(middle));
      (static_cast<int>(fusedMultiplyAdd(value, 255, 0.5f)) < byte ? below : from) = middle;
    }
    threshold[byte] = from;
  }
  threshold[kBytes] = kEnd;
  ByteTable table{};
  uint32_t next = 1;
  uint32_t start = ByteTable::kFirst << ByteTable::kShift;
  for (uint32_t& entry : table.entry) {
    const uint32_t end = start + (1u << ByteTable::kShift);
    if (threshold[next] <= start) {
      ++next;
    }
    if (next < kBytes && threshold[next + 1] < end) {
      thresholdsAreTooClose();
    }
    entry = ((next - 1) << ByteTable::kShift) - start + (threshold[next] < end ? end - threshold[next] : 0);
    start = end;
  }
  return table;
}

}  // namespace tables

inline constexpr GammaTable kGammaTable = tables::gammaTable();
inline constexpr CubeRootTable kCubeRootTable = tables::cubeRootTable();
inline constexpr Spline kExpansionSpline = tables::splineOf(tables::expanded);
inline constexpr Spline kCompressionSpline = tables::splineOf(tables::compressed);
inline constexpr ByteTable kCompressedBytes = tables::byteTable(kCompressionSpline);

// No lightness needs a clamp: the root grows, from black to white it gives 0 to 255.
static_assert((kCubeRootTable[0] * kLightnessScale - kLightnessOffset) >> kLightnessShift == 0);
static_assert((kCubeRootTable[kLinearUnit] * kLightnessScale - kLightnessOffset) >> kLightnessShift == 255);

}  // namespace HPC::fastcv::arm
