// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// The native methods of com.vantrel.faceapi.FaceLibrary as a virtual machine calls them.
#pragma once

#include <jni.h>

#include "jni/java_declarations.h"

#define FACE_LIBRARY(type, method, ...)                                         \
  JNIEXPORT type JNICALL Java_com_vantrel_faceapi_FaceLibrary_##method(JNIEnv*, \
                                                                       jclass __VA_OPT__(, ) __VA_ARGS__)

extern "C" {

JNIEXPORT jint JNICALL JNI_OnLoad(JavaVM*, void*);
FACE_LIBRARY(void, setDebug, jboolean debug);

FACE_LIBRARY(jlong, kyFaceCreateDetector, jstring modelPath, jint config);
FACE_LIBRARY(void, kyFaceDestroyDetector, jlong handle);
FACE_LIBRARY(jfloat, getDetectThreshold, jlong handle, jintArray status);
FACE_LIBRARY(void, setDetectThreshold, jlong handle, jfloat threshold, jintArray status);
FACE_LIBRARY(jobjectArray, kyFaceDetectBytes, jlong handle, jbyteArray image, jint pixelFormat, jint width,
             jint height, jint stride, jint orientation, jintArray status);
FACE_LIBRARY(jobjectArray, kyFaceDetectInts, jlong handle, jintArray image, jint pixelFormat, jint width,
             jint height, jint stride, jint orientation, jintArray status);
FACE_LIBRARY(jint, kyFaceShowInsideModel);

FACE_LIBRARY(jlong, kyFaceCreateTracker, jstring modelPath, jint reserved, jint config);
FACE_LIBRARY(void, kyFaceDestroyTracker, jlong handle);
FACE_LIBRARY(jobjectArray, kyFaceTrackBytes, jlong handle, jbyteArray image, jint pixelFormat, jint width,
             jint height, jint stride, jint orientation, jintArray status);
FACE_LIBRARY(jobjectArray, kyFaceTrackInts, jlong handle, jintArray image, jint pixelFormat, jint width,
             jint height, jint stride, jint orientation, jintArray status);
FACE_LIBRARY(void, kyFaceResetTracker, jlong handle);
FACE_LIBRARY(jint, kyFaceTrackSetDetectFaceCntLimit, jlong handle, jint limit);
FACE_LIBRARY(jint, kyFaceTrackSetDetectInterval, jlong handle, jint interval);
FACE_LIBRARY(jint, kyFaceTrackSetAlignmentThreshold, jlong handle, jint threshold);

FACE_LIBRARY(jlong, kyFaceCreateVerify, jstring modelPath);
FACE_LIBRARY(jint, kyFaceGetVerifyVersion, jlong handle);
FACE_LIBRARY(jint, kyFaceGetVerifyLength, jlong handle);
FACE_LIBRARY(jbyteArray, kyFaceGetFeatureBytes, jlong handle, jbyteArray image, jint pixelFormat, jint width,
             jint height, jint stride, jobject face, jintArray status);
FACE_LIBRARY(jbyteArray, kyFaceGetFeatureInts, jlong handle, jintArray image, jint pixelFormat, jint width,
             jint height, jint stride, jobject face, jintArray status);
FACE_LIBRARY(jfloat, kyFaceCompareFeature, jlong handle, jbyteArray feature1, jbyteArray feature2,
             jintArray status);
FACE_LIBRARY(jlong, kyFaceDeserialize, jbyteArray feature);
FACE_LIBRARY(void, kyFaceDestroyVerify, jlong handle);

FACE_LIBRARY(void, convertColorSpace, jbyteArray src, jint width, jint height, jbyteArray dst, jint code);
FACE_LIBRARY(void, getBGRADataFromBitmap, jobject bitmap, jbyteArray out);
FACE_LIBRARY(void, getBGRDataFromBitmap, jobject bitmap, jbyteArray out);
FACE_LIBRARY(void, cropNv21Data, jbyteArray nv21, jint imageWidth, jint imageHeight, jint x, jint y, jint w,
             jint h, jbyteArray out);
FACE_LIBRARY(void, rotateBGR, jbyteArray src, jint width, jint height, jbyteArray dst, jint degree,
             jintArray outSize);

FACE_LIBRARY(jint, faceBrightEvaluate, jbyteArray image, jint format, jint width, jint widthStride,
             jint height, jint heightStride, jint rectX, jint rectY, jint rectW, jint rectH);
FACE_LIBRARY(jfloat, averageBrightness, jbyteArray gray, jint width, jint height, jint x, jint y, jint w,
             jint h);

}  // extern "C"

#undef FACE_LIBRARY
