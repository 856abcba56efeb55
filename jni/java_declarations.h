// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// The native methods and the constants of the Java classes as javac declares them: a definition whose
/// parameters are not those of the Java class does not compile, nor does a constant of another value.
#pragma once

#include <jni.h>

#ifdef KYFACE_JAVA_DECLARATIONS

#include <com_vantrel_faceapi_BrightnessMetric.h>
#include <com_vantrel_faceapi_ColorConversion.h>
#include <com_vantrel_faceapi_FaceLibrary.h>
#include <com_vantrel_faceapi_PixelConversion.h>
#include <com_vantrel_faceapi_PlaneConversion.h>

namespace kyface {

template <jint value, jint inJava>
struct JavaConstant {
  static_assert(value == inJava);
  static constexpr jint kValue = value;
};

}  // namespace kyface

/// `value`, which is that of the Java class's constant.
#define JAVA_CONSTANT(javaClass, name, value) \
  kyface::JavaConstant<value, com_vantrel_faceapi_##javaClass##_##name>::kValue

#else

#define JAVA_CONSTANT(javaClass, name, value) (value)

#endif
