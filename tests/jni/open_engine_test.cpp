// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// The native methods over the open engine: faces and features go through both. What a method
// never gives back stays in the engine's tables; tests/leaks.supp says what that is.
#include <gtest/gtest.h>

#include "engine/ky_engine.h"
#include "fake_vm.h"
#include "jni/java_declarations.h"
#include "tests/support/picture.h"

namespace {

#define CALL(method, ...) \
  Java_com_vantrel_faceapi_FaceLibrary_##method(vm.env(), nullptr __VA_OPT__(, ) __VA_ARGS__)

class OpenEngineTest : public testing::Test {
 protected:
  static constexpr int kSide = 128;
  static constexpr int kStride = kSide * 3;

  OpenEngineTest() { EXPECT_EQ(JNI_OnLoad(vm.java_vm(), nullptr), JNI_VERSION_1_6); }

  /// The only face of an array, as the JVM hands it out.
  jobject only_face(jobjectArray faces) {
    EXPECT_EQ(vm.at(faces).elements.size(), 1U);
    return vm.env()->GetObjectArrayElement(faces, 0);
  }

  int status() { return vm.at(status_).words[0]; }

  fake::Vm vm;
  jbyteArray frame_ =
      vm.byte_array("frame", kyengine::test::View(kyengine::test::Portrait(), 222, 126, 1, 0, kSide).rgb);
  jintArray status_ = vm.int_array("status", {-77});
};

TEST_F(OpenEngineTest, TracksAFace) {
  const jlong tracker = CALL(kyFaceCreateTracker, nullptr, 0, KY_CONFIG_LARGE_FACES);
  ASSERT_NE(tracker, 0);
  int identity = 0;
  for (int i = 0; i < 2; ++i) {
    jobjectArray faces = CALL(kyFaceTrackBytes, tracker, frame_, KY_PIXEL_RGB, kSide, kSide, kStride,
                              KY_ORIENTATION_0, status_);
    ASSERT_EQ(status(), KY_SUCCESS);
    ASSERT_NE(faces, nullptr);
    fake::Object& face = vm.at(only_face(faces));
    EXPECT_GT(face.floats["score"], KY_DEFAULT_THRESHOLD);
    EXPECT_TRUE(i == 0 || face.ints["id"] == identity);
    identity = face.ints["id"];
  }
  CALL(kyFaceDestroyTracker, tracker);
  EXPECT_TRUE(vm.pinned().empty());
}

TEST_F(OpenEngineTest, ComparesAFaceWithItself) {
  const jlong detector = CALL(kyFaceCreateDetector, nullptr, KY_CONFIG_LARGE_FACES);
  const jlong verifier = CALL(kyFaceCreateVerify, nullptr);
  ASSERT_NE(detector, 0);
  ASSERT_NE(verifier, 0);
  jobjectArray faces = CALL(kyFaceDetectBytes, detector, frame_, KY_PIXEL_RGB, kSide, kSide, kStride,
                            KY_ORIENTATION_0, status_);
  ASSERT_NE(faces, nullptr);
  jobject face = only_face(faces);
  jbyteArray feature =
      CALL(kyFaceGetFeatureBytes, verifier, frame_, KY_PIXEL_RGB, kSide, kSide, kStride, face, status_);
  ASSERT_EQ(status(), KY_SUCCESS);
  ASSERT_NE(feature, nullptr);
  EXPECT_FLOAT_EQ(CALL(kyFaceCompareFeature, verifier, feature, feature, status_), 1);
  EXPECT_EQ(status(), KY_SUCCESS);

  vm.refuse("NewByteArray", 1);
  EXPECT_EQ(CALL(kyFaceGetFeatureBytes, verifier, frame_, KY_PIXEL_RGB, kSide, kSide, kStride, face, status_),
            nullptr);
  CALL(kyFaceDestroyVerify, verifier);
  CALL(kyFaceDestroyDetector, detector);
  EXPECT_TRUE(vm.pinned().empty());
}

}  // namespace
