// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// cvtColor: the checks of the three families of conversions, and the kernel behind each conversion.

#include "check.h"
#include "fastcv/fastcv.h"
#include "fastcv/kernels.h"

namespace HPC::fastcv {
namespace {

enum class Family { kPacked, kToYuv420, kFromYuv420 };

/// What the families compare of a matrix.
struct Shape {
  int width;
  int height;
  bool fits;  ///< the step holds a row
};

template <typename T, int nc>
Shape shapeOf(const Mat<T, nc, ECO_ENV_ARM>& mat) {
  return {mat.width, mat.height, elementStride(mat) >= wrappingMultiply(mat.width, nc)};
}

/// Whether a picture and the 4:2:0 buffer for it agree in size. X / 3 truncates, so the buffer may be up to
/// two rows higher.
bool isPictureOf(int pictureWidth, int pictureHeight, int bufferWidth, int bufferHeight) {
  return pictureWidth % 2 == 0 && pictureHeight % 2 == 0 && pictureWidth == bufferWidth &&
         pictureHeight == bufferHeight / 3 * 2;
}

bool sizesAgree(Family family, const Shape& src, const Shape& dst) {
  if (family != Family::kToYuv420 && src.fits && dst.fits) {
    return family == Family::kPacked ? src.width == dst.width && src.height == dst.height
                                     : isPictureOf(dst.width, dst.height, src.width, src.height);
  }
  // The rule of a conversion to 4:2:0 also judges the packed and the "from 4:2:0" images whose step is
  // shorter than a row (C13 in docs/compatibility.md). As widths must be equal, it does not matter whose is
  // tested for being even.
  return isPictureOf(src.width, src.height, dst.width, dst.height);
}

template <typename T>
using Kernel = void(int height, int width, int inWidthStride, const T* inData, int outWidthStride,
                    T* outData);

template <Family family, typename T, int ncSrc, int ncDst>
HPCStatus_t convert(const Mat<T, ncSrc, ECO_ENV_ARM>& src, Mat<T, ncDst, ECO_ENV_ARM>* dst,
                    Kernel<T>* kernel) {
  if (dst == nullptr) {
    return HPC_INVALID_ARGS;
  }
  if (src.dims == 0 || dst->dims == 0) {
    return HPC_MAT_EMPTY;
  }
  if (!sizesAgree(family, shapeOf(src), shapeOf(*dst))) {
    return HPC_INVALID_ARGS;
  }
  const int pictureHeight = family == Family::kFromYuv420 ? dst->height : src.height;
  kernel(pictureHeight, src.width, elementStride(src), src.data, elementStride(*dst), dst->data);
  return HPC_SUCCESS;
}

#define FASTCV_FAMILY(with, name, value, family, instances) constexpr Family kFamilyOf##name = Family::family;
FASTCV_CONVERSIONS(FASTCV_FAMILY, )

}  // namespace

#define FASTCV_DEFINE_CVT_COLOR(name, T, ncSrc, ncDst)                                                     \
  template <>                                                                                              \
  HPCStatus_t cvtColor<CVT_##name, T, ncSrc, T, ncDst, ECO_ENV_ARM>(const Mat<T, ncSrc, ECO_ENV_ARM>& src, \
                                                                    Mat<T, ncDst, ECO_ENV_ARM>* dst) {     \
    return convert<kFamilyOf##name, T, ncSrc, ncDst>(src, dst, &arm##name##Image<T, ncSrc, T, ncDst>);     \
  }
FASTCV_NAMED_INSTANCES(FASTCV_DEFINE_CVT_COLOR)

}  // namespace HPC::fastcv
