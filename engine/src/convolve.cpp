// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

#include "convolve.h"

#include <type_traits>

#include "lanes.h"

namespace kyengine {
namespace {

/// Pixels whose sums are in registers at a time: with 16 channels each, 20 of the 32 vectors of 64-bit Arm
/// and 10 of the 16 of AVX2, which leaves room for the weights and the numbers that they meet.
constexpr int kPixels = 5;

/// Adds the products of `rows` rows of `run` consecutive numbers, `row` apart, from each of the places `x`,
/// with their weights.
template <int count>
inline void AddWindow(Lanes (&sums)[count], const float* weights, const float* const (&x)[count], int rows,
                      int run, ptrdiff_t row) {
  for (ptrdiff_t start = 0; rows > 0; --rows, start += row) {
    const ptrdiff_t end = start + run;
    const ptrdiff_t last_four = end - 4;
    ptrdiff_t at = start;
    for (; at <= last_four; at += 4) {
      AddFourProducts(sums, weights, x, at);
      weights += ptrdiff_t{4} * kLanes;
    }
    for (; at < end; ++at) {
      AddProducts(sums, weights, x, at);
      weights += kLanes;
    }
  }
}

/// The 16 weights of each product of a group of output channels, as floats: the model's own, or in `memory`.
const float* WeightsOf(const Convolution& c, int group, float* memory) {
  const size_t count =
      static_cast<size_t>(c.side) * static_cast<size_t>(c.side) * static_cast<size_t>(c.inputs) * kLanes;
  const size_t first = static_cast<size_t>(group) * count;
  if (c.floats.ok()) {
    return c.floats.data() + first;
  }
#pragma GCC unroll 4
  for (size_t i = 0; i < count; i += kLanes) {
    Store(LoadBytes(c.bytes.data() + first + i, c.zero), memory + i);
  }
  return memory;
}

}  // namespace

void Convolve(const Convolution& c, const Map& from, const float* start, int side, const Finish& finish,
              const Map& to, float* memory) {
  const int run = c.side * c.inputs;
  const ptrdiff_t row = from.row();
  const ptrdiff_t step = static_cast<ptrdiff_t>(c.step) * c.inputs;
  const Lanes zero = Broadcast(0);
  for (int group = 0; group < c.outputs / kLanes; ++group) {
    const float* const weights = WeightsOf(c, group, memory);
    const ptrdiff_t first_channel = static_cast<ptrdiff_t>(group) * kLanes;
    const Lanes factor = Load(c.factors.data() + first_channel);
    const Lanes offset = Load(c.offsets.data() + first_channel);

    int y = 0;
    int x = 0;
    const auto some = [&]<int count>(std::integral_constant<int, count>) {
      const float* places[count];
      ptrdiff_t at[count];
      for (int i = 0; i < count; ++i) {
        places[i] = start + y * c.step * row + x * step;
        at[i] = to.at(y, x) - to.data + first_channel;
        if (++x == side) {
          x = 0;
          ++y;
        }
      }
      Lanes sums[count];
#pragma GCC unroll 8
      for (int i = 0; i < count; ++i) {
        sums[i] = zero;
      }
      AddWindow(sums, weights, places, c.side, run, row);
#pragma GCC unroll 8
      for (int i = 0; i < count; ++i) {
        Lanes result = MultiplyAdd(offset, sums[i], factor);
        if (finish.skip != nullptr) {
          result = Add(result, Load(finish.skip->data + at[i]));
        }
        Store(finish.rectify ? Max(result, zero) : result, to.data + at[i]);
      }
    };
    int left = side * side;
    for (; left >= kPixels; left -= kPixels) {
      some(std::integral_constant<int, kPixels>());
    }
    switch (left) {
      case 4:
        some(std::integral_constant<int, 4>());
        break;
      case 3:
        some(std::integral_constant<int, 3>());
        break;
      case 2:
        some(std::integral_constant<int, 2>());
        break;
      case 1:
        some(std::integral_constant<int, 1>());
        break;
      default:
        break;
    }
  }
}

}  // namespace kyengine
