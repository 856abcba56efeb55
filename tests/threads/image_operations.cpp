// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

#include <gtest/gtest.h>

#include <algorithm>

#include "brightness/brightness.h"
#include "fastcv/fastcv.h"
#include "frame/frame.h"
#include "operation.h"
#include "tests/support/cvt_families.h"
#include "tests/support/guarded_image.h"

namespace threads {

namespace {

using namespace HPC::fastcv;
using kyface::test::isFrom420;
using kyface::test::isTo420;

template <typename T, int nc>
using Image = Mat<T, nc, ECO_ENV_ARM>;

// Rows of several blocks, a group and a tail. A picture of four channels is what every source and destination
// has room for, with a few pixels that a conversion may reach behind its end.
constexpr int kWidth = 54;
constexpr int kHeight = 12;
constexpr size_t kRoom = static_cast<size_t>(kWidth) * kHeight * 4 + 16;

template <typename T>
std::vector<T>& source() {
  static std::vector<T> samples = [] {
    kyface::test::ByteSource next(1);
    std::vector<T> all(kRoom);
    for (T& sample : all) {
      sample = sizeof(T) == 1 ? static_cast<T>(next()) : static_cast<T>(next()) / 255;
    }
    return all;
  }();
  return samples;
}

constexpr int rowsOf(bool is420) { return is420 ? kHeight / 2 * 3 : kHeight; }

template <typename T>
struct Destination {
  std::vector<T> samples = std::vector<T>(kRoom);

  T* data() { return samples.data(); }
  Bytes bytes() const {
    const auto* first = reinterpret_cast<const unsigned char*>(samples.data());
    return {first, first + samples.size() * sizeof(T)};
  }
};

template <ColorCvtType type, typename T, int ncSrc, int ncDst>
Operation conversion(const char* name) {
  return {name, [] {
            Destination<T> out;
            const Image<T, ncSrc> src(kWidth, rowsOf(isFrom420(type)), source<T>().data());
            Image<T, ncDst> dst(kWidth, rowsOf(isTo420(type)), out.data());
            EXPECT_EQ((cvtColor<type, T, ncSrc, T, ncDst, ECO_ENV_ARM>(src, &dst)), HPC_SUCCESS);
            return out.bytes();
          }};
}

template <typename T, int nc>
void addPacked(std::vector<Operation>& operations) {
  for (const T ratio : {T{1}, T{2}}) {
    operations.push_back({"crop", [ratio] {
                            Destination<T> out;
                            const Image<T, nc> src(kWidth, kHeight, source<T>().data());
                            Image<T, nc> dst(kWidth - 5, kHeight - 3, out.data());
                            EXPECT_EQ((crop<T, nc, T, nc, nc, ECO_ENV_ARM>(src, {3, 2}, ratio, &dst)),
                                      HPC_SUCCESS);
                            return out.bytes();
                          }});
  }
  for (const int angle : {90, 180, 270}) {
    operations.push_back(
        {"rotate", [angle] {
           Destination<T> out;
           const bool sideways = angle != 180;
           const Image<T, nc> src(kWidth, kHeight, source<T>().data());
           Image<T, nc> dst(sideways ? kHeight : kWidth, sideways ? kWidth : kHeight, out.data());
           EXPECT_EQ((rotate<T, nc, nc, nc, ECO_ENV_ARM>(src, &dst, static_cast<float>(angle))), HPC_SUCCESS);
           return out.bytes();
         }});
  }
}

template <YUV420Type type>
void addFrameRotations(std::vector<Operation>& operations) {
  for (const int angle : {90, 180, 270}) {
    operations.push_back(
        {"rotate_YUV420", [angle] {
           Destination<unsigned char> out;
           const bool sideways = angle != 180;
           const Image<unsigned char, 1> src(kWidth, kHeight / 2 * 3, source<unsigned char>().data());
           Image<unsigned char, 1> dst(sideways ? kHeight : kWidth, (sideways ? kWidth : kHeight) / 2 * 3,
                                       out.data());
           EXPECT_EQ((rotate_YUV420<type, unsigned char, ECO_ENV_ARM>(src, &dst, static_cast<float>(angle))),
                     HPC_SUCCESS);
           return out.bytes();
         }});
  }
}

Operation metric(const char* name, decltype(calcGray_YUV)* measure) {
  return {name, [measure] {
            return Bytes{measure(source<unsigned char>().data(), kWidth, kWidth * 4, kHeight, kHeight, 3, 1,
                                 kWidth - 5, kHeight - 2)};
          }};
}

/// A frame helper that takes a `format`, with both.
void addHelper(std::vector<Operation>& operations, const char* name, decltype(nv2RGB)* help) {
  for (const int format : {2, 3}) {
    operations.push_back({name, [=] {
                            Destination<unsigned char> out;
                            help(source<unsigned char>().data(), format, kWidth, kHeight, out.data());
                            return out.bytes();
                          }});
  }
}

Operation helper(const char* name, decltype(BGR2RGB)* help) {
  return {name, [help] {
            Destination<unsigned char> out;
            help(source<unsigned char>().data(), kWidth, kHeight, out.data());
            return out.bytes();
          }};
}

}  // namespace

std::vector<Operation> imageOperations() {
  source<unsigned char>();
  source<float>();
  std::vector<Operation> operations = {
#define CONVERSION(type, T, ncSrc, ncDst) \
  conversion<type, T, ncSrc, ncDst>(#type "<" #T "> " #ncSrc "-" #ncDst),
      FASTCV_CVT_COLOR_INSTANCES(CONVERSION)
#undef CONVERSION
  };
#define PACKED(T, nc) addPacked<T, nc>(operations);
  FASTCV_PACKED_INSTANCES(PACKED)
#undef PACKED
#define FRAME_ROTATIONS(type) addFrameRotations<type>(operations);
  FASTCV_YUV420_INSTANCES(FRAME_ROTATIONS)
#undef FRAME_ROTATIONS

  operations.push_back(metric("calcGray_YUV", calcGray_YUV));
  operations.push_back(metric("calcGray_BGRA", calcGray_BGRA));
  operations.push_back(metric("calcGray_RGBA", calcGray_RGBA));
  operations.push_back(metric("calcLuminance_BGRA", calcLuminance_BGRA));
  operations.push_back(metric("calcLuminance_RGBA", calcLuminance_RGBA));

  addHelper(operations, "nv2RGB", nv2RGB);
  addHelper(operations, "RGB2nv", RGB2nv);
  addHelper(operations, "nv2BGR", nv2BGR);
  addHelper(operations, "nv212BGR", nv212BGR);
  addHelper(operations, "BGR2nv", BGR2nv);
  operations.push_back(helper("BGR2RGB", BGR2RGB));
  operations.push_back(helper("BGRA2RGB", BGRA2RGB));
  operations.push_back({"cropNv21", [] {
                          Destination<unsigned char> out;
                          cropNv21(source<unsigned char>().data(), kWidth, kHeight, 4, 2, kWidth - 8,
                                   kHeight - 4, out.data());
                          return out.bytes();
                        }});
  operations.push_back({"rotateBGR", [] {
                          Destination<unsigned char> out;
                          int size[2];
                          rotateBGR(source<unsigned char>().data(), kWidth, kHeight, out.data(), 270, size);
                          EXPECT_EQ(size[0], kHeight);
                          EXPECT_EQ(size[1], kWidth);
                          return out.bytes();
                        }});
  return operations;
}

}  // namespace threads
