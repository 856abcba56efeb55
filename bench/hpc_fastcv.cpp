// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// This project's own operations, taken from the lists of instances that exist.

#include "fastcv/fastcv.h"

#include <cctype>
#include <string_view>

#include "brightness/brightness.h"
#include "fastcv/kernels.h"
#include "operation.h"

namespace bench {
namespace {

using namespace HPC::fastcv;

template <typename T, int nc>
using Image = Mat<T, nc, ECO_ENV_ARM>;

// The two sides of a conversion, from the name of its enumerator: "CVT_NV212BGR" is from "NV21" to "BGR". The
// first 2 before a letter separates them.
struct Sides {
  std::string from;
  std::string to;
};

Sides sidesOf(std::string_view enumerator) {
  const std::string_view pair = enumerator.substr(enumerator.find('_') + 1);
  size_t two = pair.find('2');
  while (std::isalpha(static_cast<unsigned char>(pair[two + 1])) == 0) {
    two = pair.find('2', two + 1);
  }
  return {std::string(pair.substr(0, two)), std::string(pair.substr(two + 1))};
}

bool isYuv420(const std::string& side) {
  return side == "NV21" || side == "NV12" || side == "I420" || side == "YUV";
}

// The side with its alpha, if it has one.
std::string withAlpha(const std::string& side, int channels) {
  return channels == 4 && side.back() != 'A' ? side + "A" : side;
}

// Rows of the matrix that holds a side of a picture.
int rowsOf(const std::string& side, int height) { return isYuv420(side) ? height * 3 / 2 : height; }

// Floats that a side may hold, roughly: what kernels branch on, if they do.
template <typename T>
Range rangeOf(const std::string& side) {
  if (sizeof(T) == 1) {
    return {0, 255};
  }
  return side == "HSV" ? Range{0, 360} : side == "LAB" ? Range{-100, 100} : Range{0, 1};
}

template <ColorCvtType type, typename T, int ncSrc, int ncDst>
void addConversion(std::vector<Operation>& operations, const char* enumerator) {
  const Sides sides = sidesOf(enumerator);
  const double in = type == CVT_YUV2GRAY ? 1 : isYuv420(sides.from) ? 1.5 : ncSrc;
  const double out = isYuv420(sides.to) ? 1.5 : ncDst;
  operations.push_back(
      {withAlpha(sides.from, ncSrc) + "-to-" + withAlpha(sides.to, ncDst) + (sizeof(T) == 1 ? "" : "-f32"),
       "fastcv", (in + out) * sizeof(T), [sides](Size size) {
         const int inRows = rowsOf(sides.from, size.height);
         const int outRows = rowsOf(sides.to, size.height);
         const auto pixels = [&](int rows, int channels) {
           return static_cast<size_t>(size.width) * static_cast<size_t>(rows) * static_cast<size_t>(channels);
         };
         const auto src = samples<T>(pixels(inRows, ncSrc), rangeOf<T>(sides.from));
         const auto dst = samples<T>(pixels(outRows, ncDst));
         return [=] {
           const Image<T, ncSrc> from(size.width, inRows, src.get());
           Image<T, ncDst> to(size.width, outRows, dst.get());
           if (cvtColor<type, T, ncSrc, T, ncDst, ECO_ENV_ARM>(from, &to) != HPC_SUCCESS) {
             std::abort();
           }
         };
       }});
}

// "u8x3", "f32x1"
template <typename T>
std::string pixelName(int channels) {
  return (sizeof(T) == 1 ? "u8x" : "f32x") + std::to_string(channels);
}

template <typename T, int nc>
void addCrop(std::vector<Operation>& operations, const char* name, T ratio) {
  operations.push_back({name + pixelName<T>(nc), "fastcv", 2.0 * nc * sizeof(T), [ratio](Size size) {
                          const Size whole = croppedFrom(size);
                          const auto src = samples<T>(whole.pixels() * nc);
                          const auto dst = samples<T>(size.pixels() * nc);
                          return [=] {
                            const Image<T, nc> from(whole.width, whole.height, src.get());
                            Image<T, nc> to(size.width, size.height, dst.get());
                            const Point2_<int> at{kCropMargin, kCropMargin};
                            if (crop<T, nc, T, nc, nc, ECO_ENV_ARM>(from, at, ratio, &to) != HPC_SUCCESS) {
                              std::abort();
                            }
                          };
                        }});
}

constexpr int kAngles[] = {90, 180, 270};

// Through the kernel, as there are more of them than the front-end reaches: two channels are chroma pairs.
template <typename T, int nc>
void addRotations(std::vector<Operation>& operations) {
  for (const int angle : kAngles) {
    operations.push_back({"rotate" + std::to_string(angle) + "-" + pixelName<T>(nc), "fastcv",
                          2.0 * nc * sizeof(T), [angle](Size size) {
                            const auto src = samples<T>(size.pixels() * nc);
                            const auto dst = samples<T>(size.pixels() * nc);
                            const Size out = rotatedBy(angle, size);
                            return [=] {
                              armRotateNx90degree<T, nc, nc, nc>(size.height, size.width, size.width * nc,
                                                                 src.get(), out.height, out.width,
                                                                 out.width * nc, dst.get(), angle);
                            };
                          }});
  }
}

template <YUV420Type type>
void addFrameRotations(std::vector<Operation>& operations, const char* name) {
  for (const int angle : kAngles) {
    operations.push_back({"rotate" + std::to_string(angle) + "-" + name, "fastcv", 3, [angle](Size size) {
                            const auto src = samples<unsigned char>(size.pixels() * 3 / 2);
                            const auto dst = samples<unsigned char>(size.pixels() * 3 / 2);
                            const Size out = rotatedBy(angle, size);
                            return [=] {
                              const Image<unsigned char, 1> from(size.width, size.height * 3 / 2, src.get());
                              Image<unsigned char, 1> to(out.width, out.height * 3 / 2, dst.get());
                              const auto degree = static_cast<float>(angle);
                              if (rotate_YUV420<type, unsigned char, ECO_ENV_ARM>(from, &to, degree) !=
                                  HPC_SUCCESS) {
                                std::abort();
                              }
                            };
                          }});
  }
}

using Metric = unsigned char(const unsigned char*, int, int, int, int, int, int, int, int);

// Over the whole picture.
void addMetric(std::vector<Operation>& operations, const char* name, int channels, Metric* metric) {
  operations.push_back({name, "fastcv", static_cast<double>(channels), [=](Size size) {
                          const auto data =
                              samples<unsigned char>(size.pixels() * static_cast<size_t>(channels));
                          return [=] {
                            [[maybe_unused]] volatile unsigned char mean =
                                metric(data.get(), size.width, size.width * channels, size.height,
                                       size.height, 0, 0, size.width, size.height);
                          };
                        }});
}

}  // namespace

void addFastcv(std::vector<Operation>& operations) {
#define BENCH_CONVERSION(type, T, ncSrc, ncDst) addConversion<type, T, ncSrc, ncDst>(operations, #type);
  FASTCV_CVT_COLOR_INSTANCES(BENCH_CONVERSION)
#undef BENCH_CONVERSION
#define BENCH_CROP(T, nc)                 \
  addCrop<T, nc>(operations, "crop-", 1); \
  addCrop<T, nc>(operations, "crop-scaled-", 2);
  FASTCV_PACKED_INSTANCES(BENCH_CROP)
#undef BENCH_CROP
  addRotations<unsigned char, 1>(operations);
  addRotations<unsigned char, 2>(operations);
  addRotations<unsigned char, 3>(operations);
  addRotations<unsigned char, 4>(operations);
  addRotations<float, 1>(operations);
  addRotations<float, 2>(operations);
  addRotations<float, 3>(operations);
  addRotations<float, 4>(operations);
  addFrameRotations<YUV420_NV21>(operations, "NV21");
  addFrameRotations<YUV420_I420>(operations, "I420");
  addMetric(operations, "calcGray_YUV", 3, calcGray_YUV);
  addMetric(operations, "calcGray_BGRA", 4, calcGray_BGRA);
  addMetric(operations, "calcGray_RGBA", 4, calcGray_RGBA);
  addMetric(operations, "calcLuminance_BGRA", 4, calcLuminance_BGRA);
  addMetric(operations, "calcLuminance_RGBA", 4, calcLuminance_RGBA);
}

}  // namespace bench
