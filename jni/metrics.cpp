// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// Native methods of FaceLibrary that measure brightness.
#include "brightness/brightness.h"

#include <jni.h>

#include <algorithm>
#include <cstdint>

#include "base/log.h"
#include "brightness/clip.h"
#include "java_declarations.h"
#include "pinned.h"

namespace {

using kyface::brightness::reachesBeyond;

using Metric = decltype(calcGray_YUV);

/// The formats of faceBrightEvaluate; 2 is none (C5).
enum BrightnessMetric : jint {
  kLightnessRgba = JAVA_CONSTANT(BrightnessMetric, LIGHTNESS_RGBA, 0),
  kLightnessBgra = JAVA_CONSTANT(BrightnessMetric, LIGHTNESS_BGRA, 1),
  kLumaYuv = JAVA_CONSTANT(BrightnessMetric, LUMA_YUV, 3),
  kGrayBgra = JAVA_CONSTANT(BrightnessMetric, GRAY_BGRA, 4),
  kGrayRgba = JAVA_CONSTANT(BrightnessMetric, GRAY_RGBA, 5),
};

/// The metric of a `format`, null for one that has none.
Metric* metricOf(jint format) {
  switch (format) {
    case kLightnessRgba:
      return calcLuminance_RGBA;
    case kLightnessBgra:
      return calcLuminance_BGRA;
    case kLumaYuv:
      return calcGray_YUV;
    case kGrayBgra:
      return calcGray_BGRA;
    case kGrayRgba:
      return calcGray_RGBA;
    default:
      return nullptr;
  }
}

/// The sum of `rows` by `columns` bytes, the rows `stride` bytes apart.
std::uint32_t sumBytes(const unsigned char* first, std::int64_t stride, int columns, int rows) {
  std::uint32_t sum = 0;
  for (int y = 0; y < rows; ++y) {
    const unsigned char* row = first + y * stride;
    for (int x = 0; x < columns; ++x) {
      sum += row[x];
    }
  }
  return sum;
}

}  // namespace

extern "C" {

JNIEXPORT jint JNICALL Java_com_vantrel_faceapi_FaceLibrary_faceBrightEvaluate(
    JNIEnv* env, jclass /*type*/, jbyteArray image, jint format, jint width, jint widthStride, jint height,
    jint heightStride, jint rectX, jint rectY, jint rectW, jint rectH) {
  if (image == nullptr) {
    FACE_LOG(ANDROID_LOG_ERROR, "IMAGE IS NULL");
    return -1;
  }
  // A metric answers for an image that could not be pinned.
  const kyface::PinnedArray pinned(env, image);
  jint result = -1;
  if (Metric* metric = metricOf(format)) {
    result = metric(pinned.bytes(), width, widthStride, height, heightStride, rectX, rectY, rectW, rectH);
  }
  FACE_LOG(ANDROID_LOG_VERBOSE,
           "width:%d,width_stride:%d,height:%d,height_stride:%d,rect_x:%d,rect_y:%d,rect_w:%d,rect_h:%d",
           width, widthStride, height, heightStride, rectX, rectY, rectW, rectH);
  return result;
}

JNIEXPORT jfloat JNICALL Java_com_vantrel_faceapi_FaceLibrary_averageBrightness(JNIEnv* env, jclass /*type*/,
                                                                                jbyteArray gray, jint width,
                                                                                jint height, jint x, jint y,
                                                                                jint w, jint h) {
  kyface::PinnedArray pinned(env, gray);
  if (x > width || y > height || w < 1 || h < 1) {
    FACE_LOG(
        ANDROID_LOG_WARN,
        "averageBrightness native area is not in image frame imageFrame : %dx%d,area[x,y,w,h] : %d,%d,%d,%d",
        width, height, x, y, w, h);
    pinned.leavePinned();  // C4
    return 0.0F;
  }
  if (!pinned) {
    return 0.0F;
  }
  const int left = std::max(x, 0);
  const int top = std::max(y, 0);
  const int columns = reachesBeyond(left, w, width) ? width - left : w;
  // The height test adds to the left edge (C3): callers depend on which rectangles it cuts.
  const int rows = reachesBeyond(left, h, height) ? height - top : h;
  const std::int64_t stride = width;
  const std::uint32_t sum = sumBytes(pinned.bytes() + top * stride + left, stride, columns, rows);
  pinned.release();
  // Both in 32 bits; a rectangle without an area is 0/0.
  const auto full = static_cast<std::int32_t>(static_cast<std::uint32_t>(columns) *
                                              static_cast<std::uint32_t>(rows) * std::uint32_t{255});
  return static_cast<float>(static_cast<std::int32_t>(sum)) / static_cast<float>(full);
}

}  // extern "C"
