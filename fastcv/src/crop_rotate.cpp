// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// crop, rotate and rotate_YUV420: their checks, and the kernel behind each.

#include <cmath>

#include "arm/rotate.h"
#include "check.h"
#include "fastcv/fastcv.h"
#include "fastcv/kernels.h"

namespace HPC::fastcv {
namespace {

/// The right angle that `degree` is, or 0: exactly 90, 180 or 270, as no other float is within 1e-9 of them.
int rightAngleOf(float degree) {
  constexpr double kTolerance = 1e-9;
  for (const int angle : {90, 180, 270}) {
    const float difference = std::fabs(degree - static_cast<float>(angle));
    if (static_cast<double>(difference) <= kTolerance) {
      return angle;
    }
  }
  return 0;
}

template <typename T, int nc>
bool isInside(Point2_<int> p, const Mat<T, nc, ECO_ENV_ARM>& rectangle,
              const Mat<T, nc, ECO_ENV_ARM>& image) {
  return p.x >= 0 && p.x <= image.width && p.y >= 0 && p.y <= image.height &&
         wrappingAdd(p.x, rectangle.width) <= image.width &&
         wrappingAdd(p.y, rectangle.height) <= image.height;
}

template <typename T, int nc>
HPCStatus_t cropImage(const Mat<T, nc, ECO_ENV_ARM>& src, Point2_<int> p, T ratio,
                      Mat<T, nc, ECO_ENV_ARM>* dst) {
  if (src.dims == 0 || dst->dims == 0) {
    return HPC_MAT_EMPTY;
  }
  if (!isInside(p, *dst, src)) {
    return HPC_INVALID_ARGS;
  }
  armImageCrop<T, nc, T, nc, nc>(p.y, p.x, elementStride(src), src.data, dst->height, dst->width,
                                 elementStride(*dst), dst->data, static_cast<float>(ratio));
  return HPC_SUCCESS;
}

/// Whether an image of `width` by `height`, turned by `angle`, has the other size.
bool isTurned(int angle, int width, int height, int turnedWidth, int turnedHeight) {
  return angle == 180 ? width == turnedWidth && height == turnedHeight
                      : width == turnedHeight && height == turnedWidth;
}

template <typename T, int nc>
HPCStatus_t rotateImage(const Mat<T, nc, ECO_ENV_ARM>& src, Mat<T, nc, ECO_ENV_ARM>* dst, float degree) {
  if (src.data == nullptr || dst->data == nullptr) {
    return HPC_POINTER_NULL;
  }
  if (src.dims == 0 || dst->dims == 0) {
    return HPC_MAT_EMPTY;
  }
  const int angle = rightAngleOf(degree);
  if (angle == 0 || !isTurned(angle, src.width, src.height, dst->width, dst->height)) {
    return HPC_INVALID_ARGS;
  }
  armRotateNx90degree<T, nc, nc, nc>(src.height, src.width, elementStride(src), src.data, dst->height,
                                     dst->width, elementStride(*dst), dst->data, angle);
  return HPC_SUCCESS;
}

template <YUV420Type type>
HPCStatus_t rotateFrame(const Mat<unsigned char, 1, ECO_ENV_ARM>& src,
                        Mat<unsigned char, 1, ECO_ENV_ARM>* dst, float degree) {
  // The pointers to the pixels, unlike those of `rotate`, are the caller's word.
  if (dst == nullptr) {
    return HPC_POINTER_NULL;
  }
  if (src.dims == 0 || dst->dims == 0) {
    return HPC_MAT_EMPTY;
  }
  const int angle = rightAngleOf(degree);
  if (angle == 0 || !isTurned(angle, src.width, arm::lumaHeightOf(src.height), dst->width,
                              arm::lumaHeightOf(dst->height))) {
    return HPC_INVALID_ARGS;
  }
  constexpr int kKernelType = type == YUV420_I420 ? 1 : 0;
  armRotateNx90degree_YUV420<unsigned char>(src.height, src.width, elementStride(src), src.data, dst->height,
                                            dst->width, elementStride(*dst), dst->data, angle, kKernelType);
  return HPC_SUCCESS;
}

}  // namespace

#define FASTCV_DEFINE_PACKED(T, nc)                                                                   \
  template <>                                                                                         \
  HPCStatus_t crop<T, nc, T, nc, nc, ECO_ENV_ARM>(const Mat<T, nc, ECO_ENV_ARM>& src, Point2_<int> p, \
                                                  T ratio, Mat<T, nc, ECO_ENV_ARM>* dst) {            \
    return cropImage(src, p, ratio, dst);                                                             \
  }                                                                                                   \
  template <>                                                                                         \
  HPCStatus_t rotate<T, nc, nc, nc, ECO_ENV_ARM>(const Mat<T, nc, ECO_ENV_ARM>& src,                  \
                                                 Mat<T, nc, ECO_ENV_ARM>* dst, float degree) {        \
    return rotateImage(src, dst, degree);                                                             \
  }
FASTCV_PACKED_INSTANCES(FASTCV_DEFINE_PACKED)

#define FASTCV_DEFINE_ROTATE_YUV420(type)                                                                    \
  template <>                                                                                                \
  HPCStatus_t rotate_YUV420<type, unsigned char, ECO_ENV_ARM>(const Mat<unsigned char, 1, ECO_ENV_ARM>& src, \
                                                              Mat<unsigned char, 1, ECO_ENV_ARM>* dst,       \
                                                              float degree) {                                \
    return rotateFrame<type>(src, dst, degree);                                                              \
  }
FASTCV_YUV420_INSTANCES(FASTCV_DEFINE_ROTATE_YUV420)

}  // namespace HPC::fastcv
