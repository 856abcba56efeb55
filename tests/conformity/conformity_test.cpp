// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// OpenCV as a second opinion. For every conversion that both have, the largest difference between the two
// over all inputs (8-bit) or a dense set of them (float) must be the one that the table of docs/conformity.md
// holds, which says what it comes from.

#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <cmath>
#include <cstdio>
#include <fstream>
#include <functional>
#include <map>
#include <opencv2/core.hpp>
#include <opencv2/imgproc.hpp>
#include <random>
#include <set>
#include <sstream>
#include <string>
#include <vector>

#include "fastcv/fastcv.h"
#include "tests/support/cvt_families.h"

namespace {

using namespace HPC::fastcv;  // the conversions' names
using kyface::test::isFrom420;
using kyface::test::isTo420;

/// OpenCV's code for a conversion. Four channels are given to, or wanted from, the codes of three where it
/// takes them so: the fourth is ignored, or made.
struct Counterpart {
  const char* name;  ///< in the table
  int code;          ///< with 3 channels on the colour side
  int code4;         ///< with 4
};

const std::map<ColorCvtType, Counterpart>& counterparts() {
  static const std::map<ColorCvtType, Counterpart> all = {
      {CVT_NV212BGR, {"NV21 to BGR", cv::COLOR_YUV2BGR_NV21, cv::COLOR_YUV2BGRA_NV21}},
      {CVT_NV212RGB, {"NV21 to RGB", cv::COLOR_YUV2RGB_NV21, cv::COLOR_YUV2RGBA_NV21}},
      {CVT_NV122BGR, {"NV12 to BGR", cv::COLOR_YUV2BGR_NV12, cv::COLOR_YUV2BGRA_NV12}},
      {CVT_NV122RGB, {"NV12 to RGB", cv::COLOR_YUV2RGB_NV12, cv::COLOR_YUV2RGBA_NV12}},
      {CVT_BGR2I420, {"BGR to I420", cv::COLOR_BGR2YUV_I420, cv::COLOR_BGRA2YUV_I420}},
      {CVT_I4202BGR, {"I420 to BGR", cv::COLOR_YUV2BGR_I420, cv::COLOR_YUV2BGRA_I420}},
      {CVT_YUV2GRAY, {"4:2:0 to gray", cv::COLOR_YUV2GRAY_420, cv::COLOR_YUV2GRAY_420}},
      {CVT_BGR2GRAY, {"BGR to gray", cv::COLOR_BGR2GRAY, cv::COLOR_BGRA2GRAY}},
      {CVT_GRAY2BGR, {"gray to BGR", cv::COLOR_GRAY2BGR, cv::COLOR_GRAY2BGRA}},
      {CVT_BGR2YCrCb, {"BGR to YCrCb", cv::COLOR_BGR2YCrCb, cv::COLOR_BGR2YCrCb}},
      {CVT_YCrCb2BGR, {"YCrCb to BGR", cv::COLOR_YCrCb2BGR, cv::COLOR_YCrCb2BGR}},
      {CVT_BGR2HSV, {"BGR to HSV", cv::COLOR_BGR2HSV, cv::COLOR_BGR2HSV}},
      {CVT_HSV2BGR, {"HSV to BGR", cv::COLOR_HSV2BGR, cv::COLOR_HSV2BGR}},
      {CVT_BGR2LAB, {"BGR to Lab", cv::COLOR_BGR2Lab, cv::COLOR_BGR2Lab}},
      {CVT_LAB2BGR, {"Lab to BGR", cv::COLOR_Lab2BGR, cv::COLOR_Lab2BGR}},
  };
  return all;
}

int channelReordering(int ncSrc, int ncDst, bool swap) {
  if (ncSrc == 3) {
    return ncDst == 3 ? cv::COLOR_BGR2RGB : swap ? cv::COLOR_BGR2RGBA : cv::COLOR_BGR2BGRA;
  }
  return ncDst == 4 ? cv::COLOR_BGRA2RGBA : swap ? cv::COLOR_BGRA2RGB : cv::COLOR_BGRA2BGR;
}

struct Instance {
  ColorCvtType type;
  int depth;  // OpenCV's
  int ncSrc;
  int ncDst;
  HPCStatus_t (*convert)(cv::Mat& src, cv::Mat& dst);
};

template <typename T, int nc>
Mat<T, nc, ECO_ENV_ARM> view(cv::Mat& mat) {
  Mat<T, nc, ECO_ENV_ARM> result(mat.cols, mat.rows, mat.ptr<T>());
  result.step = static_cast<int64_t>(mat.step);
  return result;
}

template <ColorCvtType type, typename T, int ncSrc, int ncDst>
HPCStatus_t convert(cv::Mat& src, cv::Mat& dst) {
  auto out = view<T, ncDst>(dst);
  return cvtColor<type, T, ncSrc, T, ncDst, ECO_ENV_ARM>(view<T, ncSrc>(src), &out);
}

std::vector<Instance> instances() {
#define INSTANCE_OF(type, T, ncSrc, ncDst) \
  {type, cv::DataType<T>::depth, ncSrc, ncDst, convert<type, T, ncSrc, ncDst>},
  return {FASTCV_CVT_COLOR_INSTANCES(INSTANCE_OF)};
}

bool isChannelOrder(ColorCvtType type) {
  return type == CVT_BGR2BGRA || type == CVT_BGRA2BGR || type == CVT_BGR2RGB;
}

std::string nameOf(const Instance& instance) {
  return isChannelOrder(instance.type) ? "channel orders" : counterparts().at(instance.type).name;
}

int codeOf(const Instance& instance) {
  if (isChannelOrder(instance.type)) {
    return channelReordering(instance.ncSrc, instance.ncDst, instance.type == CVT_BGR2RGB);
  }
  const Counterpart& counterpart = counterparts().at(instance.type);
  return std::max(instance.ncSrc, instance.ncDst) == 4 ? counterpart.code4 : counterpart.code;
}

using Use = std::function<void(cv::Mat&)>;

/// All (Y, U, V) in a layout of 4:2:0: a chroma byte a frame, the other along a chroma row, four Ys a block.
void forEachFrame(bool planar, const Use& use) {
  constexpr int kWidth = 512, kHeight = 128, kSamples = kWidth / 2 * kHeight / 2;
  cv::Mat frame(kHeight * 3 / 2, kWidth, CV_8UC1);
  for (int first = 0; first < 256; ++first) {
    for (int r = 0; r < kHeight; ++r) {
      for (int x = 0; x < kWidth; ++x) {
        frame.at<unsigned char>(r, x) = static_cast<unsigned char>(r / 2 * 4 + r % 2 * 2 + x % 2);
      }
    }
    unsigned char* chroma = frame.ptr(kHeight);
    for (int i = 0; i < kSamples; ++i) {
      chroma[planar ? i : 2 * i] = static_cast<unsigned char>(first);
      chroma[planar ? kSamples + i : 2 * i + 1] = static_cast<unsigned char>(i % 256);
    }
    use(frame);
  }
}

/// All 8-bit colours whose first channel is in a range: a first channel an image, and an alpha of all sorts.
/// With `block` 2 a colour is the top-left pixel of a 2 x 2 block, whose others differ.
void forEachColour(int channels, int block, int begin, int end, const Use& use) {
  cv::Mat image(256 * block, 256 * block, CV_8UC(channels));
  for (int first = begin; first < end; ++first) {
    for (int r = 0; r < image.rows; ++r) {
      for (int x = 0; x < image.cols; ++x) {
        const int pixel[] = {r % block == 0 && x % block == 0 ? first : 255 - first, r / block, x / block,
                             r + x};
        for (int c = 0; c < channels; ++c) {
          image.ptr(r)[x * channels + c] = static_cast<unsigned char>(pixel[c]);
        }
      }
    }
    use(image);
  }
}

/// Float pixels: a lattice over the ranges of the first three channels, then as many random ones.
void forEachFloat(int channels, const std::array<float, 4>& low, const std::array<float, 4>& high,
                  const Use& use) {
  constexpr int kSteps = 96;
  std::minstd_rand random(1);
  for (int first = 0; first < kSteps; ++first) {
    cv::Mat image(2 * kSteps, kSteps, CV_32FC(channels));
    for (int r = 0; r < image.rows; ++r) {
      for (int x = 0; x < image.cols; ++x) {
        const int at[] = {first, r, x, first};
        for (int c = 0; c < channels; ++c) {
          const auto i = static_cast<size_t>(c);
          const float part = r < kSteps || c == 3 ? static_cast<float>(at[i]) / (kSteps - 1)
                                                  : static_cast<float>(random() % 65537) / 65536;
          image.ptr<float>(r)[x * channels + c] = low[i] + part * (high[i] - low[i]);
        }
      }
    }
    use(image);
  }
}

/// A row of the table that an instance has a part in: its name, and its inputs.
struct Row {
  std::string name;
  std::function<void(const Use&)> forEachInput;
};

std::vector<Row> rowsOf(const Instance& instance) {
  const int nc = instance.ncSrc;
  const std::string name = nameOf(instance);
  if (isFrom420(instance.type)) {
    const bool planar = instance.type == CVT_I4202BGR || instance.type == CVT_YUV2GRAY;
    return {{name, [=](const Use& use) { forEachFrame(planar, use); }}};
  }
  if (instance.depth == CV_32F) {
    const std::array<float, 4> low = {0, instance.type == CVT_LAB2BGR ? -100.0f : 0,
                                      instance.type == CVT_LAB2BGR ? -100.0f : 0, 0};
    const std::array<float, 4> high = instance.type == CVT_HSV2BGR   ? std::array<float, 4>{360, 1, 1, 1}
                                      : instance.type == CVT_LAB2BGR ? std::array<float, 4>{100, 100, 100, 1}
                                                                     : std::array<float, 4>{1, 1, 1, 1};
    return {{name, [=](const Use& use) { forEachFloat(nc, low, high, use); }}};
  }
  if (instance.type == CVT_HSV2BGR) {
    return {{name, [=](const Use& use) { forEachColour(nc, 1, 0, 180, use); }},
            {name + ", hues from 180", [=](const Use& use) { forEachColour(nc, 1, 180, 256, use); }}};
  }
  const int block = isTo420(instance.type) ? 2 : 1;
  return {{name, [=](const Use& use) { forEachColour(nc, block, 0, 256, use); }}};
}

/// The largest difference of two images; hues are compared around their circle.
double difference(const Instance& instance, const cv::Mat& ours, const cv::Mat& theirs) {
  double largest = 0;
  const double circle = instance.type != CVT_BGR2HSV ? 0 : instance.depth == CV_8U ? 180 : 360;
  for (int r = 0; r < ours.rows; ++r) {
    for (int x = 0; x < ours.cols * ours.channels(); ++x) {
      double d = instance.depth == CV_8U ? std::abs(ours.ptr(r)[x] - theirs.ptr(r)[x])
                                         : std::abs(double{ours.ptr<float>(r)[x]} - theirs.ptr<float>(r)[x]);
      if (circle > 0 && x % ours.channels() == 0) {
        d = std::min(d, circle - d);
      }
      largest = std::max(largest, d);
    }
  }
  return largest;
}

std::string written(double value, int depth) {
  char text[32];
  (void)snprintf(text, sizeof text, depth == CV_8U ? "%.0f" : "%.2g", value);
  return text;
}

/// The rows of the table: what is expected of a conversion, as written there.
std::map<std::string, std::string> table() {
  std::map<std::string, std::string> rows;
  std::ifstream file(CONFORMITY_TABLE);
  for (std::string line; std::getline(file, line);) {
    std::istringstream cells(line);
    std::string empty, name, samples, expected;
    if (std::getline(cells, empty, '|') && std::getline(cells, name, '|') &&
        std::getline(cells, samples, '|') && std::getline(cells, expected, '|')) {
      if (samples != " 8-bit " && samples != " float ") {
        continue;
      }
      const auto trimmed = [](const std::string& text) {
        const size_t first = text.find_first_not_of(' ');
        return first == std::string::npos ? "" : text.substr(first, text.find_last_not_of(' ') - first + 1);
      };
      rows[trimmed(name) + ", " + trimmed(samples)] = trimmed(expected);
    }
  }
  return rows;
}

bool isKnownToOpenCV(const Instance& instance) {
  return isChannelOrder(instance.type) || counterparts().contains(instance.type);
}

TEST(Conformity, LargestDifferencesAreThoseOfTheTable) {
  cv::setNumThreads(1);
  const std::map<std::string, std::string> expected = table();
  std::set<std::string> seen;
  for (const Instance& instance : instances()) {
    if (!isKnownToOpenCV(instance)) {
      continue;
    }
    for (const Row& row : rowsOf(instance)) {
      double largest = 0;
      row.forEachInput([&](cv::Mat& src) {
        cv::Mat theirs;
        cv::cvtColor(src, theirs, codeOf(instance), isTo420(instance.type) ? 0 : instance.ncDst);
        cv::Mat ours(theirs.rows, theirs.cols, theirs.type());
        ASSERT_EQ(instance.convert(src, ours), HPC_SUCCESS);
        largest = std::max(largest, difference(instance, ours, theirs));
      });
      const std::string key = row.name + ", " + (instance.depth == CV_8U ? "8-bit" : "float");
      seen.insert(key);
      const auto found = expected.find(key);
      EXPECT_EQ(written(largest, instance.depth), found == expected.end() ? "no row" : found->second)
          << key << ", " << instance.ncSrc << " to " << instance.ncDst << " channels";
    }
  }
  for (const auto& [key, value] : expected) {
    EXPECT_TRUE(seen.contains(key)) << "nothing was compared for the row \"" << key << "\"";
  }
}

}  // namespace
