// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

#include "gradients.h"

#include <algorithm>
#include <cmath>

#include "simd/neon.h"

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

// A gradient's direction, by the boundaries that are behind it and the quarter that it is in.
constexpr int kToTheLeft = 8;
constexpr int kUpwards = 16;
constexpr uint8_t kDirectionOf[32] = {0, 1,  2,  3,  4,  0, 0, 0,   // right and down
                                      9, 8,  7,  6,  5,  0, 0, 0,   // left and down
                                      0, 17, 16, 15, 14, 0, 0, 0,   // right and up
                                      9, 10, 11, 12, 13, 0, 0, 0};  // left and up

void FindGradient(const uint8_t* above, const uint8_t* row, const uint8_t* below, int x, uint8_t* direction,
                  float* length) {
  const int dx = row[x + 1] - row[x - 1];
  const int dy = below[x] - above[x];
  const int across = std::abs(dx);
  const int along = std::abs(dy);
  int index = 0;
  for (const Boundary& b : kBoundaries) {
    index += along * b.q > across * b.p ? 1 : 0;
  }
  index += dy < 0 ? kUpwards : 0;
  index += dx < 0 || (dx == 0 && dy < 0) ? kToTheLeft : 0;
  *direction = kDirectionOf[index];
  *length = std::sqrt(static_cast<float>(dx * dx + dy * dy));
}

/// Square roots of whole numbers. Two Newton-Raphson steps from the estimate of the reciprocal take an
/// in-order core a fraction of what its instruction for roots takes.
float32x4_t Root(uint32x4_t squares) {
  const float32x4_t x = vcvtq_f32_u32(squares);
#if defined(__ARM_NEON)
  // 0 has no reciprocal.
  const float32x4_t positive = vcvtq_f32_u32(vmaxq_u32(squares, vdupq_n_u32(1)));
  float32x4_t r = vrsqrteq_f32(positive);
  r = vmulq_f32(r, vrsqrtsq_f32(vmulq_f32(positive, r), r));
  r = vmulq_f32(r, vrsqrtsq_f32(vmulq_f32(positive, r), r));
  return vmulq_f32(x, r);
#else
  float roots[4];
  vst1q_f32(roots, x);
  for (float& root : roots) {
    root = std::sqrt(root);
  }
  return vld1q_f32(roots);
#endif
}

/// The gradients of 16 pixels from `x` on.
void FindGradients16(const uint8_t* above, const uint8_t* row, const uint8_t* below, int x,
                     uint8_t* directions, float* lengths) {
  const uint8x16_t left = vld1q_u8(row + x - 1);
  const uint8x16_t right = vld1q_u8(row + x + 1);
  const uint8x16_t up = vld1q_u8(above + x);
  const uint8x16_t down = vld1q_u8(below + x);
  const uint8x16_t across = vabdq_u8(right, left);
  const uint8x16_t along = vabdq_u8(down, up);

  uint16x8_t low = vdupq_n_u16(0);
  uint16x8_t high = vdupq_n_u16(0);
  for (const Boundary& b : kBoundaries) {
    const uint8x16_t p = vdupq_n_u8(b.p);
    const uint8x16_t q = vdupq_n_u8(b.q);
    // A lane of a comparison is -1 where it holds.
    low = vsubq_u16(low, vcgtq_u16(vmull_u8(vget_low_u8(along), vget_low_u8(q)),
                                   vmull_u8(vget_low_u8(across), vget_low_u8(p))));
    high = vsubq_u16(high, vcgtq_u16(vmull_high_u8(along, q), vmull_high_u8(across, p)));
  }
  const uint8x16_t upwards = vcltq_u8(down, up);
  const uint8x16_t to_the_left = vbslq_u8(upwards, vcleq_u8(right, left), vcltq_u8(right, left));
  uint8x16_t index = vcombine_u8(vmovn_u16(low), vmovn_u16(high));
  index = vorrq_u8(index, vandq_u8(upwards, vdupq_n_u8(kUpwards)));
  index = vorrq_u8(index, vandq_u8(to_the_left, vdupq_n_u8(kToTheLeft)));
  const uint8x16x2_t direction_of = {{vld1q_u8(kDirectionOf), vld1q_u8(kDirectionOf + 16)}};
  vst1q_u8(directions + x, vqtbl2q_u8(direction_of, index));

  const auto store_lengths = [](uint16x8_t a, uint16x8_t b, float* to) {
    vst1q_f32(to, Root(vaddl_u16(vget_low_u16(a), vget_low_u16(b))));
    vst1q_f32(to + 4, Root(vaddl_high_u16(a, b)));
  };
  store_lengths(vmull_u8(vget_low_u8(across), vget_low_u8(across)),
                vmull_u8(vget_low_u8(along), vget_low_u8(along)), lengths + x);
  store_lengths(vmull_high_u8(across, across), vmull_high_u8(along, along), lengths + x + 8);
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

/// Votes `length` times `weight` for each direction, of one pixel for each half.
void VoteOfTwo(Votes& votes, uint8_t direction0, float32x4_t weight0, float length0, uint8_t direction1,
               float32x4_t weight1, float length1) {
  float* const slot0 = votes.of[0][direction0];
  float* const slot1 = votes.of[1][direction1];
  const float32x4_t sum0 = vfmaq_n_f32(vld1q_f32(slot0), weight0, length0);
  const float32x4_t sum1 = vfmaq_n_f32(vld1q_f32(slot1), weight1, length1);
  vst1q_f32(slot0, sum0);
  vst1q_f32(slot1, sum1);
}

/// Adds the votes to the four cells' histograms, the upper two and the lower two being neighbours, and clears
/// them.
void Cast(Votes& votes, float* top, float* bottom) {
  const float32x4_t zero = vdupq_n_f32(0);
  const auto add = [](float* to, float32x4_t v) { vst1q_f32(to, vaddq_f32(vld1q_f32(to), v)); };
  for (int d = 0; d < Votes::kSlots; d += 4) {
    float32x4_t sum[4];
    for (int i = 0; i < 4; ++i) {
      sum[i] = vaddq_f32(vld1q_f32(votes.of[0][d + i]), vld1q_f32(votes.of[1][d + i]));
      vst1q_f32(votes.of[0][d + i], zero);
      vst1q_f32(votes.of[1][d + i], zero);
    }
    const float32x4_t left02 = vzip1q_f32(sum[0], sum[2]);
    const float32x4_t left13 = vzip1q_f32(sum[1], sum[3]);
    const float32x4_t right02 = vzip2q_f32(sum[0], sum[2]);
    const float32x4_t right13 = vzip2q_f32(sum[1], sum[3]);
    add(top + d, vzip1q_f32(left02, left13));
    add(bottom + d, vzip2q_f32(left02, left13));
    add(top + Votes::kSlots + d, vzip1q_f32(right02, right13));
    add(bottom + Votes::kSlots + d, vzip2q_f32(right02, right13));
  }
}

/// For every place in a square between the centres of four cells, how its pixel's vote is shared among them.
void Share(int cell, std::vector<float>& weights) {
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

void FindGradients(const uint8_t* above, const uint8_t* row, const uint8_t* below, int first, int last,
                   uint8_t* directions, float* lengths) {
  constexpr int kBlock = 16;
  int x = first;
  for (; x + kBlock <= last; x += kBlock) {
    FindGradients16(above, row, below, x, directions, lengths);
  }
  if (x < last && last - first >= kBlock) {
    FindGradients16(above, row, below, last - kBlock, directions, lengths);
    x = last;
  }
  for (; x < last; ++x) {
    FindGradient(above, row, below, x, directions + x, lengths + x);
  }
}

void FeatureMap::Vote(const GrayImage& picture, int cell, int first, int rows) {
  // The gradients at the picture's border are not known.
  const int cell_rows = CellsOf(static_cast<int>(picture.nr()), cell) + 2;
  const int last_x = std::min(columns_ * cell, static_cast<int>(picture.nc())) - 1;
  const int last_y = std::min(cell_rows * cell, static_cast<int>(picture.nr())) - 1;
  const auto pitch = static_cast<size_t>(picture.nc());
  directions_.resize(static_cast<size_t>(cell) * pitch);
  lengths_.resize(static_cast<size_t>(cell) * pitch);
  Share(cell, weights_);
  votes_.assign(static_cast<size_t>(rows + 2) * static_cast<size_t>(columns_ + 2) * kSlots, 0);
  static_assert(kSlots == Votes::kSlots);
  Votes votes = {};

  // Squares between the centres of cells, by the cell at their top left.
  for (int row = first - 1; row < first + rows; ++row) {
    const int square_top = cell / 2 + row * cell;
    const int top = std::max(square_top, 1);
    const int bottom = std::min(square_top + cell, last_y);
    for (int y = top; y < bottom; ++y) {
      const size_t line = static_cast<size_t>(y - square_top) * pitch;
      const uint8_t* const pixels = &picture[y][0];
      FindGradients(pixels - pitch, pixels, pixels + pitch, 1, last_x, &directions_[line], &lengths_[line]);
    }
    for (int column = -1; column < columns_; ++column) {
      const int square_left = cell / 2 + column * cell;
      const int left = std::max(square_left, 1);
      const int right = std::min(square_left + cell, last_x);
      if (left >= right) {
        continue;
      }
      for (int y = top; y < bottom; y += 2) {
        const size_t line = static_cast<size_t>(y - square_top);
        const float* const weights = &weights_[line * static_cast<size_t>(cell) * 4];
        const uint8_t* const directions = &directions_[line * pitch];
        const float* const lengths = &lengths_[line * pitch];
        if (y + 1 < bottom) {
          const float* const next_weights = weights + static_cast<ptrdiff_t>(cell) * 4;
          for (int x = left; x < right; ++x) {
            const ptrdiff_t place = static_cast<ptrdiff_t>(x - square_left) * 4;
            VoteOfTwo(votes, directions[x], vld1q_f32(weights + place), lengths[x],
                      directions[x + static_cast<ptrdiff_t>(pitch)], vld1q_f32(next_weights + place),
                      lengths[x + static_cast<ptrdiff_t>(pitch)]);
          }
        } else {
          for (int x = left; x < right; ++x) {
            const float32x4_t weight = vld1q_f32(weights + static_cast<ptrdiff_t>(x - square_left) * 4);
            float* const slot = votes.of[0][directions[x]];
            vst1q_f32(slot, vfmaq_n_f32(vld1q_f32(slot), weight, lengths[x]));
          }
        }
      }
      Cast(votes, Histogram(row - first + 1, column + 1), Histogram(row - first + 2, column + 1));
    }
  }
}

void FeatureMap::Normalise(int rows) {
  // A cell's energy is that of its votes without their sign.
  constexpr int kAxes = kDirections / 2;
  energies_.resize(static_cast<size_t>(rows) * static_cast<size_t>(columns_));
  for (int r = 0; r < rows; ++r) {
    for (int c = 0; c < columns_; ++c) {
      const float* const votes = Histogram(r + 1, c + 1);
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
  limits_.resize(energies_.size());
  factors_.resize(energies_.size());
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

void FeatureMap::Describe(int first_row, int rows, int left) {
  constexpr int kPitch = 32;
  constexpr float kTexture = 2 * 0.2357F;
  const int cells = columns_ - 2;
  described_.resize(static_cast<size_t>(cells + 3) * kPitch);
  for (int r = 0; r < rows; ++r) {
    for (int c = 0; c < cells; ++c) {
      const size_t block = static_cast<size_t>(r) * static_cast<size_t>(columns_) + static_cast<size_t>(c);
      const size_t below = block + static_cast<size_t>(columns_);
      // In the order of the features that tell of them: the blocks at the bottom right, the top right, the
      // bottom left, the top left.
      const size_t blocks[] = {below + 1, block + 1, below, block};
      float32x4_t limits[4];
      float32x4_t factors[4];
      for (int i = 0; i < 4; ++i) {
        limits[i] = vdupq_n_f32(limits_[blocks[i]]);
        factors[i] = vdupq_n_f32(factors_[blocks[i]]);
      }
      const float* const votes = Histogram(r + 2, c + 2);
      float* const out = &described_[static_cast<size_t>(c) * kPitch];

      float32x4_t shares[4];
      for (float32x4_t& share : shares) {
        share = vdupq_n_f32(0);
      }
      for (int d = 0; d < kSlots; d += 4) {
        const float32x4_t vote = vld1q_f32(votes + d);
        float32x4_t sum = vdupq_n_f32(0);
        for (int i = 0; i < 4; ++i) {
          const float32x4_t limited = vminq_f32(vote, limits[i]);
          sum = vfmaq_f32(sum, limited, factors[i]);
          shares[i] = vfmaq_f32(shares[i], limited, factors[i]);
        }
        vst1q_f32(out + d, sum);
      }
      // What is written too much is overwritten by what comes next.
      constexpr int kAxes = kDirections / 2;
      for (int d = 0; d < kAxes; d += 4) {
        const float32x4_t vote = vaddq_f32(vld1q_f32(votes + d), vld1q_f32(votes + d + kAxes));
        float32x4_t sum = vdupq_n_f32(0);
        for (int i = 0; i < 4; ++i) {
          sum = vfmaq_f32(sum, vminq_f32(vote, limits[i]), factors[i]);
        }
        vst1q_f32(out + kDirections + d, sum);
      }
      const float32x4_t texture =
          vpaddq_f32(vpaddq_f32(shares[0], shares[1]), vpaddq_f32(shares[2], shares[3]));
      vst1q_f32(out + kDirections + kAxes, vmulq_n_f32(texture, kTexture));
    }

    // From cell by cell to plane by plane; a plane's margin takes what is beyond the last cell.
    const size_t plane = static_cast<size_t>(rows_) * static_cast<size_t>(stride_);
    for (int f = 0; f < kFeatures; ++f) {
      float* const to = &features_[static_cast<size_t>(f) * plane +
                                   static_cast<size_t>(first_row + r) * static_cast<size_t>(stride_) +
                                   static_cast<size_t>(left)];
      const float* const from = &described_[static_cast<size_t>(f)];
      for (int c = 0; c < cells; ++c) {
        to[c] = from[static_cast<size_t>(c) * kPitch];
      }
    }
  }
}

void FeatureMap::Compute(const GrayImage& picture, int cell, int first, int rows, int left, int right) {
  const int cells_down = CellsOf(static_cast<int>(picture.nr()), cell);
  const int cells_across = std::max(CellsOf(static_cast<int>(picture.nc()), cell), 0);
  columns_ = cells_across + 2;
  rows_ = rows;
  stride_ = left + cells_across + right;
  features_.assign(static_cast<size_t>(kFeatures) * static_cast<size_t>(rows_) * static_cast<size_t>(stride_),
                   0);
  const int begin = std::max(first, 0);
  const int end = std::min(first + rows, cells_down);
  if (begin >= end || cells_across == 0) {
    return;
  }
  // A cell's features depend on the cells around it.
  const int neighbours = 2;
  Vote(picture, cell, begin, end - begin + neighbours);
  Normalise(end - begin + neighbours);
  Describe(begin - first, end - begin, left);
}

}  // namespace kyengine
