// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

#include <type_traits>

#include "operation.h"
#include "tests/jni/bridge_test.h"
#include "tests/support/frame_reference.h"

namespace threads {

namespace {

using reference::randomBytes;

constexpr int kWidth = 22;
constexpr int kHeight = 6;
constexpr size_t kPixels = static_cast<size_t>(kWidth) * kHeight;
constexpr jlong kHandle = 0x77;

/// A call's own JVM with an argument of every kind, and an engine that finds two faces and a
/// feature.
struct Machine {
  fake::Vm vm;
  jbyteArray frame = vm.byte_array("frame", randomBytes(reference::frameSize(kWidth, kHeight), 1));
  jbyteArray pixels = vm.byte_array("pixels", randomBytes(kPixels * 4, 2));
  jbyteArray out = vm.byte_array("out", Bytes(kPixels * 4));
  jintArray ints = vm.int_array("ints", {5, 6, 7});
  jintArray status = vm.int_array("status", {-77, 5});
  jbyteArray feature = vm.byte_array("feature", {'Q', 'U', 'J', 'D', 0});
  jstring path = vm.string("path", "/models/m.bin");
  jobject bitmap = vm.object("bitmap", "android/graphics/Bitmap");
  jobject face = make_java_face(vm, 3);

  Machine() {
    fake::Engine& engine = fake::engine();
    engine = {};
    engine.vm = &vm;
    engine.faces = {make_face(1, 5), make_face(20, KY_FACE_MAX_POINTS)};
    engine.value = 0.75F;
    engine.text = "QUJD";
    engine.feature_length = 3;
    fake::bitmap() = {};
    fake::bitmap().info = {kWidth, kHeight, kWidth * 4, ANDROID_BITMAP_FORMAT_RGBA_8888, 0};
    fake::bitmap().pixels = randomBytes(kPixels * 4, 3);
    fake::journal().clear();
  }
  ~Machine() { fake::engine().vm = nullptr; }
  Machine(const Machine&) = delete;
  Machine& operator=(const Machine&) = delete;
};

template <typename Elements>
void append(Bytes& all, const Elements& elements) {
  const auto* first = reinterpret_cast<const unsigned char*>(elements.data());
  all.insert(all.end(), first, first + elements.size() * sizeof(*elements.data()));
}

/// Answers with what `call` returns, what it leaves in the arrays, and the journal. A returned reference
/// stands for nothing by itself: how its object was made is in the journal.
template <typename Call>
Operation native(const char* name, Call call) {
  return {name, [call] {
            Machine machine;
            Bytes all;
            using Answer = std::invoke_result_t<Call, Machine&>;
            if constexpr (std::is_arithmetic_v<Answer>) {
              append(all, std::vector<Answer>{call(machine)});
            } else if constexpr (std::is_same_v<Answer, jbyteArray>) {
              append(all, machine.vm.bytes(call(machine)));
            } else {
              call(machine);
            }
            append(all, machine.vm.bytes(machine.out));
            append(all, machine.vm.at(machine.status).words);
            for (const std::string& line : fake::journal()) {
              append(all, line);
            }
            return all;
          }};
}

}  // namespace

std::vector<Operation> nativeOperations() {
  // `m` is the call's machine.
#define NATIVE(method, ...)                                                                               \
  native(#method, []([[maybe_unused]] Machine& m) {                                                       \
    return Java_com_vantrel_faceapi_FaceLibrary_##method(m.vm.env(), nullptr __VA_OPT__(, ) __VA_ARGS__); \
  })
  return {
      NATIVE(setDebug, JNI_TRUE),  // all set it to the same: the messages are in the journals

      NATIVE(kyFaceCreateDetector, m.path, 7),
      NATIVE(kyFaceDestroyDetector, kHandle),
      NATIVE(getDetectThreshold, kHandle, m.status),
      NATIVE(setDetectThreshold, kHandle, 0.5F, m.status),
      NATIVE(kyFaceDetectBytes, kHandle, m.frame, 1, kWidth, kHeight, kWidth, 2, m.status),
      NATIVE(kyFaceDetectInts, kHandle, m.ints, 1, kWidth, kHeight, kWidth, 2, m.status),
      NATIVE(kyFaceShowInsideModel),

      NATIVE(kyFaceCreateTracker, m.path, 0, 7),
      NATIVE(kyFaceDestroyTracker, kHandle),
      NATIVE(kyFaceTrackBytes, kHandle, m.frame, 1, kWidth, kHeight, kWidth, 2, m.status),
      NATIVE(kyFaceTrackInts, kHandle, m.ints, 1, kWidth, kHeight, kWidth, 2, m.status),
      NATIVE(kyFaceResetTracker, kHandle),
      NATIVE(kyFaceTrackSetDetectFaceCntLimit, kHandle, 3),
      NATIVE(kyFaceTrackSetDetectInterval, kHandle, 4),
      NATIVE(kyFaceTrackSetAlignmentThreshold, kHandle, 5),

      NATIVE(kyFaceCreateVerify, m.path),
      NATIVE(kyFaceGetVerifyVersion, kHandle),
      NATIVE(kyFaceGetVerifyLength, kHandle),
      NATIVE(kyFaceGetFeatureBytes, kHandle, m.frame, 1, kWidth, kHeight, kWidth, m.face, m.status),
      NATIVE(kyFaceGetFeatureInts, kHandle, m.ints, 1, kWidth, kHeight, kWidth, m.face, m.status),
      NATIVE(kyFaceCompareFeature, kHandle, m.feature, m.feature, m.status),
      NATIVE(kyFaceDeserialize, m.feature),
      NATIVE(kyFaceDestroyVerify, kHandle),

      NATIVE(convertColorSpace, m.frame, kWidth, kHeight, m.out, 1),
      NATIVE(convertColorSpace, m.frame, kWidth, kHeight, m.out, 2),
      NATIVE(convertColorSpace, m.pixels, kWidth, kHeight, m.out, 3),
      NATIVE(convertColorSpace, m.frame, kWidth, kHeight, m.out, 5),
      NATIVE(convertColorSpace, m.pixels, kWidth, kHeight, m.out, 14),
      NATIVE(convertColorSpace, m.pixels, kWidth, kHeight, m.out, 20),
      NATIVE(convertColorSpace, m.frame, kWidth, kHeight, m.out, 1001),
      NATIVE(getBGRADataFromBitmap, m.bitmap, m.out),
      NATIVE(getBGRDataFromBitmap, m.bitmap, m.out),
      NATIVE(cropNv21Data, m.frame, kWidth, kHeight, 4, 2, kWidth - 8, kHeight - 2, m.out),
      NATIVE(rotateBGR, m.pixels, kWidth, kHeight, m.out, 90, m.status),

      NATIVE(faceBrightEvaluate, m.pixels, 0, kWidth, kWidth * 4, kHeight, kHeight, 1, 1, 9, 4),
      NATIVE(faceBrightEvaluate, m.pixels, 1, kWidth, kWidth * 4, kHeight, kHeight, 1, 1, 9, 4),
      NATIVE(faceBrightEvaluate, m.pixels, 3, kWidth, kWidth * 3, kHeight, kHeight, 1, 1, 9, 4),
      NATIVE(faceBrightEvaluate, m.pixels, 4, kWidth, kWidth * 4, kHeight, kHeight, 1, 1, 9, 4),
      NATIVE(faceBrightEvaluate, m.pixels, 5, kWidth, kWidth * 4, kHeight, kHeight, 1, 1, 9, 4),
      NATIVE(averageBrightness, m.frame, kWidth, kHeight, 1, 1, 9, 4),
  };
#undef NATIVE
}

}  // namespace threads
