// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// The tracker's native methods. The conversion of faces is the detector's and is tested there.
#include "bridge_test.h"

namespace {

using testing::ElementsAre;

class TrackerTest : public BridgeTest {
 protected:
  jobjectArray track() { return CALL(kyFaceTrackBytes, 0x77, image, 1, 64, 48, 192, 2, status); }

  jbyteArray image = vm.byte_array("image", {1, 2, 3, 4});
  jintArray ints = vm.int_array("ints", {5, 6, 7});
  jintArray status = vm.int_array("status", {-77, 5});
};

// ---- create, destroy, reset

TEST_F(TrackerTest, CreatesTwiceAndReturnsTheSecond) {
  EXPECT_EQ(CALL(kyFaceCreateTracker, vm.string("path", "/models/t.bin"), 123, 7), 0x1002);
  expect_journal({"GetStringUTFChars(path)", "log 3 FaceAPI: ky_face_create_tracker config : 7",
                  "ky_face_create_tracker(/models/t.bin, 7)", "ky_face_create_tracker(/models/t.bin, 7)",
                  "ReleaseStringUTFChars(path)"});
}

TEST_F(TrackerTest, HandsANullPathOn) {
  CALL(setDebug, JNI_FALSE);
  EXPECT_EQ(CALL(kyFaceCreateTracker, nullptr, 0, -7), 0x1002);
  expect_journal({"ky_face_create_tracker(null, -7)", "ky_face_create_tracker(null, -7)"});
}

TEST_F(TrackerTest, AFailedFirstCreationIsTheOnlyOneAndKeepsThePathsCharacters) {
  engine.create_results = {-12};
  EXPECT_EQ(CALL(kyFaceCreateTracker, vm.string("path", "/models/t.bin"), 0, 7), 0);
  expect_journal({"GetStringUTFChars(path)", "log 3 FaceAPI: ky_face_create_tracker config : 7",
                  "ky_face_create_tracker(/models/t.bin, 7)",
                  "log 6 FaceAPI: kyFaceCreateTracker create handle fail result code : -12"});
  CALL(setDebug, JNI_FALSE);
  engine.create_results = {1};
  EXPECT_EQ(CALL(kyFaceCreateTracker, nullptr, 0, 7), 0);
  expect_journal({"ky_face_create_tracker(null, 7)"});
  stays_pinned = {"path"};
}

TEST_F(TrackerTest, AFailedSecondCreationIsZeroInSilence) {
  engine.create_results = {0, -12};
  EXPECT_EQ(CALL(kyFaceCreateTracker, vm.string("path", "/models/t.bin"), 0, 7), 0);
  expect_journal({"GetStringUTFChars(path)", "log 3 FaceAPI: ky_face_create_tracker config : 7",
                  "ky_face_create_tracker(/models/t.bin, 7)", "ky_face_create_tracker(/models/t.bin, 7)",
                  "ReleaseStringUTFChars(path)"});
}

TEST_F(TrackerTest, DoesNotCreateTheBuiltInTrackerWhenThePathIsRefused) {
  vm.refuse("GetStringUTFChars", 1);
  EXPECT_EQ(CALL(kyFaceCreateTracker, vm.string("path", "/models/t.bin"), 0, 7), 0);
  EXPECT_TRUE(vm.exception_pending());
  expect_journal({"GetStringUTFChars(path)"});
}

TEST_F(TrackerTest, Destroys) {
  CALL(kyFaceDestroyTracker, 0x77);
  expect_journal({"ky_face_destroy_tracker(0x77)", "log 2 FaceAPI: ky_face_destroy_tracker"});
  CALL(kyFaceDestroyTracker, 0);
  expect_journal({"log 6 FaceAPI: kyFaceDestroyTracker destroy handle is null"});
  CALL(setDebug, JNI_FALSE);
  CALL(kyFaceDestroyTracker, 0x77);
  CALL(kyFaceDestroyTracker, 0);
  expect_journal({"ky_face_destroy_tracker(0x77)"});
}

TEST_F(TrackerTest, ResetsWhateverTheHandle) {
  CALL(kyFaceResetTracker, 0x77);
  expect_journal({"ky_face_reset_tracker(0x77)", "log 2 FaceAPI: ky_face_reset_tracker"});
  CALL(setDebug, JNI_FALSE);
  CALL(kyFaceResetTracker, 0);
  expect_journal({"ky_face_reset_tracker(0)"});
}

// ---- settings

TEST_F(TrackerTest, SettersReturnTheEnginesCode) {
  for (jlong handle : {0x77, 0}) {
    const std::string prefix = handle == 0 ? "(0, " : "(0x77, ";
    engine.result = -5;
    EXPECT_EQ(CALL(kyFaceTrackSetDetectFaceCntLimit, handle, 4), -5);
    expect_journal({"ky_face_track_set_detect_face_cnt_limit" + prefix + "4)"});
    engine.result = 6;
    EXPECT_EQ(CALL(kyFaceTrackSetDetectInterval, handle, -30), 6);
    expect_journal({"ky_face_track_set_detect_interval" + prefix + "-30)"});
    engine.result = 0;
    EXPECT_EQ(CALL(kyFaceTrackSetAlignmentThreshold, handle, 50), 0);
    expect_journal({"ky_face_track_set_alignment_threshold" + prefix + "50)"});
  }
}

// ---- tracking

TEST_F(TrackerTest, TracksInBytes) {
  engine.faces = {make_face(10, 0)};
  jobjectArray faces = track();
  ASSERT_NE(faces, nullptr);
  EXPECT_EQ(vm.at(faces).elements.at(0)->ints.at("id"), 19);
  EXPECT_THAT(vm.at(status).words, ElementsAre(0, 5));
  EXPECT_EQ(vm.live_locals(), 1);
  const Lines& lines = fake::journal();
  EXPECT_THAT(Lines(lines.begin(), lines.begin() + 4),
              ElementsAre("GetByteArrayElements(image)", "GetIntArrayElements(status)",
                          "ky_face_track(0x77, image, 1, 64, 48, 192, 2)",
                          "NewObjectArray(1, com/vantrel/faceapi/model/FaceInfo)"));
  EXPECT_THAT(Lines(lines.end() - 4, lines.end()),
              ElementsAre("DeleteLocalRef(FaceInfo#1)", "ky_face_release_tracker_result(faces, 1)",
                          "ReleaseIntArrayElements(status, 0)", "ReleaseByteArrayElements(image, 0)"));
}

TEST_F(TrackerTest, TracksInInts) {
  EXPECT_EQ(CALL(kyFaceTrackInts, 0x77, ints, -1, -2, -3, -4, -5, status), nullptr);
  EXPECT_THAT(vm.at(status).words, ElementsAre(0, 5));
  expect_journal({"GetIntArrayElements(ints)", "GetIntArrayElements(status)",
                  "ky_face_track(0x77, ints, -1, -2, -3, -4, -5)", "ky_face_release_tracker_result(null, 0)",
                  "ReleaseIntArrayElements(status, 0)", "ReleaseIntArrayElements(ints, 0)"});
}

TEST_F(TrackerTest, AnEngineFailureIsNullAndItsResultGoesBack) {
  engine.result = -9;
  engine.faces = {make_face(1, 1)};
  EXPECT_EQ(track(), nullptr);
  EXPECT_THAT(vm.at(status).words, ElementsAre(-9, 5));
  expect_journal({"GetByteArrayElements(image)", "GetIntArrayElements(status)",
                  "ky_face_track(0x77, image, 1, 64, 48, 192, 2)", "ky_face_release_tracker_result(faces, 1)",
                  "ReleaseIntArrayElements(status, 0)", "ReleaseByteArrayElements(image, 0)"});
}

TEST_F(TrackerTest, ANullImageIsRefused) {
  EXPECT_EQ(CALL(kyFaceTrackBytes, 0x77, nullptr, 1, 64, 48, 192, 2, status), nullptr);
  expect_journal({"log 3 FaceAPI: track input image is null"});
  EXPECT_EQ(CALL(kyFaceTrackInts, 0x77, nullptr, 1, 64, 48, 192, 2, status), nullptr);
  expect_journal({"log 3 FaceAPI: track input image is null"});
  CALL(setDebug, JNI_FALSE);
  EXPECT_EQ(CALL(kyFaceTrackInts, 0x77, nullptr, 1, 64, 48, 192, 2, status), nullptr);
  expect_journal({});
  EXPECT_THAT(vm.at(status).words, ElementsAre(-77, 5));
}

TEST_F(TrackerTest, ANullStatusIsRefusedInSilence) {
  EXPECT_EQ(CALL(kyFaceTrackInts, 0, ints, 1, 64, 48, 192, 2, nullptr), nullptr);
  expect_journal({"GetIntArrayElements(ints)", "ReleaseIntArrayElements(ints, 0)"});
}

TEST_F(TrackerTest, AZeroHandleIsRefused) {
  EXPECT_EQ(CALL(kyFaceTrackBytes, 0, image, 1, 64, 48, 192, 2, status), nullptr);
  expect_journal({"GetByteArrayElements(image)", "log 6 FaceAPI: kyFaceTrack handle is null",
                  "ReleaseByteArrayElements(image, 0)"});
  CALL(setDebug, JNI_FALSE);
  EXPECT_EQ(CALL(kyFaceTrackInts, 0, ints, 1, 64, 48, 192, 2, status), nullptr);
  expect_journal({"GetIntArrayElements(ints)", "ReleaseIntArrayElements(ints, 0)"});
  EXPECT_THAT(vm.at(status).words, ElementsAre(-77, 5));
}

}  // namespace
