// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// Calls native methods again and again from one native frame. A method called from Java drops whatever
/// references it leaves behind; called from here they would pile up, and the JVM's checks
/// complain.
#include "jni/java_declarations.h"

extern "C" {

JNIEXPORT jint JNICALL Java_com_vantrel_faceapi_LeakTest_trackInOneFrame(JNIEnv* env, jclass type,
                                                                         jlong handle, jbyteArray image,
                                                                         jintArray status, jint calls) {
  jint faces = 0;
  for (jint i = 0; i < calls; ++i) {
    jobjectArray found = Java_com_vantrel_faceapi_FaceLibrary_kyFaceTrackBytes(env, type, handle, image, 0, 4,
                                                                               4, 4, 0, status);
    if (found == nullptr) {
      return -1;
    }
    faces += env->GetArrayLength(found);
    env->DeleteLocalRef(found);
  }
  return faces;
}

}  // extern "C"
