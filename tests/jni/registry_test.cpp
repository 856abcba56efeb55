// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// Loading the library: what it looks up, in which order, and what a look-up that fails leaves behind.
#include "bridge_test.h"

namespace {

class RegistryTest : public BridgeTest {
 protected:
  jint load() { return JNI_OnLoad(vm.java_vm(), nullptr); }

  /// The look-ups of a field, as the journal shows them.
  static Lines field_lines(const char* class_name, const char* name, const char* signature) {
    return {std::string("FindClass(") + class_name + ")",
            std::string("GetFieldID(") + class_name + ", " + name + ", " + signature + ")"};
  }

  static Lines class_lines(const char* class_name) {
    const std::string text = class_name;
    return {"FindClass(" + text + ")", "NewGlobalRef(" + text + ")",
            "GetMethodID(" + text + ", <init>, ()V)"};
  }

  /// All look-ups of a load, in order.
  static Lines load_lines() {
    struct Field {
      const char* class_name;
      const char* name;
      const char* signature;
    };
    constexpr Field kFields[] = {
        {kRectClass, "left", "I"},
        {kRectClass, "top", "I"},
        {kRectClass, "right", "I"},
        {kRectClass, "bottom", "I"},
        {kPointFClass, "x", "F"},
        {kPointFClass, "y", "F"},
        {kFaceInfoClass, "score", "F"},
        {kFaceInfoClass, "yaw", "F"},
        {kFaceInfoClass, "pitch", "F"},
        {kFaceInfoClass, "roll", "F"},
        {kFaceInfoClass, "eyeDist", "F"},
        {kFaceInfoClass, "id", "I"},
        {kFaceInfoClass, "faceRect", "Landroid/graphics/Rect;"},
        {kFaceInfoClass, "facePoints", "[Landroid/graphics/PointF;"},
    };
    Lines lines = {"GetEnv(0x10006)"};
    for (const Field& field : kFields) {
      append(lines, field_lines(field.class_name, field.name, field.signature));
    }
    for (const char* class_name : {kPointFClass, kRectClass, kFaceInfoClass}) {
      append(lines, class_lines(class_name));
    }
    return lines;
  }

  /// What is said of a class that has no constructor without arguments.
  static const char* constructor_message(const std::string& class_name) {
    return class_name == kPointFClass ? "Can't find android/graphics/PointF.PointF()"
           : class_name == kRectClass ? "Can't find android/graphics/Rect.Rect()"
                                      : "Can't find com/vantrel/faceapi/model/FaceInfo";
  }

  static void append(Lines& lines, const Lines& more) { lines.insert(lines.end(), more.begin(), more.end()); }

  /// The look-ups up to and with the n-th call of a function, then a message, then the end of the load.
  static Lines lines_until(const std::string& function, int nth, const std::string& message) {
    Lines lines;
    for (const std::string& line : load_lines()) {
      lines.push_back(line);
      if (line.rfind(function + "(", 0) == 0 && --nth == 0) {
        break;
      }
    }
    append(lines, {"log 6 FaceAPI: " + message, "ExceptionClear()"});
    return lines;
  }
};

TEST_F(RegistryTest, LooksUpFieldsThenConstructorsInOrder) {
  EXPECT_EQ(load(), JNI_VERSION_1_6);
  EXPECT_EQ(vm.calls("DeleteLocalRef"), 0);
  expect_journal(load_lines());
  EXPECT_EQ(vm.globals(), 6);  // three of the fixture's load and three of this one
  vm.forget_globals(3);
}

TEST_F(RegistryTest, RefusesToLoadWithoutAnEnvironment) {
  for (jint answer : {JNI_EVERSION, JNI_EDETACHED, JNI_ERR, 1}) {
    vm.get_env_result = answer;
    EXPECT_EQ(load(), -1);
    expect_journal({"GetEnv(0x10006)"});
  }
}

TEST_F(RegistryTest, LoadsWithoutAClass) {
  for (const char* class_name : {kRectClass, kPointFClass, kFaceInfoClass}) {
    fake::Vm bare;
    bare.hide_class(class_name);
    fake::journal().clear();
    EXPECT_EQ(JNI_OnLoad(bare.java_vm(), nullptr), JNI_VERSION_1_6);
    EXPECT_FALSE(bare.exception_pending());
    EXPECT_EQ(bare.globals(), 0);
    const int nth = class_name == kRectClass ? 1 : class_name == kPointFClass ? 5 : 7;
    EXPECT_EQ(fake::journal(), lines_until("FindClass", nth, std::string("Can't find ") + class_name));
  }
}

TEST_F(RegistryTest, LoadsWithoutAField) {
  const Lines lookups = load_lines();
  int nth = 0;
  for (const std::string& line : lookups) {
    if (line.rfind("GetFieldID(", 0) != 0) {
      continue;
    }
    ++nth;
    const size_t class_end = line.find(", ");
    const size_t name_end = line.find(", ", class_end + 2);
    const std::string class_name = line.substr(11, class_end - 11);
    const std::string name = line.substr(class_end + 2, name_end - class_end - 2);
    const std::string signature = line.substr(name_end + 2, line.size() - name_end - 3);
    fake::Vm bare;
    bare.hide_member(class_name, name + ":" + signature);
    fake::journal().clear();
    EXPECT_EQ(JNI_OnLoad(bare.java_vm(), nullptr), JNI_VERSION_1_6);
    EXPECT_FALSE(bare.exception_pending());
    EXPECT_EQ(fake::journal(), lines_until("GetFieldID", nth, "Can't find " + class_name + "." + name));
  }
  EXPECT_EQ(nth, 14);
}

TEST_F(RegistryTest, LoadsWithoutAConstructor) {
  int nth = 0;
  for (const char* class_name : {kPointFClass, kRectClass, kFaceInfoClass}) {
    fake::Vm bare;
    bare.hide_member(class_name, "<init>:()V");
    fake::journal().clear();
    EXPECT_EQ(JNI_OnLoad(bare.java_vm(), nullptr), JNI_VERSION_1_6);
    EXPECT_FALSE(bare.exception_pending());
    EXPECT_EQ(fake::journal(), lines_until("GetMethodID", ++nth, constructor_message(class_name)));
  }
}

// The JVM can find a class and not find it again: that shows as a missing constructor.
TEST_F(RegistryTest, EveryClassLookUpMayFail) {
  const Lines lookups = load_lines();
  int nth = 0;
  for (size_t i = 0; i < lookups.size(); ++i) {
    if (lookups[i].rfind("FindClass(", 0) != 0) {
      continue;
    }
    SCOPED_TRACE(lookups[i]);
    const std::string class_name = lookups[i].substr(10, lookups[i].size() - 11);
    fake::Vm bare;
    bare.refuse("FindClass", ++nth);
    fake::journal().clear();
    EXPECT_EQ(JNI_OnLoad(bare.java_vm(), nullptr), JNI_VERSION_1_6);
    EXPECT_FALSE(bare.exception_pending());
    Lines lines(lookups.begin(), lookups.begin() + static_cast<std::ptrdiff_t>(i) + 1);
    if (nth <= 14) {
      lines.push_back("log 6 FaceAPI: Can't find " + class_name);
    } else {
      append(lines, {"NewGlobalRef(null)", "GetMethodID(null, <init>, ()V)",
                     std::string("log 6 FaceAPI: ") + constructor_message(class_name)});
    }
    lines.push_back("ExceptionClear()");
    EXPECT_EQ(fake::journal(), lines);
  }
  EXPECT_EQ(nth, 17);
}

// A class without its global reference is not noticed before it is used.
TEST_F(RegistryTest, EveryGlobalReferenceMayFail) {
  for (int nth : {1, 2, 3}) {
    fake::Vm bare;
    bare.refuse("NewGlobalRef", nth);
    fake::journal().clear();
    EXPECT_EQ(JNI_OnLoad(bare.java_vm(), nullptr), JNI_VERSION_1_6);
    EXPECT_FALSE(bare.exception_pending());
    EXPECT_EQ(bare.globals(), 2);
    EXPECT_EQ(fake::journal(), load_lines());

    engine.vm = &bare;
    engine.faces = {make_face(1, 2)};
    jintArray status = bare.int_array("status", {-77});
    bare.begin_call();
    EXPECT_EQ(Java_com_vantrel_faceapi_FaceLibrary_kyFaceDetectBytes(
                  bare.env(), nullptr, 0x77, bare.byte_array("image", {1}), 1, 1, 1, 1, 0, status),
              nullptr);
    EXPECT_EQ(bare.at(status).words[0], 0);
    EXPECT_TRUE(bare.exception_pending());
    EXPECT_TRUE(bare.pinned().empty());
    EXPECT_EQ(bare.live_locals(), 0);
  }
}

TEST_F(RegistryTest, ItsMessagesAreNotSubjectToTheDebugSwitch) {
  CALL(setDebug, JNI_FALSE);
  fake::Vm bare;
  bare.hide_class(kRectClass);
  fake::journal().clear();
  JNI_OnLoad(bare.java_vm(), nullptr);
  EXPECT_EQ(fake::entries("log "), Lines{"log 6 FaceAPI: Can't find android/graphics/Rect"});
}

TEST_F(RegistryTest, TheDebugSwitchGatesTheNativeMethodsMessages) {
  const Lines message = {"log 6 FaceAPI: kyFaceDestroyDetector destroy detect handle is null"};
  CALL(setDebug, JNI_FALSE);
  CALL(kyFaceDestroyDetector, 0);
  expect_journal({});
  for (int on : {1, 2, 0x80, 0xFF}) {
    CALL(setDebug, static_cast<jboolean>(on));
    CALL(kyFaceDestroyDetector, 0);
    expect_journal(message);
  }
}

}  // namespace
