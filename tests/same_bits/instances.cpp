// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

#include "instances.h"

#include <algorithm>
#include <limits>

#include "brightness/brightness.h"
#include "brightness/total_lightness.h"
#include "fastcv/fastcv.h"
#include "fastcv/kernels.h"
#include "frame/frame.h"
#include "frame/planes.h"
#include "tests/support/cvt_families.h"

namespace same_bits {
namespace {

using namespace HPC::fastcv;
using kyface::test::is420;
using kyface::test::isFrom420;
using kyface::test::isTo420;

using Bytes = std::vector<unsigned char>;

/// What kernels may reach behind a last row, and a little more.
constexpr size_t kSlack = 64;

/// The same numbers with every C++ library.
class Random {
 public:
  /// From 0 to 65535.
  std::uint32_t operator()() {
    state_ = state_ * 1664525 + 1013904223;
    return state_ >> 16;
  }

 private:
  std::uint32_t state_ = 1;
};

/// The ranges of a float picture's channels.
struct Range {
  float low;
  float high;
};
Range rangeOf(std::string_view side, size_t channel) {
  if (side == "HSV") {
    return {0, channel == 0 ? 360.0f : 1.0f};
  }
  if (side == "LAB") {
    return channel == 0 ? Range{0, 100} : Range{-100, 100};
  }
  return {0, 1};
}

/// Random samples of pixels of a layout: bytes, or floats of its ranges, some outside them and some extreme.
template <typename T>
std::vector<T> pixels(size_t count, size_t channels, std::string_view side) {
  using Limits = std::numeric_limits<float>;
  static constexpr float kExtreme[] = {
      0.0f, -0.0f, 1.0f, -1.0f, Limits::denorm_min(), -Limits::denorm_min(), Limits::max(), Limits::lowest()};
  Random random;
  std::vector<T> samples(count);
  for (size_t i = 0; i < count; ++i) {
    const std::uint32_t number = random();
    if constexpr (sizeof(T) == 1) {
      samples[i] = static_cast<T>(number);
    } else {
      const std::uint32_t kind = random() % 32;
      const Range range = kind == 1 ? Range{-2, 300} : rangeOf(side, i % channels);
      samples[i] = kind == 0 ? kExtreme[number % std::size(kExtreme)]
                             : range.low + static_cast<float>(number) / 65535 * (range.high - range.low);
    }
  }
  return samples;
}

template <typename T>
const char* typeName() {
  return sizeof(T) == 1 ? "u8" : "f32";
}

/// "u8x3"
template <typename T>
std::string pixelName(int channels) {
  return std::string(typeName<T>()) + "x" + std::to_string(channels);
}

/// A destination, with values in it that no kernel is to find there.
template <typename T>
std::vector<T> destination(size_t count) {
  return std::vector<T>(count, static_cast<T>(93));
}

size_t area(int rows, int stride) { return static_cast<size_t>(rows) * static_cast<size_t>(stride); }

Size even(Size size) { return {std::max(2, size.width & ~1), std::max(2, size.height & ~1)}; }

Size rotated(Size size, int degrees) { return degrees % 180 == 0 ? size : Size{size.height, size.width}; }

/// Rows of the matrix that holds a picture.
int rowsOf(bool in420, int height) { return in420 ? (height * 3 + 1) / 2 : height; }

template <typename T, int nc>
Mat<T, nc, ECO_ENV_ARM> view(Size size, std::vector<T>& samples) {
  return {size.width, size.height, samples.data()};
}

/// The kernel over rows that are apart; the front-end over rows that are not; and in place where it may.
template <ColorCvtType type, typename T, int ncSrc, int ncDst>
void addConversion(std::vector<Instance>& all, const char* name,
                   void (*kernel)(int, int, int, const T*, int, T*)) {
  const auto run = [kernel](Size size, Checksum& sum) {
    constexpr bool kFrom420 = isFrom420(type), kTo420 = isTo420(type);
    constexpr bool kPlanar = type == CVT_BGR2I420 || type == CVT_I4202BGR || type == CVT_YUV2GRAY;
    if (kPlanar) {
      size = even(size);
    }
    const int inRows = rowsOf(kFrom420, size.height);
    const int outRows = rowsOf(kTo420, size.height);
    const auto source = [&](int stride) {
      return pixels<T>(area(inRows, stride) + kSlack, ncSrc, kyface::test::sidesOf(type).from);
    };

    const int inStride = size.width * ncSrc + 2 * ncSrc;
    const int outStride = size.width * ncDst + 6;
    std::vector<T> out = destination<T>(area(outRows, outStride) + kSlack);
    kernel(size.height, size.width, inStride, source(inStride).data(), outStride, out.data());
    sum.add(out);

    const Size packed = kFrom420 || kTo420 ? even(size) : size;
    std::vector<T> in = source(size.width * ncSrc);
    out = destination<T>(area(outRows, size.width * ncDst) + kSlack);
    auto to = view<T, ncDst>({packed.width, rowsOf(kTo420, packed.height)}, out);
    if (packed.width == size.width && packed.height == size.height) {
      const auto from = view<T, ncSrc>({packed.width, rowsOf(kFrom420, packed.height)}, in);
      sum.add(static_cast<int>(cvtColor<type, T, ncSrc, T, ncDst, ECO_ENV_ARM>(from, &to)));
      sum.add(out);
    }

    constexpr bool kBeyondRows = type == CVT_LAB2BGR && sizeof(T) == 1;
    if (!kFrom420 && !kTo420 && ncDst <= ncSrc && !kBeyondRows) {
      in = source(inStride);
      kernel(size.height, size.width, inStride, in.data(), inStride, in.data());
      sum.add(in);
    }
  };
  all.push_back(
      {std::string(name) + " " + typeName<T>() + " " + std::to_string(ncSrc) + " to " + std::to_string(ncDst),
       run});
}

template <typename T, int nc>
void addCrops(std::vector<Instance>& all) {
  struct Factor {
    const char* name;
    float ratio;
  };
  for (const Factor factor :
       {Factor{"1", 1}, Factor{"2", 2}, Factor{"0.3", 0.3f}, Factor{"200", 200}, Factor{"-1.5", -1.5f}}) {
    const auto run = [ratio = factor.ratio](Size size, Checksum& sum) {
      constexpr int kLeft = 3, kTop = 2;
      const int inStride = (size.width + 2 * kLeft) * nc;
      const int outStride = size.width * nc + 5;
      const auto in = pixels<T>(area(size.height + kTop, inStride) + kSlack, nc, "BGR");
      std::vector<T> out = destination<T>(area(size.height, outStride) + kSlack);
      armImageCrop<T, nc, T, nc, nc>(kTop, kLeft, inStride, in.data(), size.height, size.width, outStride,
                                     out.data(), ratio);
      sum.add(out);
    };
    all.push_back({"crop " + pixelName<T>(nc) + " by " + factor.name, run});
  }
}

constexpr int kAngles[] = {90, 180, 270};

template <typename T, int nc>
void addRotations(std::vector<Instance>& all) {
  for (const int angle : kAngles) {
    const auto run = [angle](Size size, Checksum& sum) {
      const Size to = rotated(size, angle);
      for (const int padding : {0, 5}) {
        const int inStride = size.width * nc + padding;
        const int outStride = to.width * nc + padding;
        const auto in = pixels<T>(area(size.height, inStride) + kSlack, nc, "BGR");
        std::vector<T> out = destination<T>(area(to.height, outStride) + kSlack);
        armRotateNx90degree<T, nc, nc, nc>(size.height, size.width, inStride, in.data(), to.height, to.width,
                                           outStride, out.data(), angle);
        sum.add(out);
      }
    };
    all.push_back({"rotate " + pixelName<T>(nc) + " by " + std::to_string(angle), run});
  }
}

template <YUV420Type type>
void addFrameRotations(std::vector<Instance>& all, const char* name) {
  for (const int angle : kAngles) {
    const auto run = [angle](Size size, Checksum& sum) {
      const Size from = even(size), to = rotated(from, angle);
      for (const int padding : {0, 6}) {
        const int inRows = rowsOf(true, from.height), outRows = rowsOf(true, to.height);
        Bytes in = pixels<unsigned char>(area(inRows, from.width + padding) + kSlack, 1, "NV21");
        Bytes out = destination<unsigned char>(area(outRows, to.width + padding) + kSlack);
        auto src = view<unsigned char, 1>({from.width, inRows}, in);
        auto dst = view<unsigned char, 1>({to.width, outRows}, out);
        src.step += padding;
        dst.step += padding;
        sum.add(static_cast<int>(
            rotate_YUV420<type, unsigned char, ECO_ENV_ARM>(src, &dst, static_cast<float>(angle))));
        sum.add(out);
      }
    };
    all.push_back({std::string("rotate_YUV420 ") + name + " by " + std::to_string(angle), run});
  }
}

/// Rectangles of a picture: the whole of it, its inside, and one that reaches beyond it.
std::vector<kyface::Rectangle> rectangles(Size size) {
  return {{0, 0, size.width, size.height},
          {size.width / 3, size.height / 3, (size.width + 1) / 2, (size.height + 1) / 2},
          {size.width / 2, size.height / 2, size.width, size.height}};
}

void addMetric(std::vector<Instance>& all, const char* name, int channels, decltype(calcGray_YUV)* metric) {
  const auto run = [=](Size size, Checksum& sum) {
    const int stride = size.width * channels + 3;
    const Bytes in = pixels<unsigned char>(area(size.height, stride) + kSlack, 1, "BGR");
    for (const kyface::Rectangle& part : rectangles(size)) {
      sum.add(metric(in.data(), size.width, stride, size.height, size.height, part.left, part.top, part.width,
                     part.height));
    }
  };
  all.push_back({name, run});
}

void addTotalLightness(std::vector<Instance>& all) {
  for (const bool rgba : {false, true}) {
    const auto run = [rgba](Size size, Checksum& sum) {
      const int stride = size.width * 4 + 3;
      const Bytes in = pixels<unsigned char>(area(size.height, stride) + kSlack, 1, "BGR");
      sum.add(kyface::brightness::totalLightness(in.data(), stride, size.width, size.height, rgba));
    };
    all.push_back({rgba ? "total_lightness RGBA" : "total_lightness BGRA", run});
  }
}

/// A frame helper: bytes in, bytes out, pictures of even sizes.
template <typename Call>
void addHelper(std::vector<Instance>& all, const std::string& name, const Call& call) {
  const auto run = [call](Size size, Checksum& sum) {
    size = even(size);
    Bytes in = pixels<unsigned char>(area(size.height, size.width) * 4 + kSlack, 1, "BGR");
    Bytes out = destination<unsigned char>(in.size());
    call(in.data(), size, out.data());
    sum.add(out);
  };
  all.push_back({name, run});
}

void addHelpers(std::vector<Instance>& all) {
  struct Helper {
    const char* name;
    decltype(nv2RGB)* help;
  };
  for (const Helper& helper : {Helper{"nv2RGB", nv2RGB}, Helper{"RGB2nv", RGB2nv}, Helper{"nv2BGR", nv2BGR},
                               Helper{"nv212BGR", nv212BGR}, Helper{"BGR2nv", BGR2nv}}) {
    for (const int format : {2, 3}) {
      addHelper(all, std::string(helper.name) + " of format " + std::to_string(format),
                [help = helper.help, format](unsigned char* in, Size size, unsigned char* out) {
                  help(in, format, size.width, size.height, out);
                });
    }
  }
  addHelper(all, "BGR2RGB", [](unsigned char* in, Size size, unsigned char* out) {
    BGR2RGB(in, size.width, size.height, out);
  });
  addHelper(all, "BGRA2RGB", [](unsigned char* in, Size size, unsigned char* out) {
    BGRA2RGB(in, size.width, size.height, out);
  });
  // From columns that are even and odd.
  for (const int left : {0, 1}) {
    addHelper(all, "cropNv21 from column " + std::to_string(left),
              [left](unsigned char* in, Size size, unsigned char* out) {
                cropNv21(in, size.width, size.height, left, 0, size.width - 2 * left, size.height, out);
              });
  }
  for (const int angle : kAngles) {
    addHelper(all, "rotateBGR by " + std::to_string(angle),
              [angle](unsigned char* in, Size size, unsigned char* out) {
                int outSize[2];
                rotateBGR(in, size.width, size.height, out, angle, outSize);
              });
  }
}

/// A camera's chroma: V, U pairs, U, V pairs, planes, and samples with something between them.
enum class Chroma { kVu, kUv, kPlanes, kApart };

/// The picture of a size in `bytes`: luma rows, then those of chroma, padded.
kyface::PlanarPicture planarPicture(Size size, Chroma chroma, const Bytes& bytes) {
  constexpr int kPadding = 10;
  const int step = chroma == Chroma::kPlanes ? 1 : chroma == Chroma::kApart ? 3 : 2;
  const int lumaStride = size.width + kPadding;
  const int chromaStride = size.width / 2 * step + kPadding;
  const auto lumaSize = static_cast<std::int64_t>(area(size.height, lumaStride));
  const auto chromaSize = static_cast<std::int64_t>(area(size.height / 2, chromaStride));
  const unsigned char* const first = bytes.data() + lumaSize;
  const bool pairs = step == 2;
  const unsigned char* const second = pairs ? first + 1 : first + chromaSize;
  const kyface::Plane front = {first, chromaSize - 1, chromaStride, step};
  const kyface::Plane back = {second, chromaSize - 1, chromaStride, step};
  const bool vFirst = chroma == Chroma::kVu;
  return {size.width,
          size.height,
          {bytes.data(), lumaSize, lumaStride, 1},
          vFirst ? back : front,
          vFirst ? front : back};
}

void addPlanes(std::vector<Instance>& all) {
  using kyface::PixelLayout;
  struct Layout {
    const char* name;
    PixelLayout layout;
    int bytes;
  };
  for (const Layout layout : {Layout{"RGBA", PixelLayout::kRgba, 4}, Layout{"BGRA", PixelLayout::kBgra, 4},
                              Layout{"RGB", PixelLayout::kRgb, 3}, Layout{"BGR", PixelLayout::kBgr, 3},
                              Layout{"NV21", PixelLayout::kNv21, 1}, Layout{"NV12", PixelLayout::kNv12, 1},
                              Layout{"GRAY", PixelLayout::kGray, 1}}) {
    for (const int degrees : {0, 90, 180, 270}) {
      for (const bool mirrored : {false, true}) {
        const auto run = [=](Size size, Checksum& sum) {
          size = even(size);
          const Bytes in = pixels<unsigned char>((area(size.height, size.width) + 512) * 8, 1, "YUV");
          for (const Chroma chroma : {Chroma::kVu, Chroma::kUv, Chroma::kPlanes, Chroma::kApart}) {
            for (const kyface::Rectangle& part : rectangles(size)) {
              const kyface::Orientation orientation = {degrees, mirrored};
              const kyface::Size to = sizeOfView(part, orientation);
              const int stride = to.width * layout.bytes + 7;
              Bytes out = destination<unsigned char>(area(to.height * 2, stride) + kSlack);
              const auto room = static_cast<std::int64_t>(out.size());
              sum.add(static_cast<int>(convertPlanes(planarPicture(size, chroma, in), part, orientation,
                                                     {out.data(), room, stride, layout.layout})));
              sum.add(out);
            }
          }
        };
        all.push_back({std::string("convert_planes ") + layout.name + " by " + std::to_string(degrees) +
                           (mirrored ? " mirrored" : ""),
                       run});
      }
    }
  }
}

}  // namespace

std::vector<Instance> instances() {
  std::vector<Instance> all;
#define CONVERSION(name, T, ncSrc, ncDst) \
  addConversion<CVT_##name, T, ncSrc, ncDst>(all, #name, arm##name##Image<T, ncSrc, T, ncDst>);
  FASTCV_NAMED_INSTANCES(CONVERSION)
#undef CONVERSION
#define CROPS(T, nc) addCrops<T, nc>(all);
  FASTCV_PACKED_INSTANCES(CROPS)
#undef CROPS
  addRotations<unsigned char, 1>(all);
  addRotations<unsigned char, 2>(all);
  addRotations<unsigned char, 3>(all);
  addRotations<unsigned char, 4>(all);
  addRotations<float, 1>(all);
  addRotations<float, 2>(all);
  addRotations<float, 3>(all);
  addRotations<float, 4>(all);
#define FRAME_ROTATIONS(type) addFrameRotations<type>(all, #type);
  FASTCV_YUV420_INSTANCES(FRAME_ROTATIONS)
#undef FRAME_ROTATIONS
  addMetric(all, "calcGray_YUV", 3, calcGray_YUV);
  addMetric(all, "calcGray_BGRA", 4, calcGray_BGRA);
  addMetric(all, "calcGray_RGBA", 4, calcGray_RGBA);
  addMetric(all, "calcLuminance_BGRA", 4, calcLuminance_BGRA);
  addMetric(all, "calcLuminance_RGBA", 4, calcLuminance_RGBA);
  addTotalLightness(all);
  addHelpers(all);
  addPlanes(all);
  return all;
}

}  // namespace same_bits
