// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// Loads a library as a JVM does, and prints what it throws, on a processor that may have nothing
// beyond the ABI's own instructions: this program is compiled for no more.
#include <dlfcn.h>
#include <jni.h>

#include <cstdio>

namespace {

const auto* const kThrown = reinterpret_cast<const _jclass*>("UnsatisfiedLinkError");

jclass JNICALL findClass(JNIEnv* /*env*/, const char* name) {
  std::printf("class %s\n", name);
  return const_cast<jclass>(kThrown);
}

jint JNICALL throwNew(JNIEnv* /*env*/, jclass type, const char* message) {
  std::printf("%s: %s\n", type == kThrown ? "thrown" : "thrown of another class", message);
  return 0;
}

JNIEnv* environment() {
  static JNINativeInterface_ functions = {};
  functions.FindClass = findClass;
  functions.ThrowNew = throwNew;
  static JNIEnv env = {&functions};
  return &env;
}

jint JNICALL getEnv(JavaVM* /*vm*/, void** env, jint /*version*/) {
  *env = environment();
  return JNI_OK;
}

}  // namespace

int main(int argc, char** argv) {
  void* library = argc == 2 ? dlopen(argv[1], RTLD_NOW) : nullptr;
  if (library == nullptr) {
    std::printf("not opened: %s\n", argc == 2 ? dlerror() : "no library is named");
    return 2;
  }
  const auto load = reinterpret_cast<jint(JNICALL*)(JavaVM*, void*)>(dlsym(library, "JNI_OnLoad"));
  if (load == nullptr) {
    std::printf("JNI_OnLoad is missing\n");
    return 2;
  }
  JNIInvokeInterface_ functions = {};
  functions.GetEnv = getEnv;
  JavaVM vm = {&functions};
  std::printf("JNI_OnLoad: %d\n", load(&vm, nullptr));
  return 0;
}
