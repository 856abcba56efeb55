// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// What the bridge borrows from the JVM for the length of a call: array elements and string
/// characters.
///
/// A borrow that the JVM refuses leaves the object false and the JVM's exception pending: the caller
/// then returns its failure value and makes no further call but the releases, which are allowed under an
/// exception.
#pragma once

#include <jni.h>

#include <utility>

namespace kyface {

/// The element type and the pin and release calls of a Java array type.
template <typename Array>
struct PinCalls;

template <>
struct PinCalls<jbyteArray> {
  using Element = jbyte;
  static constexpr auto kGet = &JNIEnv::GetByteArrayElements;
  static constexpr auto kRelease = &JNIEnv::ReleaseByteArrayElements;
};

template <>
struct PinCalls<jintArray> {
  using Element = jint;
  static constexpr auto kGet = &JNIEnv::GetIntArrayElements;
  static constexpr auto kRelease = &JNIEnv::ReleaseIntArrayElements;
};

/// The elements of a Java array, pinned on construction; copied back and freed (mode 0) by `release` or, at
/// the latest, by the destructor. The array itself is not checked for null.
template <typename Array>
class PinnedArray {
 public:
  using Element = typename PinCalls<Array>::Element;

  PinnedArray(JNIEnv* env, Array array)
      : env_(env), array_(array), elements_((env->*PinCalls<Array>::kGet)(array, nullptr)) {}
  PinnedArray(const PinnedArray&) = delete;
  PinnedArray& operator=(const PinnedArray&) = delete;
  ~PinnedArray() { release(); }

  explicit operator bool() const { return elements_ != nullptr; }

  /// The first element; null when the pin was refused or has been released.
  Element* data() const { return elements_; }

  /// The elements as raw bytes.
  unsigned char* bytes() const { return reinterpret_cast<unsigned char*>(elements_); }

  /// The elements as text.
  char* chars() const { return reinterpret_cast<char*>(elements_); }

  Element& operator[](int index) const { return elements_[index]; }

  /// Copies the elements back and frees them; does nothing when there are none.
  void release() {
    if (Element* elements = std::exchange(elements_, nullptr)) {
      (env_->*PinCalls<Array>::kRelease)(array_, elements, 0);
    }
  }

  /// Gives up the elements without releasing them: the array stays pinned.
  void leavePinned() { elements_ = nullptr; }

 private:
  JNIEnv* env_;
  Array array_;
  Element* elements_;
};

/// The elements of a Java array, or of none, where they are if the JVM can have it so: borrowed by the
/// constructor and given back by the destructor. In between only such arrays may be borrowed and given back,
/// no other function of the JVM called, and nothing waited for.
class CriticalArray {
 public:
  /// `mode` is what becomes of the elements: 0 to copy them back where they were copied, JNI_ABORT when they
  /// are only read.
  CriticalArray(JNIEnv* env, jarray array, jint mode)
      : env_(env),
        array_(array),
        mode_(mode),
        elements_(array != nullptr ? env->GetPrimitiveArrayCritical(array, nullptr) : nullptr) {}
  CriticalArray(const CriticalArray&) = delete;
  CriticalArray& operator=(const CriticalArray&) = delete;
  ~CriticalArray() {
    if (elements_ != nullptr) {
      env_->ReleasePrimitiveArrayCritical(array_, elements_, mode_);
    }
  }

  /// Whether the JVM refused the elements of an array.
  bool refused() const { return array_ != nullptr && elements_ == nullptr; }

  /// The elements as raw bytes; null without an array.
  unsigned char* bytes() const { return static_cast<unsigned char*>(elements_); }

 private:
  JNIEnv* env_;
  jarray array_;
  jint mode_;
  void* elements_;
};

/// The modified UTF-8 characters of a Java string, or of none: a null string has null characters and is no
/// failure. They are freed by `release` alone; without it they stay with the JVM.
class StringChars {
 public:
  StringChars(JNIEnv* env, jstring string)
      : env_(env),
        string_(string),
        chars_(string != nullptr ? env->GetStringUTFChars(string, nullptr) : nullptr) {}
  StringChars(const StringChars&) = delete;
  StringChars& operator=(const StringChars&) = delete;

  /// Whether the JVM refused the characters of a string.
  bool refused() const { return string_ != nullptr && chars_ == nullptr; }

  /// The zero-terminated characters, null for a null string.
  const char* get() const { return chars_; }

  void release() {
    if (const char* chars = std::exchange(chars_, nullptr)) {
      env_->ReleaseStringUTFChars(string_, chars);
    }
  }

 private:
  JNIEnv* env_;
  jstring string_;
  const char* chars_;
};

}  // namespace kyface
