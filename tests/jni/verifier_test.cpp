// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// The verifier's native methods, and the conversion of faces from Java.
#include "bridge_test.h"

namespace {

using testing::ElementsAre;

class VerifierTest : public BridgeTest {
 protected:
  VerifierTest() {
    engine.text = "QUJD";
    engine.feature_length = 3;
    begin();
  }

  jobject make_java_face(int count) {
    jobject face = ::make_java_face(vm, count);
    begin();
    return face;
  }

  jbyteArray get_feature(jobject face) {
    return CALL(kyFaceGetFeatureBytes, 0x77, image, 1, 64, 48, 192, face, status);
  }

  jfloat compare() { return CALL(kyFaceCompareFeature, 0x77, feature1, feature2, status); }

  static constexpr char kFeatureIsNull[] =
      "log 6 FaceAPI: ky_faceapi_KyFaceLibrary_kyFacCompareFeature feature is null";

  jbyteArray image = vm.byte_array("image", {1, 2, 3, 4});
  jintArray ints = vm.int_array("ints", {5, 6, 7});
  jintArray status = vm.int_array("status", {-77, 5});
  jbyteArray feature1 = vm.byte_array("feature1", {'Q', 'U', 'J', 'D', 0});
  jbyteArray feature2 = vm.byte_array("feature2", {'Q', 'U', 'J', 'E', 0});
};

// ---- create, destroy, properties

TEST_F(VerifierTest, CreatesFromAModelFile) {
  EXPECT_EQ(CALL(kyFaceCreateVerify, vm.string("path", "/models/v.bin")), 0x1001);
  expect_journal({"GetStringUTFChars(path)",
                  "log 3 FaceAPI: FaceCreateVerify verify model_path: /models/v.bin",
                  "ky_verify_create_handle(/models/v.bin)", "ReleaseStringUTFChars(path)"});
  CALL(setDebug, JNI_FALSE);
  EXPECT_EQ(CALL(kyFaceCreateVerify, vm.string("path", "/models/v.bin")), 0x1002);
  expect_journal(
      {"GetStringUTFChars(path)", "ky_verify_create_handle(/models/v.bin)", "ReleaseStringUTFChars(path)"});
}

TEST_F(VerifierTest, HandsANullPathOn) {
  EXPECT_EQ(CALL(kyFaceCreateVerify, nullptr), 0x1001);
  expect_journal({"ky_verify_create_handle(null)"});
}

TEST_F(VerifierTest, AFailedCreationKeepsThePathsCharacters) {
  engine.create_results = {-12, 5};
  CALL(setDebug, JNI_FALSE);
  EXPECT_EQ(CALL(kyFaceCreateVerify, vm.string("path", "/models/v.bin")), 0);
  expect_journal({"GetStringUTFChars(path)", "ky_verify_create_handle(/models/v.bin)"});
  CALL(setDebug, JNI_TRUE);
  EXPECT_EQ(CALL(kyFaceCreateVerify, nullptr), 0);
  expect_journal({"ky_verify_create_handle(null)", "log 6 FaceAPI: FaceCreateVerify create handle fail : 5"});
  stays_pinned = {"path"};
}

TEST_F(VerifierTest, DoesNotCreateTheBuiltInVerifierWhenThePathIsRefused) {
  vm.refuse("GetStringUTFChars", 1);
  EXPECT_EQ(CALL(kyFaceCreateVerify, vm.string("path", "/models/v.bin")), 0);
  EXPECT_TRUE(vm.exception_pending());
  expect_journal({"GetStringUTFChars(path)"});
}

TEST_F(VerifierTest, Destroys) {
  CALL(kyFaceDestroyVerify, 0x77);
  expect_journal({"ky_verify_destroy_handle(0x77)", "log 3 FaceAPI: ky_verify_destroy_handle"});
  CALL(kyFaceDestroyVerify, 0);
  expect_journal({"log 6 FaceAPI: kyFaceVerify DestroyVerify handle is NULL!!"});
  CALL(setDebug, JNI_FALSE);
  CALL(kyFaceDestroyVerify, 0x77);
  CALL(kyFaceDestroyVerify, 0);
  expect_journal({"ky_verify_destroy_handle(0x77)"});
}

TEST_F(VerifierTest, HandsItsPropertiesThrough) {
  for (int value : {7, 0, -1}) {
    engine.result = value;
    EXPECT_EQ(CALL(kyFaceGetVerifyVersion, 0x77), value);
    expect_journal({"ky_verify_get_version(0x77)"});
    EXPECT_EQ(CALL(kyFaceGetVerifyLength, 0), value);
    expect_journal({"ky_verify_get_feature_length(0)"});
  }
}

// ---- extraction

TEST_F(VerifierTest, ExtractsFromBytes) {
  jobject face = make_java_face(1);
  jbyteArray text = get_feature(face);
  expect_journal({
      "GetByteArrayElements(image)",
      "GetObjectField(face.faceRect)",
      "GetIntField(rect.left)",
      "GetIntField(rect.top)",
      "GetIntField(rect.right)",
      "GetIntField(rect.bottom)",
      "GetObjectField(face.facePoints)",
      "GetArrayLength(points)",
      "GetObjectArrayElement(points, 0)",
      "GetFloatField(point0.x)",
      "GetFloatField(point0.y)",
      "GetFloatField(face.score)",
      "GetFloatField(face.yaw)",
      "GetFloatField(face.pitch)",
      "GetFloatField(face.roll)",
      "GetFloatField(face.eyeDist)",
      "GetIntField(face.id)",
      "ky_verify_get_feature(0x77, image, 1, 64, 48, 192)",
      "GetIntArrayElements(status)",
      "NewByteArray(5)",
      "GetByteArrayElements(byte[]#1)",
      "ky_verify_serialize_feature(0xfea7, byte[]#1)",
      "ky_verify_release_feature(0xfea7)",
      "ReleaseIntArrayElements(status, 0)",
      "ReleaseByteArrayElements(byte[]#1, 0)",
      "ReleaseByteArrayElements(image, 0)",
  });
  EXPECT_THAT(vm.at(status).words, ElementsAre(0, 5));
  EXPECT_THAT(vm.bytes(text), ElementsAre('Q', 'U', 'J', 'D', 0));
}

TEST_F(VerifierTest, ExtractsFromInts) {
  jobject face = make_java_face(0);
  ASSERT_NE(CALL(kyFaceGetFeatureInts, 0x77, ints, -1, -2, -3, -4, face, status), nullptr);
  EXPECT_EQ(fake::journal().front(), "GetIntArrayElements(ints)");
  EXPECT_EQ(fake::journal().back(), "ReleaseIntArrayElements(ints, 0)");
  EXPECT_THAT(fake::entries("ky_verify_get"),
              ElementsAre("ky_verify_get_feature(0x77, ints, -1, -2, -3, -4)"));
}

TEST_F(VerifierTest, HandsTheWholeFaceOver) {
  get_feature(make_java_face(3));
  const ky_face_t& record = engine.record;
  EXPECT_THAT(
      (std::vector<int>{record.rect.left, record.rect.top, record.rect.right, record.rect.bottom, record.id}),
      ElementsAre(1, -2, 3, -4, 10));
  EXPECT_THAT((std::vector<float>{record.score, record.yaw, record.pitch, record.roll, record.eye_dist}),
              ElementsAre(5.5F, 6.5F, 7.5F, 8.5F, 9.5F));
  ASSERT_EQ(record.points_count, 3);
  for (int i = 0; i < 3; ++i) {
    EXPECT_EQ(record.points_array[i].x, static_cast<float>(i) + 0.5F);
    EXPECT_EQ(record.points_array[i].y, static_cast<float>(-i));
  }
  // Rectangle, point array, three points and the result: nothing is deleted on the way.
  EXPECT_EQ(vm.calls("DeleteLocalRef"), 0);
  EXPECT_EQ(vm.live_locals(), 6);
}

/// Beyond the sixteen references that a machine promises, more are asked for before they are made.
TEST_F(VerifierTest, AsksForRoomForManyPoints) {
  for (int count : {0, 1, 13, 14, 31, 256, 1000}) {
    get_feature(make_java_face(count));
    EXPECT_EQ(vm.calls("DeleteLocalRef"), 0);
    const Lines asked = fake::entries("EnsureLocalCapacity");
    if (count <= 13) {
      EXPECT_THAT(asked, ElementsAre());
    } else {
      EXPECT_THAT(asked,
                  ElementsAre("EnsureLocalCapacity(" + std::to_string(16 + std::min(count, 256)) + ")"));
    }
  }
}

TEST_F(VerifierTest, ReadsPointsWithoutThePromiseOfRoom) {
  jobject face = make_java_face(256);
  vm.refuse("EnsureLocalCapacity", 1);
  EXPECT_NE(get_feature(face), nullptr);
  EXPECT_FALSE(vm.exception_pending());
  EXPECT_EQ(engine.record.points_count, 256);
}

TEST_F(VerifierTest, AFaceWithoutPointsHasNone) {
  get_feature(make_java_face(0));
  EXPECT_EQ(engine.record.points_count, 0);
}

TEST_F(VerifierTest, ReadsAsManyPointsAsARecordHolds) {
  for (int count : {255, 256, 257, 1000}) {
    get_feature(make_java_face(count));
    const int read = std::min(count, 256);
    EXPECT_EQ(vm.calls("GetObjectArrayElement"), read);
    ASSERT_EQ(engine.record.points_count, read);
    EXPECT_EQ(engine.record.points_array[read - 1].x, static_cast<float>(read) - 0.5F);
    EXPECT_EQ(engine.record.id, 10);
  }
}

TEST_F(VerifierTest, ReadsNothingOutOfNullParts) {
  jobject face = make_java_face(3);
  vm.at(face).objects["faceRect"] = nullptr;
  vm.at(face).objects["facePoints"]->elements[1] = nullptr;
  EXPECT_NE(get_feature(face), nullptr);
  EXPECT_EQ(
      engine.record.rect.left | engine.record.rect.top | engine.record.rect.right | engine.record.rect.bottom,
      0);
  EXPECT_EQ(engine.record.points_count, 3);
  EXPECT_EQ(engine.record.points_array[1].x, 0);
  EXPECT_EQ(engine.record.points_array[1].y, 0);
  EXPECT_EQ(engine.record.points_array[2].x, 2.5F);
  vm.at(face).objects["facePoints"] = nullptr;
  begin();
  EXPECT_NE(get_feature(face), nullptr);
  EXPECT_EQ(engine.record.points_count, 0);
  EXPECT_EQ(engine.record.score, 5.5F);
}

TEST_F(VerifierTest, SizesTheTextByTheFeature) {
  const struct {
    int length;
    int size;
  } cases[] = {{0, 1}, {1, 5}, {2, 5}, {3, 5}, {4, 9}, {6, 9}, {7, 13}, {510, 681}, {511, 685}, {512, 685}};
  jobject face = make_java_face(0);
  for (const auto& one : cases) {
    begin();
    engine.feature_length = one.length;
    engine.text = std::string(static_cast<size_t>(one.size - 1), 'A');
    jbyteArray text = get_feature(face);
    std::vector<unsigned char> expected(static_cast<size_t>(one.size), 'A');
    expected.back() = 0;
    EXPECT_EQ(vm.bytes(text), expected) << one.length;
    EXPECT_THAT(fake::entries("NewByteArray"), ElementsAre("NewByteArray(" + std::to_string(one.size) + ")"));
  }
}

TEST_F(VerifierTest, RefusesNullArguments) {
  const std::string message = "log 6 FaceAPI: kyFaceVerify image or status or kyface is null";
  jobject face = make_java_face(0);
  EXPECT_EQ(CALL(kyFaceGetFeatureBytes, 0, image, 1, 64, 48, 192, nullptr, status), nullptr);
  expect_journal({"GetByteArrayElements(image)", message, "ReleaseByteArrayElements(image, 0)"});
  EXPECT_EQ(CALL(kyFaceGetFeatureInts, 0x77, ints, 1, 64, 48, 192, face, nullptr), nullptr);
  expect_journal({"GetIntArrayElements(ints)", message, "ReleaseIntArrayElements(ints, 0)"});
  EXPECT_EQ(CALL(kyFaceGetFeatureBytes, 0x77, nullptr, 1, 64, 48, 192, face, status), nullptr);
  expect_journal({message});
  EXPECT_EQ(CALL(kyFaceGetFeatureInts, 0x77, nullptr, 1, 64, 48, 192, face, status), nullptr);
  expect_journal({message});
  CALL(setDebug, JNI_FALSE);
  EXPECT_EQ(CALL(kyFaceGetFeatureBytes, 0x77, nullptr, 1, 64, 48, 192, nullptr, nullptr), nullptr);
  expect_journal({});
  EXPECT_THAT(vm.at(status).words, ElementsAre(-77, 5));
}

TEST_F(VerifierTest, RefusesAZeroHandleWithoutLookingAtTheFace) {
  jobject face = make_java_face(1);
  EXPECT_EQ(CALL(kyFaceGetFeatureBytes, 0, image, 1, 64, 48, 192, face, status), nullptr);
  expect_journal({"GetByteArrayElements(image)",
                  "log 6 FaceAPI: kyFaceVerify ky_verify_get_feature handle is NULL!!",
                  "ReleaseByteArrayElements(image, 0)"});
  EXPECT_THAT(vm.at(status).words, ElementsAre(-77, 5));
}

TEST_F(VerifierTest, AFailedExtractionLeavesTheStatus) {
  engine.result = -9;
  EXPECT_EQ(get_feature(make_java_face(0)), nullptr);
  EXPECT_THAT(fake::entries("log "), ElementsAre("log 6 FaceAPI: kyFaceVerify get feature fail result : -9"));
  EXPECT_EQ(vm.calls("GetIntArrayElements"), 0);
  EXPECT_THAT(fake::entries("ky_verify_release"), ElementsAre());
}

TEST_F(VerifierTest, AnExtractionWithoutAFeatureLeavesTheStatus) {
  engine.feature = nullptr;
  EXPECT_EQ(get_feature(make_java_face(0)), nullptr);
  EXPECT_THAT(fake::entries("log "),
              ElementsAre("log 6 FaceAPI: kyFaceVerify ky_verify_get_feature is null"));
  EXPECT_EQ(vm.calls("GetIntArrayElements"), 0);
}

TEST_F(VerifierTest, KeepsTheFeatureWhenThereIsNoArrayForItsText) {
  jobject face = make_java_face(0);
  vm.refuse("NewByteArray", 1);
  EXPECT_EQ(get_feature(face), nullptr);
  EXPECT_TRUE(vm.exception_pending());
  EXPECT_THAT(vm.at(status).words, ElementsAre(0, 5));
  const Lines& lines = fake::journal();
  EXPECT_THAT(Lines(lines.end() - 5, lines.end()),
              ElementsAre("GetIntArrayElements(status)", "NewByteArray(5)",
                          "log 6 FaceAPI: kyFaceVerify new Feature Failed !! maybe out of memory!!",
                          "ReleaseIntArrayElements(status, 0)", "ReleaseByteArrayElements(image, 0)"));
}

// ---- comparison

TEST_F(VerifierTest, Compares) {
  engine.features = {reinterpret_cast<ky_feature_t>(0xF1), reinterpret_cast<ky_feature_t>(0xF2)};
  engine.value = 0.875F;
  engine.result = 3;
  EXPECT_EQ(compare(), 0.875F);
  EXPECT_THAT(vm.at(status).words, ElementsAre(3, 5));
  expect_journal({"GetByteArrayElements(feature1)", "GetByteArrayElements(feature2)",
                  "ky_verify_deserialize_feature(feature1)", "ky_verify_deserialize_feature(feature2)",
                  "ky_verify_compare_feature(0x77, 0xf1, 0xf2)", "ReleaseByteArrayElements(feature1, 0)",
                  "ReleaseByteArrayElements(feature2, 0)", "ky_verify_release_feature(0xf1)",
                  "ky_verify_release_feature(0xf2)", "GetIntArrayElements(status)",
                  "ReleaseIntArrayElements(status, 0)"});
}

TEST_F(VerifierTest, ComparesFeaturesThatCannotBeRead) {
  engine.store_nothing = true;
  engine.result = -4;
  compare();  // its score means nothing
  EXPECT_THAT(vm.at(status).words, ElementsAre(-4, 5));
  EXPECT_THAT(fake::entries("ky_verify_"),
              ElementsAre("ky_verify_deserialize_feature(feature1)",
                          "ky_verify_deserialize_feature(feature2)", "ky_verify_compare_feature(0x77, 0, 0)",
                          "ky_verify_release_feature(0)", "ky_verify_release_feature(0)"));
}

TEST_F(VerifierTest, ComparesNothingWithNull) {
  EXPECT_EQ(CALL(kyFaceCompareFeature, 0x77, nullptr, feature2, status), 0.0F);
  expect_journal({kFeatureIsNull});
  EXPECT_EQ(CALL(kyFaceCompareFeature, 0x77, feature1, nullptr, status), 0.0F);
  expect_journal({kFeatureIsNull});
  CALL(setDebug, JNI_FALSE);
  EXPECT_EQ(CALL(kyFaceCompareFeature, 0x77, nullptr, nullptr, status), 0.0F);
  expect_journal({});
  EXPECT_THAT(vm.at(status).words, ElementsAre(-77, 5));
}

TEST_F(VerifierTest, AFeatureThatIsPinnedAloneStaysPinned) {
  vm.tolerate_calls_under_exception = true;
  vm.refuse("GetByteArrayElements", 1);
  EXPECT_EQ(compare(), 0.0F);
  EXPECT_EQ(vm.pinned(), Lines{"feature2"});
  expect_journal({"GetByteArrayElements(feature1)", "GetByteArrayElements(feature2)", kFeatureIsNull});

  vm.refuse("GetByteArrayElements", 2);
  EXPECT_EQ(compare(), 0.0F);
  EXPECT_TRUE(vm.exception_pending());
  EXPECT_EQ(vm.pinned(), (Lines{"feature1", "feature2"}));
  EXPECT_THAT(vm.at(status).words, ElementsAre(-77, 5));
  stays_pinned = {"feature1", "feature2"};
}

// ---- deserialisation

TEST_F(VerifierTest, Deserialises) {
  engine.features = {reinterpret_cast<ky_feature_t>(0x12345678F1)};
  EXPECT_EQ(CALL(kyFaceDeserialize, feature1), 0x12345678F1);
  expect_journal({"GetByteArrayElements(feature1)", "ky_verify_deserialize_feature(feature1)",
                  "ReleaseByteArrayElements(feature1, 0)"});
  EXPECT_EQ(CALL(kyFaceDeserialize, feature2), 0);
}

}  // namespace
