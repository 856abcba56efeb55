// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// What OpenCV has of the operations, on one thread.

#include <opencv2/core.hpp>
#include <opencv2/imgproc.hpp>

#include "operation.h"

namespace bench {
namespace {

// A matrix over random samples, and what keeps them alive. `sampleType` is CV_8U or CV_32F.
struct Image {
  std::shared_ptr<void> owner;
  cv::Mat mat;
};

Image image(int rows, int columns, int sampleType, int channels) {
  const size_t count =
      static_cast<size_t>(rows) * static_cast<size_t>(columns) * static_cast<size_t>(channels);
  std::shared_ptr<void> owner;
  if (sampleType == CV_8U) {
    owner = samples<unsigned char>(count);
  } else {
    owner = samples<float>(count);
  }
  return {owner, cv::Mat(rows, columns, CV_MAKETYPE(sampleType, channels), owner.get())};
}

size_t bytesOf(int sampleType) { return sampleType == CV_8U ? 1 : sizeof(float); }

struct Conversion {
  const char* name;
  int code;
  int ncSrc;
  int ncDst;
};

constexpr Conversion kConversions[] = {
    {"BGR-to-RGB", cv::COLOR_BGR2RGB, 3, 3},
    {"BGR-to-RGBA", cv::COLOR_BGR2RGBA, 3, 4},
    {"BGRA-to-RGB", cv::COLOR_BGRA2RGB, 4, 3},
    {"BGRA-to-RGBA", cv::COLOR_BGRA2RGBA, 4, 4},
    {"BGR-to-BGRA", cv::COLOR_BGR2BGRA, 3, 4},
    {"BGRA-to-BGR", cv::COLOR_BGRA2BGR, 4, 3},
    {"BGR-to-GRAY", cv::COLOR_BGR2GRAY, 3, 1},
    {"BGRA-to-GRAY", cv::COLOR_BGRA2GRAY, 4, 1},
    {"GRAY-to-BGR", cv::COLOR_GRAY2BGR, 1, 3},
    {"GRAY-to-BGRA", cv::COLOR_GRAY2BGRA, 1, 4},
    // These take four channels as three: the fourth is ignored, or made.
    {"BGR-to-YCrCb", cv::COLOR_BGR2YCrCb, 3, 3},
    {"BGRA-to-YCrCb", cv::COLOR_BGR2YCrCb, 4, 3},
    {"YCrCb-to-BGR", cv::COLOR_YCrCb2BGR, 3, 3},
    {"YCrCb-to-BGRA", cv::COLOR_YCrCb2BGR, 3, 4},
    {"BGR-to-HSV", cv::COLOR_BGR2HSV, 3, 3},
    {"BGRA-to-HSV", cv::COLOR_BGR2HSV, 4, 3},
    {"HSV-to-BGR", cv::COLOR_HSV2BGR, 3, 3},
    {"HSV-to-BGRA", cv::COLOR_HSV2BGR, 3, 4},
    {"BGR-to-LAB", cv::COLOR_BGR2Lab, 3, 3},
    {"BGRA-to-LAB", cv::COLOR_BGR2Lab, 4, 3},
    {"LAB-to-BGR", cv::COLOR_Lab2BGR, 3, 3},
    {"LAB-to-BGRA", cv::COLOR_Lab2BGR, 3, 4},
};

// To and from 4:2:0; channels of the packed side.
struct YuvConversion {
  const char* name;
  int code;
  int channels;
  bool toYuv;
};

constexpr YuvConversion kYuvConversions[] = {
    {"NV21-to-BGR", cv::COLOR_YUV2BGR_NV21, 3, false}, {"NV21-to-BGRA", cv::COLOR_YUV2BGRA_NV21, 4, false},
    {"NV21-to-RGB", cv::COLOR_YUV2RGB_NV21, 3, false}, {"NV21-to-RGBA", cv::COLOR_YUV2RGBA_NV21, 4, false},
    {"NV12-to-BGR", cv::COLOR_YUV2BGR_NV12, 3, false}, {"NV12-to-BGRA", cv::COLOR_YUV2BGRA_NV12, 4, false},
    {"NV12-to-RGB", cv::COLOR_YUV2RGB_NV12, 3, false}, {"NV12-to-RGBA", cv::COLOR_YUV2RGBA_NV12, 4, false},
    {"I420-to-BGR", cv::COLOR_YUV2BGR_I420, 3, false}, {"I420-to-BGRA", cv::COLOR_YUV2BGRA_I420, 4, false},
    {"BGR-to-I420", cv::COLOR_BGR2YUV_I420, 3, true},  {"BGRA-to-I420", cv::COLOR_BGRA2YUV_I420, 4, true},
    {"YUV-to-GRAY", cv::COLOR_YUV2GRAY_420, 1, false},
};

void addConversion(std::vector<Operation>& operations, const Conversion& conversion, int sampleType) {
  const std::string suffix = sampleType == CV_8U ? "" : "-f32";
  const double traffic = static_cast<double>(bytesOf(sampleType)) * (conversion.ncSrc + conversion.ncDst);
  operations.push_back({conversion.name + suffix, "opencv", traffic, [=](Size size) {
                          const Image in = image(size.height, size.width, sampleType, conversion.ncSrc);
                          const Image out = image(size.height, size.width, sampleType, conversion.ncDst);
                          return [=] {
                            cv::Mat dst = out.mat;
                            cv::cvtColor(in.mat, dst, conversion.code, conversion.ncDst);
                          };
                        }});
}

void addYuvConversion(std::vector<Operation>& operations, const YuvConversion& conversion) {
  const double packed = conversion.channels;
  const double yuv = conversion.channels == 1 ? 1 : 1.5;
  operations.push_back({conversion.name, "opencv", packed + yuv, [=](Size size) {
                          const Image picture = image(size.height, size.width, CV_8U, conversion.channels);
                          const Image buffer = image(size.height * 3 / 2, size.width, CV_8U, 1);
                          return [=] {
                            cv::Mat dst = conversion.toYuv ? buffer.mat : picture.mat;
                            cv::cvtColor(conversion.toYuv ? picture.mat : buffer.mat, dst, conversion.code);
                          };
                        }});
}

void addRotations(std::vector<Operation>& operations, int sampleType, int channels) {
  struct Angle {
    const char* name;
    int code;
  };
  for (const Angle angle : {Angle{"rotate90", cv::ROTATE_90_CLOCKWISE}, Angle{"rotate180", cv::ROTATE_180},
                            Angle{"rotate270", cv::ROTATE_90_COUNTERCLOCKWISE}}) {
    const std::string suffix = (sampleType == CV_8U ? "-u8x" : "-f32x") + std::to_string(channels);
    const double traffic = 2.0 * static_cast<double>(bytesOf(sampleType)) * channels;
    operations.push_back({angle.name + suffix, "opencv", traffic, [=](Size size) {
                            const bool upright = angle.code == cv::ROTATE_180;
                            const Image in = image(size.height, size.width, sampleType, channels);
                            const Image out = image(upright ? size.height : size.width,
                                                    upright ? size.width : size.height, sampleType, channels);
                            return [=] {
                              cv::Mat dst = out.mat;
                              cv::rotate(in.mat, dst, angle.code);
                            };
                          }});
  }
}

void addCrops(std::vector<Operation>& operations, int sampleType, int channels) {
  const std::string suffix = (sampleType == CV_8U ? "u8x" : "f32x") + std::to_string(channels);
  const double traffic = 2.0 * static_cast<double>(bytesOf(sampleType)) * channels;
  for (const bool scaled : {false, true}) {
    operations.push_back({(scaled ? "crop-scaled-" : "crop-") + suffix, "opencv", traffic, [=](Size size) {
                            const Size whole = croppedFrom(size);
                            const Image in = image(whole.height, whole.width, sampleType, channels);
                            const Image out = image(size.height, size.width, sampleType, channels);
                            const cv::Mat region =
                                in.mat(cv::Rect(kCropMargin, kCropMargin, size.width, size.height));
                            return [=] {
                              cv::Mat dst = out.mat;
                              scaled ? region.convertTo(dst, -1, 2) : region.copyTo(dst);
                              // The images must outlive the views of them.
                              static_cast<void>(in);
                            };
                          }});
  }
}

// The mean of a picture's gray, by way of a gray picture where there is more than luma to read.
void addMeans(std::vector<Operation>& operations) {
  operations.push_back({"calcGray_YUV", "opencv", 3, [](Size size) {
                          const Image in = image(size.height, size.width, CV_8U, 3);
                          return [=] { [[maybe_unused]] volatile double mean = cv::mean(in.mat)[0]; };
                        }});
  struct Order {
    const char* name;
    int code;
  };
  for (const Order order :
       {Order{"calcGray_BGRA", cv::COLOR_BGRA2GRAY}, Order{"calcGray_RGBA", cv::COLOR_RGBA2GRAY}}) {
    operations.push_back({order.name, "opencv", 4, [order](Size size) {
                            const Image in = image(size.height, size.width, CV_8U, 4);
                            const Image gray = image(size.height, size.width, CV_8U, 1);
                            return [=] {
                              cv::Mat dst = gray.mat;
                              cv::cvtColor(in.mat, dst, order.code);
                              [[maybe_unused]] volatile double mean = cv::mean(dst)[0];
                            };
                          }});
  }
}

}  // namespace

void addOpencv(std::vector<Operation>& operations) {
  cv::setNumThreads(1);
  for (const Conversion& conversion : kConversions) {
    addConversion(operations, conversion, CV_8U);
    addConversion(operations, conversion, CV_32F);
  }
  for (const YuvConversion& conversion : kYuvConversions) {
    addYuvConversion(operations, conversion);
  }
  for (const int sampleType : {CV_8U, CV_32F}) {
    for (const int channels : {1, 2, 3, 4}) {
      addRotations(operations, sampleType, channels);
      if (channels != 2) {
        addCrops(operations, sampleType, channels);
      }
    }
  }
  addMeans(operations);
}

}  // namespace bench
