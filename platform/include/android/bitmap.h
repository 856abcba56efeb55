// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// Android's access to the pixels of `android.graphics.Bitmap` objects, as far as the library uses it, for
/// desktops.
///
/// Works on this project's stand-in for that class. All three functions return ANDROID_BITMAP_RESULT_SUCCESS,
/// ANDROID_BITMAP_RESULT_BAD_PARAMETER for a null argument, or ANDROID_BITMAP_RESULT_JNI_EXCEPTION when the
/// object is no bitmap or does not allow the operation (a recycled bitmap has no pixels).
#pragma once

#include <jni.h>
#include <stdint.h>

#ifdef __cplusplus
extern "C" {
#endif

enum {
  ANDROID_BITMAP_RESULT_SUCCESS = 0,
  ANDROID_BITMAP_RESULT_BAD_PARAMETER = -1,
  ANDROID_BITMAP_RESULT_JNI_EXCEPTION = -2,
  ANDROID_BITMAP_RESULT_ALLOCATION_FAILED = -3,
};

enum AndroidBitmapFormat {
  ANDROID_BITMAP_FORMAT_NONE = 0,
  ANDROID_BITMAP_FORMAT_RGBA_8888 = 1,  ///< bytes R, G, B, A
  ANDROID_BITMAP_FORMAT_RGB_565 = 4,    ///< 16-bit words, red in the high bits
  ANDROID_BITMAP_FORMAT_RGBA_4444 = 7,
  ANDROID_BITMAP_FORMAT_A_8 = 8,
  ANDROID_BITMAP_FORMAT_RGBA_F16 = 9,
  ANDROID_BITMAP_FORMAT_RGBA_1010102 = 10,
};

enum {
  ANDROID_BITMAP_FLAGS_ALPHA_PREMUL = 0,
  ANDROID_BITMAP_FLAGS_ALPHA_OPAQUE = 1,
  ANDROID_BITMAP_FLAGS_ALPHA_UNPREMUL = 2,
};

typedef struct {
  uint32_t width;   ///< pixels
  uint32_t height;  ///< pixels
  uint32_t stride;  ///< bytes from one row to the next
  int32_t format;   ///< an AndroidBitmapFormat
  uint32_t flags;
} AndroidBitmapInfo;

/// Describes a bitmap; `info` may be null.
int AndroidBitmap_getInfo(JNIEnv* env, jobject jbitmap, AndroidBitmapInfo* info);

/// Keeps the pixels where they are and stores their address in `*addrPtr` (`addrPtr` may be null). Every
/// success is to be paired with an AndroidBitmap_unlockPixels.
int AndroidBitmap_lockPixels(JNIEnv* env, jobject jbitmap, void** addrPtr);

/// Ends a lock.
int AndroidBitmap_unlockPixels(JNIEnv* env, jobject jbitmap);

#ifdef __cplusplus
}
#endif
