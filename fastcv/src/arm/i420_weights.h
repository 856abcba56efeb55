// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// The weights of I420, of 2^20, and the sums that are made with them.
#pragma once

#include "simd/vector.h"

namespace HPC::fastcv::i420 {

using namespace arm;

constexpr int kShift = 20;
constexpr int kHalf = 1 << (kShift - 1);

constexpr int kYZero = 16, kChromaZero = 128;
constexpr int kYGain = 1220542;
constexpr int kBU = 2116026;
constexpr int kGU = -409993, kGV = -852492;
constexpr int kRV = 1673527;

constexpr int kYB = 102760, kYG = 528482, kYR = 269484;
constexpr int kUB = 460324, kUG = -305135, kUR = -155188;
constexpr int kVB = -74448, kVG = -385875, kVR = 460324;

/// Of the even and of the odd columns of a block.
struct EvenOdd {
  Two<SignedWords> even;
  Two<SignedWords> odd;
};

/// What a block's chroma adds to blue and red and takes from green.
struct Terms {
  Two<SignedWords> b, minusG, r;
};

}  // namespace HPC::fastcv::i420
