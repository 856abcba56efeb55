// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// The detector's native methods, and the conversion of faces to Java.
#include <limits>

#include "bridge_test.h"

namespace {

using testing::ElementsAre;

class DetectorTest : public BridgeTest {
 protected:
  jobjectArray detect() { return CALL(kyFaceDetectBytes, 0x77, image, 1, 64, 48, 192, 2, status); }

  const fake::Object& face(jobjectArray faces, size_t index) { return *vm.at(faces).elements.at(index); }

  jbyteArray image = vm.byte_array("image", {1, 2, 3, 4});
  jintArray ints = vm.int_array("ints", {5, 6, 7});
  jintArray status = vm.int_array("status", {-77, 5});
};

// ---- create and destroy

TEST_F(DetectorTest, CreatesFromAModelFile) {
  EXPECT_EQ(CALL(kyFaceCreateDetector, vm.string("path", "/models/d.bin"), 7), 0x1001);
  expect_journal({"GetStringUTFChars(path)", "ky_face_create_detector(/models/d.bin, 7)",
                  "ReleaseStringUTFChars(path)"});
}

TEST_F(DetectorTest, HandsANullPathOn) {
  EXPECT_EQ(CALL(kyFaceCreateDetector, nullptr, -3), 0x1001);
  expect_journal({"ky_face_create_detector(null, -3)"});
}

TEST_F(DetectorTest, AFailedCreationKeepsThePathsCharacters) {
  engine.create_results = {-12, 5};
  EXPECT_EQ(CALL(kyFaceCreateDetector, vm.string("path", "/models/d.bin"), 7), 0);
  expect_journal({"GetStringUTFChars(path)", "ky_face_create_detector(/models/d.bin, 7)",
                  "log 6 FaceAPI: FaceCreateDetector create handle fail : -12"});
  CALL(setDebug, JNI_FALSE);
  EXPECT_EQ(CALL(kyFaceCreateDetector, nullptr, 7), 0);
  expect_journal({"ky_face_create_detector(null, 7)"});
  stays_pinned = {"path"};
}

TEST_F(DetectorTest, DoesNotCreateTheBuiltInDetectorWhenThePathIsRefused) {
  vm.refuse("GetStringUTFChars", 1);
  EXPECT_EQ(CALL(kyFaceCreateDetector, vm.string("path", "/models/d.bin"), 7), 0);
  EXPECT_TRUE(vm.exception_pending());
  expect_journal({"GetStringUTFChars(path)"});
}

TEST_F(DetectorTest, Destroys) {
  CALL(kyFaceDestroyDetector, 0x77);
  expect_journal({"ky_face_destroy_detector(0x77)", "log 3 FaceAPI: ky_face_destroy_detector"});
  CALL(kyFaceDestroyDetector, 0);
  expect_journal({"log 6 FaceAPI: kyFaceDestroyDetector destroy detect handle is null"});
  CALL(setDebug, JNI_FALSE);
  CALL(kyFaceDestroyDetector, 0x77);
  CALL(kyFaceDestroyDetector, 0);
  expect_journal({"ky_face_destroy_detector(0x77)"});
}

TEST_F(DetectorTest, CarriesAllBitsOfAHandle) {
  CALL(kyFaceDestroyDetector, static_cast<jlong>(0x8765432187654321ULL));
  EXPECT_EQ(fake::journal().at(0), "ky_face_destroy_detector(0x8765432187654321)");
}

// ---- threshold

TEST_F(DetectorTest, GetsTheThreshold) {
  engine.value = 0.75F;
  engine.result = 3;
  EXPECT_EQ(CALL(getDetectThreshold, 0x77, status), 0.75F);
  EXPECT_THAT(vm.at(status).words, ElementsAre(3, 5));
  expect_journal({"ky_face_detect_get_threshold(0x77, 0)",
                  "log 3 FaceAPI: ky_face_detect_get_threshold threshold: 0.750000",
                  "GetIntArrayElements(status)", "ReleaseIntArrayElements(status, 0)"});
}

TEST_F(DetectorTest, AThresholdThatTheEngineDoesNotStoreIsZero) {
  engine.store_nothing = true;
  engine.result = -1;
  CALL(setDebug, JNI_FALSE);
  EXPECT_EQ(CALL(getDetectThreshold, 0, status), 0.0F);
  EXPECT_THAT(vm.at(status).words, ElementsAre(-1, 5));
  expect_journal({"ky_face_detect_get_threshold(0, 0)", "GetIntArrayElements(status)",
                  "ReleaseIntArrayElements(status, 0)"});
}

TEST_F(DetectorTest, SetsTheThreshold) {
  engine.result = 4;
  CALL(setDetectThreshold, 0x77, 0.5F, status);
  EXPECT_THAT(vm.at(status).words, ElementsAre(4, 5));
  expect_journal({"ky_face_detect_set_threshold(0x77, 0.5)",
                  "log 3 FaceAPI: ky_face_detect_set_threshold threshold: 0.500000",
                  "GetIntArrayElements(status)", "ReleaseIntArrayElements(status, 0)"});
}

TEST_F(DetectorTest, DoesNotSetAThresholdThatIsNotPositive) {
  for (float threshold : {0.0F, -0.0F, -0.5F, -std::numeric_limits<float>::infinity()}) {
    CALL(setDetectThreshold, 0x77, threshold, status);
  }
  EXPECT_THAT(vm.at(status).words, ElementsAre(-77, 5));
  expect_journal({});
}

TEST_F(DetectorTest, HandsANotANumberThresholdOn) {
  CALL(setDebug, JNI_FALSE);
  CALL(setDetectThreshold, 0x77, std::numeric_limits<float>::quiet_NaN(), status);
  EXPECT_THAT(vm.at(status).words, ElementsAre(0, 5));
  expect_journal({"ky_face_detect_set_threshold(0x77, nan)", "GetIntArrayElements(status)",
                  "ReleaseIntArrayElements(status, 0)"});
}

// ---- detection

TEST_F(DetectorTest, DetectsInBytes) {
  engine.faces = {make_face(10, 2)};
  jobjectArray faces = detect();
  ASSERT_NE(faces, nullptr);
  expect_journal({
      "GetByteArrayElements(image)",
      "GetIntArrayElements(status)",
      "ky_face_detect(0x77, image, 1, 64, 48, 192, 2)",
      "NewObjectArray(1, com/vantrel/faceapi/model/FaceInfo)",
      "NewObject(com/vantrel/faceapi/model/FaceInfo)",
      "NewObject(android/graphics/Rect)",
      "SetIntField(Rect#1.left, 11)",
      "SetIntField(Rect#1.top, 12)",
      "SetIntField(Rect#1.right, 13)",
      "SetIntField(Rect#1.bottom, 14)",
      "SetObjectField(FaceInfo#1.faceRect, Rect#1)",
      "NewObjectArray(2, android/graphics/PointF)",
      "NewObject(android/graphics/PointF)",
      "SetFloatField(PointF#1.x, 10)",
      "SetFloatField(PointF#1.y, 0)",
      "SetObjectArrayElement(PointF[]#1, 0, PointF#1)",
      "DeleteLocalRef(PointF#1)",
      "NewObject(android/graphics/PointF)",
      "SetFloatField(PointF#2.x, 11)",
      "SetFloatField(PointF#2.y, -1)",
      "SetObjectArrayElement(PointF[]#1, 1, PointF#2)",
      "DeleteLocalRef(PointF#2)",
      "SetObjectField(FaceInfo#1.facePoints, PointF[]#1)",
      "SetFloatField(FaceInfo#1.score, 10.5)",
      "SetFloatField(FaceInfo#1.yaw, 10.25)",
      "SetFloatField(FaceInfo#1.pitch, 9.75)",
      "SetFloatField(FaceInfo#1.roll, 9.5)",
      "SetFloatField(FaceInfo#1.eyeDist, 10.75)",
      "SetIntField(FaceInfo#1.id, 19)",
      "DeleteLocalRef(PointF[]#1)",
      "DeleteLocalRef(Rect#1)",
      "SetObjectArrayElement(FaceInfo[]#1, 0, FaceInfo#1)",
      "DeleteLocalRef(FaceInfo#1)",
      "ky_face_release_detector_result(faces, 1)",
      "ReleaseIntArrayElements(status, 0)",
      "ReleaseByteArrayElements(image, 0)",
  });
  EXPECT_THAT(vm.at(status).words, ElementsAre(0, 5));
}

TEST_F(DetectorTest, DetectsInInts) {
  engine.faces = {make_face(10, 0)};
  jobjectArray faces = CALL(kyFaceDetectInts, 0x77, ints, -1, -2, -3, -4, -5, status);
  ASSERT_NE(faces, nullptr);
  const Lines& lines = fake::journal();
  EXPECT_THAT(Lines(lines.begin(), lines.begin() + 3),
              ElementsAre("GetIntArrayElements(ints)", "GetIntArrayElements(status)",
                          "ky_face_detect(0x77, ints, -1, -2, -3, -4, -5)"));
  EXPECT_THAT(Lines(lines.end() - 3, lines.end()),
              ElementsAre("ky_face_release_detector_result(faces, 1)", "ReleaseIntArrayElements(status, 0)",
                          "ReleaseIntArrayElements(ints, 0)"));
}

TEST_F(DetectorTest, AFaceWithoutPointsHasAnEmptyArray) {
  engine.faces = {make_face(1, 0)};
  jobjectArray faces = detect();
  const fake::Object* points = face(faces, 0).objects.at("facePoints");
  ASSERT_NE(points, nullptr);
  EXPECT_EQ(points->elements.size(), 0U);
}

TEST_F(DetectorTest, ConvertsEveryFaceWithoutPilingUpReferences) {
  for (int i = 0; i < 40; ++i) {
    engine.faces.push_back(make_face(100 * i, i * 256 / 39));
  }
  jobjectArray faces = detect();
  ASSERT_EQ(vm.at(faces).elements.size(), 40U);
  EXPECT_EQ(vm.live_locals(), 1);  // the result
  EXPECT_LE(vm.peak_locals(), 5);  // result, face, rectangle, points, point
  for (size_t i = 0; i < 40; ++i) {
    const ky_face_t& record = engine.faces[i];
    const fake::Object& object = face(faces, i);
    const fake::Object& rect = *object.objects.at("faceRect");
    EXPECT_EQ(rect.ints.at("left"), record.rect.left);
    EXPECT_EQ(rect.ints.at("bottom"), record.rect.bottom);
    EXPECT_EQ(object.floats.at("score"), record.score);
    EXPECT_EQ(object.ints.at("id"), record.id);
    const std::vector<fake::Object*>& points = object.objects.at("facePoints")->elements;
    ASSERT_EQ(points.size(), static_cast<size_t>(record.points_count));
    for (size_t k = 0; k < points.size(); ++k) {
      EXPECT_EQ(points[k]->floats.at("x"), record.points_array[k].x);
      EXPECT_EQ(points[k]->floats.at("y"), record.points_array[k].y);
    }
  }
}

TEST_F(DetectorTest, NoFaceIsNull) {
  EXPECT_EQ(detect(), nullptr);
  EXPECT_THAT(vm.at(status).words, ElementsAre(0, 5));
  expect_journal({"GetByteArrayElements(image)", "GetIntArrayElements(status)",
                  "ky_face_detect(0x77, image, 1, 64, 48, 192, 2)",
                  "ky_face_release_detector_result(null, 0)", "ReleaseIntArrayElements(status, 0)",
                  "ReleaseByteArrayElements(image, 0)"});
}

TEST_F(DetectorTest, AnEngineFailureIsNullAndItsResultGoesBack) {
  engine.result = -9;
  engine.faces = {make_face(1, 1), make_face(2, 1)};
  EXPECT_EQ(detect(), nullptr);
  EXPECT_THAT(vm.at(status).words, ElementsAre(-9, 5));
  expect_journal({"GetByteArrayElements(image)", "GetIntArrayElements(status)",
                  "ky_face_detect(0x77, image, 1, 64, 48, 192, 2)",
                  "ky_face_release_detector_result(faces, 2)", "ReleaseIntArrayElements(status, 0)",
                  "ReleaseByteArrayElements(image, 0)"});
}

TEST_F(DetectorTest, ANullImageIsRefused) {
  EXPECT_EQ(CALL(kyFaceDetectBytes, 0x77, nullptr, 1, 64, 48, 192, 2, status), nullptr);
  expect_journal({"log 3 FaceAPI: detect input image is null"});
  EXPECT_EQ(CALL(kyFaceDetectInts, 0x77, nullptr, 1, 64, 48, 192, 2, status), nullptr);
  expect_journal({"log 3 FaceAPI: detect input image is null"});
  CALL(setDebug, JNI_FALSE);
  EXPECT_EQ(CALL(kyFaceDetectBytes, 0x77, nullptr, 1, 64, 48, 192, 2, status), nullptr);
  expect_journal({});
  EXPECT_THAT(vm.at(status).words, ElementsAre(-77, 5));
}

TEST_F(DetectorTest, ANullStatusIsRefusedInSilence) {
  EXPECT_EQ(CALL(kyFaceDetectBytes, 0, image, 1, 64, 48, 192, 2, nullptr), nullptr);
  expect_journal({"GetByteArrayElements(image)", "ReleaseByteArrayElements(image, 0)"});
}

TEST_F(DetectorTest, AZeroHandleIsRefused) {
  EXPECT_EQ(CALL(kyFaceDetectInts, 0, ints, 1, 64, 48, 192, 2, status), nullptr);
  expect_journal({"GetIntArrayElements(ints)", "log 6 FaceAPI: kyFaceDetect detect handle is null",
                  "ReleaseIntArrayElements(ints, 0)"});
  CALL(setDebug, JNI_FALSE);
  EXPECT_EQ(CALL(kyFaceDetectBytes, 0, image, 1, 64, 48, 192, 2, status), nullptr);
  expect_journal({"GetByteArrayElements(image)", "ReleaseByteArrayElements(image, 0)"});
  EXPECT_THAT(vm.at(status).words, ElementsAre(-77, 5));
}

// ---- model information

TEST_F(DetectorTest, ShowsTheInsideModel) {
  engine.result = 42;
  EXPECT_EQ(CALL(kyFaceShowInsideModel), 42);
  expect_journal({"ky_face_algorithm_info()"});
}

}  // namespace
