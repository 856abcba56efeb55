// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

#include "fake_platform.h"

#include <android/log.h>

#include <cstdarg>
#include <cstdio>

#include "journal.h"

namespace fake {

Bitmap& bitmap() {
  static thread_local Bitmap instance;
  return instance;
}

}  // namespace fake

using fake::bitmap;
using fake::note;

extern "C" {

int __android_log_print(int prio, const char* tag, const char* fmt, ...) {
  va_list arguments;
  va_start(arguments, fmt);
  char text[512];
  vsnprintf(text, sizeof text, fmt, arguments);
  va_end(arguments);
  note("log %d %s: %s", prio, tag, text);
  return 1;
}

int AndroidBitmap_getInfo(JNIEnv* /*env*/, jobject /*jbitmap*/, AndroidBitmapInfo* info) {
  note("AndroidBitmap_getInfo()");
  if (bitmap().info_result == ANDROID_BITMAP_RESULT_SUCCESS) {
    *info = bitmap().info;
  }
  return bitmap().info_result;
}

int AndroidBitmap_lockPixels(JNIEnv* /*env*/, jobject /*jbitmap*/, void** address) {
  note("AndroidBitmap_lockPixels()");
  if (!bitmap().pixels.empty()) {
    *address = bitmap().pixels.data();
    ++bitmap().locks;
  }
  return bitmap().lock_result;
}

int AndroidBitmap_unlockPixels(JNIEnv* /*env*/, jobject /*jbitmap*/) {
  note("AndroidBitmap_unlockPixels()");
  --bitmap().locks;
  return ANDROID_BITMAP_RESULT_SUCCESS;
}

}  // extern "C"
