// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// Native methods of FaceLibrary over the engine's video tracker.
#include <jni.h>

#include "base/log.h"
#include "engine_values.h"
#include "face_analysis.h"
#include "java_declarations.h"
#include "kyface_api/kyface_api.h"
#include "pinned.h"

namespace {

struct Tracker {
  static constexpr auto kAnalyse = ky_face_track;
  static constexpr auto kRelease = ky_face_release_tracker_result;
  static constexpr char kHandleIsNull[] = "kyFaceTrack handle is null";
  static constexpr char kImageIsNull[] = "track input image is null";
};

jobjectArray kyFaceTrack(JNIEnv* env, long long handle, const unsigned char* image, int pixelFormat,
                         int width, int height, int stride, int orientation, jintArray status) {
  return kyface::analyseFaces<Tracker>(env, handle, image, pixelFormat, width, height, stride, orientation,
                                       status);
}

/// Calls one of the engine's setters. What it reports through its third argument is of no use to Java.
template <typename Setter>
jint setTrackerValue(Setter* setter, jlong handle, jint value) {
  int previous = 0;
  return setter(kyface::toHandle(handle), value, &previous);
}

}  // namespace

extern "C" {

JNIEXPORT jlong JNICALL Java_com_vantrel_faceapi_FaceLibrary_kyFaceCreateTracker(JNIEnv* env, jclass /*type*/,
                                                                                 jstring modelPath,
                                                                                 jint /*reserved*/,
                                                                                 jint config) {
  kyface::StringChars path(env, modelPath);
  if (path.refused()) {
    return 0;
  }
  FACE_LOG(ANDROID_LOG_DEBUG, "ky_face_create_tracker config : %d", config);
  ky_handle_t handle = nullptr;
  int result = ky_face_create_tracker(&handle, path.get(), config);
  if (result != 0) {
    // The path's characters are not released on this path (C6 in docs/compatibility.md).
    FACE_LOG(ANDROID_LOG_ERROR, "kyFaceCreateTracker create handle fail result code : %d", result);
    return 0;
  }
  // Once more (C7): the second tracker takes the place of the first, which is never destroyed.
  result = ky_face_create_tracker(&handle, path.get(), config);
  path.release();
  return result == 0 ? kyface::toJava(handle) : 0;
}

JNIEXPORT void JNICALL Java_com_vantrel_faceapi_FaceLibrary_kyFaceDestroyTracker(JNIEnv* /*env*/,
                                                                                 jclass /*type*/,
                                                                                 jlong handle) {
  if (handle == 0) {
    FACE_LOG(ANDROID_LOG_ERROR, "kyFaceDestroyTracker destroy handle is null");
    return;
  }
  ky_face_destroy_tracker(kyface::toHandle(handle));
  FACE_LOG(ANDROID_LOG_VERBOSE, "ky_face_destroy_tracker");
}

JNIEXPORT jobjectArray JNICALL Java_com_vantrel_faceapi_FaceLibrary_kyFaceTrackBytes(
    JNIEnv* env, jclass /*type*/, jlong handle, jbyteArray image, jint pixelFormat, jint width, jint height,
    jint stride, jint orientation, jintArray status) {
  return kyface::analyseArray<Tracker>(kyFaceTrack, env, handle, image, pixelFormat, width, height, stride,
                                       orientation, status);
}

JNIEXPORT jobjectArray JNICALL Java_com_vantrel_faceapi_FaceLibrary_kyFaceTrackInts(
    JNIEnv* env, jclass /*type*/, jlong handle, jintArray image, jint pixelFormat, jint width, jint height,
    jint stride, jint orientation, jintArray status) {
  return kyface::analyseArray<Tracker>(kyFaceTrack, env, handle, image, pixelFormat, width, height, stride,
                                       orientation, status);
}

JNIEXPORT void JNICALL Java_com_vantrel_faceapi_FaceLibrary_kyFaceResetTracker(JNIEnv* /*env*/,
                                                                               jclass /*type*/,
                                                                               jlong handle) {
  ky_face_reset_tracker(kyface::toHandle(handle));
  FACE_LOG(ANDROID_LOG_VERBOSE, "ky_face_reset_tracker");
}

JNIEXPORT jint JNICALL Java_com_vantrel_faceapi_FaceLibrary_kyFaceTrackSetDetectFaceCntLimit(JNIEnv* /*env*/,
                                                                                             jclass /*type*/,
                                                                                             jlong handle,
                                                                                             jint limit) {
  return setTrackerValue(ky_face_track_set_detect_face_cnt_limit, handle, limit);
}

JNIEXPORT jint JNICALL Java_com_vantrel_faceapi_FaceLibrary_kyFaceTrackSetDetectInterval(JNIEnv* /*env*/,
                                                                                         jclass /*type*/,
                                                                                         jlong handle,
                                                                                         jint interval) {
  return setTrackerValue(ky_face_track_set_detect_interval, handle, interval);
}

JNIEXPORT jint JNICALL Java_com_vantrel_faceapi_FaceLibrary_kyFaceTrackSetAlignmentThreshold(JNIEnv* /*env*/,
                                                                                             jclass /*type*/,
                                                                                             jlong handle,
                                                                                             jint threshold) {
  return setTrackerValue(ky_face_track_set_alignment_threshold, handle, threshold);
}

}  // extern "C"
