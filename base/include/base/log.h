// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// Logging of the face bridge: Android's log under one tag, and the debug switch that gates the native
/// methods' messages.
#pragma once

#include <android/log.h>

#include <atomic>

/// The tag of every message that the library writes.
#define KYFACE_LOG_TAG "FaceAPI"

/// Writes a message whatever the debug switch says. `priority` is one of Android's ANDROID_LOG_* values; the
/// format and its arguments are printf's.
#define FACE_LOG_ALWAYS(priority, ...) __android_log_print(priority, KYFACE_LOG_TAG, __VA_ARGS__)

/// Writes a message of a native method, error messages included, while the debug switch is on.
#define FACE_LOG(priority, ...)               \
  do {                                        \
    if (kyface::debugEnabled()) {             \
      FACE_LOG_ALWAYS(priority, __VA_ARGS__); \
    }                                         \
  } while (false)

namespace kyface {

/// The debug switch: on from load, changed by `FaceLibrary.setDebug` alone. It orders nothing between
/// threads; a change takes effect for later reads. A relaxed byte costs what a plain one does, without the
/// data race.
inline std::atomic<unsigned char> debugSwitch{1};

inline bool debugEnabled() { return debugSwitch.load(std::memory_order_relaxed) != 0; }

}  // namespace kyface
