// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// Refers to every C++ function that the shared library is meant to export. It is compiled, not linked: what
// its object leaves undefined is the list.

#include "brightness/brightness.h"
#include "fastcv/fastcv.h"
#include "fastcv/kernels.h"
#include "frame/frame.h"

using PlainMetric = unsigned char(unsigned char*, int, int, int, int, int, int, int, int);
using HeaderMetric = unsigned char(const unsigned char*, int, int, int, int, int, int, int, int);
PlainMetric calcGray_YUV, calcGray_BGRA, calcGray_RGBA, calcLuminance_BGRA, calcLuminance_RGBA;

namespace HPC::fastcv {

using Function = void (*)();
#define ADDRESS(...) reinterpret_cast<Function>(&__VA_ARGS__),

#define COLOR(name, T, ncSrc, ncDst)                             \
  ADDRESS(cvtColor<CVT_##name, T, ncSrc, T, ncDst, ECO_ENV_ARM>) \
  ADDRESS(arm##name##Image<T, ncSrc, T, ncDst>)

#define PACKED(T, nc)                          \
  ADDRESS(crop<T, nc, T, nc, nc, ECO_ENV_ARM>) \
  ADDRESS(rotate<T, nc, nc, nc, ECO_ENV_ARM>)  \
  ADDRESS(armImageCrop<T, nc, T, nc, nc>)

// The kernels rotate two channels too, for pairs of chroma samples.
#define ROTATION(T, nc)                       \
  ADDRESS(armRotateNx90degree<T, nc, nc, nc>) \
  ADDRESS(imgRotate90degree<T, nc, 64, 64>)   \
  ADDRESS(imgRotate180degree<T, nc, 64, 64>)  \
  ADDRESS(imgRotate270degree<T, nc, 64, 64>)

#define FRAME(type) ADDRESS(rotate_YUV420<type, unsigned char, ECO_ENV_ARM>)

// The metrics have two names each: that of the header, and the one with a plain pointer.
#define METRIC(name)                                               \
  reinterpret_cast<Function>(static_cast<HeaderMetric*>(&::name)), \
      reinterpret_cast<Function>(static_cast<PlainMetric*>(&::name)),

// clang-format off
extern const Function intended[];
const Function intended[] = {
    FASTCV_NAMED_INSTANCES(COLOR)
    FASTCV_PACKED_INSTANCES(PACKED)
    ROTATION(unsigned char, 1) ROTATION(unsigned char, 2) ROTATION(unsigned char, 3) ROTATION(unsigned char, 4)
    ROTATION(float, 1) ROTATION(float, 2) ROTATION(float, 3) ROTATION(float, 4)
    FRAME(YUV420_NV21) FRAME(YUV420_NV12) FRAME(YUV420_I420)
    ADDRESS(armRotateNx90degree_YUV420<unsigned char>) ADDRESS(imgRotate_I420<unsigned char>)
    ADDRESS(nv2RGB) ADDRESS(RGB2nv) ADDRESS(nv2BGR) ADDRESS(nv212BGR) ADDRESS(BGR2nv)
    ADDRESS(BGR2RGB) ADDRESS(BGRA2RGB) ADDRESS(cropNv21) ADDRESS(rotateBGR)
    METRIC(calcGray_YUV) METRIC(calcGray_BGRA) METRIC(calcGray_RGBA)
    METRIC(calcLuminance_BGRA) METRIC(calcLuminance_RGBA)
};
// clang-format on

}  // namespace HPC::fastcv
