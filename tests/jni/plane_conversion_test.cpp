// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
// The native methods of PlaneConversion: into whose memory they convert, what they refuse, and what the JVM
// refuses them. What they convert is tested in a real one.
#include <utility>

#include "bridge_test.h"

#define PLANE_METHOD(method, ...)                                                                           \
  JNIEXPORT jint JNICALL Java_com_vantrel_faceapi_PlaneConversion_##method(                                 \
      JNIEnv*, jclass, jobject y, jobject u, jobject v, jintArray numbers, jint left, jint top, jint width, \
      jint height, jint degrees, jboolean mirrored, __VA_ARGS__)

extern "C" {
PLANE_METHOD(toBytes, jint layout, jbyteArray out, jint from, jint stride);
PLANE_METHOD(toInts, jint layout, jintArray out, jint from, jint stride);
PLANE_METHOD(toBuffer, jint layout, jobject out, jint from, jint to, jint stride);
PLANE_METHOD(toBitmap, jobject bitmap);
}

namespace {

constexpr jint kMemory = 16;
constexpr jint kNotLocked = 17;
constexpr jint kNotRgba = 18;
constexpr jint kSmall = 19;
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

  jint to_bytes(jobject of_v, jint from = 0) {
    return Java_com_vantrel_faceapi_PlaneConversion_toBytes(
        vm.env(), nullptr, y, u, of_v, numbers, 0, 0, kSide, kSide, 0, JNI_FALSE, 0, out, from, 4 * kSide);
  }
  jint to_ints(jintArray words, jint from) {
    return Java_com_vantrel_faceapi_PlaneConversion_toInts(vm.env(), nullptr, y, u, v, numbers, 0, 0, kSide,
                                                           kSide, 0, JNI_FALSE, 0, words, from, kSide);
  }
  jint to_buffer(jobject buffer, jint from, jint to) {
    return Java_com_vantrel_faceapi_PlaneConversion_toBuffer(vm.env(), nullptr, y, u, v, numbers, 0, 0, kSide,
                                                             kSide, 0, JNI_FALSE, 0, buffer, from, to,
                                                             4 * kSide);
  }
  jint to_bitmap(jobject bitmap) {
    return Java_com_vantrel_faceapi_PlaneConversion_toBitmap(vm.env(), nullptr, y, u, v, numbers, 0, 0, kSide,
                                                             kSide, 0, JNI_FALSE, bitmap);
  }
  jint to_bitmap() { return to_bitmap(vm.object("bitmap", "android/graphics/Bitmap")); }
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
  constexpr jint kLuma = 2;
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

TEST_F(PlaneConversionTest, IntsAndBuffersGetTheSamePixels) {
  const jintArray words = vm.int_array("words", std::vector<jint>(6, 7));
  EXPECT_EQ(to_ints(words, 1), 0);
  const auto gray = static_cast<jint>(0xFF646464);
  EXPECT_EQ(vm.at(words).words, (std::vector<jint>{7, gray, gray, gray, gray, 7}));

  const jobject buffer = vm.buffer("buffer", std::vector<unsigned char>(20, 7));
  EXPECT_EQ(to_buffer(buffer, 2, 18), 0);
  std::vector<unsigned char> pixels(2, 7);
  pixels.insert(pixels.end(), kGrayPixels.begin(), kGrayPixels.end());
  pixels.insert(pixels.end(), 2, 7);
  const std::vector<jbyte>& bytes = vm.at(buffer).bytes;
  EXPECT_EQ(std::vector<unsigned char>(bytes.begin(), bytes.end()), pixels);
}

TEST_F(PlaneConversionTest, MemoryThatIsNotThereIsRefused) {
  const jintArray words = vm.int_array("words", std::vector<jint>(4, 7));
  const jobject buffer = vm.buffer("buffer", std::vector<unsigned char>(16, 7));
  fake::bitmap().info = {kSide, kSide, 4 * kSide, ANDROID_BITMAP_FORMAT_RGBA_8888, 0};
  fake::bitmap().pixels.assign(16, 7);

  // An output that is null, begins outside itself, is no direct buffer, or ends behind its end.
  EXPECT_EQ(to_bytes(v, -1), kMemory);
  EXPECT_EQ(to_bytes(v, 17), kMemory);
  EXPECT_EQ(to_ints(nullptr, 0), kMemory);
  EXPECT_EQ(to_ints(words, 5), kMemory);
  EXPECT_EQ(to_buffer(nullptr, 0, 16), kMemory);
  EXPECT_EQ(to_buffer(vm.object("buffer on the heap", "java/nio/ByteBuffer"), 0, 16), kMemory);
  EXPECT_EQ(to_buffer(buffer, -1, 16), kMemory);
  EXPECT_EQ(to_buffer(buffer, 9, 8), kMemory);
  EXPECT_EQ(to_buffer(buffer, 0, 17), kMemory);
  EXPECT_EQ(to_bitmap(nullptr), kMemory);

  // Planes of which one is null or longer than its memory, or too few numbers.
  const auto nothingIsMade = [&] {
    EXPECT_EQ(to_bytes(v), kMemory);
    EXPECT_EQ(to_ints(words, 0), kMemory);
    EXPECT_EQ(to_buffer(buffer, 0, 16), kMemory);
    EXPECT_EQ(to_bitmap(), kMemory);
  };
  const jbyteArray right = std::exchange(u, nullptr);
  nothingIsMade();
  u = right;
  const jintArray rightNumbers = numbers;
  numbers = vm.int_array("numbers", {kSide, kSide, 0, 5, 2, 1, 0, 1, 1, 1, 0, 1, 1, 1, 1});
  nothingIsMade();
  numbers = vm.int_array("numbers", {kSide, kSide, 0, 4, 2, 1, 0, 1, 1, 1, 0, 2, 1, 1, 1});
  nothingIsMade();
  numbers = vm.int_array("numbers", {kSide, kSide, 0, 4, 2, 1, 0, 1, 1, 1, 0, 1, 1, 1});
  nothingIsMade();
  numbers = nullptr;
  nothingIsMade();

  numbers = rightNumbers;
  EXPECT_EQ(vm.bytes(out), std::vector<unsigned char>(16, 7));
  EXPECT_EQ(vm.at(words).words, std::vector<jint>(4, 7));
  EXPECT_EQ(vm.at(buffer).bytes, std::vector<jbyte>(16, 7));
  EXPECT_EQ(fake::bitmap().pixels, std::vector<unsigned char>(16, 7));
}

TEST_F(PlaneConversionTest, AnArrayOfAPlaneIsNoOutput) {
  constexpr jint kOverlap = 8;
  u = vm.byte_array("u", std::vector<unsigned char>(16, 128));
  out = static_cast<jbyteArray>(vm.another(u));
  EXPECT_EQ(to_bytes(v), kOverlap);
  EXPECT_EQ(vm.bytes(u), std::vector<unsigned char>(16, 128));
}

TEST_F(PlaneConversionTest, ABitmapMustFit) {
  const AndroidBitmapInfo right = {kSide, kSide, 4 * kSide, ANDROID_BITMAP_FORMAT_RGBA_8888, 0};
  fake::bitmap().info = right;
  fake::bitmap().info.format = ANDROID_BITMAP_FORMAT_RGB_565;
  EXPECT_EQ(to_bitmap(), kNotRgba);
  fake::bitmap().info = right;
  fake::bitmap().info.width = kSide - 1;
  EXPECT_EQ(to_bitmap(), kSmall);
  fake::bitmap().info = right;
  fake::bitmap().info.height = kSide - 1;
  EXPECT_EQ(to_bitmap(), kSmall);
  fake::bitmap().info = right;
  fake::bitmap().lock_result = ANDROID_BITMAP_RESULT_JNI_EXCEPTION;
  EXPECT_EQ(to_bitmap(), kNotLocked);
  fake::bitmap().info_result = ANDROID_BITMAP_RESULT_BAD_PARAMETER;
  EXPECT_EQ(to_bitmap(), kNotLocked);
}

}  // namespace
