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

}  // namespace

void addFastcv(std::vector<Operation>& operations) {
#define BENCH_CONVERSION(type, T, ncSrc, ncDst) addConversion<type, T, ncSrc, ncDst>(operations, #type);
  FASTCV_CVT_COLOR_INSTANCES(BENCH_CONVERSION)
#undef BENCH_CONVERSION
}

}  // namespace bench
