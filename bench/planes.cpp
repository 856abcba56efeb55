// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// A camera's planes in one pass, and the two that it replaces: their conversion, then the rotation of pixels
// or of the frame.

#include "frame/planes.h"

#include "fastcv/fastcv.h"
#include "operation.h"

namespace bench {
namespace {

using kyface::PixelLayout;
using kyface::PlanarPicture;

/// Bytes between the end of a plane's row and the next.
constexpr int kPadding = 64;

struct Planes {
  std::shared_ptr<unsigned char> luma;
  std::shared_ptr<unsigned char> chroma;
  PlanarPicture picture;
};

/// Chroma in V, U pairs, or in a plane for each.
Planes planesOf(Size size, bool pairs) {
  const std::int64_t lumaStride = size.width + kPadding;
  const std::int64_t chromaStride = (pairs ? size.width : size.width / 2) + kPadding;
  const std::int64_t lumaBytes = lumaStride * size.height;
  const std::int64_t chromaBytes = chromaStride * (size.height / 2);
  Planes planes = {samples<unsigned char>(static_cast<size_t>(lumaBytes)),
                   samples<unsigned char>(static_cast<size_t>(2 * chromaBytes)),
                   {}};
  unsigned char* const chroma = planes.chroma.get();
  const int step = pairs ? 2 : 1;
  planes.picture = {size.width,
                    size.height,
                    {planes.luma.get(), lumaBytes, lumaStride, 1},
                    {chroma + (pairs ? 1 : chromaBytes), chromaBytes - 1, chromaStride, step},
                    {chroma, chromaBytes, chromaStride, step}};
  return planes;
}

struct Layout {
  const char* name;
  PixelLayout layout;
  int bytes;
  double outBytes;
};
constexpr Layout kRgba = {"RGBA", PixelLayout::kRgba, 4, 4};
constexpr Layout kRgb = {"RGB", PixelLayout::kRgb, 3, 3};
constexpr Layout kNv21 = {"NV21", PixelLayout::kNv21, 1, 1.5};

void addView(std::vector<Operation>& operations, bool pairs, const Layout& layout, int degrees,
             bool mirrored) {
  std::string name = std::string(pairs ? "pairs" : "planes").append("-to-").append(layout.name);
  if (degrees != 0) {
    name.append("-").append(std::to_string(degrees));
  }
  name.append(mirrored ? "-mirrored" : "");
  operations.push_back(
      {name, "fastcv", 1.5 + layout.outBytes, [=](Size size) {
         const Planes planes = planesOf(size, pairs);
         const auto out = samples<unsigned char>(size.pixels() * 4);
         const int outWidth = rotatedBy(degrees == 0 ? 180 : degrees, size).width;
         return [=] {
           if (kyface::convertPlanes(planes.picture, {0, 0, size.width, size.height}, {degrees, mirrored},
                                     {out.get(), static_cast<std::int64_t>(size.pixels()) * 4,
                                      std::int64_t{outWidth} * layout.bytes, layout.layout}) !=
               kyface::PlanesStatus::kSuccess) {
             std::abort();
           }
         };
       }});
}

/// From a packed frame: what is turned in the second pass is the pixels.
void addTwoPasses(std::vector<Operation>& operations, int degrees) {
  using namespace HPC::fastcv;
  operations.push_back(
      {std::string("two-passes-NV21-to-RGBA-").append(std::to_string(degrees)), "fastcv", 1.5 + 3 * 4,
       [=](Size size) {
         const auto frame = samples<unsigned char>(size.pixels() * 3 / 2);
         const auto pixels = samples<unsigned char>(size.pixels() * 4);
         const auto out = samples<unsigned char>(size.pixels() * 4);
         const Size turned = rotatedBy(degrees, size);
         return [=] {
           using Pixels = Mat<unsigned char, 4, ECO_ENV_ARM>;
           const Mat<unsigned char, 1, ECO_ENV_ARM> from(size.width, size.height * 3 / 2, frame.get());
           Pixels upright(size.width, size.height, pixels.get());
           Pixels to(turned.width, turned.height, out.get());
           if (cvtColor<CVT_NV212RGB, unsigned char, 1, unsigned char, 4, ECO_ENV_ARM>(from, &upright) !=
                   HPC_SUCCESS ||
               rotate<unsigned char, 4, 4, 4, ECO_ENV_ARM>(upright, &to, static_cast<float>(degrees)) !=
                   HPC_SUCCESS) {
             std::abort();
           }
         };
       }});
}

}  // namespace

void addPlanes(std::vector<Operation>& operations) {
  for (const bool pairs : {true, false}) {
    for (const int degrees : {0, 90, 180, 270}) {
      for (const bool mirrored : {false, true}) {
        addView(operations, pairs, kRgba, degrees, mirrored);
      }
    }
    addView(operations, pairs, kRgb, 0, false);
    addView(operations, pairs, kRgb, 90, false);
    addView(operations, pairs, kNv21, 0, false);
    addView(operations, pairs, kNv21, 90, false);
    addView(operations, pairs, kNv21, 0, true);
  }
  for (const int degrees : {90, 180, 270}) {
    addTwoPasses(operations, degrees);
  }
}

}  // namespace bench
