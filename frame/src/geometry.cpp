// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// Crop and rotation of whole camera frames.
#include <cstdint>

#include "base/log.h"
#include "frame/frame.h"
#include "frame/image_view.h"

using kyface::Image;

namespace {

/// Copies the rectangle of `dst`'s size at (`x`, `y`); one that leaves `src` is not copied.
void copyRectangle(const Image<1>& src, int x, std::int64_t y, Image<1>* dst) {
  constexpr unsigned char kAsItIs = 1;
  HPC::fastcv::crop<unsigned char, 1, unsigned char, 1, 1, HPC::fastcv::ECO_ENV_ARM>(
      src, {x, static_cast<int>(y)}, kAsItIs, dst);
}

}  // namespace

void cropNv21(unsigned char* nv21, int imageWidth, int imageHeight, int x, int y, int w, int h,
              unsigned char* out) {
  const Image<1> frame = kyface::view420(nv21, imageWidth, imageHeight);
  const Image<1> cropped = Image<1>::allocate(w, kyface::rows420(h));
  if (cropped.data == nullptr) {
    return;
  }
  Image<1> luma(w, h, cropped.data);
  Image<1> chroma(w, h / 2, cropped.data + std::int64_t{w} * h);
  copyRectangle(frame, x, y, &luma);
  // The column is that of the luma: a chroma row holds as many bytes as a luma row.
  copyRectangle(frame, x, std::int64_t{imageHeight} + y / 2, &chroma);
  Image<4> dst(w, h, out);
  kyface::convert<HPC::fastcv::CVT_NV212RGB>(cropped, &dst);
}

void rotateBGR(unsigned char* src, int width, int height, unsigned char* dst, int degree, int* outSize) {
  const bool sideways = degree == 90 || degree == 270;
  outSize[0] = sideways ? height : width;
  outSize[1] = sideways ? width : height;
  FACE_LOG_ALWAYS(ANDROID_LOG_DEBUG, "rotateBGR degree: %d", degree);
  Image<3> rotated(outSize[0], outSize[1], dst);
  HPC::fastcv::rotate<unsigned char, 3, 3, 3, HPC::fastcv::ECO_ENV_ARM>(Image<3>(width, height, src),
                                                                        &rotated, static_cast<float>(degree));
}
