// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// The library in a process where it is loaded without, or with half of, its Java classes.
#include "bridge_test.h"

namespace {

TEST(UnregisteredTest, LogsFromLoadOn) {
  fake::Vm vm;
  CALL(kyFaceDestroyDetector, 0);
  EXPECT_EQ(fake::journal(),
            std::vector<std::string>{"log 6 FaceAPI: kyFaceDestroyDetector destroy detect handle is null"});
}

TEST(UnregisteredTest, AnswersNullForFacesItCannotBuild) {
  fake::Vm vm;
  vm.hide_class(kFaceInfoClass);
  EXPECT_EQ(JNI_OnLoad(vm.java_vm(), nullptr), JNI_VERSION_1_6);
  fake::engine() = {};
  fake::engine().vm = &vm;
  fake::engine().faces = {make_face(1, 2)};
  jbyteArray image = vm.byte_array("image", {1, 2, 3});
  jintArray status = vm.int_array("status", {7});
  vm.begin_call();
  EXPECT_EQ(CALL(kyFaceDetectBytes, 0x77, image, 1, 3, 1, 3, 0, status), nullptr);
  EXPECT_EQ(vm.at(status).words, std::vector<jint>{0});
  EXPECT_TRUE(vm.pinned().empty());
  EXPECT_EQ(fake::entries("ky_").size(), 2U);  // the result went back to the engine
}

}  // namespace
