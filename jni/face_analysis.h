// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// Detection and tracking seen from Java: one routine for both, over the engine's two operations.
///
/// An `Engine` names what differs: `kAnalyse` and `kRelease` (the operations), `kHandleIsNull` and
/// `kImageIsNull` (the messages of a zero handle and of a null image).
#pragma once

#include <jni.h>

#include "base/log.h"
#include "engine_values.h"
#include "java_model.h"
#include "kyface_api/kyface_api.h"
#include "pinned.h"

namespace kyface {

/// Analyses an image and converts the faces found. The engine's result code goes into `status[0]`. Returns
/// null without faces, on an engine failure (what it names is in `status[0]`), and, with `status` untouched,
/// for a null image, a null status array and a zero handle.
template <typename Engine>
jobjectArray analyseFaces(JNIEnv* env, long long handle, const unsigned char* image, int pixelFormat,
                          int width, int height, int stride, int orientation, jintArray status) {
  if (image == nullptr || status == nullptr) {
    return nullptr;
  }
  if (handle == 0) {
    FACE_LOG(ANDROID_LOG_ERROR, Engine::kHandleIsNull);
    return nullptr;
  }
  PinnedArray pinnedStatus(env, status);
  if (!pinnedStatus) {
    return nullptr;
  }
  ky_face_t* faces = nullptr;
  int count = 0;
  const int result = Engine::kAnalyse(toHandle(handle), image, pixelFormat, width, height, stride,
                                      orientation, &faces, &count);
  pinnedStatus[0] = result;
  jobjectArray javaFaces = nullptr;
  if (result == 0 && faces != nullptr && count >= 1) {
    javaFaces = ky_face_t_array_to_java_face(env, faces, count);
  }
  // The engine gets back whatever it stored, after a failure too.
  Engine::kRelease(faces, count);
  return javaFaces;
}

/// What `analyseFaces` is for one engine.
using FaceRoutine = jobjectArray(JNIEnv* env, long long handle, const unsigned char* image, int pixelFormat,
                                 int width, int height, int stride, int orientation, jintArray status);

/// Calls the routine on the pixels of a Java array, of bytes or of 32-bit pixels alike.
template <typename Engine, typename Array>
jobjectArray analyseArray(FaceRoutine* routine, JNIEnv* env, jlong handle, Array image, jint pixelFormat,
                          jint width, jint height, jint stride, jint orientation, jintArray status) {
  if (image == nullptr) {
    FACE_LOG(ANDROID_LOG_DEBUG, Engine::kImageIsNull);
    return nullptr;
  }
  const PinnedArray pinnedImage(env, image);
  return routine(env, handle, pinnedImage.bytes(), pixelFormat, width, height, stride, orientation, status);
}

}  // namespace kyface
