// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// cvtColor over every instance: the status against the rules written out once more; nothing touched when
// refused, nothing outside the images when not, and the same pixels as converting them one by one.

#include <algorithm>
#include <cstring>
#include <memory>
#include <vector>

#include "assertion.h"
#include "fastcv/fastcv.h"
#include "fuzz_input.h"
#include "tests/support/cvt_families.h"
#include "tests/support/guarded_image.h"

namespace {

using namespace HPC::fastcv;
using kyface::fuzz::Input;
using kyface::fuzz::wrap;
using kyface::test::GuardedImage;
using kyface::test::isFrom420;
using kyface::test::isTo420;

template <typename T, int nc>
using Image = Mat<T, nc, ECO_ENV_ARM>;

constexpr bool isPlanar(ColorCvtType t) {
  return t == CVT_BGR2I420 || t == CVT_I4202BGR || t == CVT_YUV2GRAY;
}

// Kernels whose groups and single pixels may differ by requirement, and with the row's position in the image.
constexpr bool isPositional(ColorCvtType t) {
  return t == CVT_BGR2HSV || t == CVT_HSV2BGR || t == CVT_BGR2LAB || t == CVT_LAB2BGR;
}

struct Scalars {
  int dims, width, height;
  int64_t step;
};

template <typename T, int nc>
void set(Image<T, nc>& mat, const Scalars& s, T* data) {
  mat.dims = s.dims;
  mat.width = s.width;
  mat.height = s.height;
  mat.step = s.step;
  mat.data = data;
}

HPCStatus_t expected(ColorCvtType type, size_t elementSize, const Scalars& src, int ncSrc, const Scalars& dst,
                     int ncDst) {
  if (src.dims == 0 || dst.dims == 0) {
    return HPC_MAT_EMPTY;
  }
  const int shift = elementSize == 4 ? 2 : 0;  // rounds down, below 0 too
  const int srcStride = wrap(src.step >> shift);
  const int dstStride = wrap(dst.step >> shift);
  const bool fits =
      srcStride >= wrap(int64_t{src.width} * ncSrc) && dstStride >= wrap(int64_t{dst.width} * ncDst);
  bool good = false;
  if (isTo420(type) || !fits) {
    good = src.width % 2 == 0 && src.height % 2 == 0 && src.width == dst.width &&
           src.height == dst.height / 3 * 2;
  } else if (isFrom420(type)) {
    good = dst.width % 2 == 0 && dst.height % 2 == 0 && src.width == dst.width &&
           dst.height == src.height / 3 * 2;
  } else {
    good = src.width == dst.width && src.height == dst.height;
  }
  return good ? HPC_SUCCESS : HPC_INVALID_ARGS;
}

template <ColorCvtType type, typename T, int ncSrc, int ncDst>
void refuse(const Scalars& src, const Scalars& dst) {
  // Sizes that nothing could hold, over no memory at all: only a refusal may come of it.
  const HPCStatus_t want = expected(type, sizeof(T), src, ncSrc, dst, ncDst);
  if (want == HPC_SUCCESS) {
    return;
  }
  Image<T, ncSrc> in;
  Image<T, ncDst> out;
  set(in, src, static_cast<T*>(nullptr));
  set(out, dst, static_cast<T*>(nullptr));
  const HPCStatus_t got = cvtColor<type, T, ncSrc, T, ncDst, ECO_ENV_ARM>(in, &out);
  FUZZ_CHECK(got == want);
  const HPCStatus_t none =
      cvtColor<type, T, ncSrc, T, ncDst, ECO_ENV_ARM>(in, static_cast<Image<T, ncDst>*>(nullptr));
  FUZZ_CHECK(none == HPC_INVALID_ARGS);
}

template <typename T>
T sample(Input& input) {
  if constexpr (sizeof(T) == 1) {
    return input.pixel();
  } else {
    const uint8_t kind = input.pixel();
    if (kind < 200) {
      return static_cast<float>(kind) / 200;
    }
    const uint32_t bits = static_cast<uint32_t>(input.pixel()) << 24 |
                          static_cast<uint32_t>(input.pixel()) << 16 |
                          static_cast<uint32_t>(input.pixel()) << 8 | input.pixel();
    float value;
    memcpy(&value, &bits, sizeof value);
    return value;
  }
}

template <ColorCvtType type, typename T, int ncSrc, int ncDst>
std::vector<T> byPixels(const GuardedImage<T>& in, int height, int width) {
  std::vector<T> all;
  for (int r = 0; r < height; ++r) {
    for (int x = 0; x < width; ++x) {
      T pixel[ncSrc];
      std::copy_n(in.row(r) + x * ncSrc, ncSrc, pixel);
      T result[ncDst];
      const Image<T, ncSrc> one(1, 1, pixel);
      Image<T, ncDst> converted(1, 1, result);
      cvtColor<type, T, ncSrc, T, ncDst, ECO_ENV_ARM>(one, &converted);
      all.insert(all.end(), result, result + ncDst);
    }
  }
  return all;
}

// Where the two chroma bytes of the block in chroma row j, column k are, in a buffer of rows `stride` apart.
struct Chroma {
  ptrdiff_t first, second;
};

Chroma chromaAt(ColorCvtType type, int height, int width, ptrdiff_t stride, int j, int k) {
  if (!isPlanar(type)) {
    const ptrdiff_t at = (height + j) * stride + 2 * k;
    return {at, at + 1};
  }
  // Two chroma rows share a buffer row; V begins in the second half of one where the luma rows leave 2 of 4.
  const int vRow = j + height % 4 / 2;
  return {(height + j / 2) * stride + j % 2 * (width / 2) + k,
          (height + height / 4 + vRow / 2) * stride + vRow % 2 * (width / 2) + k};
}

// The same conversion, one 2 x 2 block after the other. `all` is the destination's rows as they were.
template <ColorCvtType type, int ncSrc, int ncDst>
std::vector<unsigned char> byBlocks(const GuardedImage<unsigned char>& in, std::vector<unsigned char> all,
                                    int height, int width) {
  for (int r = 0; r < height; r += 2) {
    for (int x = 0; x < width; x += 2) {
      unsigned char block[2 * 2 * 4];
      unsigned char result[2 * 2 * 4];
      for (int i = 0; i < 4; ++i) {
        std::copy_n(in.row(r + i / 2) + (x + i % 2) * ncSrc, ncSrc, block + i * ncSrc);
      }
      if constexpr (isFrom420(type)) {
        const Chroma chroma = chromaAt(type, height, width, in.stride(), r / 2, x / 2);
        block[4] = in.data()[chroma.first];
        block[5] = in.data()[chroma.second];
      }
      const Image<unsigned char, ncSrc> one(2, isFrom420(type) ? 3 : 2, block);
      Image<unsigned char, ncDst> converted(2, isTo420(type) ? 3 : 2, result);
      cvtColor<type, unsigned char, ncSrc, unsigned char, ncDst, ECO_ENV_ARM>(one, &converted);
      for (int i = 0; i < 4; ++i) {
        std::copy_n(result + i * ncDst, ncDst,
                    &all[(static_cast<size_t>(r + i / 2) * width + x + i % 2) * ncDst]);
      }
      if constexpr (isTo420(type)) {
        // `all` holds the rows without padding: packed, but with the halves of chroma rows where they are.
        const Chroma chroma = chromaAt(type, height, width, width, r / 2, x / 2);
        all[static_cast<size_t>(chroma.first)] = result[4];
        all[static_cast<size_t>(chroma.second)] = result[5];
      }
    }
  }
  return all;
}

template <ColorCvtType type, typename T, int ncSrc, int ncDst>
void convert(Input& input) {
  int width = input.in(0, 72);
  int height = input.in(0, 10);
  if (isTo420(type) || isFrom420(type)) {
    width &= ~1;
    height &= ~1;
  }
  const int inPad = input.in(0, 9);
  const int outPad = input.in(0, 9);
  const int inRows = isFrom420(type) ? height / 2 * 3 : height;
  const int outRows = isTo420(type) ? height / 2 * 3 : height;
  const int slack = type == CVT_LAB2BGR && sizeof(T) == 1 ? 4 : 0;
  GuardedImage<T> in(inRows, width * ncSrc, width * ncSrc + inPad, slack * ncSrc);
  GuardedImage<T> out(outRows, width * ncDst, width * ncDst + outPad, slack * ncDst);
  in.fill([&] { return sample<T>(input); });
  constexpr int kSize = static_cast<int>(sizeof(T));
  const Scalars src{2, width, inRows, int64_t{in.stride()} * kSize};
  const Scalars dst{2, width, outRows, int64_t{out.stride()} * kSize};

  const bool asserts = isPlanar(type) && (width == 0 || height == 0 || in.stride() == 0 || out.stride() == 0);
  Image<T, ncSrc> inMat;
  Image<T, ncDst> outMat;
  set(inMat, src, in.data());
  set(outMat, dst, out.data());
  const std::vector<T> before = in.contents();
  HPCStatus_t got = HPC_INVALID_ARGS;
  const bool stopped =
      kyface::fuzz::asserted([&] { got = cvtColor<type, T, ncSrc, T, ncDst, ECO_ENV_ARM>(inMat, &outMat); });
  FUZZ_CHECK(stopped == asserts);
  if (stopped) {
    return;
  }
  FUZZ_CHECK(got == HPC_SUCCESS);
  FUZZ_CHECK(in.holds(before));

  if (slack != 0) {
    return;  // the padding is what such a kernel may write to
  }
  std::vector<T> want;
  if constexpr (isPositional(type)) {
    want = out.contents();  // so that only the padding is compared
  } else if constexpr (type == CVT_YUV2GRAY) {
    want.assign(before.begin(), before.begin() + static_cast<ptrdiff_t>(width) * height);
  } else if constexpr (isTo420(type) || isFrom420(type)) {
    want = byBlocks<type, ncSrc, ncDst>(in, out.contents(), height, width);
  } else {
    want = byPixels<type, T, ncSrc, ncDst>(in, height, width);
  }
  FUZZ_CHECK(out.holds(want));
}

struct Instance {
  void (*convert)(Input&);
  void (*refuse)(const Scalars&, const Scalars&);
};

const Instance kInstances[] = {
#define INSTANCE(type, T, ncSrc, ncDst) {convert<type, T, ncSrc, ncDst>, refuse<type, T, ncSrc, ncDst>},
    FASTCV_CVT_COLOR_INSTANCES(INSTANCE)
#undef INSTANCE
};

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  Input input(data, size);
  const Instance& instance = kInstances[input.byte() % std::size(kInstances)];
  if (input.seldom(3)) {
    const auto scalars = [&] {
      const int64_t high = input.seldom(4) ? input.any() : 0;
      return Scalars{
          input.seldom(8) ? 0 : 2, input.any(), input.any(),
          static_cast<int64_t>((static_cast<uint64_t>(high) << 32) + static_cast<uint64_t>(input.any()))};
    };
    const Scalars src = scalars();
    Scalars dst = scalars();
    if (input.seldom(2)) {
      dst.width = src.width;
    }
    instance.refuse(src, dst);
  } else {
    instance.convert(input);
  }
  return 0;
}
