// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// Where the JVM enters the library first. On x86-64 the rest is compiled for AVX2 and FMA, which
// not every processor has, and would die of its first instruction: what is here is compiled for the ABI's own
// instructions, looks, and refuses. So nothing inline may be used of what other sources use, or the linker
// may keep their copy of it: the functions of the JVM are called through their tables.
#include "java_model.h"

#if defined(__x86_64__)
#include <cpuid.h>
#endif

#include "base/log.h"

namespace {

/// What is missing of the processor for the rest of the library, as a sentence, or null.
const char* missing() {
#if defined(__x86_64__)
  constexpr unsigned kFma = 1U << 12, kXsave = 1U << 27, kAvx = 1U << 28;  // leaf 1, ecx
  constexpr unsigned kAvx2 = 1U << 5;                                      // leaf 7, ebx
  constexpr unsigned kSavedState = 6;  // the system keeps the wide registers over a change of tasks
  unsigned eax = 0;
  unsigned ebx = 0;
  unsigned ecx = 0;
  unsigned edx = 0;
  bool hasAll = false;
  if (__get_cpuid(1, &eax, &ebx, &ecx, &edx) != 0 && (~ecx & (kFma | kXsave | kAvx)) == 0) {
    unsigned saved = 0;
    unsigned high = 0;
    __asm__("xgetbv" : "=a"(saved), "=d"(high) : "c"(0));
    hasAll = (~saved & kSavedState) == 0 && __get_cpuid_count(7, 0, &eax, &ebx, &ecx, &edx) != 0 &&
             (ebx & kAvx2) != 0;
  }
  if (!hasAll) {
    return "libjni_kyface_api.so for x86_64 needs a processor with AVX2 and FMA, which this one is not";
  }
#endif
  return nullptr;
}

}  // namespace

extern "C" JNIEXPORT jint JNICALL JNI_OnLoad(JavaVM* vm, void* /*reserved*/) {
  JNIEnv* env = nullptr;
  if (vm->functions->GetEnv(vm, reinterpret_cast<void**>(&env), JNI_VERSION_1_6) != JNI_OK) {
    return JNI_ERR;
  }
  if (const char* const sentence = missing()) {
    FACE_LOG_ALWAYS(ANDROID_LOG_ERROR, "%s", sentence);
    jclass error = env->functions->FindClass(env, "java/lang/UnsatisfiedLinkError");
    if (error != nullptr) {
      env->functions->ThrowNew(env, error, sentence);
    }
    return JNI_ERR;
  }
  if (register_face_fields(env) < 0) {
    // A JVM that finds the look-up's exception pending after this call refuses to load the
    // library; an incomplete registry must not prevent the use of everything that needs no Java class.
    env->functions->ExceptionClear(env);
  }
  return JNI_VERSION_1_6;
}
