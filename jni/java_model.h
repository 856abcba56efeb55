// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// The Java side of a face: the registry of classes and fields, and the conversions between the engine's
/// records and `FaceInfo` objects.
///
/// The registry is written by `JNI_OnLoad` and only read afterwards, on any thread. A conversion uses the
/// calling thread's environment only. When the JVM refuses an object or an array, a conversion
/// deletes what it has made so far and returns null, and the JVM's exception stays pending.
#pragma once

#include <jni.h>

#include "kyface_api/kyface_api.h"

/// Looks up the Java classes, constructors and fields. Returns 0, or -1 after logging the first that is
/// missing; what was found before it stays registered.
int register_face_fields(JNIEnv* env);

/// Converts `count` points to a `PointF[]`, an empty one for a count of 0. The caller owns the local
/// reference.
jobjectArray ky_pointf_t_array_to_java_pointf(JNIEnv* env, const ky_pointf_t* points, int count);

/// Converts a record to a `FaceInfo`. A points count below 0 counts as 0, one above KY_FACE_MAX_POINTS as
/// that many. The caller owns the local reference.
jobject ky_face_t_to_java_face(JNIEnv* env, const ky_face_t* record);

/// Converts `count` packed records to a `FaceInfo[]`, an empty one for a count of 0. The number of live local
/// references does not grow with the count. The caller owns the local reference.
jobjectArray ky_face_t_array_to_java_face(JNIEnv* env, const ky_face_t* records, int count);

/// Converts a `FaceInfo` to a record.
///
/// At most KY_FACE_MAX_POINTS points are read, further ones are ignored. A null rectangle reads as (0, 0, 0,
/// 0), a null point array as an empty one, a null point as (0, 0). The local references made here (rectangle,
/// point array and every point) are left to the end of the native method.
ky_face_t java_face_to_ky_face_t(JNIEnv* env, jobject face);
