// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

#include "gradients.h"

#include <algorithm>
#include <cmath>
#include <cstring>

#include "lanes.h"
#include "simd/loop.h"

namespace kyengine {
namespace {

// ---- gradients
// ---------------------------------------------------------------------------------------------------

/// Between two directions of one quarter lies a boundary; a gradient is beyond it when |dy| q > |dx| p. The
/// boundaries are where the gradient's products with both directions' vectors, of four decimals as dlib has
/// them, are equal, which no gradient's are. p / q is the largest fraction of bytes below the boundary, so
/// that for gradients of bytes it separates as the boundary itself does.
struct Boundary {
  uint8_t p;
  uint8_t q;
};
constexpr Boundary kBoundaries[] = {
    {43, 244},   // (1.0000 - 0.9397) / (0.3420 - 0.0000)
    {138, 239},  // (0.9397 - 0.7660) / (0.6428 - 0.3420)
    {230, 193},  // (0.7660 - 0.5000) / (0.8660 - 0.6428)
    {250, 91},   // (0.5000 - 0.1736) / (0.9848 - 0.8660)
};

/// The direction of a gradient that has `beyond` boundaries of its quarter behind it, counted from the
/// horizontal; of bytes, or of 16 of them.
template <typename Truth, typename Number>
Number directionOf(Truth upwards, Truth toTheLeft, Number beyond) {
  constexpr int kLeft = kDirections / 2;
  const Number right = upwards ? kDirections - beyond : beyond;
  return toTheLeft ? (upwards ? kLeft + beyond : kLeft - beyond) : right == kDirections ? Number{} : right;
}

void findGradient(const uint8_t* above, const uint8_t* row, const uint8_t* below, ptrdiff_t x,
                  uint8_t* direction, float* length) {
  const int dx = row[x + 1] - row[x - 1];
  const int dy = below[x] - above[x];
  const int across = std::abs(dx);
  const int along = std::abs(dy);
  int beyond = 0;
  for (const Boundary& b : kBoundaries) {
    beyond += along * b.q > across * b.p ? 1 : 0;
  }
  const bool upwards = dy < 0;
  const bool toTheLeft = upwards ? dx <= 0 : dx < 0;
  *direction = static_cast<uint8_t>(directionOf(upwards, toTheLeft, beyond));
  *length = std::sqrt(static_cast<float>(dx * dx + dy * dy));
}

/// The gradients of 16 pixels from `x` on.
void findGradients16(const uint8_t* above, const uint8_t* row, const uint8_t* below, ptrdiff_t x,
                     uint8_t* directions, float* lengths) {
  using Bytes = Sixteen<uint8_t>;
  using Halves = Sixteen<uint16_t>;
  using Words = Sixteen<int32_t>;
  const Bytes left = loadSixteen(row + x - 1);
  const Bytes right = loadSixteen(row + x + 1);
  const Bytes up = loadSixteen(above + x);
  const Bytes down = loadSixteen(below + x);
  const auto distance = [](Bytes a, Bytes b) {
    return __builtin_convertvector(a > b ? a - b : b - a, Halves);
  };
  const Halves across = distance(right, left);
  const Halves along = distance(down, up);

  Halves beyond = {};
  for (const Boundary& b : kBoundaries) {
    // A lane of a comparison is -1 where it holds.
    beyond -= (Halves)(along * b.q > across * b.p);
  }
  const auto upwards = down < up;
  const auto toTheLeft = upwards ? right <= left : right < left;
  const Bytes direction = directionOf(upwards, toTheLeft, __builtin_convertvector(beyond, Bytes));
  std::memcpy(directions + x, &direction, sizeof(direction));

  const auto squares =
      __builtin_convertvector(across * across, Words) + __builtin_convertvector(along * along, Words);
  store(root(lanesOf(squares)), lengths + x);
}

// ---- votes
// ---------------------------------------------------------------------------------------------------

/// The votes of a square of pixels between the centres of four cells, by direction: of a vector's lanes, the
/// one at the top left, the bottom left, the top right and the bottom right. Rows take turns between the two
/// halves: a vote need not wait for its neighbour's, which often is for the same direction.
struct Votes {
  static constexpr int kSlots = 20;
  float of[2][kSlots][4];
};

void storeFour(float* p, Four four) { std::memcpy(p, &four, sizeof(four)); }

/// sum + a b of each, rounded once.
Four multiplyAdd(Four sum, Four a, float b) {
  for (int i = 0; i < 4; ++i) {
    sum[i] = std::fma(a[i], b, sum[i]);
  }
  return sum;
}

/// Votes `length` times `weight` for each direction, of one pixel for each half.
void voteOfTwo(Votes& votes, uint8_t direction0, const float* weight0, float length0, uint8_t direction1,
               const float* weight1, float length1) {
  float* const slot0 = votes.of[0][direction0];
  float* const slot1 = votes.of[1][direction1];
  const Four sum0 = multiplyAdd(loadFour(slot0), loadFour(weight0), length0);
  const Four sum1 = multiplyAdd(loadFour(slot1), loadFour(weight1), length1);
  storeFour(slot0, sum0);
  storeFour(slot1, sum1);
}

/// Adds the votes to the four cells' histograms, the upper two and the lower two being neighbours, and clears
/// them.
void cast(Votes& votes, float* top, float* bottom) {
  const auto add = [](float* to, Four v) { storeFour(to, loadFour(to) + v); };
  for (int d = 0; d < Votes::kSlots; d += 4) {
    Four sum[4];
    for (int i = 0; i < 4; ++i) {
      sum[i] = loadFour(votes.of[0][d + i]) + loadFour(votes.of[1][d + i]);
      storeFour(votes.of[0][d + i], Four{});
      storeFour(votes.of[1][d + i], Four{});
    }
    const Four left02 = __builtin_shufflevector(sum[0], sum[2], 0, 4, 1, 5);
    const Four left13 = __builtin_shufflevector(sum[1], sum[3], 0, 4, 1, 5);
    const Four right02 = __builtin_shufflevector(sum[0], sum[2], 2, 6, 3, 7);
    const Four right13 = __builtin_shufflevector(sum[1], sum[3], 2, 6, 3, 7);
    add(top + d, __builtin_shufflevector(left02, left13, 0, 4, 1, 5));
    add(bottom + d, __builtin_shufflevector(left02, left13, 2, 6, 3, 7));
    add(top + Votes::kSlots + d, __builtin_shufflevector(right02, right13, 0, 4, 1, 5));
    add(bottom + Votes::kSlots + d, __builtin_shufflevector(right02, right13, 2, 6, 3, 7));
  }
}

/// For every place in a square between the centres of four cells, how its pixel's vote is shared among them.
void share(int cell, std::vector<float>& weights) {
  // How far pixel i behind the centre of one cell is on its way to the next one's.
  const int half = cell / 2;
  const auto way = [cell, half](int i) {
    return (static_cast<float>(half + i) + 0.5F) / static_cast<float>(cell) - 0.5F;
  };
  weights.clear();
  for (int y = 0; y < cell; ++y) {
    for (int x = 0; x < cell; ++x) {
      weights.insert(weights.end(), {(1 - way(y)) * (1 - way(x)), way(y) * (1 - way(x)),
                                     (1 - way(y)) * way(x), way(y) * way(x)});
    }
  }
}

}  // namespace

void findGradients(const uint8_t* above, const uint8_t* row, const uint8_t* below, int first, int last,
                   uint8_t* directions, float* lengths) {
  const auto tail = last - first >= kLanes ? simd::Tail::kOverlap : simd::Tail::kSteps;
  simd::walk<kLanes, 1, 1>(
      last, tail,
      [=](ptrdiff_t x, simd::Blocks<1>) { findGradients16(above, row, below, x, directions, lengths); },
      [=](ptrdiff_t x) { findGradient(above, row, below, x, directions + x, lengths + x); }, first);
}

void FeatureMap::vote(const GrayImage& picture, int cell, int first, int rows) {
  // The gradients at the picture's border are not known.
  const int cellRows = cellsOf(static_cast<int>(picture.nr()), cell) + 2;
  const int lastX = std::min(columns_ * cell, static_cast<int>(picture.nc())) - 1;
  const int lastY = std::min(cellRows * cell, static_cast<int>(picture.nr())) - 1;
  const auto pitch = static_cast<size_t>(picture.nc());
  directions_.resize(static_cast<size_t>(cell) * pitch);
  lengths_.resize(static_cast<size_t>(cell) * pitch);
  share(cell, weights_);
  votes_.assign(static_cast<size_t>(rows + 2) * static_cast<size_t>(columns_ + 2) * kSlots, 0);
  static_assert(kSlots == Votes::kSlots);
  Votes votes = {};

  // Squares between the centres of cells, by the cell at their top left.
  for (int row = first - 1; row < first + rows; ++row) {
    const int squareTop = cell / 2 + row * cell;
    const int top = std::max(squareTop, 1);
    const int bottom = std::min(squareTop + cell, lastY);
    for (int y = top; y < bottom; ++y) {
      const size_t line = static_cast<size_t>(y - squareTop) * pitch;
      const uint8_t* const pixels = &picture[y][0];
      findGradients(pixels - pitch, pixels, pixels + pitch, 1, lastX, &directions_[line], &lengths_[line]);
    }
    for (int column = -1; column < columns_; ++column) {
      const int squareLeft = cell / 2 + column * cell;
      const int left = std::max(squareLeft, 1);
      const int right = std::min(squareLeft + cell, lastX);
      if (left >= right) {
        continue;
      }
      for (int y = top; y < bottom; y += 2) {
        const size_t line = static_cast<size_t>(y - squareTop);
        const float* const weights = &weights_[line * static_cast<size_t>(cell) * 4];
        const uint8_t* const directions = &directions_[line * pitch];
        const float* const lengths = &lengths_[line * pitch];
        if (y + 1 < bottom) {
          const float* const nextWeights = weights + static_cast<ptrdiff_t>(cell) * 4;
          for (int x = left; x < right; ++x) {
            const ptrdiff_t place = static_cast<ptrdiff_t>(x - squareLeft) * 4;
            voteOfTwo(votes, directions[x], weights + place, lengths[x],
                      directions[x + static_cast<ptrdiff_t>(pitch)], nextWeights + place,
                      lengths[x + static_cast<ptrdiff_t>(pitch)]);
          }
        } else {
          for (int x = left; x < right; ++x) {
            const Four weight = loadFour(weights + static_cast<ptrdiff_t>(x - squareLeft) * 4);
            float* const slot = votes.of[0][directions[x]];
            storeFour(slot, multiplyAdd(loadFour(slot), weight, lengths[x]));
          }
        }
      }
      cast(votes, histogram(row - first + 1, column + 1), histogram(row - first + 2, column + 1));
    }
  }
}

void FeatureMap::normalise(int rows) {
  // A cell's energy is that of its votes without their sign.
  constexpr int kAxes = kDirections / 2;
  energies_.resize(static_cast<size_t>(rows) * static_cast<size_t>(columns_));
  for (int r = 0; r < rows; ++r) {
    for (int c = 0; c < columns_; ++c) {
      const float* const votes = histogram(r + 1, c + 1);
      float energy = 0;
      for (int d = 0; d < kAxes; ++d) {
        const float both = votes[d] + votes[d + kAxes];
        energy += both * both;
      }
      energies_[static_cast<size_t>(r) * static_cast<size_t>(columns_) + static_cast<size_t>(c)] = energy;
    }
  }

  // Each block by its cell at the top left.
  constexpr float kNotZero = 0.0001F;
  // A register may be loaded from the last one on.
  limits_.resize(energies_.size() + kLanes);
  factors_.resize(energies_.size() + kLanes);
  for (int r = 0; r + 1 < rows; ++r) {
    const size_t line = static_cast<size_t>(r) * static_cast<size_t>(columns_);
    const float* const upper = &energies_[line];
    const float* const lower = upper + columns_;
    for (int c = 0; c + 1 < columns_; ++c) {
      const float limit = 0.2F * std::sqrt(lower[c + 1] + upper[c + 1] + lower[c] + upper[c] + kNotZero);
      limits_[line + static_cast<size_t>(c)] = limit;
      factors_[line + static_cast<size_t>(c)] = 0.1F / limit;
    }
  }
}

void FeatureMap::describe(int firstRow, int rows, int left) {
  using simd::Floats;
  constexpr int kCells = sizeof(Floats) / sizeof(float);
  constexpr int kAxes = kDirections / 2;
  constexpr float kTexture = 2 * 0.2357F;
  const int cells = columns_ - 2;
  const ptrdiff_t pitch = (cells + kCells - 1) / kCells * kCells;
  described_.resize(static_cast<size_t>(kFeatures * pitch));
  // Where the histograms of neighbouring cells begin, in rows of four numbers.
  simd::Words histograms = {};
  for (int i = 0; i < kCells; ++i) {
    histograms[i] = static_cast<uint32_t>(i * (kSlots / 4));
  }
  for (int r = 0; r < rows; ++r) {
    // A register at a time, of which the last one may describe what is beyond the last cell.
    for (int c = 0; c < cells; c += kCells) {
      const size_t block = static_cast<size_t>(r) * static_cast<size_t>(columns_) + static_cast<size_t>(c);
      const size_t below = block + static_cast<size_t>(columns_);
      // In the order of the features that tell of them: the blocks at the bottom right, the top right, the
      // bottom left, the top left.
      const size_t blocks[] = {below + 1, block + 1, below, block};
      Floats limits[4];
      Floats factors[4];
      for (int i = 0; i < 4; ++i) {
        limits[i] = simd::load(&limits_[blocks[i]]);
        factors[i] = simd::load(&factors_[blocks[i]]);
      }
      const auto* const rowsOfFour = reinterpret_cast<const float(*)[4]>(histogram(r + 2, c + 2));
      float* const out = &described_[static_cast<size_t>(c)];

      // Every fourth direction's shares are summed up apart.
      Floats votes[kSlots];
      Floats shares[4][4] = {};
      for (int d = 0; d < kSlots; d += 4) {
        Floats four[4];
        simd::lookUpRows(rowsOfFour + d / 4, histograms, four);
        for (int k = 0; k < 4; ++k) {
          votes[d + k] = four[k];
          Floats sum = {};
          for (int i = 0; i < 4; ++i) {
            const Floats limited = simd::min(four[k], limits[i]);
            sum = simd::multiplyAdd(sum, limited, factors[i]);
            shares[i][k] = simd::multiplyAdd(shares[i][k], limited, factors[i]);
          }
          // What is stored too much is overwritten by what comes next.
          simd::store(out + (d + k) * pitch, sum);
        }
      }
      for (int d = 0; d < kAxes; ++d) {
        const Floats vote = votes[d] + votes[d + kAxes];
        Floats sum = {};
        for (int i = 0; i < 4; ++i) {
          sum = simd::multiplyAdd(sum, simd::min(vote, limits[i]), factors[i]);
        }
        simd::store(out + (kDirections + d) * pitch, sum);
      }
      for (int i = 0; i < 4; ++i) {
        const Floats texture = (shares[i][0] + shares[i][1]) + (shares[i][2] + shares[i][3]);
        simd::store(out + (kDirections + kAxes + i) * pitch, texture * simd::splat<Floats>(kTexture));
      }
    }

    const size_t plane = static_cast<size_t>(rows_) * static_cast<size_t>(stride_);
    const size_t begin =
        static_cast<size_t>(firstRow + r) * static_cast<size_t>(stride_) + static_cast<size_t>(left);
    for (int f = 0; f < kFeatures; ++f) {
      std::copy_n(&described_[static_cast<size_t>(f * pitch)], cells,
                  &features_[static_cast<size_t>(f) * plane + begin]);
    }
  }
}

void FeatureMap::computeCells(const GrayImage& picture, int cell, int first, int rows, int left, int right) {
  const int cellsDown = cellsOf(static_cast<int>(picture.nr()), cell);
  const int cellsAcross = std::max(cellsOf(static_cast<int>(picture.nc()), cell), 0);
  columns_ = cellsAcross + 2;
  rows_ = rows;
  stride_ = left + cellsAcross + right;
  features_.assign(static_cast<size_t>(kFeatures) * static_cast<size_t>(rows_) * static_cast<size_t>(stride_),
                   0);
  const int begin = std::max(first, 0);
  const int end = std::min(first + rows, cellsDown);
  if (begin >= end || cellsAcross == 0) {
    return;
  }
  // A cell's features depend on the cells around it.
  const int neighbours = 2;
  vote(picture, cell, begin, end - begin + neighbours);
  normalise(end - begin + neighbours);
  describe(begin - first, end - begin, left);
}

}  // namespace kyengine
