// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// The image methods and the frame helpers under them.
#include <malloc.h>

#include <cstdlib>

#include "bridge_test.h"
#include "frame/frame.h"
#include "tests/support/frame_reference.h"

namespace {

/// What the library asks memalign for; it gets nothing while `refuse` is set.
struct {
  bool refuse = false;
  size_t alignment = 0;
  size_t size = 0;
  int calls = 0;
} heap;

}  // namespace

extern "C" void* memalign(size_t alignment, size_t size) noexcept(noexcept(memalign(64, 64))) {
  heap.alignment = alignment;
  heap.size = size;
  ++heap.calls;
  void* memory = nullptr;
  return !heap.refuse && posix_memalign(&memory, alignment, size) == 0 ? memory : nullptr;
}

namespace {

using reference::Bytes;
using reference::frameSize;
using reference::randomBytes;
using reference::toFrame;
using reference::toPixels;
using testing::ElementsAre;

constexpr unsigned char kUntouched = 0xA5;

/// 4-byte pixels with their first and third byte exchanged; the fourth stays or goes.
Bytes swap_red_and_blue(const Bytes& from, int channels) {
  Bytes to;
  for (size_t i = 0; i < from.size(); i += 4) {
    to.insert(to.end(), {from[i + 2], from[i + 1], from[i]});
    if (channels == 4) {
      to.push_back(from[i + 3]);
    }
  }
  return to;
}

size_t pixels(int width, int height) { return static_cast<size_t>(width) * height; }

class ImageTest : public BridgeTest {
 protected:
  static constexpr int kWidth = 22;
  static constexpr int kHeight = 6;

  /// Converts `input` and returns the output array of `size` bytes.
  Bytes convert(const Bytes& input, int width, int height, size_t size, int code) {
    jbyteArray src = vm.byte_array("src", input);
    jbyteArray dst = vm.byte_array("dst", Bytes(size, kUntouched));
    CALL(convertColorSpace, src, width, height, dst, code);
    EXPECT_EQ(vm.bytes(src), input);
    return vm.bytes(dst);
  }

  /// The journal of a conversion that writes the given messages.
  void expect_conversion(const Lines& messages) {
    Lines lines = {"GetByteArrayElements(src)", "GetByteArrayElements(dst)"};
    for (const std::string& message : messages) {
      lines.push_back("log 4 FaceAPI: " + message);
    }
    lines.insert(lines.end(), {"ReleaseByteArrayElements(src, 0)", "ReleaseByteArrayElements(dst, 0)"});
    expect_journal(lines);
  }

  const Bytes frame = randomBytes(frameSize(kWidth, kHeight), 1);
  const Bytes colours = randomBytes(pixels(kWidth, kHeight) * 4, 2);
};

// ---- convertColorSpace

TEST_F(ImageTest, ConvertsFramesToPixels) {
  const struct {
    int code;
    reference::Chroma chroma;
    reference::Layout layout;
    Lines messages;
  } cases[] = {
      {1, reference::kNv21, reference::kBgra, {"nv2BGR start", "nv2BGR end"}},
      {2, reference::kNv21, reference::kRgba, {"nv2RGB "}},
      {5, reference::kNv12, reference::kBgra, {"nv2BGR start", "nv2BGR end"}},
      {1001, reference::kNv21, reference::kBgr, {"nv212BGR start", "nv212BGR end"}},
  };
  for (const auto& one : cases) {
    const Bytes expected = toPixels(frame, kWidth, kHeight, one.chroma, one.layout);
    EXPECT_EQ(convert(frame, kWidth, kHeight, expected.size(), one.code), expected) << one.code;
    expect_conversion(one.messages);
  }
}

TEST_F(ImageTest, ConvertsPixelsToFrames) {
  EXPECT_EQ(convert(colours, kWidth, kHeight, frame.size(), 3),
            toFrame(colours, kWidth, kHeight, reference::kNv21, reference::kRgba));
  expect_conversion({"RGB2nv "});
  EXPECT_EQ(convert(colours, kWidth, kHeight, frame.size(), 20),
            toFrame(colours, kWidth, kHeight, reference::kNv12, reference::kRgba));
  expect_conversion({"RGB2nv "});
}

TEST_F(ImageTest, SwapsRedAndBlue) {
  for (int code : {14, 101}) {
    EXPECT_EQ(convert(colours, kWidth, kHeight, colours.size(), code), swap_red_and_blue(colours, 4)) << code;
    expect_conversion({"BGR2RGB start", "BGR2RGB end"});
  }
}

TEST_F(ImageTest, SwapsInImagesOfOddSizes) {
  const Bytes input(colours.begin(), colours.begin() + 21 * 5 * 4);
  EXPECT_EQ(convert(input, 21, 5, input.size(), 14), swap_red_and_blue(input, 4));
}

TEST_F(ImageTest, LeavesTheOutputOfAnUnknownCode) {
  const size_t size = pixels(kWidth, kHeight) * 4;
  for (int code : {0, 4, 6, 13, 15, 21, 100, 102, 1000, 1002, -1, -2147483647 - 1}) {
    EXPECT_EQ(convert(frame, kWidth, kHeight, size, code), Bytes(size, kUntouched)) << code;
    expect_conversion({});
  }
}

TEST_F(ImageTest, LeavesTheOutputOfOddSizes) {
  const size_t size = pixels(kWidth, kHeight) * 4;
  for (int code : {1, 2, 3, 5, 20, 1001}) {
    EXPECT_EQ(convert(colours, kWidth - 1, kHeight, size, code), Bytes(size, kUntouched)) << code;
    EXPECT_EQ(convert(colours, kWidth, kHeight - 1, size, code), Bytes(size, kUntouched)) << code;
  }
}

TEST_F(ImageTest, DoesNothingWithANullArray) {
  jbyteArray array = vm.byte_array("array", frame);
  CALL(convertColorSpace, nullptr, kWidth, kHeight, array, 2);
  CALL(convertColorSpace, array, kWidth, kHeight, nullptr, 2);
  expect_journal({});
}

// ---- frame helpers

TEST_F(ImageTest, HelpersTakeEveryFormatButThreeForNv12) {
  for (int format : {3, 2, 0, 1, 4, -1}) {
    const reference::Chroma chroma = format == 3 ? reference::kNv21 : reference::kNv12;
    Bytes in = frame;
    Bytes four(pixels(kWidth, kHeight) * 4);
    Bytes three(pixels(kWidth, kHeight) * 3);
    begin();
    nv2RGB(in.data(), format, kWidth, kHeight, four.data());
    EXPECT_EQ(four, toPixels(frame, kWidth, kHeight, chroma, reference::kRgba));
    expect_journal({"log 4 FaceAPI: nv2RGB "});
    nv2BGR(in.data(), format, kWidth, kHeight, four.data());
    EXPECT_EQ(four, toPixels(frame, kWidth, kHeight, chroma, reference::kBgra));
    expect_journal({"log 4 FaceAPI: nv2BGR start", "log 4 FaceAPI: nv2BGR end"});
    nv212BGR(in.data(), format, kWidth, kHeight, three.data());
    EXPECT_EQ(three, toPixels(frame, kWidth, kHeight, chroma, reference::kBgr));
    expect_journal({"log 4 FaceAPI: nv212BGR start", "log 4 FaceAPI: nv212BGR end"});

    in = colours;
    Bytes out(frame.size());
    RGB2nv(in.data(), format, kWidth, kHeight, out.data());
    EXPECT_EQ(out, toFrame(colours, kWidth, kHeight, chroma, reference::kRgba));
    expect_journal({"log 4 FaceAPI: RGB2nv "});
    BGR2nv(in.data(), format, kWidth, kHeight, out.data());
    EXPECT_EQ(out, toFrame(colours, kWidth, kHeight, chroma, reference::kBgra));
    expect_journal({"log 4 FaceAPI: BGR2nv start", "log 4 FaceAPI: BGR2nv end"});
  }
}

TEST_F(ImageTest, HelpersLogWithTheDebugSwitchOff) {
  CALL(setDebug, JNI_FALSE);
  convert(frame, kWidth, kHeight, pixels(kWidth, kHeight) * 4, 1);
  expect_conversion({"nv2BGR start", "nv2BGR end"});
}

TEST_F(ImageTest, HelpersWriteNothingForAnOddPictureHeight) {
  Bytes in(frameSize(kWidth, 482));
  Bytes out(pixels(kWidth, 481) * 4, kUntouched);
  nv2BGR(in.data(), 3, kWidth, 481, out.data());
  EXPECT_EQ(out, Bytes(out.size(), kUntouched));
}

// ---- bitmaps

class BitmapTest : public ImageTest {
 protected:
  BitmapTest() {
    fake::bitmap().info = {kWidth, kHeight, kWidth * 4, ANDROID_BITMAP_FORMAT_RGBA_8888, 0};
    fake::bitmap().pixels = colours;
    begin();
  }

  /// Both methods, with what they are to write.
  struct Method {
    void (*call)(JNIEnv*, jclass, jobject, jbyteArray);
    int channels;
    const char* helper;
  };
  static constexpr Method kMethods[] = {
      {Java_com_vantrel_faceapi_FaceLibrary_getBGRADataFromBitmap, 4, "BGR2RGB"},
      {Java_com_vantrel_faceapi_FaceLibrary_getBGRDataFromBitmap, 3, "BGRA2RGB"},
  };

  /// Calls a method and returns the output array.
  Bytes read(const Method& method) {
    jbyteArray out = vm.byte_array("out", Bytes(pixels(kWidth, kHeight) * method.channels, kUntouched));
    method.call(vm.env(), nullptr, bitmap, out);
    return vm.bytes(out);
  }

  static Bytes untouched(const Method& method) {
    return Bytes(pixels(kWidth, kHeight) * method.channels, kUntouched);
  }

  jobject bitmap = vm.object("bitmap", "android/graphics/Bitmap");
};

TEST_F(BitmapTest, ReadsAnRgbaBitmap) {
  for (bool debug : {true, false}) {
    CALL(setDebug, debug ? JNI_TRUE : JNI_FALSE);
    for (const Method& method : kMethods) {
      EXPECT_EQ(read(method), swap_red_and_blue(colours, method.channels));
      expect_journal({"AndroidBitmap_getInfo()", "AndroidBitmap_lockPixels()", "GetByteArrayElements(out)",
                      std::string("log 4 FaceAPI: ") + method.helper + " start",
                      std::string("log 4 FaceAPI: ") + method.helper + " end",
                      "ReleaseByteArrayElements(out, 0)", "AndroidBitmap_unlockPixels()"});
    }
  }
}

TEST_F(BitmapTest, TakesRowsAsPackedWhateverTheStride) {
  fake::bitmap().info.stride = kWidth * 4 + 64;
  for (const Method& method : kMethods) {
    EXPECT_EQ(read(method), swap_red_and_blue(colours, method.channels));
  }
}

TEST_F(BitmapTest, RefusesANullBitmap) {
  bitmap = nullptr;
  for (const Method& method : kMethods) {
    CALL(setDebug, JNI_TRUE);
    EXPECT_EQ(read(method), untouched(method));
    expect_journal({"log 6 FaceAPI: getBGRADataFromBitmap image is null "});
    CALL(setDebug, JNI_FALSE);
    read(method);
    expect_journal({});
  }
}

TEST_F(BitmapTest, RefusesWhatIsNotRgba8888) {
  const auto good = fake::bitmap().info;
  auto no_width = good;
  no_width.width = 0;
  auto no_height = good;
  no_height.height = 0;
  auto rgb_565 = good;
  rgb_565.format = ANDROID_BITMAP_FORMAT_RGB_565;
  auto none = good;
  none.format = ANDROID_BITMAP_FORMAT_NONE;
  for (const auto& info : {no_width, no_height, rgb_565, none}) {
    fake::bitmap().info = info;
    for (const Method& method : kMethods) {
      CALL(setDebug, JNI_TRUE);
      EXPECT_EQ(read(method), untouched(method));
      expect_journal(
          {"AndroidBitmap_getInfo()", "log 6 FaceAPI: getBGRADataFromBitmap image is not  RGBA_8888"});
      CALL(setDebug, JNI_FALSE);
      read(method);
      expect_journal({"AndroidBitmap_getInfo()"});
    }
  }
}

TEST_F(BitmapTest, RefusesABitmapThatDoesNotTellItsFormat) {
  fake::bitmap().info_result = ANDROID_BITMAP_RESULT_JNI_EXCEPTION;
  for (const Method& method : kMethods) {
    EXPECT_EQ(read(method), untouched(method));
    expect_journal(
        {"AndroidBitmap_getInfo()", "log 6 FaceAPI: getBGRADataFromBitmap image is not  RGBA_8888"});
  }
}

TEST_F(BitmapTest, DoesNotUnlockWhatItCouldNotLock) {
  fake::bitmap().pixels.clear();
  fake::bitmap().lock_result = ANDROID_BITMAP_RESULT_ALLOCATION_FAILED;
  for (const Method& method : kMethods) {
    EXPECT_EQ(read(method), untouched(method));
    expect_journal({"AndroidBitmap_getInfo()", "AndroidBitmap_lockPixels()"});
  }
}

TEST_F(BitmapTest, GoesByThePixelsAndNotByTheResultOfTheLock) {
  fake::bitmap().lock_result = ANDROID_BITMAP_RESULT_JNI_EXCEPTION;
  EXPECT_EQ(read(kMethods[0]), swap_red_and_blue(colours, 4));
}

// ---- crop

class CropTest : public ImageTest {
 protected:
  struct Rectangle {
    int x, y, w, h;
  };

  /// Crops through the native method.
  Bytes crop(const Rectangle& r) {
    jbyteArray nv21 = vm.byte_array("nv21", frame);
    jbyteArray out = vm.byte_array("out", Bytes(output_size(r), kUntouched));
    CALL(cropNv21Data, nv21, kWidth, kHeight, r.x, r.y, r.w, r.h, out);
    EXPECT_EQ(vm.bytes(nv21), frame);
    expect_journal({"GetByteArrayElements(nv21)", "GetByteArrayElements(out)",
                    "ReleaseByteArrayElements(nv21, 0)", "ReleaseByteArrayElements(out, 0)"});
    return vm.bytes(out);
  }

  static size_t output_size(const Rectangle& r) { return r.w < 1 || r.h < 1 ? 16 : pixels(r.w, r.h) * 4; }

  /// The rectangle's luma rows, then its chroma rows from the same byte columns, as pixels.
  Bytes expected(const Rectangle& r) {
    Bytes cut;
    for (int row = 0; row < r.h + r.h / 2; ++row) {
      const int from = row < r.h ? r.y + row : kHeight + r.y / 2 + row - r.h;
      const auto start = frame.begin() + static_cast<ptrdiff_t>(from) * kWidth + r.x;
      cut.insert(cut.end(), start, start + r.w);
    }
    return toPixels(cut, r.w, r.h, reference::kNv21, reference::kRgba);
  }

  static constexpr int kWidth = 40;
  static constexpr int kHeight = 12;
  const Bytes frame = randomBytes(frameSize(kWidth, kHeight), 3);
};

TEST_F(CropTest, CutsRectangles) {
  const Rectangle rectangles[] = {{0, 0, 2, 2},   {4, 2, 18, 6},  {38, 10, 2, 2}, {0, 10, 40, 2},
                                  {38, 0, 2, 12}, {6, 4, 34, 8},  {3, 2, 8, 4},   {1, 0, 38, 12},
                                  {4, 3, 8, 4},   {5, 1, 34, 10}, {0, 0, 40, 12}, {22, 6, 16, 4},
                                  {24, 6, 16, 6}};
  for (const Rectangle& r : rectangles) {
    EXPECT_EQ(crop(r), expected(r)) << r.x << "," << r.y << " " << r.w << "x" << r.h;
  }
}

TEST_F(CropTest, TheWholeFrameIsItsConversion) {
  EXPECT_EQ(crop({0, 0, kWidth, kHeight}),
            toPixels(frame, kWidth, kHeight, reference::kNv21, reference::kRgba));
}

TEST_F(CropTest, LeavesTheOutputOfOddSizes) {
  for (const Rectangle& r : {Rectangle{0, 0, 3, 4}, {0, 0, 4, 3}, {0, 0, 5, 5}, {2, 2, 1, 1}}) {
    EXPECT_EQ(crop(r), Bytes(output_size(r), kUntouched)) << r.w << "x" << r.h;
  }
}

TEST_F(CropTest, LeavesTheOutputOfSizesBelowOne) {
  for (const Rectangle& r : {Rectangle{0, 0, 0, 0},
                             {0, 0, 0, 4},
                             {0, 0, 4, 0},
                             {0, 0, -2, 4},
                             {0, 0, 4, -2},
                             {0, 0, -2, -2},
                             {4, 4, -1, -1},
                             {0, 0, -2147483647 - 1, 2}}) {
    EXPECT_EQ(crop(r), Bytes(output_size(r), kUntouched)) << r.w << "x" << r.h;
  }
}

TEST_F(CropTest, ARectangleThatLeavesTheFrameConvertsWhatIsThere) {
  // Luma rows past the picture are rows of the frame still, here chroma; its own chroma is not copied.
  const Rectangle past = {0, kHeight, kWidth, 4};
  const Bytes out = crop(past);
  EXPECT_EQ(out.size(), output_size(past));
  for (size_t i = 3; i < out.size(); i += 4) {
    ASSERT_EQ(out[i], 255);  // converted, whatever its colour
  }
  for (const Rectangle& r : {Rectangle{-2, 0, 4, 4},
                             {0, -4, 4, 4},
                             {kWidth - 2, 0, 4, 4},
                             {0, kHeight * 2, 4, 4},
                             {2147483647, 2147483647, 4, 4}}) {
    const Bytes undefined = crop(r);
    for (size_t i = 3; i < undefined.size(); i += 4) {
      ASSERT_EQ(undefined[i], 255);
    }
  }
}

// A frame without rows is not looked at, not even where 3/2 of its height is more than 32 bits hold.
TEST_F(CropTest, ReadsNothingOfAFrameOfNegativeHeight) {
  for (const int height : {-1, -2, -1431655766, -2147483647 - 1}) {
    for (const int y : {0, 2, 2147483647, -2147483647 - 1}) {
      Bytes out(2 * 2 * 4, kUntouched);
      cropNv21(nullptr, kWidth, height, 0, y, 2, 2, out.data());
      for (size_t i = 3; i < out.size(); i += 4) {
        EXPECT_EQ(out[i], 255);  // converted, whatever its colour
      }
    }
  }
}

TEST_F(CropTest, TakesAnAlignedTemporaryFrame) {
  const struct {
    Rectangle r;
    size_t size;
  } cases[] = {{{0, 0, 2, 2}, 64}, {{0, 0, 8, 4}, 64}, {{0, 0, 16, 4}, 128}, {{0, 0, 40, 12}, 768}};
  for (const auto& one : cases) {
    heap = {};
    crop(one.r);
    EXPECT_EQ(heap.calls, 1);
    EXPECT_EQ(heap.alignment, 64U);
    EXPECT_EQ(heap.size, one.size);
  }
}

TEST_F(CropTest, LeavesTheOutputWhenThereIsNoMemory) {
  heap.refuse = true;
  EXPECT_EQ(crop({0, 0, 4, 4}), Bytes(4 * 4 * 4, kUntouched));
  heap.refuse = false;
}

// ---- rotation

class RotationTest : public ImageTest {
 protected:
  static constexpr int kWidth = 7;
  static constexpr int kHeight = 5;

  /// Rotates through the native method and checks its journal and the size that it reports.
  Bytes rotate(int degree, int expected_width, int expected_height) {
    jbyteArray src = vm.byte_array("src", picture);
    jbyteArray dst = vm.byte_array("dst", Bytes(picture.size(), kUntouched));
    jintArray size = vm.int_array("outSize", {-1, -2, -3});
    CALL(rotateBGR, src, kWidth, kHeight, dst, degree, size);
    EXPECT_THAT(vm.at(size).words, ElementsAre(expected_width, expected_height, -3));
    EXPECT_EQ(vm.bytes(src), picture);
    expect_journal({"GetByteArrayElements(src)", "GetByteArrayElements(dst)", "GetIntArrayElements(outSize)",
                    "log 3 FaceAPI: rotateBGR degree: " + std::to_string(degree),
                    "ReleaseByteArrayElements(src, 0)", "ReleaseByteArrayElements(dst, 0)",
                    "ReleaseIntArrayElements(outSize, 0)"});
    return vm.bytes(dst);
  }

  /// An image of the given size whose pixels come from the picture's (row, column) that `source` names.
  template <typename Source>
  Bytes mapped(int width, int height, Source source) {
    Bytes out;
    for (int r = 0; r < height; ++r) {
      for (int c = 0; c < width; ++c) {
        const auto [row, column] = source(r, c);
        const auto pixel = picture.begin() + (row * kWidth + column) * 3;
        out.insert(out.end(), pixel, pixel + 3);
      }
    }
    return out;
  }

  const Bytes picture = randomBytes(pixels(kWidth, kHeight) * 3, 4);
};

TEST_F(RotationTest, TurnsClockwise) {
  EXPECT_EQ(rotate(90, kHeight, kWidth),
            mapped(kHeight, kWidth, [](int r, int c) { return std::pair(kHeight - 1 - c, r); }));
  EXPECT_EQ(rotate(180, kWidth, kHeight),
            mapped(kWidth, kHeight, [](int r, int c) { return std::pair(kHeight - 1 - r, kWidth - 1 - c); }));
  EXPECT_EQ(rotate(270, kHeight, kWidth),
            mapped(kHeight, kWidth, [](int r, int c) { return std::pair(c, kWidth - 1 - r); }));
}

TEST_F(RotationTest, LeavesTheOutputOfOtherAnglesButReportsASize) {
  CALL(setDebug, JNI_FALSE);  // its message is written all the same
  for (int degree : {0, 45, 89, 91, 360, 450, -90, -270}) {
    EXPECT_EQ(rotate(degree, kWidth, kHeight), Bytes(picture.size(), kUntouched)) << degree;
  }
}

TEST_F(ImageTest, HelpersSwapRedAndBlue) {
  Bytes in = colours;
  Bytes four(colours.size());
  BGR2RGB(in.data(), kWidth, kHeight, four.data());
  EXPECT_EQ(four, swap_red_and_blue(colours, 4));
  expect_journal({"log 4 FaceAPI: BGR2RGB start", "log 4 FaceAPI: BGR2RGB end"});
  Bytes three(pixels(kWidth, kHeight) * 3);
  BGRA2RGB(in.data(), kWidth, kHeight, three.data());
  EXPECT_EQ(three, swap_red_and_blue(colours, 3));
  expect_journal({"log 4 FaceAPI: BGRA2RGB start", "log 4 FaceAPI: BGRA2RGB end"});
}

}  // namespace
