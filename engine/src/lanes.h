// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// Sixteen floats in registers, and what the engine's convolutions do with them. Each operation rounds
/// the same way on both architectures: lanes never meet, and a multiply-add rounds once.
#pragma once

#include <bit>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <iterator>
#include <type_traits>
#include <utility>

#include "simd/vector.h"

namespace kyengine {

namespace simd = HPC::fastcv::arm;

constexpr int kLanes = 16;

struct Lanes {
  simd::Floats v[kLanes * sizeof(float) / sizeof(simd::Floats)];
};

/// A result of each register, by its number.
template <typename Operation>
inline Lanes eachOf(Operation operation) {
  return [&]<size_t... i>(std::index_sequence<i...>) -> Lanes {
    return {{operation(i)...}};
  }(std::make_index_sequence<std::size(Lanes{}.v)>());
}

inline Lanes broadcast(float x) {
  return eachOf([x](size_t) { return simd::splat<simd::Floats>(x); });
}

inline Lanes load(const float* p) {
  return eachOf([p](size_t i) { return simd::load(p + i * (sizeof(simd::Floats) / sizeof(float))); });
}

inline void store(const Lanes& a, float* p) {
  for (const simd::Floats& v : a.v) {
    simd::store(p, v);
    p += sizeof(v) / sizeof(float);
  }
}

/// Sixteen numbers in as many bytes as they take, or four floats in 16 bytes: whole registers or parts of
/// one.
template <typename T>
using Sixteen __attribute__((vector_size(kLanes * sizeof(T)))) = T;
typedef float Four __attribute__((vector_size(16)));

inline Sixteen<uint8_t> loadSixteen(const uint8_t* p) {
  Sixteen<uint8_t> bytes;
  std::memcpy(&bytes, p, sizeof(bytes));
  return bytes;
}
inline Four loadFour(const float* p) {
  Four four;
  std::memcpy(&four, p, sizeof(four));
  return four;
}

/// Whole numbers as floats.
template <typename T>
inline Lanes lanesOf(const T& numbers) {
  return std::bit_cast<Lanes>(
      __builtin_convertvector(__builtin_convertvector(numbers, Sixteen<int32_t>), Sixteen<float>));
}

/// Sixteen bytes less `zero`.
inline Lanes loadBytes(const uint8_t* p, uint8_t zero = 0) {
  using Numbers = Sixteen<int16_t>;
  return lanesOf(__builtin_convertvector(loadSixteen(p), Numbers) -
                 __builtin_convertvector(Sixteen<uint8_t>{} + zero, Numbers));
}

/// Stores the whole parts of numbers from 0 to 255.
inline void storeBytes(const Lanes& a, uint8_t* p) {
  Sixteen<float> numbers;
  std::memcpy(&numbers, &a, sizeof(numbers));
  const auto whole = __builtin_convertvector(numbers, Sixteen<int32_t>);
  const auto bytes =
      __builtin_convertvector(__builtin_convertvector(whole, Sixteen<int16_t>), Sixteen<uint8_t>);
  std::memcpy(p, &bytes, sizeof(bytes));
}

inline Lanes operator+(const Lanes& a, const Lanes& b) {
  return eachOf([&](size_t i) { return a.v[i] + b.v[i]; });
}
inline Lanes operator-(const Lanes& a, const Lanes& b) {
  return eachOf([&](size_t i) { return a.v[i] - b.v[i]; });
}
inline Lanes operator*(const Lanes& a, const Lanes& b) {
  return eachOf([&](size_t i) { return a.v[i] * b.v[i]; });
}

/// Of a NaN in `b` it makes one.
inline Lanes max(const Lanes& a, const Lanes& b) {
  return eachOf([&](size_t i) { return simd::max(b.v[i], a.v[i]); });
}

/// Square roots of whole numbers.
inline Lanes root(const Lanes& a) {
  return eachOf([&](size_t i) { return simd::rootOfWhole(a.v[i]); });
}

/// sum + a b, rounded once.
inline Lanes multiplyAdd(const Lanes& sum, const Lanes& a, const Lanes& b) {
  return eachOf([&](size_t i) { return simd::multiplyAdd(sum.v[i], a.v[i], b.v[i]); });
}

/// sum - a b, rounded once.
inline Lanes multiplySubtract(const Lanes& sum, const Lanes& a, const Lanes& b) {
  return eachOf([&](size_t i) { return simd::multiplySubtract(sum.v[i], a.v[i], b.v[i]); });
}

/// sums[i] += weights x[i][at] for the sixteen weights at `weights`.
template <int count>
inline void addProducts(Lanes (&sums)[count], const float* weights, const float* const (&x)[count],
                        ptrdiff_t at) {
  const Lanes w = load(weights);
#pragma GCC unroll 8
  for (int i = 0; i < count; ++i) {
    sums[i] = multiplyAdd(sums[i], w, broadcast(x[i][at]));
  }
}

/// The same of four consecutive `at`, each with its sixteen weights, one after the other.
template <int count>
inline void addFourProducts(Lanes (&sums)[count], const float* weights, const float* const (&x)[count]) {
  // On Arm the four numbers of a pixel come with one load and are multiplied from their lanes.
  Four four[count];
#pragma GCC unroll 8
  for (int i = 0; i < count; ++i) {
    four[i] = loadFour(x[i]);
  }
#pragma GCC unroll 4
  for (int k = 0; k < 4; ++k) {
    const Lanes w = load(weights + static_cast<ptrdiff_t>(kLanes) * k);
#pragma GCC unroll 8
    for (int i = 0; i < count; ++i) {
      sums[i] = multiplyAdd(sums[i], w, broadcast(four[i][k]));
    }
  }
}

}  // namespace kyengine
