// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// Native methods of FaceLibrary over the frame helpers.
#include <android/bitmap.h>
#include <jni.h>

#include "base/log.h"
#include "frame/frame.h"
#include "java_declarations.h"
#include "pinned.h"

namespace {

using kyface::kFormatNv12;
using kyface::kFormatNv21;

/// The codes of convertColorSpace.
enum ColorConversion : jint {
  kNv21ToBgra = JAVA_CONSTANT(ColorConversion, NV21_TO_BGRA, 1),
  kNv21ToRgba = JAVA_CONSTANT(ColorConversion, NV21_TO_RGBA, 2),
  kRgbaToNv21 = JAVA_CONSTANT(ColorConversion, RGBA_TO_NV21, 3),
  kNv12ToBgra = JAVA_CONSTANT(ColorConversion, NV12_TO_BGRA, 5),
  kBgraToRgba = JAVA_CONSTANT(ColorConversion, BGRA_TO_RGBA, 14),
  kRgbaToNv12 = JAVA_CONSTANT(ColorConversion, RGBA_TO_NV12, 20),
  kBgraToRgbaAlias = JAVA_CONSTANT(ColorConversion, BGRA_TO_RGBA_ALIAS, 101),
  kNv21ToBgr = JAVA_CONSTANT(ColorConversion, NV21_TO_BGR, 1001),
};

/// Converts the pixels of an RGBA bitmap into `out`. Rows are taken as packed, whatever the bitmap's stride.
/// Both methods over it write the messages of the first (C11 in docs/compatibility.md).
void readBitmap(JNIEnv* env, jobject bitmap, jbyteArray out, decltype(BGR2RGB)* convert) {
  if (bitmap == nullptr) {
    FACE_LOG(ANDROID_LOG_ERROR, "getBGRADataFromBitmap image is null ");
    return;
  }
  AndroidBitmapInfo info = {};
  AndroidBitmap_getInfo(env, bitmap, &info);
  if (info.width == 0 || info.height == 0 || info.format != ANDROID_BITMAP_FORMAT_RGBA_8888) {
    FACE_LOG(ANDROID_LOG_ERROR, "getBGRADataFromBitmap image is not  RGBA_8888");
    return;
  }
  void* pixels = nullptr;
  AndroidBitmap_lockPixels(env, bitmap, &pixels);
  if (pixels == nullptr) {
    return;
  }
  if (kyface::PinnedArray pinnedOut(env, out); pinnedOut) {
    convert(static_cast<unsigned char*>(pixels), static_cast<int>(info.width), static_cast<int>(info.height),
            pinnedOut.bytes());
  }
  AndroidBitmap_unlockPixels(env, bitmap);
}

}  // namespace

extern "C" {

JNIEXPORT void JNICALL Java_com_vantrel_faceapi_FaceLibrary_convertColorSpace(JNIEnv* env, jclass /*type*/,
                                                                              jbyteArray src, jint width,
                                                                              jint height, jbyteArray dst,
                                                                              jint code) {
  if (src == nullptr || dst == nullptr) {
    return;
  }
  kyface::PinnedArray in(env, src);
  if (!in) {
    return;
  }
  kyface::PinnedArray out(env, dst);
  if (!out) {
    return;
  }
  switch (code) {
    case kNv21ToBgra:
      nv2BGR(in.bytes(), kFormatNv21, width, height, out.bytes());
      break;
    case kNv21ToRgba:
      nv2RGB(in.bytes(), kFormatNv21, width, height, out.bytes());
      break;
    case kRgbaToNv21:
      RGB2nv(in.bytes(), kFormatNv21, width, height, out.bytes());
      break;
    case kNv12ToBgra:
      nv2BGR(in.bytes(), kFormatNv12, width, height, out.bytes());
      break;
    case kBgraToRgba:
    case kBgraToRgbaAlias:
      BGR2RGB(in.bytes(), width, height, out.bytes());
      break;
    case kRgbaToNv12:
      RGB2nv(in.bytes(), kFormatNv12, width, height, out.bytes());
      break;
    case kNv21ToBgr:
      nv212BGR(in.bytes(), kFormatNv21, width, height, out.bytes());
      break;
    default:
      break;
  }
  in.release();
  out.release();
}

JNIEXPORT void JNICALL Java_com_vantrel_faceapi_FaceLibrary_getBGRADataFromBitmap(JNIEnv* env,
                                                                                  jclass /*type*/,
                                                                                  jobject bitmap,
                                                                                  jbyteArray out) {
  readBitmap(env, bitmap, out, BGR2RGB);
}

JNIEXPORT void JNICALL Java_com_vantrel_faceapi_FaceLibrary_getBGRDataFromBitmap(JNIEnv* env, jclass /*type*/,
                                                                                 jobject bitmap,
                                                                                 jbyteArray out) {
  readBitmap(env, bitmap, out, BGRA2RGB);
}

JNIEXPORT void JNICALL Java_com_vantrel_faceapi_FaceLibrary_cropNv21Data(JNIEnv* env, jclass /*type*/,
                                                                         jbyteArray nv21, jint imageWidth,
                                                                         jint imageHeight, jint x, jint y,
                                                                         jint w, jint h, jbyteArray out) {
  kyface::PinnedArray frame(env, nv21);
  if (!frame) {
    return;
  }
  kyface::PinnedArray pixels(env, out);
  if (!pixels) {
    return;
  }
  cropNv21(frame.bytes(), imageWidth, imageHeight, x, y, w, h, pixels.bytes());
  frame.release();
  pixels.release();
}

JNIEXPORT void JNICALL Java_com_vantrel_faceapi_FaceLibrary_rotateBGR(JNIEnv* env, jclass /*type*/,
                                                                      jbyteArray src, jint width, jint height,
                                                                      jbyteArray dst, jint degree,
                                                                      jintArray outSize) {
  kyface::PinnedArray in(env, src);
  if (!in) {
    return;
  }
  kyface::PinnedArray out(env, dst);
  if (!out) {
    return;
  }
  kyface::PinnedArray size(env, outSize);
  if (!size) {
    return;
  }
  rotateBGR(in.bytes(), width, height, out.bytes(), degree, size.data());
  in.release();
  out.release();
  size.release();
}

}  // extern "C"
