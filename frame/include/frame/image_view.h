// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// Packed caller memory seen as the image library's matrices.
#pragma once

#include <algorithm>
#include <climits>
#include <cstdint>

#include "fastcv/fastcv.h"

namespace kyface {

/// An 8-bit image of `channels` interleaved channels.
template <int channels>
using Image = HPC::fastcv::Mat<unsigned char, channels, HPC::fastcv::ECO_ENV_ARM>;

/// Rows of a semi-planar 4:2:0 frame, luma and chroma together, for a picture of `height` rows. More than
/// there can be are as many as there can be, which no height agrees with; wrapped, a negative height would
/// have rows.
inline int rows420(int height) {
  return static_cast<int>(std::clamp<std::int64_t>(std::int64_t{3} * height / 2, INT_MIN, INT_MAX));
}

/// A semi-planar 4:2:0 frame.
inline Image<1> view420(unsigned char* frame, int width, int height) {
  return Image<1>(width, rows420(height), frame);
}

/// The 8-bit conversion of the image library. What it refuses it leaves unwritten; the helpers report
/// nothing.
template <HPC::fastcv::ColorCvtType type, int srcChannels, int dstChannels>
void convert(const Image<srcChannels>& src, Image<dstChannels>* dst) {
  HPC::fastcv::cvtColor<type, unsigned char, srcChannels, unsigned char, dstChannels,
                        HPC::fastcv::ECO_ENV_ARM>(src, dst);
}

}  // namespace kyface
