// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// Native methods of FaceLibrary over the engine's verifier.
#include <jni.h>

#include <cstdint>

#include "base/log.h"
#include "engine_values.h"
#include "java_declarations.h"
#include "java_model.h"
#include "kyface_api/kyface_api.h"
#include "pinned.h"

namespace {

/// Bytes of the text of a feature of `length` bytes: base64 and a terminating zero, in unsigned 32-bit
/// arithmetic whatever the engine says the length is.
jsize serializedSize(int length) {
  return static_cast<jsize>((static_cast<std::uint32_t>(length) + 2) / 3 * 4 + 1);
}

/// Extracts the feature of a face and returns its text. The engine's 0 goes into `status[0]`; every failure
/// returns null, and one before or inside the engine leaves `status` untouched.
jbyteArray kyFaceVerify(JNIEnv* env, jclass /*type*/, long long handle, const unsigned char* image,
                        int pixelFormat, int width, int height, int stride, jobject face, jintArray status) {
  if (status == nullptr || face == nullptr || image == nullptr) {
    FACE_LOG(ANDROID_LOG_ERROR, "kyFaceVerify image or status or kyface is null");
    return nullptr;
  }
  if (handle == 0) {
    FACE_LOG(ANDROID_LOG_ERROR, "kyFaceVerify ky_verify_get_feature handle is NULL!!");
    return nullptr;
  }
  const ky_face_t record = java_face_to_ky_face_t(env, face);
  ky_feature_t feature = nullptr;
  int length = 0;
  const int result = ky_verify_get_feature(kyface::toHandle(handle), image, pixelFormat, width, height,
                                           stride, &record, &feature, &length);
  if (result != 0) {
    FACE_LOG(ANDROID_LOG_ERROR, "kyFaceVerify get feature fail result : %d", result);
    return nullptr;
  }
  if (feature == nullptr) {
    FACE_LOG(ANDROID_LOG_ERROR, "kyFaceVerify ky_verify_get_feature is null");
    return nullptr;
  }
  kyface::PinnedArray pinnedStatus(env, status);
  if (!pinnedStatus) {
    ky_verify_release_feature(feature);
    return nullptr;
  }
  pinnedStatus[0] = result;
  jbyteArray text = env->NewByteArray(serializedSize(length));
  if (text == nullptr) {
    // The feature is not released on this path (C8).
    FACE_LOG(ANDROID_LOG_ERROR, "kyFaceVerify new Feature Failed !! maybe out of memory!!");
    return nullptr;
  }
  kyface::PinnedArray pinnedText(env, text);
  if (!pinnedText) {
    ky_verify_release_feature(feature);
    return nullptr;
  }
  ky_verify_serialize_feature(feature, pinnedText.chars());
  ky_verify_release_feature(feature);
  pinnedStatus.release();
  pinnedText.release();
  return text;
}

/// Extracts a feature from an image that is held in a Java array, of bytes or of 32-bit pixels alike.
template <typename Array>
jbyteArray getFeature(JNIEnv* env, jclass type, jlong handle, Array image, jint pixelFormat, jint width,
                      jint height, jint stride, jobject face, jintArray status) {
  if (image == nullptr) {  // refused below, like a null face: a JVM need not survive pinning it
    return kyFaceVerify(env, type, handle, nullptr, pixelFormat, width, height, stride, face, status);
  }
  const kyface::PinnedArray pinnedImage(env, image);
  return kyFaceVerify(env, type, handle, pinnedImage.bytes(), pixelFormat, width, height, stride, face,
                      status);
}

}  // namespace

extern "C" {

JNIEXPORT jlong JNICALL Java_com_vantrel_faceapi_FaceLibrary_kyFaceCreateVerify(JNIEnv* env, jclass /*type*/,
                                                                                jstring modelPath) {
  kyface::StringChars path(env, modelPath);
  if (path.refused()) {
    return 0;
  }
  if (path.get() != nullptr) {
    FACE_LOG(ANDROID_LOG_DEBUG, "FaceCreateVerify verify model_path: %s", path.get());
  }
  ky_handle_t handle = nullptr;
  const int result = ky_verify_create_handle(&handle, path.get());
  if (result != 0) {
    // The path's characters are not released on this path (C6 in docs/compatibility.md).
    FACE_LOG(ANDROID_LOG_ERROR, "FaceCreateVerify create handle fail : %d", result);
    return 0;
  }
  path.release();
  return kyface::toJava(handle);
}

JNIEXPORT jint JNICALL Java_com_vantrel_faceapi_FaceLibrary_kyFaceGetVerifyVersion(JNIEnv* /*env*/,
                                                                                   jclass /*type*/,
                                                                                   jlong handle) {
  return ky_verify_get_version(kyface::toHandle(handle));
}

JNIEXPORT jint JNICALL Java_com_vantrel_faceapi_FaceLibrary_kyFaceGetVerifyLength(JNIEnv* /*env*/,
                                                                                  jclass /*type*/,
                                                                                  jlong handle) {
  return ky_verify_get_feature_length(kyface::toHandle(handle));
}

JNIEXPORT jbyteArray JNICALL Java_com_vantrel_faceapi_FaceLibrary_kyFaceGetFeatureBytes(
    JNIEnv* env, jclass type, jlong handle, jbyteArray image, jint pixelFormat, jint width, jint height,
    jint stride, jobject face, jintArray status) {
  return getFeature(env, type, handle, image, pixelFormat, width, height, stride, face, status);
}

JNIEXPORT jbyteArray JNICALL Java_com_vantrel_faceapi_FaceLibrary_kyFaceGetFeatureInts(
    JNIEnv* env, jclass type, jlong handle, jintArray image, jint pixelFormat, jint width, jint height,
    jint stride, jobject face, jintArray status) {
  return getFeature(env, type, handle, image, pixelFormat, width, height, stride, face, status);
}

JNIEXPORT jfloat JNICALL Java_com_vantrel_faceapi_FaceLibrary_kyFaceCompareFeature(
    JNIEnv* env, jclass /*type*/, jlong handle, jbyteArray feature1, jbyteArray feature2, jintArray status) {
  if (feature1 == nullptr || feature2 == nullptr) {
    FACE_LOG(ANDROID_LOG_ERROR, "ky_faceapi_KyFaceLibrary_kyFacCompareFeature feature is null");
    return 0.0F;
  }
  kyface::PinnedArray text1(env, feature1);
  kyface::PinnedArray text2(env, feature2);
  if (!text1 || !text2) {
    // Where one of the two is pinned it stays so (C9).
    text1.leavePinned();
    text2.leavePinned();
    FACE_LOG(ANDROID_LOG_ERROR, "ky_faceapi_KyFaceLibrary_kyFacCompareFeature feature is null");
    return 0.0F;
  }
  ky_feature_t engineFeature1 = ky_verify_deserialize_feature(text1.chars());
  ky_feature_t engineFeature2 = ky_verify_deserialize_feature(text2.chars());
  float score;  // the engine's alone (C10): after a failure it means nothing, and the status says so
  const int result =
      ky_verify_compare_feature(kyface::toHandle(handle), engineFeature1, engineFeature2, &score);
  text1.release();
  text2.release();
  ky_verify_release_feature(engineFeature1);
  ky_verify_release_feature(engineFeature2);
  return kyface::writeStatus(env, status, result) ? score : 0.0F;
}

JNIEXPORT jlong JNICALL Java_com_vantrel_faceapi_FaceLibrary_kyFaceDeserialize(JNIEnv* env, jclass /*type*/,
                                                                               jbyteArray feature) {
  const kyface::PinnedArray text(env, feature);
  if (!text) {
    return 0;
  }
  return kyface::toJava(ky_verify_deserialize_feature(text.chars()));
}

JNIEXPORT void JNICALL Java_com_vantrel_faceapi_FaceLibrary_kyFaceDestroyVerify(JNIEnv* /*env*/,
                                                                                jclass /*type*/,
                                                                                jlong handle) {
  if (handle == 0) {
    FACE_LOG(ANDROID_LOG_ERROR, "kyFaceVerify DestroyVerify handle is NULL!!");
    return;
  }
  ky_verify_destroy_handle(kyface::toHandle(handle));
  FACE_LOG(ANDROID_LOG_DEBUG, "ky_verify_destroy_handle");
}

}  // extern "C"
