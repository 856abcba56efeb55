// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

#include "correlate.h"

#include "lanes.h"

namespace kyengine {
namespace {

static_assert(kColumnsTogether == kLanes);

template <int together>
void ApplyRowsTogether(const float* from, ptrdiff_t stride, const float* weights, int taps, int rows,
                       int columns, float* to) {
  const ptrdiff_t part = static_cast<ptrdiff_t>(rows) * columns;
  for (int y = 0; y < rows; ++y) {
    for (int x = 0; x < columns; x += kColumnsTogether) {
      const float* const place = from + y * stride + x;
      Lanes sums[together];
      for (Lanes& sum : sums) {
        sum = Broadcast(0);
      }
      for (int t = 0; t < taps; ++t) {
        const Lanes numbers = Load(place + t);
#pragma GCC unroll 4
        for (int i = 0; i < together; ++i) {
          sums[i] =
              MultiplyAdd(sums[i], numbers, Broadcast(weights[static_cast<ptrdiff_t>(t) * together + i]));
        }
      }
#pragma GCC unroll 4
      for (int i = 0; i < together; ++i) {
        Store(sums[i], to + i * part + static_cast<ptrdiff_t>(y) * columns + x);
      }
    }
  }
}

/// `fixed` is the number of taps where that is known when this is compiled, so that the rows that two sums
/// share are read once; or else 0.
template <int fixed>
void AddColumnOf(const float* from, int columns, const float* weights, int taps, int rows, float* sums) {
  const int count = fixed > 0 ? fixed : taps;
  for (int y = 0; y < rows; y += kRowsTogether) {
    for (int x = 0; x < columns; x += kColumnsTogether) {
      const float* const place = from + static_cast<ptrdiff_t>(y) * columns + x;
      float* const result = sums + static_cast<ptrdiff_t>(y) * columns + x;
      Lanes sum[kRowsTogether];
      for (int j = 0; j < kRowsTogether; ++j) {
        sum[j] = Load(result + static_cast<ptrdiff_t>(j) * columns);
      }
#pragma GCC unroll 10
      for (int t = 0; t < count; ++t) {
        const Lanes weight = Broadcast(weights[t]);
#pragma GCC unroll 4
        for (int j = 0; j < kRowsTogether; ++j) {
          sum[j] = MultiplyAdd(sum[j], Load(place + static_cast<ptrdiff_t>(t + j) * columns), weight);
        }
      }
      for (int j = 0; j < kRowsTogether; ++j) {
        Store(sum[j], result + static_cast<ptrdiff_t>(j) * columns);
      }
    }
  }
}

}  // namespace

void ApplyRows(const float* from, ptrdiff_t stride, const float* weights, int together, int taps, int rows,
               int columns, float* to) {
  switch (together) {
    case 1:
      return ApplyRowsTogether<1>(from, stride, weights, taps, rows, columns, to);
    case 2:
      return ApplyRowsTogether<2>(from, stride, weights, taps, rows, columns, to);
    case 3:
      return ApplyRowsTogether<3>(from, stride, weights, taps, rows, columns, to);
    default:
      return ApplyRowsTogether<4>(from, stride, weights, taps, rows, columns, to);
  }
}

void AddColumn(const float* from, int columns, const float* weights, int taps, int rows, float* sums) {
  constexpr int kUsualTaps = 10;
  if (taps == kUsualTaps) {
    AddColumnOf<kUsualTaps>(from, columns, weights, taps, rows, sums);
  } else {
    AddColumnOf<0>(from, columns, weights, taps, rows, sums);
  }
}

}  // namespace kyengine
