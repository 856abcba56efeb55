// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
// The native methods of PlaneConversion where the JVM refuses what they ask for. What they
// convert, and from and to what, is tested in a real one.
#include "bridge_test.h"

#define PLANE_METHOD(method, ...)                                                                           \
  JNIEXPORT jint JNICALL Java_com_vantrel_faceapi_PlaneConversion_##method(                                 \
      JNIEnv*, jclass, jobject y, jobject u, jobject v, jintArray numbers, jint left, jint top, jint width, \
      jint height, jint degrees, jboolean mirrored, __VA_ARGS__)

extern "C" {
PLANE_METHOD(toBytes, jint layout, jbyteArray out, jint from, jint stride);
PLANE_METHOD(toBitmap, jobject bitmap);
}

namespace {

constexpr jint kNoElements = 20;

class PlaneConversionTest : public BridgeTest {
 protected:
  static constexpr int kSide = 2;

  // One 2 x 2 picture: a direct luma plane, chroma samples in arrays of their own.
  jobject y = vm.buffer("y", {100, 100, 100, 100});
  jbyteArray u = vm.byte_array("u", {128});
  jbyteArray v = vm.byte_array("v", {128});
  jintArray numbers = vm.int_array("numbers", {kSide, kSide, 0, 4, 2, 1, 0, 1, 1, 1, 0, 1, 1, 1, 1});
  jbyteArray out = vm.byte_array("out", std::vector<unsigned char>(16, 7));

  jint to_bytes(jobject of_v) {
    return Java_com_vantrel_faceapi_PlaneConversion_toBytes(vm.env(), nullptr, y, u, of_v, numbers, 0, 0,
                                                            kSide, kSide, 0, JNI_FALSE, 0, out, 0, 4 * kSide);
  }
  jint to_bitmap() {
    return Java_com_vantrel_faceapi_PlaneConversion_toBitmap(vm.env(), nullptr, y, u, v, numbers, 0, 0, kSide,
                                                             kSide, 0, JNI_FALSE,
                                                             vm.object("bitmap", "android/graphics/Bitmap"));
  }
};

const std::vector<unsigned char> kGrayPixels = {100, 100, 100, 255, 100, 100, 100, 255,
                                                100, 100, 100, 255, 100, 100, 100, 255};

TEST_F(PlaneConversionTest, ArraysAreBorrowedOnceAndSourcesNotCopiedBack) {
  EXPECT_EQ(to_bytes(v), 0);
  EXPECT_EQ(vm.bytes(out), kGrayPixels);
  expect_journal({"GetArrayLength(numbers)", "GetArrayLength(u)", "GetArrayLength(v)", "GetArrayLength(out)",
                  "GetArrayLength(out)", "GetPrimitiveArrayCritical(u)", "GetPrimitiveArrayCritical(v)",
                  "GetPrimitiveArrayCritical(out)", "ReleasePrimitiveArrayCritical(out, 0)",
                  "ReleasePrimitiveArrayCritical(v, 2)", "ReleasePrimitiveArrayCritical(u, 2)"});
  EXPECT_EQ(to_bytes(u), 0);
  EXPECT_EQ(vm.calls("GetPrimitiveArrayCritical"), 2);
}

TEST_F(PlaneConversionTest, AnArrayOfAllPlanesIsBorrowedOnce) {
  y = vm.byte_array("frame", {100, 100, 100, 100, 128, 128});
  u = static_cast<jbyteArray>(vm.another(y));
  numbers = vm.int_array("numbers", {kSide, kSide, 0, 4, 2, 1, 4, 5, 1, 1, 5, 6, 1, 1, 0});
  EXPECT_EQ(to_bytes(u), 0);
  EXPECT_EQ(vm.bytes(out), kGrayPixels);
  EXPECT_EQ(vm.calls("GetPrimitiveArrayCritical"), 2);
}

TEST_F(PlaneConversionTest, APlaneOfNoBytesIsThereButTooShort) {
  constexpr jint kLuma = 2, kMemory = 16;
  numbers = vm.int_array("numbers", {kSide, kSide, 4, 4, 2, 1, 0, 1, 1, 1, 0, 1, 1, 1, 1});
  EXPECT_EQ(to_bytes(v), kLuma);
  numbers = vm.int_array("numbers", {kSide, kSide, 4, 3, 2, 1, 0, 1, 1, 1, 0, 1, 1, 1, 1});
  EXPECT_EQ(to_bytes(v), kMemory);
  EXPECT_EQ(vm.bytes(out), std::vector<unsigned char>(16, 7));
}

TEST_F(PlaneConversionTest, ARefusedBorrowGivesBackTheOthersAndWritesNothing) {
  for (int refused = 1; refused <= 3; ++refused) {
    begin();
    vm.refuse("GetPrimitiveArrayCritical", refused);
    vm.tolerate_calls_under_exception = true;
    EXPECT_EQ(to_bytes(v), kNoElements);
    EXPECT_TRUE(vm.exception_pending());
    EXPECT_TRUE(vm.pinned().empty());
    EXPECT_EQ(vm.bytes(out), std::vector<unsigned char>(16, 7));
  }
}

TEST_F(PlaneConversionTest, ABitmapIsUnlockedWhateverHappens) {
  fake::bitmap().info = {kSide, kSide, 4 * kSide, ANDROID_BITMAP_FORMAT_RGBA_8888, 0};
  fake::bitmap().pixels.assign(16, 7);
  EXPECT_EQ(to_bitmap(), 0);
  EXPECT_EQ(fake::bitmap().pixels, kGrayPixels);
  EXPECT_EQ(fake::bitmap().locks, 0);

  fake::bitmap().pixels.assign(16, 7);
  for (int refused = 1; refused <= 2; ++refused) {
    begin();
    vm.refuse("GetPrimitiveArrayCritical", refused);
    vm.tolerate_calls_under_exception = true;
    EXPECT_EQ(to_bitmap(), kNoElements);
    EXPECT_EQ(fake::bitmap().locks, 0);
    EXPECT_EQ(fake::bitmap().pixels, std::vector<unsigned char>(16, 7));
  }
}

}  // namespace
