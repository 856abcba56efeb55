// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// Native methods of FaceLibrary over the engine's still-image detector.
#include <jni.h>

#include "base/log.h"
#include "engine_values.h"
#include "face_analysis.h"
#include "java_declarations.h"
#include "kyface_api/kyface_api.h"
#include "pinned.h"

namespace {

struct Detector {
  static constexpr auto kAnalyse = ky_face_detect;
  static constexpr auto kRelease = ky_face_release_detector_result;
  static constexpr char kHandleIsNull[] = "kyFaceDetect detect handle is null";
  static constexpr char kImageIsNull[] = "detect input image is null";
};

jobjectArray kyFaceDetect(JNIEnv* env, long long handle, const unsigned char* image, int pixelFormat,
                          int width, int height, int stride, int orientation, jintArray status) {
  return kyface::analyseFaces<Detector>(env, handle, image, pixelFormat, width, height, stride, orientation,
                                        status);
}

}  // namespace

extern "C" {

JNIEXPORT jlong JNICALL Java_com_vantrel_faceapi_FaceLibrary_kyFaceCreateDetector(JNIEnv* env,
                                                                                  jclass /*type*/,
                                                                                  jstring modelPath,
                                                                                  jint config) {
  kyface::StringChars path(env, modelPath);
  if (path.refused()) {
    return 0;
  }
  ky_handle_t handle = nullptr;
  const int result = ky_face_create_detector(&handle, path.get(), config);
  if (result != 0) {
    // The path's characters are not released on this path (C6 in docs/compatibility.md).
    FACE_LOG(ANDROID_LOG_ERROR, "FaceCreateDetector create handle fail : %d", result);
    return 0;
  }
  path.release();
  return kyface::toJava(handle);
}

JNIEXPORT void JNICALL Java_com_vantrel_faceapi_FaceLibrary_kyFaceDestroyDetector(JNIEnv* /*env*/,
                                                                                  jclass /*type*/,
                                                                                  jlong handle) {
  if (handle == 0) {
    FACE_LOG(ANDROID_LOG_ERROR, "kyFaceDestroyDetector destroy detect handle is null");
    return;
  }
  ky_face_destroy_detector(kyface::toHandle(handle));
  FACE_LOG(ANDROID_LOG_DEBUG, "ky_face_destroy_detector");
}

JNIEXPORT jfloat JNICALL Java_com_vantrel_faceapi_FaceLibrary_getDetectThreshold(JNIEnv* env, jclass /*type*/,
                                                                                 jlong handle,
                                                                                 jintArray status) {
  float threshold = 0.0F;
  const int result = ky_face_detect_get_threshold(kyface::toHandle(handle), &threshold);
  FACE_LOG(ANDROID_LOG_DEBUG, "ky_face_detect_get_threshold threshold: %f", static_cast<double>(threshold));
  return kyface::writeStatus(env, status, result) ? threshold : 0.0F;
}

JNIEXPORT void JNICALL Java_com_vantrel_faceapi_FaceLibrary_setDetectThreshold(JNIEnv* env, jclass /*type*/,
                                                                               jlong handle, jfloat threshold,
                                                                               jintArray status) {
  if (threshold <= 0.0F) {  // a NaN goes on to the engine
    return;
  }
  const int result = ky_face_detect_set_threshold(kyface::toHandle(handle), threshold);
  FACE_LOG(ANDROID_LOG_DEBUG, "ky_face_detect_set_threshold threshold: %f", static_cast<double>(threshold));
  kyface::writeStatus(env, status, result);
}

JNIEXPORT jobjectArray JNICALL Java_com_vantrel_faceapi_FaceLibrary_kyFaceDetectBytes(
    JNIEnv* env, jclass /*type*/, jlong handle, jbyteArray image, jint pixelFormat, jint width, jint height,
    jint stride, jint orientation, jintArray status) {
  return kyface::analyseArray<Detector>(kyFaceDetect, env, handle, image, pixelFormat, width, height, stride,
                                        orientation, status);
}

JNIEXPORT jobjectArray JNICALL Java_com_vantrel_faceapi_FaceLibrary_kyFaceDetectInts(
    JNIEnv* env, jclass /*type*/, jlong handle, jintArray image, jint pixelFormat, jint width, jint height,
    jint stride, jint orientation, jintArray status) {
  return kyface::analyseArray<Detector>(kyFaceDetect, env, handle, image, pixelFormat, width, height, stride,
                                        orientation, status);
}

JNIEXPORT jint JNICALL Java_com_vantrel_faceapi_FaceLibrary_kyFaceShowInsideModel(JNIEnv* /*env*/,
                                                                                  jclass /*type*/) {
  return ky_face_algorithm_info();
}

}  // extern "C"
