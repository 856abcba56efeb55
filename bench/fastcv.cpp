// This project's own operations, taken from the lists of instances that exist.

#include "fastcv.h"

#include <cctype>
#include <string_view>

#include "kernels.h"
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

// Adds what one call does to a picture of `nc` channels of T, `upright` when the result has its shape. `call`
// is given the two images.
template <typename T, int nc, typename Call>
void addPacked(std::vector<Operation>& operations, const std::string& name, bool upright, const Call& call) {
  const std::string suffix = (sizeof(T) == 1 ? "-u8x" : "-f32x") + std::to_string(nc);
  operations.push_back({name + suffix, "fastcv", 2.0 * nc * sizeof(T), [=](Size size) {
                          const auto src = samples<T>(size.pixels() * nc);
                          const auto dst = samples<T>(size.pixels() * nc);
                          return [=] {
                            const Image<T, nc> from(size.width, size.height, src.get());
                            Image<T, nc> to(upright ? size.width : size.height,
                                            upright ? size.height : size.width, dst.get());
                            call(from, to);
                          };
                        }});
}

// Rotations by all angles, of any number of channels: through the kernel, as the front-end lacks two.
template <typename T, int nc>
void addRotations(std::vector<Operation>& operations) {
  for (const int degree : {90, 180, 270}) {
    addPacked<T, nc>(
        operations, "rotate" + std::to_string(degree), degree == 180, [degree](const auto& from, auto& to) {
          armRotateNx90degree<T, nc, nc, nc>(from.height, from.width, from.width * nc, from.data, to.height,
                                             to.width, to.width * nc, to.data, degree);
        });
  }
}

// Crops of the whole picture: copies, and samples multiplied by a whole factor.
template <typename T, int nc>
void addCrops(std::vector<Operation>& operations) {
  for (const int ratio : {1, 2}) {
    addPacked<T, nc>(
        operations, ratio == 1 ? "crop" : "crop-times-2", true, [ratio](const auto& from, auto& to) {
          if (crop<T, nc, T, nc, nc, ECO_ENV_ARM>(from, {0, 0}, static_cast<T>(ratio), &to) != HPC_SUCCESS) {
            std::abort();
          }
        });
  }
}

template <YUV420Type type>
void addFrameRotations(std::vector<Operation>& operations, const std::string& layout) {
  for (const int degree : {90, 180, 270}) {
    operations.push_back({"rotate" + std::to_string(degree) + "-" + layout, "fastcv", 3, [=](Size size) {
                            const auto src = samples<unsigned char>(size.pixels() * 3 / 2);
                            const auto dst = samples<unsigned char>(size.pixels() * 3 / 2);
                            return [=] {
                              const Size out = degree == 180 ? size : Size{size.height, size.width};
                              const Image<unsigned char, 1> from(size.width, size.height * 3 / 2, src.get());
                              Image<unsigned char, 1> to(out.width, out.height * 3 / 2, dst.get());
                              if (rotate_YUV420<type, unsigned char, ECO_ENV_ARM>(
                                      from, &to, static_cast<float>(degree)) != HPC_SUCCESS) {
                                std::abort();
                              }
                            };
                          }});
  }
}

}  // namespace

void addFastcv(std::vector<Operation>& operations) {
#define BENCH_CONVERSION(type, T, ncSrc, ncDst) addConversion<type, T, ncSrc, ncDst>(operations, #type);
  FASTCV_CVT_COLOR_INSTANCES(BENCH_CONVERSION)
#undef BENCH_CONVERSION
#define BENCH_PACKED(T, nc)        \
  addRotations<T, nc>(operations); \
  addCrops<T, nc>(operations);
  FASTCV_PACKED_INSTANCES(BENCH_PACKED)
#undef BENCH_PACKED
  addRotations<unsigned char, 2>(operations);
  addRotations<float, 2>(operations);
  addFrameRotations<YUV420_NV21>(operations, "NV21");
  addFrameRotations<YUV420_I420>(operations, "I420");
}

}  // namespace bench
