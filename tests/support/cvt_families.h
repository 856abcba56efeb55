/// Which conversions of `cvtColor` make or take YUV 4:2:0 buffers; all others are of packed images.
#pragma once

#include "fastcv/fastcv.h"

namespace kyface::test {

constexpr bool isTo420(HPC::fastcv::ColorCvtType type) {
  using namespace HPC::fastcv;
  return type == CVT_BGR2NV21 || type == CVT_RGB2NV21 || type == CVT_BGR2NV12 || type == CVT_BGR2I420 ||
         type == CVT_RGB2NV12;
}

constexpr bool isFrom420(HPC::fastcv::ColorCvtType type) {
  using namespace HPC::fastcv;
  return type == CVT_NV212BGR || type == CVT_NV212RGB || type == CVT_NV122BGR || type == CVT_I4202BGR ||
         type == CVT_YUV2GRAY || type == CVT_NV122RGB;
}

}  // namespace kyface::test
