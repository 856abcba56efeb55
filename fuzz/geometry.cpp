// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// crop, rotate and rotate_YUV420: the status against the rules written out once more; nothing touched when
// refused, and when not, every pixel where the mapping of indices puts it and nothing outside.

#include <algorithm>
#include <cmath>
#include <cstring>
#include <vector>

#include "assertion.h"
#include "fastcv/fastcv.h"
#include "fuzz_input.h"
#include "tests/support/guarded_image.h"

namespace {

using namespace HPC::fastcv;
using kyface::fuzz::asserted;
using kyface::fuzz::Input;
using kyface::fuzz::wrap;
using kyface::test::GuardedImage;

template <typename T, int nc>
using Image = Mat<T, nc, ECO_ENV_ARM>;

template <typename T>
T sample(Input& input) {
  return sizeof(T) == 1 ? static_cast<T>(input.pixel())
                        : static_cast<T>(static_cast<float>(input.pixel()) / 16 - 4);
}

float someAngle(Input& input) {
  static constexpr float kAngles[] = {90,  180, 270, 90,        180,       270, 0,
                                      360, -90, 45,  89.99999F, 90.00001F, NAN, INFINITY};
  return kAngles[input.byte() % std::size(kAngles)];
}

int turnOf(float degree) { return degree == 90 ? 90 : degree == 180 ? 180 : degree == 270 ? 270 : 0; }

// The source pixel of destination pixel (r, c), for a source of `height` by `width`.
struct At {
  int row, column;
};
At source(int turn, int height, int width, int r, int c) {
  return turn == 90    ? At{height - 1 - c, r}
         : turn == 180 ? At{height - 1 - r, width - 1 - c}
                       : At{c, width - 1 - r};
}

// ---- crop
// -----------------------------------------------------------------------------------------------------

unsigned char scaled(unsigned char s, float ratio) {
  const float v = std::fmaf(ratio, s, 0.5F);
  return static_cast<unsigned char>(v < 0 ? 0 : v > 255 ? 255 : v);
}
float scaled(float s, float ratio) { return s * ratio; }

// A group of 8 keeps 16 bits of the scaled value and takes them as signed.
unsigned char scaledInGroup(unsigned char s, float ratio) {
  const int value = static_cast<int16_t>(static_cast<int>(std::fmaf(ratio, s, 0.5F)));
  return static_cast<unsigned char>(std::clamp(value, 0, 255));
}
float scaledInGroup(float s, float ratio) { return s * ratio; }

template <typename T, int nc>
void fuzzCrop(Input& input) {
  const int width = input.in(0, 40), height = input.in(0, 12);
  const int outWidth = input.in(0, 40), outHeight = input.in(0, 12);
  const Point2_<int> p{input.seldom(6) ? input.any() : input.in(-1, 20),
                       input.seldom(6) ? input.any() : input.in(-1, 8)};
  const T ratio = input.seldom(2) ? T{1} : sample<T>(input);
  GuardedImage<T> in(height, width * nc, width * nc + input.in(0, 5));
  GuardedImage<T> out(outHeight, outWidth * nc, outWidth * nc + input.in(0, 5));
  in.fill([&] { return sample<T>(input); });
  Image<T, nc> src(width, height, in.data());
  Image<T, nc> dst(outWidth, outHeight, out.data());
  src.step = int64_t{in.stride()} * static_cast<int64_t>(sizeof(T));
  dst.step = int64_t{out.stride()} * static_cast<int64_t>(sizeof(T));
  src.dims = input.seldom(12) ? 0 : 2;
  dst.dims = input.seldom(12) ? 0 : 2;

  const bool empty = src.dims == 0 || dst.dims == 0;
  const bool inside = p.x >= 0 && p.x <= width && p.y >= 0 && p.y <= height &&
                      wrap(int64_t{p.x} + outWidth) <= width && wrap(int64_t{p.y} + outHeight) <= height;
  std::vector<T> want = out.contents();
  if (!empty && inside) {
    const int grouped = outWidth / 8 * 8;
    for (int r = 0; r < outHeight; ++r) {
      for (int i = 0; i < outWidth * nc; ++i) {
        const T s = in.row(p.y + r)[p.x * nc + i];
        // One-channel images are scaled in groups of 8 samples, others in groups of 8 pixels: the same here.
        want[static_cast<size_t>(r) * outWidth * nc + i] = ratio == T{1}      ? s
                                                           : i < grouped * nc ? scaledInGroup(s, ratio)
                                                                              : scaled(s, ratio);
      }
    }
  }
  const HPCStatus_t got = crop<T, nc, T, nc, nc, ECO_ENV_ARM>(src, p, ratio, &dst);
  FUZZ_CHECK(got == (empty ? HPC_MAT_EMPTY : inside ? HPC_SUCCESS : HPC_INVALID_ARGS));
  FUZZ_CHECK(out.holds(want));
}

// ---- rotate
// ---------------------------------------------------------------------------------------------------

template <typename T, int nc>
void fuzzRotate(Input& input) {
  const int width = input.in(0, 80), height = input.in(0, 80);
  const float degree = someAngle(input);
  const int turn = turnOf(degree);
  const bool wrongSize = input.seldom(8);
  const int outWidth = (turn == 180 ? width : height) + (wrongSize ? 1 : 0);
  const int outHeight = turn == 180 ? height : width;
  GuardedImage<T> in(height, width * nc, width * nc + input.in(0, 5));
  GuardedImage<T> out(outHeight, outWidth * nc, outWidth * nc + input.in(0, 5));
  in.fill([&] { return sample<T>(input); });
  Image<T, nc> src(width, height, input.seldom(12) ? nullptr : in.data());
  Image<T, nc> dst(outWidth, outHeight, input.seldom(12) ? nullptr : out.data());
  src.step = int64_t{in.stride()} * static_cast<int64_t>(sizeof(T));
  dst.step = int64_t{out.stride()} * static_cast<int64_t>(sizeof(T));
  src.dims = input.seldom(12) ? 0 : 2;
  dst.dims = input.seldom(12) ? 0 : 2;

  HPCStatus_t want = HPC_SUCCESS;
  if (src.data == nullptr || dst.data == nullptr) {
    want = HPC_POINTER_NULL;
  } else if (src.dims == 0 || dst.dims == 0) {
    want = HPC_MAT_EMPTY;
  } else if (turn == 0 || wrongSize) {
    want = HPC_INVALID_ARGS;
  }
  const bool asserts = want == HPC_SUCCESS && (width == 0 || height == 0 || in.stride() == 0);
  std::vector<T> pixels = out.contents();
  if (want == HPC_SUCCESS && !asserts) {
    for (int r = 0; r < outHeight; ++r) {
      for (int c = 0; c < outWidth; ++c) {
        const At at = source(turn, height, width, r, c);
        std::copy_n(in.row(at.row) + at.column * nc, nc,
                    &pixels[(static_cast<size_t>(r) * outWidth + c) * nc]);
      }
    }
  }
  HPCStatus_t got = want;
  const bool stopped = asserted([&] { got = rotate<T, nc, nc, nc, ECO_ENV_ARM>(src, &dst, degree); });
  FUZZ_CHECK(stopped == asserts && got == want);
  FUZZ_CHECK(out.holds(pixels));
}

// ---- rotate_YUV420
// --------------------------------------------------------------------------------------------

// Where the bytes of chroma block (j, k) are: a pair, or a U and a V.
struct Chroma {
  ptrdiff_t first, second;
};
Chroma chromaAt(bool planar, int lumaHeight, int width, ptrdiff_t stride, int j, int k) {
  if (!planar) {
    const ptrdiff_t at = (lumaHeight + j) * stride + 2 * k;
    return {at, at + 1};
  }
  const int vRow = j + lumaHeight % 4 / 2;
  return {(lumaHeight + j / 2) * stride + j % 2 * (width / 2) + k,
          (lumaHeight + lumaHeight / 4 + vRow / 2) * stride + vRow % 2 * (width / 2) + k};
}

template <YUV420Type type>
void fuzzRotate420(Input& input) {
  constexpr bool kPlanar = type == YUV420_I420;
  const int width = input.in(0, 40) * 2, height = input.in(0, 40) * 2;
  const float degree = someAngle(input);
  const int turn = turnOf(degree);
  const bool wrongSize = input.seldom(8);
  const int outWidth = (turn == 180 ? width : height) + (wrongSize ? 2 : 0);
  const int outHeight = turn == 180 ? height : width;
  GuardedImage<unsigned char> in(height / 2 * 3, width, width + input.in(0, 5));
  GuardedImage<unsigned char> out(outHeight / 2 * 3, outWidth, outWidth + input.in(0, 5));
  in.fill([&] { return input.pixel(); });
  Image<unsigned char, 1> src(width, height / 2 * 3, in.data());
  Image<unsigned char, 1> dst(outWidth, outHeight / 2 * 3, out.data());
  src.step = in.stride();
  dst.step = out.stride();
  src.dims = input.seldom(12) ? 0 : 2;
  dst.dims = input.seldom(12) ? 0 : 2;

  const HPCStatus_t want = src.dims == 0 || dst.dims == 0 ? HPC_MAT_EMPTY
                           : turn == 0 || wrongSize       ? HPC_INVALID_ARGS
                                                          : HPC_SUCCESS;
  std::vector<unsigned char> bytes = out.contents();
  if (want == HPC_SUCCESS) {
    for (int r = 0; r < outHeight; ++r) {
      for (int c = 0; c < outWidth; ++c) {
        const At at = source(turn, height, width, r, c);
        bytes[static_cast<size_t>(r) * outWidth + c] = in.row(at.row)[at.column];
      }
    }
    for (int r = 0; r < outHeight / 2; ++r) {
      for (int c = 0; c < outWidth / 2; ++c) {
        const At at = source(turn, height / 2, width / 2, r, c);
        const Chroma from = chromaAt(kPlanar, height, width, in.stride(), at.row, at.column);
        const Chroma to = chromaAt(kPlanar, outHeight, outWidth, outWidth, r, c);
        bytes[static_cast<size_t>(to.first)] = in.data()[from.first];
        bytes[static_cast<size_t>(to.second)] = in.data()[from.second];
      }
    }
  }
  const HPCStatus_t got = rotate_YUV420<type, unsigned char, ECO_ENV_ARM>(src, &dst, degree);
  FUZZ_CHECK(got == want);
  FUZZ_CHECK(out.holds(bytes));
  const HPCStatus_t none = rotate_YUV420<type, unsigned char, ECO_ENV_ARM>(
      src, static_cast<Image<unsigned char, 1>*>(nullptr), degree);
  FUZZ_CHECK(none == HPC_POINTER_NULL);
}

using Target = void (*)(Input&);
const Target kTargets[] = {
#define CROP(T, nc) fuzzCrop<T, nc>,
    FASTCV_PACKED_INSTANCES(CROP)
#undef CROP
#define ROTATE(T, nc) fuzzRotate<T, nc>,
        FASTCV_PACKED_INSTANCES(ROTATE)
#undef ROTATE
            fuzzRotate420<YUV420_NV21>,
    fuzzRotate420<YUV420_NV12>,
    fuzzRotate420<YUV420_I420>,
};

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  Input input(data, size);
  kTargets[input.byte() % std::size(kTargets)](input);
  return 0;
}
