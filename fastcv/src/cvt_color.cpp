// cvtColor: the checks of the three families of conversions, and the kernel behind each conversion.

#include "check.h"
#include "fastcv/fastcv.h"
#include "fastcv/kernels.h"

namespace HPC::fastcv {
namespace {

enum class Family { kPacked, kToYuv420, kFromYuv420 };

constexpr Family familyOf(ColorCvtType type) {
  switch (type) {
    case CVT_BGR2NV21:
    case CVT_RGB2NV21:
    case CVT_BGR2NV12:
    case CVT_BGR2I420:
    case CVT_RGB2NV12:
      return Family::kToYuv420;
    case CVT_NV212BGR:
    case CVT_NV212RGB:
    case CVT_NV122BGR:
    case CVT_I4202BGR:
    case CVT_YUV2GRAY:
    case CVT_NV122RGB:
      return Family::kFromYuv420;
    default:
      return Family::kPacked;
  }
}

/// The kernel of a conversion, with the four template arguments of its front-end.
template <ColorCvtType type, typename T, int ncSrc, int ncDst>
constexpr auto kernelOf() {
  // clang-format off
  if constexpr (type == CVT_BGR2NV21) { return &armBGR2NV21Image<T, ncSrc, T, ncDst>; }
  else if constexpr (type == CVT_NV212BGR) { return &armNV212BGRImage<T, ncSrc, T, ncDst>; }
  else if constexpr (type == CVT_NV212RGB) { return &armNV212RGBImage<T, ncSrc, T, ncDst>; }
  else if constexpr (type == CVT_RGB2NV21) { return &armRGB2NV21Image<T, ncSrc, T, ncDst>; }
  else if constexpr (type == CVT_BGR2NV12) { return &armBGR2NV12Image<T, ncSrc, T, ncDst>; }
  else if constexpr (type == CVT_NV122BGR) { return &armNV122BGRImage<T, ncSrc, T, ncDst>; }
  else if constexpr (type == CVT_YCrCb2BGR) { return &armYCrCb2BGRImage<T, ncSrc, T, ncDst>; }
  else if constexpr (type == CVT_BGR2YCrCb) { return &armBGR2YCrCbImage<T, ncSrc, T, ncDst>; }
  else if constexpr (type == CVT_BGR2HSV) { return &armBGR2HSVImage<T, ncSrc, T, ncDst>; }
  else if constexpr (type == CVT_HSV2BGR) { return &armHSV2BGRImage<T, ncSrc, T, ncDst>; }
  else if constexpr (type == CVT_BGR2GRAY) { return &armBGR2GRAYImage<T, ncSrc, T, ncDst>; }
  else if constexpr (type == CVT_GRAY2BGR) { return &armGRAY2BGRImage<T, ncSrc, T, ncDst>; }
  else if constexpr (type == CVT_BGR2BGRA) { return &armBGR2BGRAImage<T, ncSrc, T, ncDst>; }
  else if constexpr (type == CVT_BGRA2BGR) { return &armBGRA2BGRImage<T, ncSrc, T, ncDst>; }
  else if constexpr (type == CVT_BGR2RGB) { return &armBGR2RGBImage<T, ncSrc, T, ncDst>; }
  else if constexpr (type == CVT_BGR2LAB) { return &armBGR2LABImage<T, ncSrc, T, ncDst>; }
  else if constexpr (type == CVT_LAB2BGR) { return &armLAB2BGRImage<T, ncSrc, T, ncDst>; }
  else if constexpr (type == CVT_BGR2I420) { return &armBGR2I420Image<T, ncSrc, T, ncDst>; }
  else if constexpr (type == CVT_I4202BGR) { return &armI4202BGRImage<T, ncSrc, T, ncDst>; }
  else if constexpr (type == CVT_YUV2GRAY) { return &armYUV2GRAYImage<T, ncSrc, T, ncDst>; }
  else if constexpr (type == CVT_RGB2NV12) { return &armRGB2NV12Image<T, ncSrc, T, ncDst>; }
  else { static_assert(type == CVT_NV122RGB); return &armNV122RGBImage<T, ncSrc, T, ncDst>; }
  // clang-format on
}

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
  // The rule of a conversion to 4:2:0 also judges, deliberately, the packed and the "from 4:2:0" images whose
  // step is shorter than a row. As widths must be equal, it does not matter whose is tested for being even.
  return isPictureOf(src.width, src.height, dst.width, dst.height);
}

template <ColorCvtType type, typename T, int ncSrc, int ncDst>
HPCStatus_t convert(const Mat<T, ncSrc, ECO_ENV_ARM>& src, Mat<T, ncDst, ECO_ENV_ARM>* dst) {
  if (dst == nullptr) {
    return HPC_INVALID_ARGS;
  }
  if (src.dims == 0 || dst->dims == 0) {
    return HPC_MAT_EMPTY;
  }
  constexpr Family kFamily = familyOf(type);
  if (!sizesAgree(kFamily, shapeOf(src), shapeOf(*dst))) {
    return HPC_INVALID_ARGS;
  }
  const int pictureHeight = kFamily == Family::kFromYuv420 ? dst->height : src.height;
  kernelOf<type, T, ncSrc, ncDst>()(pictureHeight, src.width, elementStride(src), src.data,
                                    elementStride(*dst), dst->data);
  return HPC_SUCCESS;
}

}  // namespace

#define FASTCV_DEFINE_CVT_COLOR(type, T, ncSrc, ncDst)                                               \
  template <>                                                                                        \
  HPCStatus_t cvtColor<type, T, ncSrc, T, ncDst, ECO_ENV_ARM>(const Mat<T, ncSrc, ECO_ENV_ARM>& src, \
                                                              Mat<T, ncDst, ECO_ENV_ARM>* dst) {     \
    return convert<type, T, ncSrc, ncDst>(src, dst);                                                 \
  }
FASTCV_CVT_COLOR_INSTANCES(FASTCV_DEFINE_CVT_COLOR)

}  // namespace HPC::fastcv
