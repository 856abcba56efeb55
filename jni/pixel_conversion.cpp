// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// Native methods of PixelConversion. They compare every array and bitmap with the sizes that come with it,
// and say nothing to the log.
#include <android/bitmap.h>
#include <jni.h>

#include <climits>
#include <cstdint>

#include "brightness/total_lightness.h"
#include "frame/image_view.h"
#include "java_declarations.h"
#include "pinned.h"

namespace {

using kyface::CriticalArray;
using kyface::Image;

/// What the methods answer. Sums are not negative.
enum Status : jint {
  kSuccess = JAVA_CONSTANT(PixelConversion, SUCCESS, 0),
  kSizes = -1,  ///< sizes that there are not, or that an array does not hold
  /// A bitmap without pixels, such as a recycled one.
  kNoPixels = JAVA_CONSTANT(PixelConversion, NO_PIXELS, -2),
  /// A bitmap of other sizes or another configuration than it was said to have.
  kChanged = JAVA_CONSTANT(PixelConversion, CHANGED, -3),
  kNoElements = -4,  ///< the JVM does not give an array's elements; its exception is pending
};

enum Conversion : jint {
  kSwapRedAndBlue = JAVA_CONSTANT(PixelConversion, SWAP_RED_AND_BLUE, 0),
  kRgbaToNv21 = JAVA_CONSTANT(PixelConversion, RGBA_TO_NV21, 1),
  kRgbaToNv12 = JAVA_CONSTANT(PixelConversion, RGBA_TO_NV12, 2),
};

/// The pixels of an image, 0 when there is no such image.
std::int64_t pixelsOf(jint width, jint height) {
  const std::int64_t pixels = std::int64_t{width} * height;
  return width > 0 && height > 0 && pixels <= INT_MAX ? pixels : 0;
}

bool holds(JNIEnv* env, jbyteArray array, std::int64_t bytes) {
  return array != nullptr && bytes > 0 && env->GetArrayLength(array) >= bytes;
}

/// Calls `use` with the bytes of two arrays, the second to be written.
template <typename Use>
jint withBytes(JNIEnv* env, jbyteArray src, jbyteArray dst, const Use& use) {
  const CriticalArray in(env, src, JNI_ABORT);
  if (in.refused()) {
    return kNoElements;
  }
  const CriticalArray out(env, dst, 0);
  if (out.refused()) {
    return kNoElements;
  }
  use(in.bytes(), out.bytes());
  return kSuccess;
}

template <int channels>
void rotate(const Image<channels>& src, jint degrees, unsigned char* out) {
  const bool sideways = degrees != 180;
  Image<channels> dst(sideways ? src.height : src.width, sideways ? src.width : src.height, out);
  HPC::fastcv::rotate<unsigned char, channels, channels, channels, HPC::fastcv::ECO_ENV_ARM>(
      src, &dst, static_cast<float>(degrees));
}

/// Calls `sum` with the first byte of the rectangle at (`x`, `y`) of an image of `channels` bytes a pixel.
template <int channels, typename Sum>
jlong sumOf(JNIEnv* env, jbyteArray image, jint stride, jint x, jint y, jint w, jint h, const Sum& sum) {
  if (image == nullptr || stride < 1 || x < 0 || y < 0 || w < 1 || h < 1 || h > INT_MAX - y) {
    return kSizes;
  }
  const std::int64_t first = std::int64_t{y} * stride + std::int64_t{x} * channels;
  const std::int64_t end =
      std::int64_t{y + h - 1} * stride + (std::int64_t{x} + w) * channels;  // behind the last pixel
  if (end > env->GetArrayLength(image)) {
    return kSizes;
  }
  const CriticalArray pixels(env, image, JNI_ABORT);
  return pixels.refused() ? jlong{kNoElements} : static_cast<jlong>(sum(pixels.bytes() + first));
}

}  // namespace

extern "C" {

JNIEXPORT jint JNICALL Java_com_vantrel_faceapi_PixelConversion_convert(JNIEnv* env, jclass /*type*/,
                                                                        jbyteArray src, jint width,
                                                                        jint height, jbyteArray dst,
                                                                        jint conversion) {
  const std::int64_t pixels = pixelsOf(width, height);
  const bool toFrame = conversion != kSwapRedAndBlue;
  if ((toFrame && (width % 2 != 0 || height % 2 != 0)) || !holds(env, src, pixels * 4) ||
      !holds(env, dst, toFrame ? pixels + pixels / 2 : pixels * 4)) {
    return kSizes;
  }
  return withBytes(env, src, dst, [&](unsigned char* in, unsigned char* out) {
    const Image<4> rgba(width, height, in);
    Image<4> swapped(width, height, out);
    Image<1> frame = kyface::view420(out, width, height);
    switch (conversion) {
      case kRgbaToNv21:
        return kyface::convert<HPC::fastcv::CVT_RGB2NV21>(rgba, &frame);
      case kRgbaToNv12:
        return kyface::convert<HPC::fastcv::CVT_RGB2NV12>(rgba, &frame);
      default:
        return kyface::convert<HPC::fastcv::CVT_BGR2RGB>(rgba, &swapped);
    }
  });
}

JNIEXPORT jint JNICALL Java_com_vantrel_faceapi_PixelConversion_rotate(JNIEnv* env, jclass /*type*/,
                                                                       jbyteArray src, jint width,
                                                                       jint height, jint bytesPerPixel,
                                                                       jint degrees, jbyteArray dst) {
  const std::int64_t bytes = pixelsOf(width, height) * bytesPerPixel;
  if ((bytesPerPixel != 1 && bytesPerPixel != 3 && bytesPerPixel != 4) ||
      (degrees != 90 && degrees != 180 && degrees != 270) || !holds(env, src, bytes) ||
      !holds(env, dst, bytes)) {
    return kSizes;
  }
  return withBytes(env, src, dst, [&](unsigned char* in, unsigned char* out) {
    if (bytesPerPixel == 1) {
      rotate(Image<1>(width, height, in), degrees, out);
    } else if (bytesPerPixel == 3) {
      rotate(Image<3>(width, height, in), degrees, out);
    } else {
      rotate(Image<4>(width, height, in), degrees, out);
    }
  });
}

JNIEXPORT jint JNICALL Java_com_vantrel_faceapi_PixelConversion_read(JNIEnv* env, jclass /*type*/,
                                                                     jobject bitmap, jint width, jint height,
                                                                     jint bytesPerPixel, jbyteArray dst) {
  if (bitmap == nullptr || (bytesPerPixel != 3 && bytesPerPixel != 4) ||
      !holds(env, dst, pixelsOf(width, height) * bytesPerPixel)) {
    return kSizes;
  }
  AndroidBitmapInfo info = {};
  if (AndroidBitmap_getInfo(env, bitmap, &info) != ANDROID_BITMAP_RESULT_SUCCESS) {
    return kNoPixels;
  }
  if (info.width != static_cast<std::uint32_t>(width) || info.height != static_cast<std::uint32_t>(height) ||
      info.format != ANDROID_BITMAP_FORMAT_RGBA_8888) {
    return kChanged;
  }
  void* pixels = nullptr;
  if (AndroidBitmap_lockPixels(env, bitmap, &pixels) != ANDROID_BITMAP_RESULT_SUCCESS) {
    return kNoPixels;
  }
  jint status = kNoPixels;
  if (pixels != nullptr) {
    const CriticalArray out(env, dst, 0);
    status = out.refused() ? kNoElements : kSuccess;
    if (status == kSuccess) {
      Image<4> src(width, height, static_cast<unsigned char*>(pixels));
      src.step = info.stride;
      Image<4> bgra(width, height, out.bytes());
      Image<3> bgr(width, height, out.bytes());
      if (bytesPerPixel == 4) {
        kyface::convert<HPC::fastcv::CVT_BGR2RGB>(src, &bgra);
      } else {
        kyface::convert<HPC::fastcv::CVT_BGR2RGB>(src, &bgr);
      }
    }
  }
  AndroidBitmap_unlockPixels(env, bitmap);
  return status;
}

JNIEXPORT jlong JNICALL Java_com_vantrel_faceapi_PixelConversion_sumBytes(JNIEnv* env, jclass /*type*/,
                                                                          jbyteArray image, jint stride,
                                                                          jint x, jint y, jint w, jint h) {
  return sumOf<1>(env, image, stride, x, y, w, h, [&](const unsigned char* first) {
    std::uint64_t sum = 0;
    for (std::int64_t row = 0; row < h; ++row) {
      for (std::int64_t column = 0; column < w; ++column) {
        sum += first[row * stride + column];
      }
    }
    return sum;
  });
}

JNIEXPORT jlong JNICALL Java_com_vantrel_faceapi_PixelConversion_sumLightness(JNIEnv* env, jclass /*type*/,
                                                                              jbyteArray image, jint stride,
                                                                              jboolean rgba, jint x, jint y,
                                                                              jint w, jint h) {
  return sumOf<4>(env, image, stride, x, y, w, h, [&](const unsigned char* first) {
    return kyface::brightness::totalLightness(first, stride, w, h, rgba != JNI_FALSE);
  });
}

}  // extern "C"
