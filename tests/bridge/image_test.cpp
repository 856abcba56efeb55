// The image methods and the frame helpers under them.
#include <malloc.h>

#include <cstdlib>

#include "bridge_test.h"
#include "frame.h"
#include "frame_reference.h"

namespace {

/// What the library asks memalign for; it gets nothing while `refuse` is set.
struct {
  bool refuse = false;
  size_t alignment = 0;
  size_t size = 0;
  int calls = 0;
} heap;

}  // namespace

extern "C" void* memalign(size_t alignment, size_t size) noexcept {
  heap.alignment = alignment;
  heap.size = size;
  ++heap.calls;
  return heap.refuse ? nullptr : aligned_alloc(alignment, size);
}

namespace {

using reference::Bytes;
using reference::frame_size;
using reference::random_bytes;
using reference::to_frame;
using reference::to_pixels;
using testing::ElementsAre;

constexpr unsigned char kUntouched = 0xA5;

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

  const Bytes frame = random_bytes(frame_size(kWidth, kHeight), 1);
  const Bytes colours = random_bytes(pixels(kWidth, kHeight) * 4, 2);
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
    const Bytes expected = to_pixels(frame, kWidth, kHeight, one.chroma, one.layout);
    EXPECT_EQ(convert(frame, kWidth, kHeight, expected.size(), one.code), expected) << one.code;
    expect_conversion(one.messages);
  }
}

TEST_F(ImageTest, ConvertsPixelsToFrames) {
  EXPECT_EQ(convert(colours, kWidth, kHeight, frame.size(), 3),
            to_frame(colours, kWidth, kHeight, reference::kNv21, reference::kRgba));
  expect_conversion({"RGB2nv "});
  EXPECT_EQ(convert(colours, kWidth, kHeight, frame.size(), 20),
            to_frame(colours, kWidth, kHeight, reference::kNv12, reference::kRgba));
  expect_conversion({"RGB2nv "});
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
    EXPECT_EQ(four, to_pixels(frame, kWidth, kHeight, chroma, reference::kRgba));
    expect_journal({"log 4 FaceAPI: nv2RGB "});
    nv2BGR(in.data(), format, kWidth, kHeight, four.data());
    EXPECT_EQ(four, to_pixels(frame, kWidth, kHeight, chroma, reference::kBgra));
    expect_journal({"log 4 FaceAPI: nv2BGR start", "log 4 FaceAPI: nv2BGR end"});
    nv212BGR(in.data(), format, kWidth, kHeight, three.data());
    EXPECT_EQ(three, to_pixels(frame, kWidth, kHeight, chroma, reference::kBgr));
    expect_journal({"log 4 FaceAPI: nv212BGR start", "log 4 FaceAPI: nv212BGR end"});

    in = colours;
    Bytes out(frame.size());
    RGB2nv(in.data(), format, kWidth, kHeight, out.data());
    EXPECT_EQ(out, to_frame(colours, kWidth, kHeight, chroma, reference::kRgba));
    expect_journal({"log 4 FaceAPI: RGB2nv "});
    BGR2nv(in.data(), format, kWidth, kHeight, out.data());
    EXPECT_EQ(out, to_frame(colours, kWidth, kHeight, chroma, reference::kBgra));
    expect_journal({"log 4 FaceAPI: BGR2nv start", "log 4 FaceAPI: BGR2nv end"});
  }
}

TEST_F(ImageTest, HelpersLogWithTheDebugSwitchOff) {
  CALL(setDebug, JNI_FALSE);
  convert(frame, kWidth, kHeight, pixels(kWidth, kHeight) * 4, 1);
  expect_conversion({"nv2BGR start", "nv2BGR end"});
}

TEST_F(ImageTest, HelpersWriteNothingForAnOddPictureHeight) {
  Bytes in(frame_size(kWidth, 482));
  Bytes out(pixels(kWidth, 481) * 4, kUntouched);
  nv2BGR(in.data(), 3, kWidth, 481, out.data());
  EXPECT_EQ(out, Bytes(out.size(), kUntouched));
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
    return to_pixels(cut, r.w, r.h, reference::kNv21, reference::kRgba);
  }

  static constexpr int kWidth = 40;
  static constexpr int kHeight = 12;
  const Bytes frame = random_bytes(frame_size(kWidth, kHeight), 3);
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
            to_pixels(frame, kWidth, kHeight, reference::kNv21, reference::kRgba));
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

  const Bytes picture = random_bytes(pixels(kWidth, kHeight) * 3, 4);
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

}  // namespace
