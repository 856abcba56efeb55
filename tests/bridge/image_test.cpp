// The image methods and the frame helpers under them.
#include "bridge_test.h"
#include "frame.h"
#include "frame_reference.h"

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

}  // namespace
