// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// The tables of the lightness metrics: global, and rebuilt by every call that uses them.
#pragma once

#include <atomic>
#include <cstdint>

/// Linear light of a byte of sRGB, 0..2040. Every element is an atomic, read and written relaxed: callers on
/// several threads may rebuild the tables at once, all with the same values.
extern std::atomic<uint16_t> sRGBGammaTab[256];

/// Cube root of i / 2040, linear for the darkest, times 32768. Only the entries 0..2040 are read.
extern std::atomic<uint16_t> labCbrtTab[3072];

/// Fills both tables.
void initLuminanceTables();
