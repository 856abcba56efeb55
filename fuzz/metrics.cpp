// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// The brightness metrics with any scalars over images that hold what they describe: the mean as the formulas
// give it, and no byte outside the image read.

#include <unistd.h>

#include <algorithm>
#include <cmath>

#include "brightness/brightness.h"
#include "fuzz_input.h"
#include "tests/support/guarded_image.h"

namespace {

using kyface::fuzz::Input;
using kyface::fuzz::wrap;
using kyface::test::GuardedImage;

using Metric = unsigned char (*)(const unsigned char*, int, int, int, int, int, int, int, int);

unsigned luma(const unsigned char* p) { return p[0]; }
template <int blue>
unsigned gray(const unsigned char* p) {
  return (77u * p[blue] + 150u * p[1] + 29u * p[2 - blue] + 128) >> 8;
}

struct Target {
  Metric metric;
  int channels;
  unsigned (*value)(const unsigned char*);  // null: lightness, for which a single pixel's mean stands in
};
const Target kTargets[] = {
    {calcGray_YUV, 3, luma},          {calcGray_BGRA, 4, gray<0>},      {calcGray_RGBA, 4, gray<2>},
    {calcLuminance_BGRA, 4, nullptr}, {calcLuminance_RGBA, 4, nullptr},
};

}  // namespace

extern "C" int LLVMFuzzerInitialize(int* /*argc*/, char*** /*argv*/) {
  // The metrics' complaint about their arguments would fill the terminal.
  return freopen("/dev/null", "w", stdout) == nullptr ? 1 : 0;
}

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  Input input(data, size);
  const Target& target = kTargets[input.byte() % std::size(kTargets)];
  const int width = input.in(0, 70), height = input.in(0, 6);
  GuardedImage<unsigned char> image(height, width * target.channels,
                                    width * target.channels + input.in(0, 5));
  image.fill([&] { return input.pixel(); });
  const auto scalar = [&](int high) { return input.seldom(5) ? input.any() : input.in(-3, high); };
  const int x = scalar(width + 2), y = scalar(height + 2), w = scalar(width + 4), h = scalar(height + 4);
  const int stride = input.seldom(20) ? std::min(input.any(), 0) : image.stride();

  int want = 255;
  if (stride >= 1 && wrap(int64_t{w} * h) != 0) {
    // Ends are those of whole numbers; counts and sums wrap.
    const int64_t x0 = std::max(x, 0), x1 = std::min<int64_t>(int64_t{x} + w, width) - 1;
    const int64_t y0 = std::max(y, 0), y1 = std::min<int64_t>(int64_t{y} + h, height) - 1;
    uint32_t sum = 0;
    for (int64_t r = y0; r <= y1; ++r) {
      for (int64_t c = x0; c <= x1; ++c) {
        const unsigned char* p = image.row(static_cast<int>(r)) + c * target.channels;
        sum += target.value != nullptr ? target.value(p)
                                       : target.metric(p, 1, target.channels, 1, 1, 0, 0, 1, 1);
      }
    }
    const int n = wrap(int64_t{wrap(x1 - x0 + 1)} * wrap(y1 - y0 + 1));
    want = n == 0 ? 0 : static_cast<unsigned char>(int64_t{wrap(int64_t{sum} + n / 2)} / n);
  }
  const unsigned char* pixels = input.seldom(30) ? nullptr : image.data();
  FUZZ_CHECK(target.metric(pixels, width, stride, height, input.any(), x, y, w, h) ==
             (pixels == nullptr ? 255 : want));
  return 0;
}
