// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

#include <android/bitmap.h>

namespace {

bool failed(JNIEnv* env) { return env->ExceptionCheck() == JNI_TRUE; }

// The members of the stand-in are looked up by name on every call: a bitmap is locked seldom, and nothing has
// to be kept from one call to the next.
jclass bitmapClass(JNIEnv* env, jobject bitmap) {
  jclass type = env->FindClass("android/graphics/Bitmap");
  return type != nullptr && env->IsInstanceOf(bitmap, type) == JNI_TRUE ? type : nullptr;
}

bool readInt(JNIEnv* env, jobject bitmap, jclass type, const char* name, jint* value) {
  jfieldID field = env->GetFieldID(type, name, "I");
  if (field == nullptr) {
    return false;
  }
  *value = env->GetIntField(bitmap, field);
  return true;
}

}  // namespace

extern "C" int AndroidBitmap_getInfo(JNIEnv* env, jobject jbitmap, AndroidBitmapInfo* info) {
  if (env == nullptr || jbitmap == nullptr) {
    return ANDROID_BITMAP_RESULT_BAD_PARAMETER;
  }
  jclass type = bitmapClass(env, jbitmap);
  jint width;
  jint height;
  jint stride;
  jint format;
  if (type == nullptr || !readInt(env, jbitmap, type, "width", &width) ||
      !readInt(env, jbitmap, type, "height", &height) || !readInt(env, jbitmap, type, "rowBytes", &stride) ||
      !readInt(env, jbitmap, type, "nativeFormat", &format)) {
    return ANDROID_BITMAP_RESULT_JNI_EXCEPTION;
  }
  env->DeleteLocalRef(type);
  if (info != nullptr) {
    info->width = static_cast<uint32_t>(width);
    info->height = static_cast<uint32_t>(height);
    info->stride = static_cast<uint32_t>(stride);
    info->format = format;
    info->flags = format == ANDROID_BITMAP_FORMAT_RGB_565 ? ANDROID_BITMAP_FLAGS_ALPHA_OPAQUE
                                                          : ANDROID_BITMAP_FLAGS_ALPHA_PREMUL;
  }
  return ANDROID_BITMAP_RESULT_SUCCESS;
}

extern "C" int AndroidBitmap_lockPixels(JNIEnv* env, jobject jbitmap, void** addrPtr) {
  if (env == nullptr || jbitmap == nullptr) {
    return ANDROID_BITMAP_RESULT_BAD_PARAMETER;
  }
  jclass type = bitmapClass(env, jbitmap);
  jmethodID lock =
      type == nullptr ? nullptr : env->GetMethodID(type, "lockPixels", "()Ljava/nio/ByteBuffer;");
  if (lock == nullptr) {
    return ANDROID_BITMAP_RESULT_JNI_EXCEPTION;
  }
  jobject pixels = env->CallObjectMethod(jbitmap, lock);
  if (failed(env) || pixels == nullptr) {
    return ANDROID_BITMAP_RESULT_JNI_EXCEPTION;
  }
  void* address = env->GetDirectBufferAddress(pixels);
  env->DeleteLocalRef(pixels);  // the bitmap itself keeps the memory
  env->DeleteLocalRef(type);
  if (addrPtr != nullptr) {
    *addrPtr = address;
  }
  return ANDROID_BITMAP_RESULT_SUCCESS;
}

extern "C" int AndroidBitmap_unlockPixels(JNIEnv* env, jobject jbitmap) {
  if (env == nullptr || jbitmap == nullptr) {
    return ANDROID_BITMAP_RESULT_BAD_PARAMETER;
  }
  jclass type = bitmapClass(env, jbitmap);
  jmethodID unlock = type == nullptr ? nullptr : env->GetMethodID(type, "unlockPixels", "()V");
  if (unlock == nullptr) {
    return ANDROID_BITMAP_RESULT_JNI_EXCEPTION;
  }
  env->CallVoidMethod(jbitmap, unlock);
  if (failed(env)) {
    return ANDROID_BITMAP_RESULT_JNI_EXCEPTION;
  }
  env->DeleteLocalRef(type);
  return ANDROID_BITMAP_RESULT_SUCCESS;
}
