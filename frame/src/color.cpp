// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// Colour conversions of whole camera frames. Their messages are written whatever the debug switch says.
#include "base/log.h"
#include "frame/frame.h"
#include "frame/image_view.h"

using kyface::Image;
using kyface::view420;

namespace {

/// The conversion for the chroma order that `format` names.
template <HPC::fastcv::ColorCvtType nv21, HPC::fastcv::ColorCvtType nv12, int srcChannels, int dstChannels>
void convert420(int format, const Image<srcChannels>& src, Image<dstChannels>* dst) {
  if (format == kyface::kFormatNv21) {
    kyface::convert<nv21>(src, dst);
  } else {
    kyface::convert<nv12>(src, dst);
  }
}

}  // namespace

void nv2RGB(unsigned char* nv, int format, int width, int height, unsigned char* out) {
  FACE_LOG_ALWAYS(ANDROID_LOG_INFO, "nv2RGB ");
  Image<4> dst(width, height, out);
  convert420<HPC::fastcv::CVT_NV212RGB, HPC::fastcv::CVT_NV122RGB>(format, view420(nv, width, height), &dst);
}

void RGB2nv(unsigned char* in, int format, int width, int height, unsigned char* nv) {
  FACE_LOG_ALWAYS(ANDROID_LOG_INFO, "RGB2nv ");
  Image<1> dst = view420(nv, width, height);
  convert420<HPC::fastcv::CVT_RGB2NV21, HPC::fastcv::CVT_RGB2NV12>(format, Image<4>(width, height, in), &dst);
}

void nv2BGR(unsigned char* nv, int format, int width, int height, unsigned char* out) {
  FACE_LOG_ALWAYS(ANDROID_LOG_INFO, "nv2BGR start");
  Image<4> dst(width, height, out);
  convert420<HPC::fastcv::CVT_NV212BGR, HPC::fastcv::CVT_NV122BGR>(format, view420(nv, width, height), &dst);
  FACE_LOG_ALWAYS(ANDROID_LOG_INFO, "nv2BGR end");
}

void nv212BGR(unsigned char* nv, int format, int width, int height, unsigned char* out) {
  FACE_LOG_ALWAYS(ANDROID_LOG_INFO, "nv212BGR start");
  Image<3> dst(width, height, out);
  convert420<HPC::fastcv::CVT_NV212BGR, HPC::fastcv::CVT_NV122BGR>(format, view420(nv, width, height), &dst);
  FACE_LOG_ALWAYS(ANDROID_LOG_INFO, "nv212BGR end");
}

void BGR2nv(unsigned char* in, int format, int width, int height, unsigned char* nv) {
  FACE_LOG_ALWAYS(ANDROID_LOG_INFO, "BGR2nv start");
  Image<1> dst = view420(nv, width, height);
  convert420<HPC::fastcv::CVT_BGR2NV21, HPC::fastcv::CVT_BGR2NV12>(format, Image<4>(width, height, in), &dst);
  FACE_LOG_ALWAYS(ANDROID_LOG_INFO, "BGR2nv end");
}

void BGR2RGB(unsigned char* in, int width, int height, unsigned char* out) {
  FACE_LOG_ALWAYS(ANDROID_LOG_INFO, "BGR2RGB start");
  Image<4> dst(width, height, out);
  kyface::convert<HPC::fastcv::CVT_BGR2RGB>(Image<4>(width, height, in), &dst);
  FACE_LOG_ALWAYS(ANDROID_LOG_INFO, "BGR2RGB end");
}

void BGRA2RGB(unsigned char* in, int width, int height, unsigned char* out) {
  FACE_LOG_ALWAYS(ANDROID_LOG_INFO, "BGRA2RGB start");
  Image<3> dst(width, height, out);
  kyface::convert<HPC::fastcv::CVT_BGR2RGB>(Image<4>(width, height, in), &dst);
  FACE_LOG_ALWAYS(ANDROID_LOG_INFO, "BGRA2RGB end");
}
