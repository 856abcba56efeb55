// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// Sums of rows and columns of numbers with weights.
#pragma once

#include <cstddef>

namespace kyengine {

/// Rows of weights that can be applied at once.
constexpr size_t kMostTogether = 4;
/// Numbers, and rows, that are computed at once: what is asked for must be a multiple.
constexpr int kColumnsTogether = 16;
constexpr int kRowsTogether = 4;

/// Applies `together` rows of weights of `taps` each, interleaved, to each place of `rows` rows of `columns`
/// numbers: the sum of the products with the numbers from there on, of which there are `taps - 1` more. Rows
/// of `from` are `stride` numbers apart. What a row of weights gives follows, without gaps, what the one
/// before it gives.
void applyRows(const float* from, ptrdiff_t stride, const float* weights, int together, int taps, int rows,
               int columns, float* to);

/// Applies a column of weights to each place of `rows` rows of `columns` numbers, followed by `taps - 1` rows
/// more, and adds the results to `sums`. There are no gaps in either.
void addColumn(const float* from, int columns, const float* weights, int taps, int rows, float* sums);

}  // namespace kyengine
