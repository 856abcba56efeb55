// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// cvtColor's checks, in their order, and what it calls: every instance over kernels that only record their
// arguments. The definitions of the kernels here take the place of the library's.

#include <gtest/gtest.h>

#include <cstdint>
#include <cstring>
#include <iterator>
#include <set>
#include <sstream>
#include <string>
#include <vector>

#include "fastcv/fastcv.h"
#include "fastcv/kernels.h"
#include "tests/support/cvt_families.h"

namespace {

/// A call of a kernel. Pointers are kept as such, whatever their type.
struct Call {
  std::string instance;
  int height;
  int width;
  int inWidthStride;
  const void* inData;
  int outWidthStride;
  const void* outData;

  bool operator==(const Call&) const = default;
};

std::vector<Call> calls;

std::ostream& operator<<(std::ostream& out, const Call& call) {
  return out << call.instance << "(" << call.height << ", " << call.width << ", " << call.inWidthStride
             << ", " << call.inData << ", " << call.outWidthStride << ", " << call.outData << ")";
}

template <typename T, int ncSrc, int ncDst>
std::string instanceOf(const char* function) {
  return std::string(function) + (sizeof(T) == 1 ? "_u8_" : "_f32_") + std::to_string(ncSrc) + "_" +
         std::to_string(ncDst);
}

}  // namespace

namespace HPC::fastcv {

#define DEFINE_KERNEL(name, T, ncSrc, ncDst)                                                                 \
  template <>                                                                                                \
  void arm##name##Image<T, ncSrc, T, ncDst>(int height, int width, int inWidthStride, const T* inData,       \
                                            int outWidthStride, T* outData) {                                \
    calls.push_back({instanceOf<T, ncSrc, ncDst>("arm" #name "Image"), height, width, inWidthStride, inData, \
                     outWidthStride, outData});                                                              \
  }
FASTCV_NAMED_INSTANCES(DEFINE_KERNEL)

}  // namespace HPC::fastcv

namespace {

using HPC::fastcv::ColorCvtType;
using HPC::fastcv::ECO_ENV_ARM;
using HPC::fastcv::HPCStatus_t;
using HPC::fastcv::Mat;
using namespace HPC::fastcv;  // the conversions' names
using kyface::test::channelPairsOf;
using kyface::test::isFrom420;
using kyface::test::isTo420;
using kyface::test::sidesOf;

/// A matrix whatever its type: the fields that the front-end reads, and some that it must not.
struct Fields {
  int dims = 2;
  int width = 0;
  int height = 0;
  int64_t step = 0;
  void* data = nullptr;
  int64_t total = -1;
  int64_t byteSize = -1;

  bool operator==(const Fields&) const = default;
};

template <typename T, int nc>
void set(Mat<T, nc, ECO_ENV_ARM>& mat, const Fields& fields) {
  mat.dims = fields.dims;
  mat.width = fields.width;
  mat.height = fields.height;
  mat.step = fields.step;
  mat.data = static_cast<T*>(fields.data);
  mat.total = fields.total;
  mat.byteSize = fields.byteSize;
}

template <typename T, int nc>
Fields fieldsOf(const Mat<T, nc, ECO_ENV_ARM>& mat) {
  EXPECT_FALSE(mat.ownsData);
  return {mat.dims, mat.width, mat.height, mat.step, mat.data, mat.total, mat.byteSize};
}

/// Converts; `dst` may be null, and is left as the front-end leaves it.
template <ColorCvtType type, typename T, int ncSrc, int ncDst>
HPCStatus_t convert(const Fields& src, Fields* dst) {
  Mat<T, ncSrc, ECO_ENV_ARM> srcMat;
  set(srcMat, src);
  if (dst == nullptr) {
    return cvtColor<type, T, ncSrc, T, ncDst, ECO_ENV_ARM>(srcMat, nullptr);
  }
  Mat<T, ncDst, ECO_ENV_ARM> dstMat;
  set(dstMat, *dst);
  const HPCStatus_t status = cvtColor<type, T, ncSrc, T, ncDst, ECO_ENV_ARM>(srcMat, &dstMat);
  *dst = fieldsOf(dstMat);
  return status;
}

struct Instance {
  std::string name;
  std::string kernel;
  ColorCvtType type;
  int elementSize;
  int ncSrc;
  int ncDst;
  HPCStatus_t (*convert)(const Fields&, Fields*);
};

void PrintTo(const Instance& instance, std::ostream* out) { *out << instance.name; }

const std::vector<Instance>& instances() {
#define INSTANCE_OF(name, T, ncSrc, ncDst)           \
  {instanceOf<T, ncSrc, ncDst>("CVT_" #name),        \
   instanceOf<T, ncSrc, ncDst>("arm" #name "Image"), \
   CVT_##name,                                       \
   static_cast<int>(sizeof(T)),                      \
   ncSrc,                                            \
   ncDst,                                            \
   convert<CVT_##name, T, ncSrc, ncDst>},
  static const std::vector<Instance> all = {FASTCV_NAMED_INSTANCES(INSTANCE_OF)};
  return all;
}

enum class Family { kPacked, kTo420, kFrom420 };

Family familyOf(ColorCvtType type) {
  return isTo420(type) ? Family::kTo420 : isFrom420(type) ? Family::kFrom420 : Family::kPacked;
}

// The low 32 bits.
int32_t low(int64_t value) {
  return static_cast<int32_t>(static_cast<uint32_t>(static_cast<uint64_t>(value)));
}

/// A step in elements, rounded down.
int32_t elements(int64_t step, int elementSize) {
  const int64_t rest = (step % elementSize + elementSize) % elementSize;
  return low((step - rest) / elementSize);
}

/// Whether the sizes pass, said once more.
bool sizesPass(const Instance& instance, const Fields& src, const Fields& dst) {
  const int32_t srcStride = elements(src.step, instance.elementSize);
  const int32_t dstStride = elements(dst.step, instance.elementSize);
  const bool fit = srcStride >= low(int64_t{src.width} * instance.ncSrc) &&
                   dstStride >= low(int64_t{dst.width} * instance.ncDst);
  switch (familyOf(instance.type)) {
    case Family::kPacked:
      if (fit) {
        return src.width == dst.width && src.height == dst.height;
      }
      break;
    case Family::kFrom420:
      if (fit) {
        return dst.width % 2 == 0 && dst.height % 2 == 0 && src.width == dst.width &&
               dst.height == src.height / 3 * 2;
      }
      break;
    case Family::kTo420:
      break;
  }
  return src.width % 2 == 0 && src.height % 2 == 0 && src.width == dst.width &&
         src.height == dst.height / 3 * 2;
}

class CvtColor : public testing::TestWithParam<Instance> {
 protected:
  CvtColor() { calls.clear(); }

  static const Instance& instance() { return GetParam(); }
  static Family family() { return familyOf(instance().type); }

  /// A picture of `width` by `height` and its counterpart as the instance wants them, rows without padding.
  Fields source(int width, int height) {
    return fields(width, family() == Family::kFrom420 ? height * 3 / 2 : height, instance().ncSrc, in_);
  }
  Fields destination(int width, int height) {
    return fields(width, family() == Family::kTo420 ? height * 3 / 2 : height, instance().ncDst, out_);
  }

  /// Steps a little shorter than a row.
  static Fields shortened(Fields fields) {
    fields.step -= instance().elementSize;
    return fields;
  }

  static void expectCall(const Fields& src, const Fields& dst) {
    Fields after = dst;
    ASSERT_EQ(instance().convert(src, &after), HPC_SUCCESS) << describe(src, dst);
    EXPECT_TRUE(after == dst) << describe(src, dst);
    const Call expected = {instance().kernel, family() == Family::kFrom420 ? dst.height : src.height,
                           src.width,         elements(src.step, instance().elementSize),
                           src.data,          elements(dst.step, instance().elementSize),
                           dst.data};
    EXPECT_EQ(calls, std::vector<Call>{expected}) << describe(src, dst);
    calls.clear();
  }

  static void expectRefusal(HPCStatus_t status, const Fields& src, const Fields& dst) {
    Fields after = dst;
    EXPECT_EQ(instance().convert(src, &after), status) << describe(src, dst);
    EXPECT_TRUE(after == dst) << describe(src, dst);
    EXPECT_TRUE(calls.empty()) << describe(src, dst);
    calls.clear();
  }

  static std::string describe(const Fields& src, const Fields& dst) {
    std::string text;
    for (const Fields* f : {&src, &dst}) {
      text += " dims " + std::to_string(f->dims) + ", " + std::to_string(f->width) + " x " +
              std::to_string(f->height) + ", step " + std::to_string(f->step) + ";";
    }
    return text;
  }

 private:
  static Fields fields(int width, int height, int nc, char* data) {
    Fields result;
    result.width = width;
    result.height = height;
    result.step = int64_t{width} * nc * instance().elementSize;
    result.data = data;
    return result;
  }

  alignas(4) char in_[4] = {};
  alignas(4) char out_[4] = {};
};

TEST_P(CvtColor, PassesThePictureToItsKernel) {
  expectCall(source(64, 48), destination(64, 48));
  Fields src = source(64, 48);
  Fields dst = destination(64, 48);
  src.step += 12;
  dst.step += 64;
  expectCall(src, dst);
  // Nothing is known about the data.
  src.data = nullptr;
  dst.data = nullptr;
  expectCall(src, dst);
  // One pixel, its stride in elements.
  if (family() == Family::kPacked) {
    expectCall(source(1, 1), destination(1, 1));
  }
}

TEST_P(CvtColor, NullDestinationComesFirst) {
  EXPECT_EQ(instance().convert(source(64, 48), nullptr), HPC_INVALID_ARGS);
  Fields src = source(63, 47);
  src.dims = 0;
  EXPECT_EQ(instance().convert(src, nullptr), HPC_INVALID_ARGS);
  EXPECT_TRUE(calls.empty());
}

TEST_P(CvtColor, EmptyMatricesComeBeforeSizes) {
  for (const int width : {64, 63}) {
    const Fields src = source(width, 48);
    const Fields dst = destination(64, 47);
    Fields emptySrc = src;
    emptySrc.dims = 0;
    Fields emptyDst = dst;
    emptyDst.dims = 0;
    expectRefusal(HPC_MAT_EMPTY, emptySrc, dst);
    expectRefusal(HPC_MAT_EMPTY, src, emptyDst);
    expectRefusal(HPC_MAT_EMPTY, emptySrc, emptyDst);
  }
  // Whatever is not 0 is set up.
  Fields src = source(64, 48);
  Fields dst = destination(64, 48);
  src.dims = -1;
  dst.dims = 3;
  expectCall(src, dst);
}

TEST_P(CvtColor, RefusesOtherSizes) {
  const Fields src = source(64, 48);
  const Fields dst = destination(64, 48);
  for (const int delta : {-2, -1, 1, 2}) {
    Fields other = dst;
    other.width += delta;
    other.step += 16;
    expectRefusal(HPC_INVALID_ARGS, src, other);
    other = src;
    other.width += delta;
    other.step += 16;
    expectRefusal(HPC_INVALID_ARGS, other, dst);
    // A 4:2:0 buffer may be up to two rows higher than its picture needs.
    const bool enoughRows = delta > 0;
    other = dst;
    other.height += delta;
    if (family() == Family::kTo420 && enoughRows) {
      expectCall(src, other);
    } else {
      expectRefusal(HPC_INVALID_ARGS, src, other);
    }
    other = src;
    other.height += delta;
    if (family() == Family::kFrom420 && enoughRows) {
      expectCall(other, dst);
    } else {
      expectRefusal(HPC_INVALID_ARGS, other, dst);
    }
  }
}

TEST_P(CvtColor, OddSizes) {
  Fields src = source(63, 48);
  Fields dst = destination(63, 48);
  if (family() == Family::kPacked) {
    expectCall(src, dst);
    expectCall(source(63, 47), destination(63, 47));
    return;
  }
  expectRefusal(HPC_INVALID_ARGS, src, dst);
  // An odd picture height whose buffer agrees in every other way does not exist; these are the nearest.
  src = source(64, 48);
  dst = destination(64, 48);
  (family() == Family::kTo420 ? src : dst).height = 47;
  for (const int bufferHeight : {69, 70, 71, 72}) {
    (family() == Family::kTo420 ? dst : src).height = bufferHeight;
    expectRefusal(HPC_INVALID_ARGS, src, dst);
  }
}

// A step shorter than a row: the rule of a conversion to 4:2:0 decides.
TEST_P(CvtColor, ShortSteps) {
  const bool shortSrc[] = {true, false, true};
  const bool shortDst[] = {false, true, true};
  for (int i = 0; i < 3; ++i) {
    Fields src = source(64, 48);
    Fields dst = destination(64, 48);
    src.height = 48;
    dst.height = 72;
    if (shortSrc[i]) {
      src = shortened(src);
    }
    if (shortDst[i]) {
      dst = shortened(dst);
    }
    expectCall(src, dst);
    for (const int height : {73, 74}) {
      dst.height = height;
      expectCall(src, dst);
    }
    for (const int height : {48, 71, 75}) {
      dst.height = height;
      expectRefusal(HPC_INVALID_ARGS, src, dst);
    }
    dst.height = 72;
    src.height = 47;
    expectRefusal(HPC_INVALID_ARGS, src, dst);
    src.height = 48;
    dst.width = 62;
    expectRefusal(HPC_INVALID_ARGS, src, dst);
    src.width = 63;
    dst.width = 63;
    src.step = shortSrc[i] ? 0 : 1024;
    dst.step = shortDst[i] ? 0 : 1024;
    expectRefusal(HPC_INVALID_ARGS, src, dst);
  }
}

// All combinations of small sizes, negative ones too, with steps around the row.
TEST_P(CvtColor, EverySmallSize) {
  std::vector<std::pair<Fields, Fields>> pairs;
  for (int srcWidth = -2; srcWidth <= 3; ++srcWidth) {
    for (int dstWidth = -2; dstWidth <= 3; ++dstWidth) {
      for (int srcHeight = -4; srcHeight <= 8; ++srcHeight) {
        for (int dstHeight = -4; dstHeight <= 8; ++dstHeight) {
          for (const int srcExtra : {-1, 0}) {
            for (const int dstExtra : {-1, 0}) {
              Fields src = source(srcWidth, 2);
              Fields dst = destination(dstWidth, 2);
              src.height = srcHeight;
              dst.height = dstHeight;
              src.step += srcExtra * instance().elementSize;
              dst.step += dstExtra * instance().elementSize;
              if (sizesPass(instance(), src, dst)) {
                expectCall(src, dst);
              } else {
                expectRefusal(HPC_INVALID_ARGS, src, dst);
              }
              if (HasFailure()) {
                return;
              }
            }
          }
        }
      }
    }
  }
}

// Bytes that make no whole element do not count, in steps below 0 either.
TEST_P(CvtColor, StepsAreRoundedDown) {
  for (int bytes = 1; bytes < instance().elementSize; ++bytes) {
    for (const int64_t step : {int64_t{4096}, int64_t{0}, int64_t{-4}, int64_t{-4096}}) {
      Fields src = source(64, 48);
      Fields dst = destination(64, 72);
      src.step = step + bytes;
      dst.step = step + bytes;
      if (step > 0) {
        dst.height = 48;
      }
      expectCall(src, dst);
    }
    // One byte less than a row is too short.
    Fields src = source(64, 48);
    src.step -= bytes;
    expectRefusal(HPC_INVALID_ARGS, src, destination(64, 48));
  }
}

// Everything is compared in 32 bits.
TEST_P(CvtColor, ArithmeticWraps) {
  Fields src = source(64, 48);
  Fields dst = destination(64, 48);
  // Of a step in elements only the low 32 bits count.
  src.step += (int64_t{1} << 32) * instance().elementSize;
  dst.step -= (int64_t{1} << 33) * instance().elementSize;
  expectCall(src, dst);
  // With 4 channels a row of 2^30 pixels has no elements, so that a step of 0 holds it; with 3 channels it
  // has -2^30, and one of 2^30 + 2 pixels has 6 less than 2^30.
  const int width = (1 << 30) + 2;
  src = source(2, 48);
  dst = destination(2, 48);
  src.width = dst.width = width;
  for (const int64_t srcStep : {int64_t{0}, int64_t{5}, int64_t{8}, int64_t{width}, int64_t{-8}}) {
    for (const int64_t dstStep : {int64_t{0}, int64_t{5}, int64_t{8}, int64_t{width}, int64_t{-8}}) {
      for (const int dstHeight : {48, 32, 72}) {
        src.step = srcStep * instance().elementSize;
        dst.step = dstStep * instance().elementSize;
        dst.height = dstHeight;
        if (sizesPass(instance(), src, dst)) {
          expectCall(src, dst);
        } else {
          expectRefusal(HPC_INVALID_ARGS, src, dst);
        }
      }
    }
  }
}

INSTANTIATE_TEST_SUITE_P(All, CvtColor, testing::ValuesIn(instances()),
                         [](const auto& i) { return i.param.name; });

// What a conversion's name says is what exists of it, and no more: 8-bit, and float of packed images.
TEST(CvtColorInstances, AreThoseOfTheirNames) {
  std::set<std::string> names, wanted;
  std::set<ColorCvtType> types;
  for (const Instance& instance : instances()) {
    EXPECT_TRUE(names.insert(instance.name).second) << instance.name << " is listed twice";
    types.insert(instance.type);
  }
  for (const ColorCvtType type : types) {
    std::ostringstream name;
    name << "CVT_" << sidesOf(type).from << "2" << sidesOf(type).to;
    for (const auto& [from, to] : channelPairsOf(type)) {
      std::ostringstream channels;
      channels << "_" << from << "_" << to;
      wanted.insert(name.str() + "_u8" + channels.str());
      if (familyOf(type) == Family::kPacked) {
        wanted.insert(name.str() + "_f32" + channels.str());
      }
    }
  }
  EXPECT_EQ(names, wanted);
}

// Callers have them compiled in.
TEST(CvtColorValues, StayWhatTheyAre) {
  const ColorCvtType inOrder[] = {CVT_BGR2NV21, CVT_NV212BGR,  CVT_NV212RGB,  CVT_RGB2NV21, CVT_BGR2NV12,
                                  CVT_NV122BGR, CVT_YCrCb2BGR, CVT_BGR2YCrCb, CVT_BGR2HSV,  CVT_HSV2BGR,
                                  CVT_BGR2GRAY, CVT_GRAY2BGR,  CVT_BGR2BGRA,  CVT_BGRA2BGR, CVT_BGR2RGB,
                                  CVT_BGR2LAB,  CVT_LAB2BGR,   CVT_BGR2I420,  CVT_I4202BGR, CVT_YUV2GRAY,
                                  CVT_RGB2NV12, CVT_NV122RGB};
  for (size_t value = 0; value < std::size(inOrder); ++value) {
    EXPECT_EQ(static_cast<size_t>(inOrder[value]), value);
  }
}

// Cases as callers meet them.
TEST(CvtColorExamples, NV21ToBGR) {
  calls.clear();
  unsigned char frame[1], picture[1];
  const Mat<unsigned char, 1, ECO_ENV_ARM> src(640, 720, frame);
  Mat<unsigned char, 3, ECO_ENV_ARM> dst(640, 480, picture);
  EXPECT_EQ((cvtColor<CVT_NV212BGR, unsigned char, 1, unsigned char, 3, ECO_ENV_ARM>(src, &dst)),
            HPC_SUCCESS);
  ASSERT_EQ(calls.size(), 1u);
  EXPECT_EQ(calls[0], (Call{"armNV212BGRImage_u8_1_3", 480, 640, 640, frame, 1920, picture}));
  Mat<unsigned char, 3, ECO_ENV_ARM> wider(641, 480, picture);
  EXPECT_EQ((cvtColor<CVT_NV212BGR, unsigned char, 1, unsigned char, 3, ECO_ENV_ARM>(src, &wider)),
            HPC_INVALID_ARGS);
  Mat<unsigned char, 3, ECO_ENV_ARM> lower(640, 479, picture);
  EXPECT_EQ((cvtColor<CVT_NV212BGR, unsigned char, 1, unsigned char, 3, ECO_ENV_ARM>(src, &lower)),
            HPC_INVALID_ARGS);
  EXPECT_EQ(calls.size(), 1u);
}

TEST(CvtColorExamples, BGRToNV21) {
  calls.clear();
  unsigned char frame[1], picture[1];
  const Mat<unsigned char, 3, ECO_ENV_ARM> src(640, 480, picture);
  Mat<unsigned char, 1, ECO_ENV_ARM> dst(640, 722, frame);
  EXPECT_EQ((cvtColor<CVT_BGR2NV21, unsigned char, 3, unsigned char, 1, ECO_ENV_ARM>(src, &dst)),
            HPC_SUCCESS);
  ASSERT_EQ(calls.size(), 1u);
  EXPECT_EQ(calls[0], (Call{"armBGR2NV21Image_u8_3_1", 480, 640, 1920, picture, 640, frame}));
}

}  // namespace
