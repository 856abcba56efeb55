// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// What a call of a native method costs beyond the pixels: run under the counting plugin,
//
//   bench_bridge REPEATS
//
// It plays the virtual machine, the engine and the log itself, with functions that do next to nothing. Prints
// the address range of the shared library, whose instructions alone are to be counted, and then a line for
// each call in the order of their laps: name, calls into the virtual machine, and how often it was called.

#include <com_vantrel_faceapi_ColorConversion.h>
#include <com_vantrel_faceapi_FaceLibrary.h>
#include <dlfcn.h>
#include <jni.h>
#include <link.h>

#include <cstdio>
#include <cstdlib>
#include <functional>
#include <string>
#include <vector>

#include "fastcv/kernels.h"
#include "frame/frame.h"
#include "kyface_api/kyface_api.h"
#include "lap.h"

namespace {

// ---- a virtual machine in which everything succeeds

int machineCalls = 0;
alignas(64) jbyte bytes[64 * 64 * 4];
jint status[1];

template <typename T>
T* someObject() {
  static char object;
  return reinterpret_cast<T*>(&object);
}

// A function of the machine that returns `value`.
template <auto value, typename Result, typename... Arguments>
Result answer(Arguments...) {
  ++machineCalls;
  return value();
}
template <auto value, typename Result, typename... Arguments>
void answerWith(Result(JNICALL*& entry)(Arguments...)) {
  entry = answer<value, Result, Arguments...>;
}
template <typename... Arguments>
void ignoreIn(void(JNICALL*& entry)(Arguments...)) {
  entry = [](Arguments...) { ++machineCalls; };
}

JNINativeInterface_ machineFunctions() {
  JNINativeInterface_ f{};
  answerWith<someObject<_jclass>>(f.FindClass);
  answerWith<someObject<_jobject>>(f.NewGlobalRef);
  answerWith<someObject<_jmethodID>>(f.GetMethodID);
  answerWith<someObject<_jfieldID>>(f.GetFieldID);
  answerWith<someObject<_jobject>>(f.NewObjectV);
  answerWith<someObject<_jobjectArray>>(f.NewObjectArray);
  answerWith<[] { return bytes; }>(f.GetByteArrayElements);
  answerWith<[] { return status; }>(f.GetIntArrayElements);
  ignoreIn(f.ReleaseByteArrayElements);
  ignoreIn(f.ReleaseIntArrayElements);
  ignoreIn(f.SetObjectArrayElement);
  ignoreIn(f.SetObjectField);
  ignoreIn(f.SetIntField);
  ignoreIn(f.SetFloatField);
  ignoreIn(f.DeleteLocalRef);
  ignoreIn(f.ExceptionClear);
  return f;
}

JNIEnv* environment() {
  static const JNINativeInterface_ functions = machineFunctions();
  static JNIEnv env{&functions};
  return &env;
}

JavaVM* machine() {
  static const JNIInvokeInterface_ functions = [] {
    JNIInvokeInterface_ f{};
    f.GetEnv = [](JavaVM*, void** env, jint) -> jint {
      *env = environment();
      return JNI_OK;
    };
    return f;
  }();
  static JavaVM vm{&functions};
  return &vm;
}

// ---- an engine that has found its faces before

std::vector<ky_face_t> faces;

}  // namespace

extern "C" {

int ky_face_track(ky_handle_t, const unsigned char*, int, int, int, int, int, ky_face_t** found, int* count) {
  *found = faces.empty() ? nullptr : faces.data();
  *count = static_cast<int>(faces.size());
  return 0;
}
void ky_face_release_tracker_result(ky_face_t*, int) {}

int __android_log_print(int, const char*, const char*, ...) { return 0; }

}  // extern "C"

namespace {

// The code of the shared library that holds `function`.
struct Range {
  uintptr_t begin;
  uintptr_t end;
};

Range codeAround(const void* function) {
  struct Search {
    uintptr_t address;
    Range found;
  } search{reinterpret_cast<uintptr_t>(function), {}};
  dl_iterate_phdr(
      [](dl_phdr_info* info, size_t, void* data) {
        auto& s = *static_cast<Search*>(data);
        for (int i = 0; i < info->dlpi_phnum; ++i) {
          const auto& segment = info->dlpi_phdr[i];
          const uintptr_t begin = info->dlpi_addr + segment.p_vaddr;
          const uintptr_t end = begin + segment.p_memsz;
          if (segment.p_type == PT_LOAD && begin <= s.address && s.address < end) {
            s.found = {begin, end};
          }
        }
        return 0;
      },
      &search);
  return search.found;
}

struct Call {
  std::string name;
  std::function<void()> call;
};

std::vector<Call> calls() {
  using namespace HPC::fastcv;
  constexpr int kSide = 64;
  constexpr int kToRgba = com_vantrel_faceapi_ColorConversion_NV21_TO_RGBA;
  constexpr int kPoints = 106;
  auto* const pixels = reinterpret_cast<unsigned char*>(bytes);
  static std::vector<unsigned char> out(sizeof(bytes));
  std::vector<Call> result = {
      {"kernel alone, NV21 to RGBA, 64 x 64",
       [=] {
         armNV212RGBImage<unsigned char, 1, unsigned char, 4>(kSide, kSide, kSide, pixels, 4 * kSide,
                                                              out.data());
       }},
      {"frame helper nv2RGB, 64 x 64",
       [=] { nv2RGB(pixels, kyface::kFormatNv21, kSide, kSide, out.data()); }},
      {"convertColorSpace, 64 x 64",
       [] {
         auto* const array = someObject<_jbyteArray>();
         Java_com_vantrel_faceapi_FaceLibrary_convertColorSpace(environment(), someObject<_jclass>(), array,
                                                                kSide, kSide, array, kToRgba);
       }},
  };
  for (const int count : {0, 1, 10}) {
    result.push_back({"kyFaceTrackBytes, faces of 106 points: " + std::to_string(count), [=] {
                        faces.resize(static_cast<size_t>(count));
                        for (ky_face_t& face : faces) {
                          face.points_count = kPoints;
                        }
                        Java_com_vantrel_faceapi_FaceLibrary_kyFaceTrackBytes(
                            environment(), someObject<_jclass>(), 1, someObject<_jbyteArray>(), 0, kSide,
                            kSide, kSide, 0, someObject<_jintArray>());
                      }});
  }
  return result;
}

}  // namespace

int main(int argc, char** argv) {
  if (argc != 2) {
    (void)std::fprintf(stderr, "usage: %s REPEATS\n", argv[0]);
    return 2;
  }
  const int repeats = std::stoi(argv[1]);
  JNI_OnLoad(machine(), nullptr);
  const Range code = codeAround(reinterpret_cast<const void*>(&JNI_OnLoad));
  std::printf("%zx\t%zx\n", code.begin, code.end);
  for (const Call& call : calls()) {
    machineCalls = 0;
    call.call();
    const int callsOfOne = machineCalls;
    bench::measure(call.call, repeats);
    std::printf("%s\t%d\t%d\n", call.name.c_str(), callsOfOne, repeats);
  }
  return 0;
}
