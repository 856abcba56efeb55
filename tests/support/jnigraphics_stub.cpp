// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// Stands in for Android's libjnigraphics, which is not everywhere where its C library is: there are no
// bitmaps.
#include <android/bitmap.h>

extern "C" {

int AndroidBitmap_getInfo(JNIEnv* /*env*/, jobject /*jbitmap*/, AndroidBitmapInfo* /*info*/) {
  return ANDROID_BITMAP_RESULT_BAD_PARAMETER;
}

int AndroidBitmap_lockPixels(JNIEnv* /*env*/, jobject /*jbitmap*/, void** /*addrPtr*/) {
  return ANDROID_BITMAP_RESULT_BAD_PARAMETER;
}

int AndroidBitmap_unlockPixels(JNIEnv* /*env*/, jobject /*jbitmap*/) {
  return ANDROID_BITMAP_RESULT_BAD_PARAMETER;
}

}  // extern "C"
