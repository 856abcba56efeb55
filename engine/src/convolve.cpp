// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

#include "convolve.h"

#include <algorithm>
#include <type_traits>

#include "lanes.h"

namespace kyengine {
namespace {

/// Pixels whose sums are in registers at a time: with 16 channels each, 20 of the 32 vectors of 64-bit Arm
/// and 10 of the 16 of AVX2, which leaves room for the weights and the numbers that they meet.
constexpr int kPixels = 5;

/// Calls `some` with five at a time, as a constant, and with what is left at last.
template <typename Some>
void inFives(ptrdiff_t all, Some some) {
  static_assert(kPixels == 5);
  for (; all >= kPixels; all -= kPixels) {
    some(std::integral_constant<int, kPixels>());
  }
  switch (all) {
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

/// The sums of the products of `rows` rows of `run` consecutive numbers, `row` apart, from each of `places`
/// on, with their weights.
template <int count>
inline void sumWindow(Lanes (&sums)[count], const float* weights, const float* const (&places)[count],
                      int rows, int run, ptrdiff_t row) {
#pragma GCC unroll 8
  for (Lanes& sum : sums) {
    sum = broadcast(0);
  }
  const float* at[count];
  std::copy_n(places, count, at);
  const auto advance = [&at](ptrdiff_t by) {
    for (const float*& place : at) {
      place += by;
    }
  };
  for (; rows > 0; --rows) {
    for (int fours = run / 4; fours > 0; --fours) {
      addFourProducts(sums, weights, at);
      weights += ptrdiff_t{4} * kLanes;
      advance(4);
    }
    for (int left = run % 4; left > 0; --left) {
      addProducts(sums, weights, at, 0);
      weights += kLanes;
      advance(1);
    }
    advance(row - run);
  }
}

/// Makes results of sums, for 16 channels from `channel` on.
class Finisher {
 public:
  /// The sums are so many times too large as `scale` is less than 1.
  Finisher(const Convolution& c, const Finish& finish, const Map& to, int channel, float scale)
      : factor_(load(c.factors.data() + channel) * broadcast(scale)),
        offset_(load(c.offsets.data() + channel)),
        rectify_(finish.rectify),
        skip_(finish.skip == nullptr ? nullptr : finish.skip->data),
        to_(to.data) {}

  /// Stores the result of a sum; `at` is where, in the map and in the skip.
  void store(const Lanes& sum, ptrdiff_t at) const {
    Lanes result = multiplyAdd(offset_, sum, factor_);
    if (skip_ != nullptr) {
      result = result + load(skip_ + at);
    }
    kyengine::store(rectify_ ? max(result, broadcast(0)) : result, to_ + at);
  }

 private:
  Lanes factor_;
  Lanes offset_;
  bool rectify_;
  const float* skip_;
  float* to_;
};

/// The weights that lead to 16 output channels.
size_t groupWeights(const Convolution& c) {
  return static_cast<size_t>(c.side) * static_cast<size_t>(c.side) * static_cast<size_t>(c.inputs) * kLanes;
}

/// Sixteen weights as floats.
Lanes loadWeights(const Convolution& c, size_t at) {
  return c.floats.ok() ? load(c.floats.data() + at) : loadBytes(c.bytes.data() + at, c.zero);
}

// ---- by definition

/// The 16 weights of each product of a group of output channels, as floats: the model's own, or in `memory`.
const float* weightsOf(const Convolution& c, size_t first, float* memory) {
  if (c.floats.ok()) {
    return c.floats.data() + first;
  }
  const size_t count = groupWeights(c);
#pragma GCC unroll 4
  for (size_t i = 0; i < count; i += kLanes) {
    store(loadBytes(c.bytes.data() + first + i, c.zero), memory + i);
  }
  return memory;
}

void convolveDirectly(const Convolution& c, const Map& from, const Finish& finish, const Map& to,
                      float* memory) {
  const int side = resultSide(from.side, c.side, c.step);
  const int border = c.step == 1 ? c.side / 2 : 0;
  const float* const start = from.at(-border, -border);
  const ptrdiff_t step = static_cast<ptrdiff_t>(c.step) * c.inputs;
  size_t first = 0;
  for (int channel = 0; channel < c.outputs; channel += kLanes) {
    const float* const weights = weightsOf(c, first, memory);
    first += groupWeights(c);
    const Finisher finisher(c, finish, to, channel, 1);
    int y = 0;
    int x = 0;
    inFives(ptrdiff_t{side} * side, [&]<int count>(std::integral_constant<int, count>) {
      const float* places[count];
      ptrdiff_t at[count];
      for (int i = 0; i < count; ++i) {
        places[i] = start + y * c.step * from.row() + x * step;
        at[i] = to.at(y, x) - to.data + channel;
        if (++x == side) {
          x = 0;
          ++y;
        }
      }
      Lanes sums[count];
      sumWindow(sums, weights, places, c.side, c.side * c.inputs, from.row());
#pragma GCC unroll 8
      for (int i = 0; i < count; ++i) {
        finisher.store(sums[i], at[i]);
      }
    });
  }
}

// ---- in tiles

// 3 x 3 in steps of one by Winograd's F(4 x 4, 3 x 3): where the polynomials of the pixels and of the weights
// are known at 0, 1, -1, 2, -2 and infinity, those of the results are their products there. Along both axes
// that is 36 products for 16 results, where the definition takes 144. The weights take their values as they
// are, which for bytes is exact; what they would be divided by is in the results' coefficients, as far as it
// differs, and in kTileScale.
constexpr int kKernel = 3;
constexpr int kTile = 4;
constexpr int kWindow = kTile + kKernel - 1;
constexpr int kPoints = kWindow * kWindow;
constexpr float kTileScale = 1.0F / (24 * 24);

/// On fewer pixels transforming the weights takes what the products save.
constexpr int kLeastTiledSide = 2 * kTile;

void transformWeights(const Lanes (&w)[kKernel], Lanes (&transformed)[kWindow]) {
  const Lanes two = broadcast(2);
  const Lanes near = w[0] + w[2];
  const Lanes far = multiplyAdd(w[0], broadcast(4), w[2]);
  transformed[0] = w[0];
  transformed[1] = near + w[1];
  transformed[2] = near - w[1];
  transformed[3] = multiplyAdd(far, two, w[1]);
  transformed[4] = multiplySubtract(far, two, w[1]);
  transformed[5] = w[2];
}

void transformPixels(const Lanes (&p)[kWindow], Lanes (&transformed)[kWindow]) {
  const Lanes two = broadcast(2);
  const Lanes four = broadcast(4);
  const Lanes five = broadcast(5);
  const Lanes nearEven = multiplySubtract(p[4], four, p[2]);
  const Lanes nearOdd = multiplySubtract(p[3], four, p[1]);
  const Lanes farEven = p[4] - p[2];
  const Lanes farOdd = p[3] - p[1];
  transformed[0] = multiplyAdd(multiplySubtract(p[4], five, p[2]), four, p[0]);
  transformed[1] = nearEven + nearOdd;
  transformed[2] = nearEven - nearOdd;
  transformed[3] = multiplyAdd(farEven, two, farOdd);
  transformed[4] = multiplySubtract(farEven, two, farOdd);
  transformed[5] = multiplyAdd(multiplySubtract(p[5], five, p[3]), four, p[1]);
}

/// The results, 24 times.
void transformSums(const Lanes (&s)[kWindow], Lanes (&results)[kTile]) {
  const Lanes four = broadcast(4);
  const Lanes nearEven = (s[1] + s[2]) * four;
  const Lanes nearOdd = (s[2] - s[1]) * four;
  const Lanes farEven = s[3] + s[4];
  const Lanes farOdd = s[3] - s[4];
  results[0] = multiplyAdd(farEven - nearEven, broadcast(6), s[0]);
  results[1] = multiplyAdd(nearOdd, broadcast(2), farOdd);
  results[2] = farEven * four - nearEven;
  results[3] = multiplyAdd(multiplyAdd(nearOdd, broadcast(8), farOdd), broadcast(24), s[5]);
}

/// Transforms each column and then each row of what `load(y, x)` gives, and has `store(y, x, lanes)` take it.
template <int from, int to, typename Load, typename Store>
void transformBothWays(void (*transform)(const Lanes (&)[from], Lanes (&)[to]), Load load, Store store) {
  Lanes rows[to][from];
  for (int x = 0; x < from; ++x) {
    Lanes column[from];
    for (int y = 0; y < from; ++y) {
      column[y] = load(y, x);
    }
    Lanes transformed[to];
    transform(column, transformed);
    for (int y = 0; y < to; ++y) {
      rows[y][x] = transformed[y];
    }
  }
  for (int y = 0; y < to; ++y) {
    Lanes transformed[to];
    transform(rows[y], transformed);
    for (int x = 0; x < to; ++x) {
      store(y, x, transformed[x]);
    }
  }
}

constexpr int tilesAlong(int side) { return (side + kTile - 1) / kTile; }

/// The tiles of a map, and the memory in which their numbers at each of the points lie.
struct Tiles {
  int along;
  ptrdiff_t count;
  float* pixels;   ///< [kPoints][count][inputs]
  float* sums;     ///< [kPoints][count][16]
  float* weights;  ///< [kPoints][inputs][16]

  Tiles(int side, ptrdiff_t inputs, float* memory)
      : along(tilesAlong(side)),
        count(ptrdiff_t{along} * along),
        pixels(memory),
        sums(pixels + kPoints * count * inputs),
        weights(sums + kPoints * count * kLanes) {}

  static size_t size(int side, int inputs) {
    const int count = tilesAlong(side) * tilesAlong(side);
    return static_cast<size_t>(kPoints) * static_cast<size_t>(count * (inputs + kLanes) + inputs * kLanes);
  }

  /// Calls `visit` with each tile's number and its first pixel.
  template <typename Visit>
  void forEach(Visit visit) const {
    ptrdiff_t tile = 0;
    for (int y = 0; y < along; ++y) {
      for (int x = 0; x < along; ++x) {
        visit(tile++, y * kTile, x * kTile);
      }
    }
  }
};

void transformPixelsOf(const Map& map, const Tiles& tiles) {
  tiles.forEach([&](ptrdiff_t tile, int top, int left) {
    for (int channel = 0; channel < map.channels; channel += kLanes) {
      transformBothWays(
          transformPixels,
          [&](int dy, int dx) {
            const int y = top + dy - 1;
            const int x = left + dx - 1;
            // The last tiles reach beyond the border.
            return y > map.side || x > map.side ? broadcast(0) : load(map.at(y, x) + channel);
          },
          [&](int y, int x, const Lanes& transformed) {
            store(transformed,
                  tiles.pixels + ((y * kWindow + x) * tiles.count + tile) * map.channels + channel);
          });
    }
  });
}

void transformWeightsOf(const Convolution& c, size_t first, const Tiles& tiles) {
  const ptrdiff_t inputs = c.inputs;
  for (ptrdiff_t input = 0; input < inputs; ++input) {
    transformBothWays(
        transformWeights,
        [&](int y, int x) {
          return loadWeights(c, first + static_cast<size_t>(((y * kKernel + x) * inputs + input) * kLanes));
        },
        [&](int y, int x, const Lanes& transformed) {
          store(transformed, tiles.weights + ((y * kWindow + x) * inputs + input) * kLanes);
        });
  }
}

void sumProducts(int inputs, const Tiles& tiles) {
  const float* pixels = tiles.pixels;
  const float* weights = tiles.weights;
  float* sum = tiles.sums;
  for (int point = 0; point < kPoints; ++point) {
    inFives(tiles.count, [&]<int count>(std::integral_constant<int, count>) {
      const float* places[count];
      for (const float*& place : places) {
        place = pixels;
        pixels += inputs;
      }
      Lanes sums[count];
      sumWindow(sums, weights, places, 1, inputs, 0);
#pragma GCC unroll 8
      for (int i = 0; i < count; ++i) {
        store(sums[i], sum);
        sum += kLanes;
      }
    });
    weights += ptrdiff_t{inputs} * kLanes;
  }
}

void convolveInTiles(const Convolution& c, const Map& from, const Finish& finish, const Map& to,
                     float* memory) {
  const Tiles tiles(from.side, c.inputs, memory);
  transformPixelsOf(from, tiles);
  size_t first = 0;
  for (int channel = 0; channel < c.outputs; channel += kLanes) {
    transformWeightsOf(c, first, tiles);
    first += groupWeights(c);
    sumProducts(c.inputs, tiles);
    const Finisher finisher(c, finish, to, channel, kTileScale);
    tiles.forEach([&](ptrdiff_t tile, int top, int left) {
      transformBothWays(
          transformSums,
          [&](int y, int x) { return load(tiles.sums + ((y * kWindow + x) * tiles.count + tile) * kLanes); },
          [&](int dy, int dx, const Lanes& result) {
            const int y = top + dy;
            const int x = left + dx;
            if (y < from.side && x < from.side) {
              finisher.store(result, to.at(y, x) - to.data + channel);
            }
          });
    });
  }
}

constexpr bool inTiles(int kernel, int step, int side) {
  return kernel == kKernel && step == 1 && side >= kLeastTiledSide;
}

}  // namespace

size_t convolveMemory(int kernel, int step, int inputs, int side) {
  return inTiles(kernel, step, side) ? Tiles::size(side, inputs)
                                     : static_cast<size_t>(kernel * kernel * inputs) * kLanes;
}

void convolve(const Convolution& c, const Map& from, const Finish& finish, const Map& to, float* memory) {
  const auto convolve = inTiles(c.side, c.step, from.side) ? convolveInTiles : convolveDirectly;
  convolve(c, from, finish, to, memory);
}

}  // namespace kyengine
