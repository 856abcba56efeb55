// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// The names of every function of a JNIEnv's table, in no particular order: KY_JNI_FUNCTIONS(X) calls
/// X(name).
#pragma once

#include <jni.h>

#include <type_traits>

/// The tables of functions behind a JNIEnv and a JavaVM, which the JDK's header and Android's name
/// differently.
using JniFunctions = std::remove_const_t<std::remove_pointer_t<decltype(JNIEnv::functions)>>;
using JniInvokeFunctions = std::remove_const_t<std::remove_pointer_t<decltype(JavaVM::functions)>>;

// clang-format does not come to rest over these lists.
// clang-format off
#define KY_JNI_PRIMITIVES(X, Y) \
  X(Y, Boolean) X(Y, Byte) X(Y, Char) X(Y, Short) X(Y, Int) X(Y, Long) X(Y, Float) X(Y, Double)

#define KY_JNI_CALLS(Y, Type) \
  Y(Call##Type##Method) Y(Call##Type##MethodV) Y(Call##Type##MethodA) Y(CallNonvirtual##Type##Method) \
  Y(CallNonvirtual##Type##MethodV) Y(CallNonvirtual##Type##MethodA) Y(CallStatic##Type##Method) \
  Y(CallStatic##Type##MethodV) Y(CallStatic##Type##MethodA)

#define KY_JNI_FIELDS(Y, Type) \
  Y(Get##Type##Field) Y(Set##Type##Field) Y(GetStatic##Type##Field) Y(SetStatic##Type##Field)

#define KY_JNI_ARRAYS(Y, Type) \
  Y(New##Type##Array) Y(Get##Type##ArrayElements) Y(Release##Type##ArrayElements) \
  Y(Get##Type##ArrayRegion) Y(Set##Type##ArrayRegion)

#ifdef JNI_VERSION_9
#define KY_JNI_SINCE_9(Y) Y(GetModule)
#else
#define KY_JNI_SINCE_9(Y)
#endif
#ifdef JNI_VERSION_21
#define KY_JNI_SINCE_21(Y) Y(IsVirtualThread)
#else
#define KY_JNI_SINCE_21(Y)
#endif
#ifdef JNI_VERSION_24
#define KY_JNI_SINCE_24(Y) Y(GetStringUTFLengthAsLong)
#else
#define KY_JNI_SINCE_24(Y)
#endif

#define KY_JNI_FUNCTIONS(Y) \
  Y(GetVersion) Y(DefineClass) Y(FindClass) Y(FromReflectedMethod) Y(FromReflectedField) \
  Y(ToReflectedMethod) Y(GetSuperclass) Y(IsAssignableFrom) Y(ToReflectedField) Y(Throw) \
  Y(ThrowNew) Y(ExceptionOccurred) Y(ExceptionDescribe) Y(ExceptionClear) Y(ExceptionCheck) \
  Y(FatalError) Y(PushLocalFrame) Y(PopLocalFrame) Y(NewGlobalRef) Y(DeleteGlobalRef) Y(NewLocalRef) \
  Y(DeleteLocalRef) Y(NewWeakGlobalRef) Y(DeleteWeakGlobalRef) Y(IsSameObject) \
  Y(EnsureLocalCapacity) Y(AllocObject) Y(NewObject) Y(NewObjectV) Y(NewObjectA) \
  Y(GetObjectClass) Y(IsInstanceOf) Y(GetObjectRefType) Y(GetMethodID) Y(GetFieldID) \
  Y(GetStaticMethodID) Y(GetStaticFieldID) KY_JNI_CALLS(Y, Object) KY_JNI_CALLS(Y, Void) \
  KY_JNI_PRIMITIVES(KY_JNI_CALLS, Y) KY_JNI_FIELDS(Y, Object) \
  KY_JNI_PRIMITIVES(KY_JNI_FIELDS, Y) KY_JNI_PRIMITIVES(KY_JNI_ARRAYS, Y) Y(GetArrayLength) \
  Y(NewObjectArray) Y(GetObjectArrayElement) Y(SetObjectArrayElement) Y(NewString) Y(GetStringLength) \
  Y(GetStringChars) Y(ReleaseStringChars) Y(NewStringUTF) Y(GetStringUTFLength) Y(GetStringUTFChars) \
  Y(ReleaseStringUTFChars) Y(GetStringRegion) Y(GetStringUTFRegion) Y(GetStringCritical) \
  Y(ReleaseStringCritical) Y(GetPrimitiveArrayCritical) Y(ReleasePrimitiveArrayCritical) \
  Y(RegisterNatives) Y(UnregisterNatives) Y(MonitorEnter) Y(MonitorExit) Y(GetJavaVM) \
  Y(NewDirectByteBuffer) Y(GetDirectBufferAddress) Y(GetDirectBufferCapacity) KY_JNI_SINCE_9(Y) \
  KY_JNI_SINCE_21(Y) KY_JNI_SINCE_24(Y)
// clang-format on
