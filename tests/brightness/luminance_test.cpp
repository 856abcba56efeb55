// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// The tables of the lightness metrics, their rebuilding, and the sum over them.

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <vector>

#include "brightness/brightness.h"
#include "brightness/src/lightness_sum.h"
#include "brightness/src/luminance_tables.h"
#include "brightness/total_lightness.h"
#include "tests/support/lab_reference.h"
#include "tests/support/sparse_memory.h"

namespace {

using kyface::brightness::LightnessSum;
using kyface::test::cubeRootEntry;
using kyface::test::gammaEntry;
using kyface::test::LightnessReference;

using Calc = unsigned char (*)(const unsigned char*, int, int, int, int, int, int, int, int);

void expectTables() {
  for (int i = 0; i < 256; ++i) {
    ASSERT_EQ(sRGBGammaTab[i].load(), gammaEntry(i)) << i;
  }
  for (int i = 0; i < 3072; ++i) {
    ASSERT_EQ(labCbrtTab[i].load(), cubeRootEntry(i)) << i;
  }
}

TEST(LuminanceTables, EveryEntry) {
  initLuminanceTables();
  expectTables();
  // The one entry that shows in which precision Newton's steps are made.
  EXPECT_EQ(labCbrtTab[324].load(), 17745);
  EXPECT_EQ(labCbrtTab[2040].load(), 32768);
}

// The mathematical functions in long double, wherever they are not next to a rounding.
TEST(LuminanceTables, AreTheCurves) {
  initLuminanceTables();
  int unclear = 0;
  const auto expectNear = [&](int entry, long double exact, long double unsure, int i) {
    const long double rounded = exact + 0.5L;
    const long double fraction = rounded - std::floor(rounded);
    if (fraction < unsure || fraction > 1 - unsure) {
      ++unclear;
    } else {
      EXPECT_EQ(entry, static_cast<int>(std::floor(rounded))) << i;
    }
  };
  for (int i = 0; i < 256; ++i) {
    const long double x = i / 255.0L;
    expectNear(sRGBGammaTab[i].load(), 2040 * (i <= 10 ? x / 12.92L : std::pow((x + 0.055L) / 1.055L, 2.4L)),
               0.001L, i);
  }
  for (int i = 0; i < 3072; ++i) {
    const long double x = i / 2040.0L;
    expectNear(labCbrtTab[i].load(), 32768 * (x < 0.008856L ? 7.787L * x + 16.0L / 116 : std::cbrt(x)), 0.02L,
               i);
  }
  EXPECT_LT(unclear, 3328 * 5 / 100);
}

TEST(LuminanceTables, AreRebuiltByEveryCall) {
  const unsigned char pixel[4] = {10, 20, 30, 40};
  for (const Calc calc : {calcLuminance_BGRA, calcLuminance_RGBA}) {
    for (auto& entry : sRGBGammaTab) {
      entry = 1;
    }
    for (auto& entry : labCbrtTab) {
      entry = 2;
    }
    calc(pixel, 1, 4, 1, 1, 0, 0, 1, 1);
    expectTables();
  }
}

// Every colour, in blocks with different reds.
template <int blue>
void expectEveryColour() {
  constexpr int kBlock = kyface::brightness::kBlock;
  initLuminanceTables();
  const LightnessReference reference;
  LightnessSum<blue> sum;
  uint32_t before = 0;
  for (int b = 0; b < 256; ++b) {
    for (int g = 0; g < 256; ++g) {
      for (int r = 0; r < 256; r += kBlock) {
        unsigned char bytes[4 * kBlock];
        uint32_t expected = 0;
        for (int i = 0; i < kBlock; ++i) {
          bytes[4 * i + blue] = static_cast<unsigned char>(b);
          bytes[4 * i + 1] = static_cast<unsigned char>(g);
          bytes[4 * i + 2 - blue] = static_cast<unsigned char>(r + i);
          bytes[4 * i + 3] = static_cast<unsigned char>(b + i);
          expected += static_cast<uint32_t>(reference(b, g, r + i));
        }
        const auto block = kyface::brightness::loadBlock<LightnessSum<blue>>(bytes);
        sum.add({block});
        ASSERT_EQ(sum.total() - before, expected) << b << ", " << g << ", " << r;
        before = sum.total();
      }
    }
  }
}

TEST(LightnessSum, EveryColourBlueFirst) { expectEveryColour<0>(); }
TEST(LightnessSum, EveryColourRedFirst) { expectEveryColour<2>(); }

/// White pixels, as many as have a sum that 32 bits do not hold, in the memory of a few.
TEST(TotalLightness, IsWholeBeyond32Bits) {
  constexpr size_t kBlock = 1 << 16;
  constexpr int kColumns = 1029 * (kBlock / 4);
  static_assert(int64_t{kColumns} * 255 > int64_t{1} << 32);
  const kyface::test::RepeatedMemory memory(1029, kBlock);
  unsigned char* const pixels = memory.as<unsigned char>();
  std::fill_n(pixels, kBlock, 255);
  std::fill_n(pixels + 1028 * kBlock, kBlock, 255);
  const auto total = [&](int columns, int rows, bool rgba) {
    return kyface::brightness::totalLightness(pixels, 0, columns, rows, rgba);
  };
  // Each only once: they are many pixels for an emulator.
  EXPECT_EQ(total(kColumns, 1, true), uint64_t{255} * kColumns);
  EXPECT_EQ(total(kColumns - 5, 2, false), uint64_t{255} * 2 * (kColumns - 5)) << "rows that are parted";
  EXPECT_EQ(total(kColumns / 3, 4, false), uint64_t{255} * 4 * (kColumns / 3))
      << "of which some fit together";
}

}  // namespace
