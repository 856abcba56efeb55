// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// The JVM saying no: every call that can be refused is refused, at its first, second and last
// time, in every native method. The method answers with its failure value, nothing stays borrowed, no further
// call is made under the exception, and the exception stays.
#include <functional>

#include "bridge_test.h"

namespace {

class RefusalTest : public BridgeTest {
 protected:
  /// A call that succeeds when nothing is refused.
  struct Scenario {
    const char* method;
    /// Calls it and tells whether the result is its failure value (for a method that returns nothing:
    /// always).
    std::function<bool()> fails;
    /// What stays pinned when the n-th call of a function is refused.
    std::function<Lines(const std::string& function, int nth)> leaks = {};
  };

  RefusalTest() {
    engine.faces = {make_face(1, 3), make_face(2, 2)};
    engine.text = "QUJD";
    engine.feature_length = 3;
    engine.value = 0.5F;
    fake::bitmap().info = {2, 2, 8, ANDROID_BITMAP_FORMAT_RGBA_8888, 0};
    fake::bitmap().pixels = std::vector<unsigned char>(16, 1);
    vm.at(face).objects = {{"faceRect", &vm.at(vm.object("rect", kRectClass))},
                           {"facePoints", &vm.at(vm.object_array("points", kPointFClass, {}))}};
  }

  /// Runs a scenario with every refusal that it can meet.
  void refuse_everything(const Scenario& scenario) {
    SCOPED_TRACE(scenario.method);
    prepare();
    EXPECT_EQ(scenario.fails(), returns_nothing(scenario)) << "with nothing refused";
    EXPECT_FALSE(vm.exception_pending());
    const std::map<std::string, int> calls = vm.all_calls();
    int refusals = 0;
    for (const char* function : {"GetByteArrayElements", "GetIntArrayElements", "GetStringUTFChars",
                                 "NewObjectArray", "NewObjectV", "NewByteArray"}) {
      const auto found = calls.find(function);
      const int count = found == calls.end() ? 0 : found->second;
      for (int nth = 1; nth <= count; ++nth) {
        SCOPED_TRACE(std::string(function) + " refused at call " + std::to_string(nth));
        prepare();
        vm.refuse(function, nth);
        EXPECT_TRUE(scenario.fails());
        EXPECT_TRUE(vm.exception_pending());
        expect_leaks(scenario.leaks ? scenario.leaks(function, nth) : Lines{});
        EXPECT_EQ(fake::bitmap().locks, 0);
        EXPECT_EQ(vm.live_locals(), left_locals(function));
        expect_engine_got_everything_back(function);
        ++refusals;
      }
    }
    EXPECT_GT(refusals, 0);
  }

  void prepare() {
    engine.features = {reinterpret_cast<ky_feature_t>(0xF1), reinterpret_cast<ky_feature_t>(0xF2)};
    vm.tolerate_calls_under_exception = false;
    begin();
  }

  static bool returns_nothing(const Scenario& scenario) { return scenario.method[0] == '-'; }

  void expect_leaks(const Lines& names) {
    Lines expected = stays_pinned;
    expected.insert(expected.end(), names.begin(), names.end());
    std::sort(expected.begin(), expected.end());
    EXPECT_EQ(vm.pinned(), expected);
    stays_pinned = vm.pinned();
  }

  /// Local references that are left to the JVM: those of a face that was read, and the text's
  /// array.
  int left_locals(const std::string& function) const {
    const bool read_face = vm.calls("GetObjectField") > 0;
    const bool made_text = vm.calls("NewByteArray") > 0 && function != "NewByteArray";
    return (read_face ? 2 : 0) + (made_text ? 1 : 0);
  }

  /// Results and features go back to the engine, except the one feature that has no array for its text.
  static void expect_engine_got_everything_back(const std::string& function) {
    EXPECT_EQ(fake::entries("ky_face_detect(").size(),
              fake::entries("ky_face_release_detector_result(").size());
    EXPECT_EQ(fake::entries("ky_face_track(").size(),
              fake::entries("ky_face_release_tracker_result(").size());
    const size_t features = fake::entries("ky_verify_get_feature(").size() +
                            fake::entries("ky_verify_deserialize_feature(").size();
    EXPECT_EQ(fake::entries("ky_verify_release_feature(").size(), function == "NewByteArray" ? 0 : features);
  }

  jbyteArray bytes = vm.byte_array("bytes", std::vector<unsigned char>(64, 9));
  jbyteArray more_bytes = vm.byte_array("more bytes", std::vector<unsigned char>(64, 8));
  jintArray ints = vm.int_array("ints", {1, 2, 3, 4});
  jintArray status = vm.int_array("status", {-77, -78});
  jstring path = vm.string("path", "/models/m.bin");
  jobject face = vm.object("face", kFaceInfoClass);
  jobject bitmap = vm.object("bitmap", "android/graphics/Bitmap");
};

TEST_F(RefusalTest, Creation) {
  refuse_everything({"kyFaceCreateDetector", [&] { return CALL(kyFaceCreateDetector, path, 1) == 0; }});
  refuse_everything({"kyFaceCreateTracker", [&] { return CALL(kyFaceCreateTracker, path, 0, 1) == 0; }});
  refuse_everything({"kyFaceCreateVerify", [&] { return CALL(kyFaceCreateVerify, path) == 0; }});
}

TEST_F(RefusalTest, Threshold) {
  refuse_everything({"getDetectThreshold", [&] { return CALL(getDetectThreshold, 0x77, status) == 0.0F; }});
  refuse_everything({"-setDetectThreshold", [&] {
                       CALL(setDetectThreshold, 0x77, 0.5F, status);
                       return true;
                     }});
}

TEST_F(RefusalTest, Faces) {
  refuse_everything({"kyFaceDetectBytes",
                     [&] { return CALL(kyFaceDetectBytes, 0x77, bytes, 1, 2, 2, 8, 0, status) == nullptr; }});
  refuse_everything({"kyFaceDetectInts",
                     [&] { return CALL(kyFaceDetectInts, 0x77, ints, 1, 2, 2, 8, 0, status) == nullptr; }});
  refuse_everything({"kyFaceTrackBytes",
                     [&] { return CALL(kyFaceTrackBytes, 0x77, bytes, 1, 2, 2, 8, 0, status) == nullptr; }});
  refuse_everything({"kyFaceTrackInts",
                     [&] { return CALL(kyFaceTrackInts, 0x77, ints, 1, 2, 2, 8, 0, status) == nullptr; }});
}

TEST_F(RefusalTest, Features) {
  refuse_everything({"kyFaceGetFeatureBytes", [&] {
                       return CALL(kyFaceGetFeatureBytes, 0x77, bytes, 1, 2, 2, 8, face, status) == nullptr;
                     }});
  refuse_everything({"kyFaceGetFeatureInts", [&] {
                       return CALL(kyFaceGetFeatureInts, 0x77, ints, 1, 2, 2, 8, face, status) == nullptr;
                     }});
  refuse_everything({"kyFaceDeserialize", [&] { return CALL(kyFaceDeserialize, bytes) == 0; }});
  refuse_everything({"kyFaceCompareFeature",
                     [&] {
                       vm.tolerate_calls_under_exception =
                           true;  // both are pinned before either is looked at
                       return CALL(kyFaceCompareFeature, 0x77, bytes, more_bytes, status) == 0.0F;
                     },
                     [](const std::string& function, int nth) -> Lines {
                       if (function != "GetByteArrayElements") {
                         return {};
                       }
                       return {nth == 1 ? "more bytes" : "bytes"};
                     }});
}

TEST_F(RefusalTest, Images) {
  for (int code : {1, 2, 3, 5, 14, 20, 101, 1001, 4}) {
    refuse_everything({"-convertColorSpace", [&, code] {
                         CALL(convertColorSpace, bytes, 2, 2, more_bytes, code);
                         return true;
                       }});
  }
  refuse_everything({"-getBGRADataFromBitmap", [&] {
                       CALL(getBGRADataFromBitmap, bitmap, bytes);
                       return true;
                     }});
  refuse_everything({"-getBGRDataFromBitmap", [&] {
                       CALL(getBGRDataFromBitmap, bitmap, bytes);
                       return true;
                     }});
  refuse_everything({"-cropNv21Data", [&] {
                       CALL(cropNv21Data, bytes, 4, 4, 0, 0, 2, 2, more_bytes);
                       return true;
                     }});
  refuse_everything({"-rotateBGR", [&] {
                       CALL(rotateBGR, bytes, 2, 3, more_bytes, 90, ints);
                       return true;
                     }});
}

TEST_F(RefusalTest, NothingIsWrittenToAnArrayWhosePartnerIsRefused) {
  const std::vector<unsigned char> before = vm.bytes(more_bytes);
  for (int nth : {1, 2}) {
    begin();
    vm.refuse("GetByteArrayElements", nth);
    CALL(convertColorSpace, bytes, 2, 2, more_bytes, 2);
    EXPECT_EQ(vm.bytes(more_bytes), before);
  }
  begin();
  vm.refuse("GetIntArrayElements", 1);
  CALL(rotateBGR, bytes, 2, 3, more_bytes, 90, ints);
  EXPECT_EQ(vm.bytes(more_bytes), before);
}

TEST_F(RefusalTest, Brightness) {
  testing::internal::CaptureStdout();
  for (int format : {0, 1, 3, 4, 5}) {
    refuse_everything({"faceBrightEvaluate", [&, format] {
                         return CALL(faceBrightEvaluate, bytes, format, 4, 16, 4, 4, 0, 0, 4, 4) == 255;
                       }});
  }
  refuse_everything({"-faceBrightEvaluate, without a metric",
                     [&] { return CALL(faceBrightEvaluate, bytes, 2, 4, 16, 4, 4, 0, 0, 4, 4) == -1; }});
  refuse_everything(
      {"averageBrightness", [&] { return CALL(averageBrightness, bytes, 8, 8, 0, 0, 8, 8) == 0.0F; }});
  testing::internal::GetCapturedStdout();
}

// Every other native method has nothing that could be refused.
TEST_F(RefusalTest, TheOthersAskTheMachineForNothing) {
  begin();
  CALL(setDebug, JNI_TRUE);
  CALL(kyFaceDestroyDetector, 0x77);
  CALL(kyFaceDestroyTracker, 0x77);
  CALL(kyFaceDestroyVerify, 0x77);
  CALL(kyFaceShowInsideModel);
  CALL(kyFaceResetTracker, 0x77);
  CALL(kyFaceTrackSetDetectFaceCntLimit, 0x77, 1);
  CALL(kyFaceTrackSetDetectInterval, 0x77, 1);
  CALL(kyFaceTrackSetAlignmentThreshold, 0x77, 1);
  CALL(kyFaceGetVerifyVersion, 0x77);
  CALL(kyFaceGetVerifyLength, 0x77);
  EXPECT_TRUE(vm.all_calls().empty());
}

}  // namespace
