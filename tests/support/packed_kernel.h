// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// Runs colour kernels over packed images, in every shape that they must take, against a formula for one
/// pixel.
#pragma once

#include <gtest/gtest.h>

#include <algorithm>
#include <bit>
#include <cmath>
#include <cstdint>
#include <functional>
#include <limits>
#include <ostream>
#include <random>
#include <string>
#include <vector>

#include "guarded_image.h"

namespace kyface::test {

/// A colour kernel of element type `T`, and what it must make of a pixel.
template <typename T>
struct PackedKernel {
  using Function = void (*)(int, int, int, const T*, int, T*);
  /// `grouped` says whether the pixel is in one of its row's whole groups of 8.
  using Reference = std::function<void(const T* in, T* out, bool grouped)>;
  /// Whether an element may be `got` where `want` is expected; by default, if it is the same bit for bit.
  using Agree = std::function<bool(T got, T want)>;

  std::string name;
  Function run;
  int ncSrc;
  int ncDst;
  Reference reference;
  Agree agree = [](T got, T want) { return memcmp(&got, &want, sizeof(T)) == 0; };
  bool takesNan = true;  ///< whether the reference says what becomes of a NaN
};

template <typename T>
std::ostream& operator<<(std::ostream& out, const PackedKernel<T>& kernel) {
  return out << kernel.name;
}

/// GoogleTest's name for a kernel as a parameter.
inline constexpr auto kKernelName = [](const auto& info) { return info.param.name; };

/// Random floats: mostly of [0, 1], some of [-2, 300], and every special kind.
class FloatSource {
 public:
  explicit FloatSource(unsigned seed, bool nan = true) : nan_(nan), engine_(seed) {}
  float operator()() {
    using Limits = std::numeric_limits<float>;
    static constexpr float kSpecial[] = {0.0f,
                                         -0.0f,
                                         1.0f,
                                         -1.0f,
                                         Limits::infinity(),
                                         -Limits::infinity(),
                                         Limits::denorm_min(),
                                         -Limits::denorm_min(),
                                         Limits::min() / 2,
                                         Limits::max(),
                                         Limits::lowest(),
                                         Limits::quiet_NaN()};
    switch (std::uniform_int_distribution(0, 15)(engine_)) {
      case 0:
        return kSpecial[std::uniform_int_distribution<size_t>(0,
                                                              std::size(kSpecial) - (nan_ ? 1 : 2))(engine_)];
      case 1:
        return std::uniform_real_distribution(-2.0f, 300.0f)(engine_);
      default:
        return std::uniform_real_distribution(0.0f, 1.0f)(engine_);
    }
  }

 private:
  bool nan_;
  std::mt19937 engine_;
};

/// Equal bit for bit, or both not a number: what arithmetic can promise.
inline bool sameNumber(float got, float want) {
  return std::bit_cast<uint32_t>(got) == std::bit_cast<uint32_t>(want) ||
         (std::isnan(got) && std::isnan(want));
}

/// Runs the kernel over one image of random elements and checks every element and the padding; `inPlace` puts
/// the destination where the source is.
template <typename T>
void checkImage(const PackedKernel<T>& kernel, int height, int width, int inPad, int outPad,
                bool inPlace = false) {
  const int rows = std::max(height, 0);
  GuardedImage<T> in(rows, width * kernel.ncSrc, width * kernel.ncSrc + inPad);
  GuardedImage<T> separate(rows, width * kernel.ncDst, width * kernel.ncDst + outPad);
  const auto seed = static_cast<unsigned>(height * 131 + width);
  if constexpr (sizeof(T) == 1) {
    in.fill(ByteSource(seed));
  } else {
    in.fill(FloatSource(seed, kernel.takesNan));
  }
  const std::vector<T> source = in.contents();
  GuardedImage<T>& out = inPlace ? in : separate;
  kernel.run(height, width, in.stride(), in.data(), out.stride(), out.data());
  std::vector<T> want(static_cast<size_t>(kernel.ncDst));
  for (int r = 0; r < rows; ++r) {
    for (int x = 0; x < width; ++x) {
      const T* pixel = &source[(static_cast<size_t>(r) * width + x) * kernel.ncSrc];
      kernel.reference(pixel, want.data(), x < width / 8 * 8);
      for (int c = 0; c < kernel.ncDst; ++c) {
        const T got = out.row(r)[x * kernel.ncDst + c];
        ASSERT_TRUE(kernel.agree(got, want[c]))
            << width << " x " << height << ": row " << r << ", pixel " << x << ", channel " << c << ": "
            << +got << ", expected " << +want[c];
      }
    }
  }
  ASSERT_TRUE(out.holds(out.contents())) << width << " x " << height;
  if (!inPlace) {
    ASSERT_TRUE(in.holds(source)) << "the source of " << width << " x " << height << " was written";
  }
}

/// Every width that meets other blocks and tails, and heights that hold nothing; packed and padded.
template <typename T>
void checkShapes(const PackedKernel<T>& kernel) {
  for (int width = 1; width <= 70; ++width) {
    for (const int height : {-1, 0, 1, 2, 3}) {
      checkImage(kernel, height, width, 0, 0);
      checkImage(kernel, height, width, 5, 3);
    }
  }
  for (const int width : {127, 128, 129, 318, 640, 1278}) {
    checkImage(kernel, 5, width, 0, 0);
    checkImage(kernel, 4, width, 1, 33);
  }
  checkImage(kernel, 2, 0, 4, 4);
}

/// `checkShapes` for a destination that is the source, of as many channels.
template <typename T>
void checkShapesInPlace(const PackedKernel<T>& kernel) {
  for (int width = 1; width <= 70; ++width) {
    checkImage(kernel, 3, width, 0, 0, true);
    checkImage(kernel, 3, width, 5, 5, true);
  }
  checkImage(kernel, 5, 1278, 0, 0, true);
}

/// The colours of a check: 256 of channels 1 and 2, every `step`th of channel 0; the shape of the image.
struct Colours {
  int step = 1;
  int width = 1 << 16;  ///< pixels in a row, a divisor of 2^16
  int pad = 0;          ///< elements between rows: with any, rows cannot be joined
};

/// Runs the kernel over the colours, and gives every pixel, its result and whether it was in a group of 8 to
/// `visit`. With step 1 they are all 2^24. A fourth channel that the kernel reads varies.
template <typename Visit>
void forEachColour(const PackedKernel<unsigned char>& kernel, const Colours& colours, const Visit& visit) {
  constexpr int kPixels = 1 << 16;
  const int width = colours.width;
  const int height = kPixels / width;
  const int inStride = width * kernel.ncSrc + colours.pad;
  const int outStride = width * kernel.ncDst + colours.pad;
  std::vector<unsigned char> in(static_cast<size_t>(height) * inStride);
  std::vector<unsigned char> out(static_cast<size_t>(height) * outStride);
  const auto forEach = [&](const auto& act) {
    for (int r = 0, i = 0; r < height; ++r) {
      unsigned char* source = &in[static_cast<size_t>(r) * inStride];
      unsigned char* result = &out[static_cast<size_t>(r) * outStride];
      for (int x = 0; x < width; ++x, ++i, source += kernel.ncSrc, result += kernel.ncDst) {
        act(i, source, result, x < width / 8 * 8);
      }
    }
  };
  forEach([&](int i, unsigned char* pixel, unsigned char*, bool) {
    pixel[1] = static_cast<unsigned char>(i >> 8);
    pixel[2] = static_cast<unsigned char>(i);
    if (kernel.ncSrc == 4) {
      pixel[3] = static_cast<unsigned char>(i * 7);
    }
  });
  for (int c0 = 0; c0 < 256 && !::testing::Test::HasFatalFailure(); c0 += colours.step) {
    forEach(
        [&](int, unsigned char* pixel, unsigned char*, bool) { *pixel = static_cast<unsigned char>(c0); });
    kernel.run(height, width, inStride, in.data(), outStride, out.data());
    forEach([&](int, const unsigned char* pixel, const unsigned char* result, bool grouped) {
      visit(pixel, result, grouped);
    });
  }
}

/// Checks the kernel's result for the colours.
inline void checkColours(const PackedKernel<unsigned char>& kernel, const Colours& colours) {
  unsigned char want[4];
  forEachColour(kernel, colours, [&](const unsigned char* in, const unsigned char* out, bool grouped) {
    kernel.reference(in, want, grouped);
    for (int c = 0; c < kernel.ncDst; ++c) {
      if (out[c] != want[c] && !kernel.agree(out[c], want[c])) {
        ASSERT_EQ(+out[c], +want[c]) << "channel " << c << " of (" << +in[0] << ", " << +in[1] << ", "
                                     << +in[2] << ")";
      }
    }
  });
}

/// All 2^24 colours of a kernel of three channels; of one with a fourth somewhere, whose arithmetic is the
/// same, every 17th. Then every 17th in rows of 4 pixels, which are done pixel by pixel, and in rows of 8, a
/// group but no block of bytes.
inline void checkAllColours(const PackedKernel<unsigned char>& kernel) {
  checkColours(kernel, {.step = kernel.ncSrc == 4 || kernel.ncDst == 4 ? 17 : 1});
  checkColours(kernel, {.step = 17, .width = 4, .pad = 1});
  checkColours(kernel, {.step = 17, .width = 8, .pad = 1});
}

}  // namespace kyface::test
