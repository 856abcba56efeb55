// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

#include "correlate.h"

#include "lanes.h"

namespace kyengine {
namespace {

static_assert(kColumnsTogether == kLanes);

template <int together>
void applyRowsTogether(const float* from, ptrdiff_t stride, const float* weights, int taps, int rows,
                       int columns, float* to) {
  const ptrdiff_t part = static_cast<ptrdiff_t>(rows) * columns;
  for (int y = 0; y < rows; ++y) {
    for (int x = 0; x < columns; x += kColumnsTogether) {
      const float* const place = from + y * stride + x;
      Lanes sums[together];
      for (Lanes& sum : sums) {
        sum = broadcast(0);
      }
      for (int t = 0; t < taps; ++t) {
        const Lanes numbers = load(place + t);
#pragma GCC unroll 4
        for (int i = 0; i < together; ++i) {
          sums[i] =
              multiplyAdd(sums[i], numbers, broadcast(weights[static_cast<ptrdiff_t>(t) * together + i]));
        }
      }
#pragma GCC unroll 4
      for (int i = 0; i < together; ++i) {
        store(sums[i], to + i * part + static_cast<ptrdiff_t>(y) * columns + x);
      }
    }
  }
}

/// `fixed` is the number of taps where that is known when this is compiled, so that the rows that two sums
/// share are read once; or else 0.
template <int fixed>
void addColumnOf(const float* from, int columns, const float* weights, int taps, int rows, float* sums) {
  const int count = fixed > 0 ? fixed : taps;
  for (int y = 0; y < rows; y += kRowsTogether) {
    for (int x = 0; x < columns; x += kColumnsTogether) {
      const float* const place = from + static_cast<ptrdiff_t>(y) * columns + x;
      float* const result = sums + static_cast<ptrdiff_t>(y) * columns + x;
      Lanes sum[kRowsTogether];
      for (int j = 0; j < kRowsTogether; ++j) {
        sum[j] = load(result + static_cast<ptrdiff_t>(j) * columns);
      }
#pragma GCC unroll 10
      for (int t = 0; t < count; ++t) {
        const Lanes weight = broadcast(weights[t]);
#pragma GCC unroll 4
        for (int j = 0; j < kRowsTogether; ++j) {
          sum[j] = multiplyAdd(sum[j], load(place + static_cast<ptrdiff_t>(t + j) * columns), weight);
        }
      }
      for (int j = 0; j < kRowsTogether; ++j) {
        store(sum[j], result + static_cast<ptrdiff_t>(j) * columns);
      }
    }
  }
}

}  // namespace

void applyRows(const float* from, ptrdiff_t stride, const float* weights, int together, int taps, int rows,
               int columns, float* to) {
  switch (together) {
    case 1:
      return applyRowsTogether<1>(from, stride, weights, taps, rows, columns, to);
    case 2:
      return applyRowsTogether<2>(from, stride, weights, taps, rows, columns, to);
    case 3:
      return applyRowsTogether<3>(from, stride, weights, taps, rows, columns, to);
    default:
      return applyRowsTogether<4>(from, stride, weights, taps, rows, columns, to);
  }
}

void addColumn(const float* from, int columns, const float* weights, int taps, int rows, float* sums) {
  constexpr int kUsualTaps = 10;
  if (taps == kUsualTaps) {
    addColumnOf<kUsualTaps>(from, columns, weights, taps, rows, sums);
  } else {
    addColumnOf<0>(from, columns, weights, taps, rows, sums);
  }
}

}  // namespace kyengine
