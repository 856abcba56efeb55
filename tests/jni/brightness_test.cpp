// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// The brightness methods. The metrics themselves are tested beside them; here it is which one is called, and
// how.
#include <cmath>
#include <limits>

#include "bridge_test.h"

namespace {

using Bytes = std::vector<unsigned char>;

// ---- faceBrightEvaluate

class FaceBrightTest : public BridgeTest {
 protected:
  // Distinct numbers throughout: an exchanged pair of arguments shows.
  static constexpr int kWidth = 9;
  static constexpr int kWidthStride = 50;
  static constexpr int kHeight = 7;
  static constexpr int kHeightStride = 77;
  static constexpr int kX = 2;
  static constexpr int kY = 1;
  static constexpr int kW = 3;
  static constexpr int kH = 4;

  jint evaluate(jbyteArray array, int format) {
    return CALL(faceBrightEvaluate, array, format, kWidth, kWidthStride, kHeight, kHeightStride, kX, kY, kW,
                kH);
  }

  /// An image whose rectangle is filled with one pixel, and everything else with another.
  static Bytes picture(const Bytes& inside, const Bytes& outside) {
    Bytes bytes(static_cast<size_t>(kWidthStride * kHeight), 0);
    const auto channels = static_cast<int>(inside.size());
    for (int y = 0; y < kHeight; ++y) {
      for (int x = 0; x < kWidth; ++x) {
        const bool in = x >= kX && x < kX + kW && y >= kY && y < kY + kH;
        std::copy_n((in ? inside : outside).begin(), channels,
                    bytes.begin() + y * kWidthStride + x * channels);
      }
    }
    return bytes;
  }

  /// CIE lightness of a colour, scaled to 0..255.
  static double lightness(int red, int green, int blue) {
    const auto linear = [](int value) {
      const double v = value / 255.0;
      return v <= 0.04045 ? v / 12.92 : std::pow((v + 0.055) / 1.055, 2.4);
    };
    const double y = 0.2126 * linear(red) + 0.7152 * linear(green) + 0.0722 * linear(blue);
    return (y > 0.008856 ? 116 * std::cbrt(y) - 16 : 903.3 * y) * 2.55;
  }

  static constexpr char kSizes[] =
      "log 2 FaceAPI: width:9,width_stride:50,height:7,height_stride:77,rect_x:2,rect_y:1,rect_w:3,rect_h:4";
  const Lines with_sizes = {"GetByteArrayElements(image)", kSizes, "ReleaseByteArrayElements(image, 0)"};

  jbyteArray four = vm.byte_array("image", picture({200, 90, 20, 7}, {1, 250, 130, 255}));
  jbyteArray three = vm.byte_array("image", picture({181, 3, 250}, {77, 0, 0}));
};

TEST_F(FaceBrightTest, ChoosesTheMetricByFormat) {
  EXPECT_NEAR(evaluate(four, 0), lightness(200, 90, 20), 1.0);
  expect_journal(with_sizes);
  EXPECT_NEAR(evaluate(four, 1), lightness(20, 90, 200), 1.0);
  expect_journal(with_sizes);
  EXPECT_EQ(evaluate(three, 3), 181);
  expect_journal(with_sizes);
  EXPECT_EQ(evaluate(four, 4), (77 * 200 + 150 * 90 + 29 * 20 + 128) >> 8);
  expect_journal(with_sizes);
  EXPECT_EQ(evaluate(four, 5), (77 * 20 + 150 * 90 + 29 * 200 + 128) >> 8);
  expect_journal(with_sizes);
}

TEST_F(FaceBrightTest, ResultsHaveNoSign) {
  EXPECT_EQ(evaluate(vm.byte_array("image", picture({255, 255, 255, 255}, {0, 0, 0, 0})), 4), 255);
}

TEST_F(FaceBrightTest, OtherFormatsHaveNoMetricButASizeLine) {
  for (int format : {2, 6, -1, 255, 256, std::numeric_limits<int>::min(), std::numeric_limits<int>::max()}) {
    EXPECT_EQ(evaluate(four, format), -1) << format;
    expect_journal(with_sizes);
  }
  CALL(setDebug, JNI_FALSE);
  EXPECT_EQ(evaluate(four, 2), -1);
  expect_journal({"GetByteArrayElements(image)", "ReleaseByteArrayElements(image, 0)"});
}

TEST_F(FaceBrightTest, ANullImageIsRefused) {
  EXPECT_EQ(evaluate(nullptr, 4), -1);
  expect_journal({"log 6 FaceAPI: IMAGE IS NULL"});
  CALL(setDebug, JNI_FALSE);
  EXPECT_EQ(evaluate(nullptr, 4), -1);
  expect_journal({});
}

TEST_F(FaceBrightTest, TheMetricsComplaintArrivesAs255) {
  testing::internal::CaptureStdout();
  EXPECT_EQ(CALL(faceBrightEvaluate, four, 4, kWidth, kWidthStride, kHeight, kHeightStride, kX, kY, 0, kH),
            255);
  EXPECT_EQ(testing::internal::GetCapturedStdout(), "wrong enter\r\n");
}

TEST_F(FaceBrightTest, TheMetricAnswersForAnImageThatIsRefused) {
  vm.refuse("GetByteArrayElements", 1);
  testing::internal::CaptureStdout();
  EXPECT_EQ(evaluate(four, 4), 255);
  EXPECT_EQ(testing::internal::GetCapturedStdout(), "wrong enter\r\n");
  EXPECT_TRUE(vm.exception_pending());
  expect_journal({"GetByteArrayElements(image)", kSizes});
  vm.refuse("GetByteArrayElements", 1);
  EXPECT_EQ(evaluate(four, 2), -1);
}

// ---- averageBrightness

class AverageBrightnessTest : public BridgeTest {
 protected:
  float average(const Bytes& gray, int width, int height, int x, int y, int w, int h) {
    return CALL(averageBrightness, vm.byte_array("gray", gray), width, height, x, y, w, h);
  }

  /// The mean as a fraction, of the bytes that a clipped rectangle names.
  static float mean(const Bytes& gray, int width, int x0, int y0, int columns, int rows) {
    unsigned sum = 0;
    for (int y = y0; y < y0 + rows; ++y) {
      for (int x = x0; x < x0 + columns; ++x) {
        sum += gray[static_cast<size_t>(y) * width + x];
      }
    }
    return static_cast<float>(sum) / static_cast<float>(columns * rows * 255);
  }

  static Bytes ramp(int width, int height) {
    Bytes gray(static_cast<size_t>(width) * height);
    for (size_t i = 0; i < gray.size(); ++i) {
      gray[i] = static_cast<unsigned char>(i * 7 + i / 251);
    }
    return gray;
  }
};

TEST_F(AverageBrightnessTest, IsTheMeanAsAFraction) {
  const Bytes gray = ramp(100, 60);
  EXPECT_EQ(average(gray, 100, 50, 3, 5, 40, 20), mean(gray, 100, 3, 5, 40, 20));
  expect_journal({"GetByteArrayElements(gray)", "ReleaseByteArrayElements(gray, 0)"});
  EXPECT_EQ(average(gray, 100, 60, 0, 0, 100, 60), mean(gray, 100, 0, 0, 100, 60));
  EXPECT_EQ(average(gray, 100, 60, 99, 59, 1, 1), static_cast<float>(gray.back()) / 255.0F);
  EXPECT_EQ(average(Bytes(16, 255), 4, 4, 0, 0, 4, 4), 1.0F);
  EXPECT_EQ(average(Bytes(16, 0), 4, 4, 0, 0, 4, 4), 0.0F);
}

TEST_F(AverageBrightnessTest, ClipsTheRectangle) {
  EXPECT_EQ(average(Bytes(16, 255), 4, 4, 0, 0, 10, 10), 1.0F);
  const Bytes gray = ramp(100, 60);
  EXPECT_EQ(average(gray, 100, 50, 90, 0, 20, 50), mean(gray, 100, 90, 0, 10, 50));
  // A negative corner moves to the edge and takes the whole size with it.
  EXPECT_EQ(average(gray, 100, 50, -5, -6, 20, 30), mean(gray, 100, 0, 0, 20, 30));
  EXPECT_EQ(average(gray, 100, 50, -100, -200, 200, 300), mean(gray, 100, 0, 0, 100, 50));
  constexpr int kHuge = std::numeric_limits<int>::max();
  EXPECT_EQ(average(gray, 100, 50, 7, 9, kHuge, kHuge), mean(gray, 100, 7, 9, 93, 41));
}

TEST_F(AverageBrightnessTest, ClipsTheHeightByTheLeftEdge) {
  const Bytes gray = ramp(100, 60);
  EXPECT_EQ(average(gray, 100, 50, 60, 0, 10, 50), mean(gray, 100, 60, 0, 10, 50));
  EXPECT_EQ(average(gray, 100, 50, 30, 10, 10, 20), mean(gray, 100, 30, 10, 10, 20));  // 30 + 20 = 50
  EXPECT_EQ(average(gray, 100, 50, 60, 10, 10, 20), mean(gray, 100, 60, 10, 10, 40));  // 60 + 20 > 50
  EXPECT_EQ(average(gray, 100, 50, 0, 40, 10, 20), mean(gray, 100, 0, 40, 10, 20));    // past the last row
}

TEST_F(AverageBrightnessTest, AnEmptyRectangleIsNotANumber) {
  const Bytes gray = ramp(10, 10);
  EXPECT_TRUE(std::isnan(average(gray, 10, 10, 10, 0, 5, 5)));
  EXPECT_TRUE(std::isnan(average(gray, 10, 10, 4, 10, 5, 7)));  // 4 + 7 > 10: no rows
}

TEST_F(AverageBrightnessTest, CountsIn32Bits) {
  // The sum and the product both pass 2^31 and meet again.
  EXPECT_EQ(average(Bytes(3000 * 3000, 255), 3000, 3000, 0, 0, 3000, 3000), 1.0F);
}

TEST_F(AverageBrightnessTest, ARectangleOutsideIsRefusedAndTheArrayStaysPinned) {
  const struct {
    int x, y, w, h;
  } cases[] = {{11, 0, 5, 5}, {0, 9, 5, 5}, {0, 0, 0, 5}, {0, 0, 5, 0}, {0, 0, -1, 5}, {0, 0, 5, -3}};
  for (const auto& one : cases) {
    EXPECT_EQ(average(ramp(10, 8), 10, 8, one.x, one.y, one.w, one.h), 0.0F);
    char message[200];
    snprintf(message, sizeof message,
             "log 5 FaceAPI: averageBrightness native area is not in image frame imageFrame : "
             "10x8,area[x,y,w,h] : %d,%d,%d,%d",
             one.x, one.y, one.w, one.h);
    expect_journal({"GetByteArrayElements(gray)", message});
    stays_pinned.emplace_back("gray");
  }
  CALL(setDebug, JNI_FALSE);
  EXPECT_EQ(average(ramp(10, 8), 10, 8, 0, 0, 0, 0), 0.0F);
  expect_journal({"GetByteArrayElements(gray)"});
  stays_pinned.emplace_back("gray");
}

TEST_F(AverageBrightnessTest, AnImageThatIsRefusedIsZero) {
  vm.refuse("GetByteArrayElements", 1);
  EXPECT_EQ(average(ramp(10, 8), 10, 8, 0, 0, 4, 4), 0.0F);
  EXPECT_TRUE(vm.exception_pending());
  expect_journal({"GetByteArrayElements(gray)"});
}

}  // namespace
