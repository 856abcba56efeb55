// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// An engine that does not keep to its contract: what it says of its results is believed as far as the bridge
// cannot know better, and nothing outside them is touched.
#include <functional>
#include <limits>

#include "bridge_test.h"

namespace {

using testing::ElementsAre;

constexpr int kLeast = std::numeric_limits<int>::min();
constexpr int kMost = std::numeric_limits<int>::max();

class StrangeEngineTest : public BridgeTest {
 protected:
  /// A native method that analyses an image, and what gives its result back to the engine.
  struct Method {
    const char* name;
    std::function<jobjectArray()> call;
    std::string release;
  };

  StrangeEngineTest() {
    engine.text = "";
    vm.at(face).objects = {{"faceRect", nullptr}, {"facePoints", nullptr}};
  }

  /// Runs `check` over every method that returns faces, `faces` being what the engine finds.
  void for_each_method(const std::vector<ky_face_t>& faces, const std::function<void(const Method&)>& check) {
    const Method methods[] = {
        {"kyFaceDetectBytes", [&] { return CALL(kyFaceDetectBytes, 0x77, bytes, 1, 2, 2, 8, 0, status); },
         "ky_face_release_detector_result("},
        {"kyFaceDetectInts", [&] { return CALL(kyFaceDetectInts, 0x77, ints, 1, 2, 2, 8, 0, status); },
         "ky_face_release_detector_result("},
        {"kyFaceTrackBytes", [&] { return CALL(kyFaceTrackBytes, 0x77, bytes, 1, 2, 2, 8, 0, status); },
         "ky_face_release_tracker_result("},
        {"kyFaceTrackInts", [&] { return CALL(kyFaceTrackInts, 0x77, ints, 1, 2, 2, 8, 0, status); },
         "ky_face_release_tracker_result("},
    };
    engine.faces = faces;
    for (const Method& method : methods) {
      SCOPED_TRACE(method.name);
      vm.at(status).words[0] = -77;
      begin();
      check(method);
      EXPECT_EQ(vm.at(status).words[0], engine.result);
      EXPECT_TRUE(vm.pinned().empty());
    }
  }

  jbyteArray bytes = vm.byte_array("bytes", {1, 2, 3, 4});
  jintArray ints = vm.int_array("ints", {5});
  jintArray status = vm.int_array("status", {-77});
  jobject face = vm.object("face", kFaceInfoClass);
};

TEST_F(StrangeEngineTest, ACountBelowOneIsNoFace) {
  for (const int count : {0, -1, -3, kLeast}) {
    engine.count = count;
    for_each_method({make_face(1, 1)}, [&](const Method& method) {
      EXPECT_EQ(method.call(), nullptr);
      EXPECT_EQ(vm.calls("NewObjectArray"), 0);
      EXPECT_THAT(fake::entries(method.release),
                  ElementsAre(method.release + "faces, " + std::to_string(count) + ")"));
    });
  }
}

TEST_F(StrangeEngineTest, ACountWithoutFacesIsNoFace) {
  engine.null_faces = true;
  for (const int count : {1, 3, kMost}) {
    engine.count = count;
    for_each_method({make_face(1, 1)}, [&](const Method& method) {
      EXPECT_EQ(method.call(), nullptr);
      EXPECT_EQ(vm.calls("NewObjectArray"), 0);
      EXPECT_THAT(fake::entries(method.release),
                  ElementsAre(method.release + "null, " + std::to_string(count) + ")"));
    });
  }
}

// No JVM has room for so many: none of them is read. A count that it has room for, of faces that
// are not there, is one that the bridge cannot tell from a true one.
TEST_F(StrangeEngineTest, ACountThatTheMachineHasNoMemoryForIsNoFace) {
  engine.count = kMost;
  for_each_method({make_face(1, 1)}, [&](const Method& method) {
    EXPECT_EQ(method.call(), nullptr);
    EXPECT_TRUE(vm.exception_pending());
    EXPECT_EQ(vm.calls("NewObjectV"), 0);
    EXPECT_THAT(fake::entries(method.release), ElementsAre(method.release + "faces, 2147483647)"));
  });
}

TEST_F(StrangeEngineTest, FacesAfterAFailureAreNotLookedAt) {
  engine.count = kMost;
  for (const int result : {1, -1, kLeast}) {
    engine.result = result;
    for_each_method({make_face(1, kMost)}, [&](const Method& method) {
      EXPECT_EQ(method.call(), nullptr);
      EXPECT_FALSE(vm.exception_pending());
      EXPECT_EQ(vm.calls("NewObjectArray"), 0);
      EXPECT_EQ(fake::entries(method.release).size(), 1U);
    });
  }
}

// The last face's record ends where the engine's memory does, so that reading a point beyond it is not
// overlooked by an address check.
TEST_F(StrangeEngineTest, APointsCountBeyondTheRecordIsCutOff) {
  const std::vector<ky_face_t> faces = {make_face(1, 0),    make_face(2, -1),  make_face(3, kLeast),
                                        make_face(4, 1),    make_face(5, 256), make_face(6, 257),
                                        make_face(7, kMost)};
  const size_t sizes[] = {0, 0, 0, 1, 256, 256, 256};
  for_each_method(faces, [&](const Method& method) {
    jobjectArray java_faces = method.call();
    ASSERT_NE(java_faces, nullptr);
    const std::vector<fake::Object*>& elements = vm.at(java_faces).elements;
    ASSERT_EQ(elements.size(), faces.size());
    for (size_t i = 0; i < faces.size(); ++i) {
      const std::vector<fake::Object*>& points = elements[i]->objects.at("facePoints")->elements;
      ASSERT_EQ(points.size(), sizes[i]) << faces[i].points_count;
      for (size_t k = 0; k < points.size(); ++k) {
        ASSERT_EQ(points[k]->floats.at("x"), faces[i].points_array[k].x);
      }
    }
  });
}

// A feature's text is as long as the length makes it, in unsigned 32-bit arithmetic. What becomes longer than
// Java's arrays, or negative, is refused by the JVM.
TEST_F(StrangeEngineTest, AFeaturesLengthIsTakenAsUnsigned) {
  const struct {
    int length;
    const char* call;
    bool fails;
  } cases[] = {{0, "NewByteArray(1)", false},
               {-1, "NewByteArray(1)", false},
               {-2, "NewByteArray(1)", false},
               {-3, "NewByteArray(1431655765)", true},
               {kLeast, "NewByteArray(-1431655763)", true},
               {kMost, "NewByteArray(-1431655763)", true}};
  for (const auto& one : cases) {
    SCOPED_TRACE(one.length);
    engine.feature_length = one.length;
    for (const bool of_bytes : {true, false}) {
      begin();
      jbyteArray text = of_bytes ? CALL(kyFaceGetFeatureBytes, 0x77, bytes, 1, 2, 2, 8, face, status)
                                 : CALL(kyFaceGetFeatureInts, 0x77, ints, 1, 2, 2, 8, face, status);
      EXPECT_THAT(fake::entries("NewByteArray"), ElementsAre(one.call));
      EXPECT_EQ(text == nullptr, one.fails);
      EXPECT_EQ(vm.exception_pending(), one.fails);
      EXPECT_EQ(fake::entries("ky_verify_serialize").size(), one.fails ? 0U : 1U);
      EXPECT_TRUE(vm.pinned().empty());
    }
  }
}

}  // namespace
