// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// What the tests of the native methods share: a JVM that has loaded the library, a fresh engine,
/// and an empty journal.
#pragma once

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <string>
#include <vector>

#include "fake_engine.h"
#include "fake_platform.h"
#include "fake_vm.h"
#include "jni/java_declarations.h"
#include "journal.h"

/// Calls a native method in the fixture's JVM.
#define CALL(method, ...) \
  Java_com_vantrel_faceapi_FaceLibrary_##method(vm.env(), nullptr __VA_OPT__(, ) __VA_ARGS__)

constexpr char kFaceInfoClass[] = "com/vantrel/faceapi/model/FaceInfo";
constexpr char kRectClass[] = "android/graphics/Rect";
constexpr char kPointFClass[] = "android/graphics/PointF";

class BridgeTest : public testing::Test {
 protected:
  BridgeTest() {
    fake::engine() = {};
    fake::engine().vm = &vm;
    fake::bitmap() = {};
    EXPECT_EQ(JNI_OnLoad(vm.java_vm(), nullptr), JNI_VERSION_1_6);
    CALL(setDebug, JNI_TRUE);
    begin();
  }

  /// Whatever a test does, what was borrowed is given back, except for what it expects to stay.
  ~BridgeTest() override {
    EXPECT_EQ(vm.pinned(), stays_pinned);
    EXPECT_EQ(fake::bitmap().locks, 0);
    EXPECT_EQ(vm.globals(), 3);
  }

  /// Starts the next call with an empty journal.
  void begin() {
    fake::journal().clear();
    vm.begin_call();
  }

  using Lines = std::vector<std::string>;

  /// Compares the whole journal since `begin`, then empties it.
  void expect_journal(const Lines& lines) {
    EXPECT_EQ(fake::journal(), lines);
    begin();
  }

  /// Arrays and strings that are pinned at the end of the test, sorted by name.
  Lines stays_pinned;

  fake::Vm vm;
  fake::Engine& engine = fake::engine();
};

/// A FaceInfo with every field distinct and `count` points (i + 0.5, -i).
inline jobject make_java_face(fake::Vm& vm, int count) {
  jobject face = vm.object("face", kFaceInfoClass);
  fake::Object& rect = vm.at(vm.object("rect", kRectClass));
  rect.ints = {{"left", 1}, {"top", -2}, {"right", 3}, {"bottom", -4}};
  std::vector<fake::Object*> points;
  for (int i = 0; i < count; ++i) {
    fake::Object& point = vm.at(vm.object("point" + std::to_string(i), kPointFClass));
    point.floats = {{"x", static_cast<float>(i) + 0.5F}, {"y", static_cast<float>(-i)}};
    points.push_back(&point);
  }
  vm.at(face).objects = {{"faceRect", &rect},
                         {"facePoints", &vm.at(vm.object_array("points", kPointFClass, points))}};
  vm.at(face).floats = {{"score", 5.5F}, {"yaw", 6.5F}, {"pitch", 7.5F}, {"roll", 8.5F}, {"eyeDist", 9.5F}};
  vm.at(face).ints = {{"id", 10}};
  return face;
}

/// A record with every field distinct; its points are (seed + i, -i).
inline ky_face_t make_face(int seed, int points_count) {
  ky_face_t face = {};
  face.rect = {seed + 1, seed + 2, seed + 3, seed + 4};
  face.score = static_cast<float>(seed) + 0.5F;
  face.points_count = points_count;
  face.yaw = static_cast<float>(seed) + 0.25F;
  face.pitch = static_cast<float>(seed) - 0.25F;
  face.roll = static_cast<float>(seed) - 0.5F;
  face.eye_dist = static_cast<float>(seed) + 0.75F;
  face.id = seed + 9;
  for (int i = 0; i < KY_FACE_MAX_POINTS; ++i) {
    face.points_array[i] = {static_cast<float>(seed + i), static_cast<float>(-i)};
  }
  return face;
}
