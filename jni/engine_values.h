// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// How the engine's values cross into Java.
#pragma once

#include <jni.h>

#include "kyface_api/kyface_api.h"
#include "pinned.h"

namespace kyface {

/// An engine handle as Java carries it.
inline ky_handle_t toHandle(long long handle) {
  return reinterpret_cast<ky_handle_t>(handle);  // NOLINT(performance-no-int-to-ptr): what Java's long is for
}

/// Java's value of an engine handle or feature.
inline jlong toJava(void* handle) { return reinterpret_cast<jlong>(handle); }

/// Puts the engine's result code, whatever it is, into the first element of a status array. Returns false
/// when the JVM refuses the array.
inline bool writeStatus(JNIEnv* env, jintArray status, int result) {
  PinnedArray pinned(env, status);
  if (!pinned) {
    return false;
  }
  pinned[0] = result;
  return true;
}

}  // namespace kyface
