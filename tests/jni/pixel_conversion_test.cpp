// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
// The native methods of PixelConversion: what they make, what they refuse, and what the JVM refuses them.
#include <climits>
#include <functional>
#include <numeric>

#include "bridge_test.h"
#include "tests/support/frame_reference.h"
#include "tests/support/lab_reference.h"
#include "tests/support/rotated.h"

#define PIXEL_METHOD(type, method, ...) \
  JNIEXPORT type JNICALL Java_com_vantrel_faceapi_PixelConversion_##method(JNIEnv*, jclass, __VA_ARGS__)

extern "C" {
PIXEL_METHOD(jint, convert, jbyteArray src, jint width, jint height, jbyteArray dst, jint conversion);
PIXEL_METHOD(jint, rotate, jbyteArray src, jint width, jint height, jint bytesPerPixel, jint degrees,
             jbyteArray dst);
PIXEL_METHOD(jint, read, jobject bitmap, jint width, jint height, jint bytesPerPixel, jbyteArray dst);
PIXEL_METHOD(jlong, sumBytes, jbyteArray image, jint stride, jint x, jint y, jint w, jint h);
PIXEL_METHOD(jlong, sumLightness, jbyteArray image, jint stride, jboolean rgba, jint x, jint y, jint w,
             jint h);
}

#define PIXELS(method, ...) Java_com_vantrel_faceapi_PixelConversion_##method(vm.env(), nullptr, __VA_ARGS__)

namespace {

using reference::Bytes;
using reference::randomBytes;

enum Status : jint { kSuccess = 0, kSizes = -1, kNoPixels = -2, kChanged = -3, kNoElements = -4 };
enum Conversion : jint { kSwap = 0, kToNv21 = 1, kToNv12 = 2 };

class PixelConversionTest : public BridgeTest {
 protected:
  static constexpr int kWidth = 6;
  static constexpr int kHeight = 4;
  static constexpr int kPixels = kWidth * kHeight;
  static constexpr unsigned char kUntouched = 7;

  Bytes rgba = randomBytes(4 * kPixels, 1);
  jbyteArray src = vm.byte_array("src", rgba);

  /// An array to be written, two bytes larger than it must be.
  jbyteArray target(int bytes) {
    return vm.byte_array("dst", Bytes(static_cast<size_t>(bytes) + 2, kUntouched));
  }
  Bytes untouched(int bytes) { return Bytes(static_cast<size_t>(bytes) + 2, kUntouched); }
  static Bytes withRest(Bytes bytes) {
    bytes.insert(bytes.end(), {kUntouched, kUntouched});
    return bytes;
  }

  /// Both arrays are asked for in turn, and the one that comes is given back, when the other does not.
  void expectRefusals(int arrays, jbyteArray dst, const std::function<jlong()>& call) {
    const Bytes before = dst == nullptr ? Bytes() : vm.bytes(dst);
    for (int refused = 1; refused <= arrays; ++refused) {
      begin();
      vm.refuse("GetPrimitiveArrayCritical", refused);
      vm.tolerate_calls_under_exception = true;
      EXPECT_EQ(call(), kNoElements);
      EXPECT_TRUE(vm.exception_pending());
      EXPECT_TRUE(vm.pinned().empty());
    }
    if (dst != nullptr) {
      EXPECT_EQ(vm.bytes(dst), before);
    }
  }
};

TEST_F(PixelConversionTest, RedAndBlueAreSwapped) {
  const jbyteArray dst = target(4 * kPixels);
  EXPECT_EQ(PIXELS(convert, src, kWidth, kHeight, dst, kSwap), kSuccess);
  Bytes swapped = rgba;
  for (size_t i = 0; i < swapped.size(); i += 4) {
    std::swap(swapped[i], swapped[i + 2]);
  }
  EXPECT_EQ(vm.bytes(dst), withRest(swapped));
  expect_journal({"GetArrayLength(src)", "GetArrayLength(dst)", "GetPrimitiveArrayCritical(src)",
                  "GetPrimitiveArrayCritical(dst)", "ReleasePrimitiveArrayCritical(dst, 0)",
                  "ReleasePrimitiveArrayCritical(src, 2)"});
}

TEST_F(PixelConversionTest, PixelsBecomeFrames) {
  for (const auto& [conversion, chroma] :
       {std::pair(kToNv21, reference::kNv21), {kToNv12, reference::kNv12}}) {
    const jbyteArray dst = target(kPixels * 3 / 2);
    EXPECT_EQ(PIXELS(convert, src, kWidth, kHeight, dst, conversion), kSuccess);
    EXPECT_EQ(vm.bytes(dst), withRest(reference::toFrame(rgba, kWidth, kHeight, chroma, reference::kRgba)));
  }
}

TEST_F(PixelConversionTest, ConversionsOfSizesThatAreNotThereAreRefused) {
  const jbyteArray dst = target(4 * kPixels);
  const jbyteArray small = vm.byte_array("small", Bytes(4 * kPixels - 1, kUntouched));
  const jbyteArray smallFrame = vm.byte_array("small frame", Bytes(kPixels * 3 / 2 - 1, kUntouched));
  const struct {
    jbyteArray src;
    jint width, height;
    jbyteArray dst;
    jint conversion;
  } refused[] = {
      {nullptr, kWidth, kHeight, dst, kSwap},
      {src, kWidth, kHeight, nullptr, kSwap},
      {src, 0, kHeight, dst, kSwap},
      {src, kWidth, 0, dst, kSwap},
      {src, -kWidth, -kHeight, dst, kSwap},
      {src, INT_MAX, INT_MAX, dst, kSwap},
      {src, 1 << 16, 1 << 16, dst, kSwap},
      {small, kWidth, kHeight, dst, kSwap},
      {src, kWidth, kHeight, small, kSwap},
      {src, kWidth - 1, kHeight, dst, kToNv21},
      {src, kWidth, kHeight - 1, dst, kToNv12},
      {small, kWidth, kHeight, dst, kToNv21},
      {src, kWidth, kHeight, smallFrame, kToNv21},
  };
  for (const auto& call : refused) {
    EXPECT_EQ(PIXELS(convert, call.src, call.width, call.height, call.dst, call.conversion), kSizes);
  }
  EXPECT_EQ(vm.calls("GetPrimitiveArrayCritical"), 0);
  EXPECT_EQ(vm.bytes(dst), untouched(4 * kPixels));
}

TEST_F(PixelConversionTest, PixelsOfAnySizeAreTurned) {
  for (const int channels : {1, 3, 4}) {
    const Bytes pixels = randomBytes(static_cast<size_t>(channels * kPixels), 2);
    const jbyteArray image = vm.byte_array("image", pixels);
    for (const int degrees : {90, 180, 270}) {
      const int height = degrees == 180 ? kHeight : kWidth;
      const int width = degrees == 180 ? kWidth : kHeight;
      Bytes turned;
      for (int r = 0; r < height; ++r) {
        for (int c = 0; c < width; ++c) {
          const kyface::test::Place from = kyface::test::sourceOf(degrees, kHeight, kWidth, r, c);
          const unsigned char* pixel =
              &pixels[static_cast<size_t>((from.row * kWidth + from.column) * channels)];
          turned.insert(turned.end(), pixel, pixel + channels);
        }
      }
      const jbyteArray dst = target(channels * kPixels);
      EXPECT_EQ(PIXELS(rotate, image, kWidth, kHeight, channels, degrees, dst), kSuccess);
      EXPECT_EQ(vm.bytes(dst), withRest(turned)) << channels << " channels, " << degrees << " degrees";
    }
  }
}

TEST_F(PixelConversionTest, TurnsThatThereAreNotAreRefused) {
  const jbyteArray dst = target(4 * kPixels);
  const jbyteArray small = vm.byte_array("small", Bytes(3 * kPixels - 1, kUntouched));
  const struct {
    jbyteArray src;
    jint width, height, bytesPerPixel, degrees;
    jbyteArray dst;
  } refused[] = {
      {nullptr, kWidth, kHeight, 3, 90, dst}, {src, kWidth, kHeight, 3, 90, nullptr},
      {src, kWidth, kHeight, 2, 90, dst},     {src, kWidth, kHeight, -4, 90, dst},
      {src, kWidth, kHeight, 3, 0, dst},      {src, kWidth, kHeight, 3, 360, dst},
      {src, kWidth, kHeight, 3, -90, dst},    {src, kWidth, 0, 3, 90, dst},
      {small, kWidth, kHeight, 3, 180, dst},  {src, kWidth, kHeight, 3, 270, small},
  };
  for (const auto& call : refused) {
    EXPECT_EQ(PIXELS(rotate, call.src, call.width, call.height, call.bytesPerPixel, call.degrees, call.dst),
              kSizes);
  }
  EXPECT_EQ(vm.bytes(dst), untouched(4 * kPixels));
}

class PixelsOfABitmapTest : public PixelConversionTest {
 protected:
  static constexpr int kStride = 4 * kWidth + 8;

  PixelsOfABitmapTest() {
    fake::bitmap().info = {kWidth, kHeight, kStride, ANDROID_BITMAP_FORMAT_RGBA_8888, 0};
    fake::bitmap().pixels = randomBytes(kStride * kHeight, 3);
  }

  jobject bitmap = vm.object("bitmap", "android/graphics/Bitmap");
};

TEST_F(PixelsOfABitmapTest, AreReadWhateverItsStride) {
  for (const int channels : {3, 4}) {
    Bytes want;
    for (size_t y = 0; y < kHeight; ++y) {
      for (size_t x = 0; x < kWidth; ++x) {
        const unsigned char* pixel = &fake::bitmap().pixels[y * kStride + 4 * x];
        want.insert(want.end(), {pixel[2], pixel[1], pixel[0]});
        if (channels == 4) {
          want.push_back(pixel[3]);
        }
      }
    }
    const jbyteArray dst = target(channels * kPixels);
    EXPECT_EQ(PIXELS(read, bitmap, kWidth, kHeight, channels, dst), kSuccess);
    EXPECT_EQ(vm.bytes(dst), withRest(want)) << channels;
    EXPECT_EQ(fake::bitmap().locks, 0);
  }
}

TEST_F(PixelsOfABitmapTest, AreRefusedBeforeTheBitmapIsLookedAt) {
  const jbyteArray dst = target(4 * kPixels);
  const jbyteArray small = vm.byte_array("small", Bytes(3 * kPixels - 1, kUntouched));
  EXPECT_EQ(PIXELS(read, nullptr, kWidth, kHeight, 4, dst), kSizes);
  EXPECT_EQ(PIXELS(read, bitmap, kWidth, kHeight, 1, dst), kSizes);
  EXPECT_EQ(PIXELS(read, bitmap, kWidth, kHeight, 4, nullptr), kSizes);
  EXPECT_EQ(PIXELS(read, bitmap, kWidth, kHeight, 3, small), kSizes);
  EXPECT_EQ(PIXELS(read, bitmap, 0, kHeight, 4, dst), kSizes);
  EXPECT_THAT(fake::journal(), testing::Not(testing::Contains("AndroidBitmap_getInfo()")));
}

TEST_F(PixelsOfABitmapTest, AreNotTakenFromOneThatChanged) {
  const jbyteArray dst = target(4 * kPixels);
  const auto read = [&] { return PIXELS(read, bitmap, kWidth, kHeight, 4, dst); };
  const AndroidBitmapInfo right = fake::bitmap().info;
  fake::bitmap().info.width = kWidth + 1;
  EXPECT_EQ(read(), kChanged);
  fake::bitmap().info = right;
  fake::bitmap().info.height = kHeight - 1;
  EXPECT_EQ(read(), kChanged);
  fake::bitmap().info = right;
  fake::bitmap().info.format = ANDROID_BITMAP_FORMAT_RGB_565;
  EXPECT_EQ(read(), kChanged);

  fake::bitmap().info = right;
  fake::bitmap().info_result = ANDROID_BITMAP_RESULT_BAD_PARAMETER;
  EXPECT_EQ(read(), kNoPixels);
  fake::bitmap().info_result = ANDROID_BITMAP_RESULT_SUCCESS;
  expectRefusals(1, dst, read);
  EXPECT_EQ(fake::bitmap().locks, 0);
  begin();

  fake::bitmap().pixels.clear();
  fake::bitmap().lock_result = ANDROID_BITMAP_RESULT_JNI_EXCEPTION;
  EXPECT_EQ(read(), kNoPixels);
  EXPECT_EQ(vm.bytes(dst), untouched(4 * kPixels));
}

TEST_F(PixelConversionTest, SumsAreThoseOfTheRectangle) {
  constexpr int kStride = 4 * kWidth;
  // A rectangle of bytes and one of pixels, with something on each side of them.
  jlong bytes = 0;
  for (int y = 1; y < 3; ++y) {
    bytes = std::accumulate(&rgba[static_cast<size_t>(y * kStride + 2)],
                            &rgba[static_cast<size_t>(y * kStride + 2 + 17)], bytes);
  }
  EXPECT_EQ(PIXELS(sumBytes, src, kStride, 2, 1, 17, 2), bytes);

  const kyface::test::LightnessReference lightness;
  for (const bool isRgba : {true, false}) {
    jlong sum = 0;
    for (int y = 1; y < 3; ++y) {
      for (int x = 2; x < 5; ++x) {
        const unsigned char* pixel = &rgba[static_cast<size_t>(y * kStride + 4 * x)];
        sum += isRgba ? lightness(pixel[2], pixel[1], pixel[0]) : lightness(pixel[0], pixel[1], pixel[2]);
      }
    }
    EXPECT_EQ(PIXELS(sumLightness, src, kStride, isRgba ? JNI_TRUE : JNI_FALSE, 2, 1, 3, 2), sum) << isRgba;
  }
  // The whole, to the last byte.
  EXPECT_EQ(PIXELS(sumBytes, src, kStride, 0, 0, kStride, kHeight),
            std::accumulate(rgba.begin(), rgba.end(), jlong{0}));
}

TEST_F(PixelConversionTest, SumsBeyondTheImageAreRefused) {
  constexpr int kStride = 4 * kWidth;
  const struct {
    jbyteArray image;
    jint stride, x, y, w, h;
  } refused[] = {
      {nullptr, kStride, 0, 0, 1, 1},
      {src, 0, 0, 0, 1, 1},
      {src, -1, 0, 0, 1, 1},
      {src, kStride, -1, 0, 1, 1},
      {src, kStride, 0, -1, 1, 1},
      {src, kStride, 0, 0, 0, 1},
      {src, kStride, 0, 0, 1, 0},
      {src, kStride, 0, 1, 1, kHeight},
      {src, kStride, kStride, 3, 1, 1},
      {src, kStride, 1, 0, kStride, kHeight},
      {src, kStride, 0, 2, 1, INT_MAX},
      {src, kStride, 1, 0, INT_MAX, 1},
      {src, INT_MAX, 0, INT_MAX - 1, 1, 1},
  };
  for (const auto& call : refused) {
    EXPECT_EQ(PIXELS(sumBytes, call.image, call.stride, call.x, call.y, call.w, call.h), kSizes);
    EXPECT_EQ(PIXELS(sumLightness, call.image, call.stride, JNI_TRUE, call.x, call.y, call.w, call.h),
              kSizes);
  }
  EXPECT_EQ(vm.calls("GetPrimitiveArrayCritical"), 0);
}

TEST_F(PixelConversionTest, ARefusedArrayLeavesNothingBehind) {
  const jbyteArray dst = target(4 * kPixels);
  expectRefusals(2, dst, [&] { return PIXELS(convert, src, kWidth, kHeight, dst, kSwap); });
  expectRefusals(2, dst, [&] { return PIXELS(rotate, src, kWidth, kHeight, 4, 90, dst); });
  expectRefusals(1, nullptr, [&] { return PIXELS(sumBytes, src, 4 * kWidth, 0, 0, 4, 4); });
  expectRefusals(1, nullptr, [&] { return PIXELS(sumLightness, src, 4 * kWidth, JNI_TRUE, 0, 0, 4, 4); });
}

}  // namespace
