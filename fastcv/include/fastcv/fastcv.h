// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// HPC::fastcv: image kernels for camera frames, vectorised for 64-bit Arm.
///
/// Callers wrap their pixel buffers in matrices (`Mat`) and call a front-end: `cvtColor`, `crop`, `rotate` or
/// `rotate_YUV420`. A front-end checks both matrices, returns an `HPCStatus_t`, and on success runs one
/// kernel over the whole image. It allocates nothing, logs nothing, keeps no state, and leaves the
/// destination as it was whenever it returns anything but `HPC_SUCCESS`. Threads may call it on distinct
/// destinations.
///
/// Source and destination must not overlap, unless a front-end's comment says that it works forwards. Such a
/// front-end takes images that overlap as long as no row of the destination begins behind the row of the
/// source that it is made of: both are one buffer with one step, or a smaller destination is packed at the
/// source's start.
///
/// A front-end checks what its comment lists, and no more. These matrices pass every front-end's checks and
/// reach its kernel:
/// - A `data` that is null (`rotate` excepted), or has less room than the other fields say.
/// - Negative sizes: nothing is read or written. Sizes of 0: the same, but conversions 17, 18 and 19 and
///   `rotate` end the process by assertion.
/// - A `step` that is no whole number of elements: it is rounded down. A `step` beyond 2^31 elements: its low
///   32 bits count.
///
/// Where a front-end does not look at a step, or lets a short one pass, its kernel takes the step as it is:
/// row r begins r steps behind the first and is as long as the width says. With too short a step rows
/// overlap, and the last one ends behind `step * height`. With a step of 0 all rows are one (17, 18, 19 and,
/// in the source, `rotate` end the process). With a negative step rows lie before `data`. Nothing outside
/// these rows is touched (but see CVT_LAB2BGR). Under "Malformed" a front-end's comment lists what else it
/// lets through.
#pragma once

#include <malloc.h>

#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <utility>

// Everything declared here is part of the shared library's interface.
#pragma GCC visibility push(default)

namespace HPC::fastcv {

/// Result of a front-end.
enum HPCStatus_t : int32_t {
  HPC_SUCCESS = 0,
  HPC_POINTER_NULL = 4,  ///< `rotate`: a `data` pointer is null; `rotate_YUV420`: the destination is null
  HPC_INVALID_ARGS = 5,  ///< sizes, parity, strides, rectangle or angle; `cvtColor`: the destination is null
  HPC_MAT_EMPTY = 12,    ///< a matrix has `dims` 0
};

/// Execution environment whose kernels a front-end calls; the last template argument of everything here.
enum EcoEnv_t {
  ECO_ENV_ARM = 2,  ///< the NEON kernels
};

// The element types and channel counts that a conversion exists for. X is given (conversion, element type of
// both sides, source channels, destination channels).
#define FASTCV_BOTH_TYPES(X, conversion, ncSrc, ncDst) \
  X(conversion, unsigned char, ncSrc, ncDst)           \
  X(conversion, float, ncSrc, ncDst)
#define FASTCV_U8_COLOR_TO_1(X, conversion) \
  X(conversion, unsigned char, 3, 1)        \
  X(conversion, unsigned char, 4, 1)
#define FASTCV_U8_1_TO_COLOR(X, conversion) \
  X(conversion, unsigned char, 1, 3)        \
  X(conversion, unsigned char, 1, 4)
#define FASTCV_U8_1_TO_1(X, conversion) X(conversion, unsigned char, 1, 1)
#define FASTCV_COLOR_TO_1(X, conversion) \
  FASTCV_BOTH_TYPES(X, conversion, 3, 1) \
  FASTCV_BOTH_TYPES(X, conversion, 4, 1)
#define FASTCV_1_TO_COLOR(X, conversion) \
  FASTCV_BOTH_TYPES(X, conversion, 1, 3) \
  FASTCV_BOTH_TYPES(X, conversion, 1, 4)
#define FASTCV_COLOR_TO_3(X, conversion) \
  FASTCV_BOTH_TYPES(X, conversion, 3, 3) \
  FASTCV_BOTH_TYPES(X, conversion, 4, 3)
#define FASTCV_3_TO_COLOR(X, conversion) \
  FASTCV_BOTH_TYPES(X, conversion, 3, 3) \
  FASTCV_BOTH_TYPES(X, conversion, 3, 4)
#define FASTCV_3_TO_4(X, conversion) FASTCV_BOTH_TYPES(X, conversion, 3, 4)
#define FASTCV_4_TO_3(X, conversion) FASTCV_BOTH_TYPES(X, conversion, 4, 3)
#define FASTCV_COLOR_TO_COLOR(X, conversion) \
  FASTCV_3_TO_COLOR(X, conversion)           \
  FASTCV_BOTH_TYPES(X, conversion, 4, 3)     \
  FASTCV_BOTH_TYPES(X, conversion, 4, 4)

/// The conversions: the one table from which the enumeration, the front-ends, the kernels' declarations and
/// the benchmarks are made. X is given (`with`, which is handed on; name; value; family of the checks;
/// instances): conversion NAME is `CVT_NAME`, its kernel `armNAMEImage`.
#define FASTCV_CONVERSIONS(X, with)                        \
  X(with, BGR2NV21, 0, kToYuv420, FASTCV_U8_COLOR_TO_1)    \
  X(with, NV212BGR, 1, kFromYuv420, FASTCV_U8_1_TO_COLOR)  \
  X(with, NV212RGB, 2, kFromYuv420, FASTCV_U8_1_TO_COLOR)  \
  X(with, RGB2NV21, 3, kToYuv420, FASTCV_U8_COLOR_TO_1)    \
  X(with, BGR2NV12, 4, kToYuv420, FASTCV_U8_COLOR_TO_1)    \
  X(with, NV122BGR, 5, kFromYuv420, FASTCV_U8_1_TO_COLOR)  \
  X(with, RGB2NV12, 20, kToYuv420, FASTCV_U8_COLOR_TO_1)   \
  X(with, NV122RGB, 21, kFromYuv420, FASTCV_U8_1_TO_COLOR) \
  X(with, BGR2I420, 17, kToYuv420, FASTCV_U8_COLOR_TO_1)   \
  X(with, I4202BGR, 18, kFromYuv420, FASTCV_U8_1_TO_COLOR) \
  X(with, YUV2GRAY, 19, kFromYuv420, FASTCV_U8_1_TO_1)     \
  X(with, YCrCb2BGR, 6, kPacked, FASTCV_3_TO_COLOR)        \
  X(with, BGR2YCrCb, 7, kPacked, FASTCV_COLOR_TO_3)        \
  X(with, BGR2HSV, 8, kPacked, FASTCV_COLOR_TO_3)          \
  X(with, HSV2BGR, 9, kPacked, FASTCV_3_TO_COLOR)          \
  X(with, BGR2GRAY, 10, kPacked, FASTCV_COLOR_TO_1)        \
  X(with, GRAY2BGR, 11, kPacked, FASTCV_1_TO_COLOR)        \
  X(with, BGR2BGRA, 12, kPacked, FASTCV_3_TO_4)            \
  X(with, BGRA2BGR, 13, kPacked, FASTCV_4_TO_3)            \
  X(with, BGR2RGB, 14, kPacked, FASTCV_COLOR_TO_COLOR)     \
  X(with, BGR2LAB, 15, kPacked, FASTCV_COLOR_TO_3)         \
  X(with, LAB2BGR, 16, kPacked, FASTCV_3_TO_COLOR)

/// All instances: X is given (`CVT_NAME`, element type, source channels, destination channels) ...
#define FASTCV_CVT_COLOR_INSTANCES(X) FASTCV_CONVERSIONS(FASTCV_INSTANCES_BY_TYPE, X)
#define FASTCV_INSTANCES_BY_TYPE(X, name, value, family, instances) instances(X, CVT_##name)
/// ... or (NAME, element type, source channels, destination channels).
#define FASTCV_NAMED_INSTANCES(X) FASTCV_CONVERSIONS(FASTCV_INSTANCES_BY_NAME, X)
#define FASTCV_INSTANCES_BY_NAME(X, name, value, family, instances) instances(X, name)

/// Colour conversions, those of FASTCV_CONVERSIONS. "BGR" and "RGB" images may have a fourth channel, alpha:
/// a conversion ignores it unless it only moves channels; where it creates one, that is opaque (255, or 1.0f
/// for float).
///
/// - CVT_BGR2RGB swaps red and blue, with or without alpha on either side; it is its own inverse.
/// - CVT_BGR2LAB converts to CIE L*a*b*, sRGB primaries, D65 white. 8-bit: L * 2.55, a + 128, b + 128. Float:
///   L 0..100 and a, b as they are, of colours 0..1.
/// - CVT_LAB2BGR converts back; colours are clamped to 0..255, or 0..1 for float. The 8-bit conversion
///   works on groups of 8 pixels that start before column `width` - 3, so it reads and writes up to 4 pixels
///   beyond the end of each row: 12 bytes of the source and 12 (BGR) or 16 (BGRA) of the destination. Between
///   rows that is padding, whose contents are lost, or the start of the next row, which is written later. The
///   buffers must have room for it after the last row too, unless `width` % 8 is below 4.
/// - CVT_YUV2GRAY takes the luma plane of any 4:2:0 buffer.
enum ColorCvtType {
#define FASTCV_ENUMERATOR(with, name, value, family, instances) CVT_##name = value,
  FASTCV_CONVERSIONS(FASTCV_ENUMERATOR, )
#undef FASTCV_ENUMERATOR
};

/// Layouts of a YUV 4:2:0 frame: a luma plane, then the chroma.
enum YUV420Type {
  YUV420_NV21 = 0,  ///< one half-height plane of V,U pairs
  YUV420_NV12 = 1,  ///< one half-height plane of U,V pairs
  YUV420_I420 = 2,  ///< a U plane, then a V plane, each a quarter of the luma plane
};

/// A point, or the top-left corner of a rectangle.
template <typename T>
struct Point2_ {
  T x;  ///< column
  T y;  ///< row
};

/// An image of `nc` (1, 3 or 4) interleaved channels of `T` (`unsigned char` or `float`).
///
/// A matrix is a view over its caller's pixels unless `ownsData` says otherwise; the fields may be set
/// freely. A YUV 4:2:0 frame is held as a one-channel matrix whose `height` is 3/2 of the picture's: luma
/// rows, then chroma rows, all `step` bytes apart.
template <typename T, int nc, EcoEnv_t env>
struct Mat {
  int32_t dims = 0;       ///< 2 once set up, 0 for an empty matrix
  int32_t width = 0;      ///< columns, in pixels
  int32_t height = 0;     ///< rows
  int64_t step = 0;       ///< distance between the starts of two rows, in bytes
  int64_t total = 0;      ///< `width * height`
  int64_t byteSize = 0;   ///< `step * height`
  T* data = nullptr;      ///< first element of row 0
  bool ownsData = false;  ///< whether the destructor releases `data` with `free`

  /// An empty matrix.
  Mat() = default;

  /// A view of `viewHeight` rows of `viewWidth` pixels at `pixels`, with nothing between the rows.
  Mat(int viewWidth, int viewHeight, T* pixels)
      : dims(2),
        width(viewWidth),
        height(viewHeight),
        step(static_cast<int64_t>(viewWidth) * nc * static_cast<int64_t>(sizeof(T))),
        total(static_cast<int64_t>(viewWidth) * viewHeight),
        byteSize(step * viewHeight),
        data(pixels) {}

  /// A matrix that owns packed, uninitialised pixels, 64-byte aligned. `data` is null when there is no memory
  /// for them.
  static Mat allocate(int width, int height) {
    constexpr size_t kAlignment = 64;
    Mat mat(width, height, nullptr);
    const size_t size = (static_cast<size_t>(mat.byteSize) + kAlignment - 1) / kAlignment * kAlignment;
    mat.data = static_cast<T*>(memalign(kAlignment, size));
    mat.ownsData = true;
    return mat;
  }

  Mat(const Mat&) = delete;
  Mat& operator=(const Mat&) = delete;

  Mat(Mat&& other) noexcept { swap(other); }

  Mat& operator=(Mat&& other) noexcept {
    swap(other);
    return *this;
  }

  ~Mat() {
    if (data != nullptr && ownsData) {
      free(data);
    }
  }

 private:
  void swap(Mat& other) noexcept {
    std::swap(dims, other.dims);
    std::swap(width, other.width);
    std::swap(height, other.height);
    std::swap(step, other.step);
    std::swap(total, other.total);
    std::swap(byteSize, other.byteSize);
    std::swap(data, other.data);
    std::swap(ownsData, other.ownsData);
  }
};

namespace detail {
/// Always false, but only known to be so once its template is instantiated: the condition of the front-ends'
/// `static_assert`.
template <auto... values>
inline constexpr bool kNever = false;
}  // namespace detail

/// Converts `src` into `*dst`, which the caller has set up with its size and data.
///
/// CVT_YUV2GRAY and the packed conversions into no more channels than there were work forwards over images
/// that overlap (8-bit CVT_LAB2BGR excepted, for what it writes beyond its rows); all others need them apart.
///
/// Only the instances of FASTCV_CVT_COLOR_INSTANCES exist; any other does not compile.
///
/// Checks, in order: `dst` null: HPC_INVALID_ARGS; `src`, then `*dst` empty: HPC_MAT_EMPTY; the sizes, by the
/// conversion's family in FASTCV_CONVERSIONS: HPC_INVALID_ARGS. With W and H a matrix's width and height, in
/// signed 32-bit arithmetic whose division truncates, the sizes must be these:
/// - Packed, where both steps hold a row: W and H are equal.
/// - Packed otherwise, and to 4:2:0: W and H of `src` are even, W is equal, and H(src) == H(dst) / 3 * 2.
/// - From 4:2:0, where both steps hold a row: W and H of `*dst` are even, W is equal, and
///   H(dst) == H(src) / 3 * 2.
/// - From 4:2:0 otherwise: as to 4:2:0.
///
/// What holds "otherwise" can describe no valid image. It decides which malformed calls still reach a kernel,
/// and is kept for callers that rely on it.
///
/// Malformed:
/// - Packed: a step that is shorter than a row, on either side or both, when the destination is 3/2 as high
///   as the source, or one or two rows more. H(src) rows are read, and as many written.
/// - To 4:2:0: any steps. The destination may have one or two rows too many, which stay as they are.
/// - From 4:2:0: a source with one or two rows too many, which are not read.
/// - From 4:2:0, with a step shorter than a row on either side: a destination 3/2 as high as the source, or
///   one or two rows more. Its height is taken for the picture's: H(dst) * 3/2 rows are read of a source that
///   says it has 2/3 H(dst), even when its own step is in order. Of an odd height the last row is neither
///   read nor written, but CVT_YUV2GRAY copies it, and CVT_I4202BGR ends the process by assertion.
/// - All but to 4:2:0: a width whose product with the channels is beyond 2^31. The product wraps, and a step
///   that is shorter than the row can count as holding it.
template <ColorCvtType type, typename Tsrc, int ncSrc, typename Tdst, int ncDst, EcoEnv_t env>
HPCStatus_t cvtColor(const Mat<Tsrc, ncSrc, env>& /*src*/, Mat<Tdst, ncDst, env>* /*dst*/) {
  static_assert(
      detail::kNever<type, ncSrc, ncDst, env>,
      "HPC::fastcv::cvtColor has no such instance: FASTCV_CVT_COLOR_INSTANCES lists the conversions, "
      "element types and channel counts that exist");
  return HPC_INVALID_ARGS;
}

/// Copies the rectangle of `dst->width` by `dst->height` pixels at `p` out of `src` into `*dst`, every sample
/// (alpha too) multiplied by `ratio`; a `ratio` of 1 is a plain copy. 8-bit results are rounded, halves
/// upward, and saturated. Works forwards over images that overlap.
///
/// Checks, in order: `src`, then `*dst` empty: HPC_MAT_EMPTY; the rectangle not wholly inside `src` (touching
/// the right and bottom edges is inside): HPC_INVALID_ARGS.
///
/// Malformed: any steps. A rectangle so large that its right or bottom edge, formed in 32 bits, wraps to a
/// negative number counts as inside.
template <typename T, int ncSrc, typename TDst, int ncDst, int nc, EcoEnv_t env>
HPCStatus_t crop(const Mat<T, ncSrc, env>& /*src*/, Point2_<int> /*p*/, TDst /*ratio*/,
                 Mat<TDst, ncDst, env>* /*dst*/) {
  static_assert(detail::kNever<ncSrc, ncDst, nc, env>,
                "HPC::fastcv::crop has no such instance: FASTCV_PACKED_INSTANCES lists those that exist");
  return HPC_INVALID_ARGS;
}

/// Rotates `src` clockwise by `degree`, exactly 90, 180 or 270, into `*dst`. The images must not overlap.
///
/// Checks, in order: `src.data`, then `dst->data` null: HPC_POINTER_NULL; `src`, then `*dst` empty:
/// HPC_MAT_EMPTY; any other angle, or a destination whose size is not that of the rotated source:
/// HPC_INVALID_ARGS. A size or source step of 0 that passes them ends the process by assertion.
///
/// Malformed: any other steps.
template <typename T, int ncSrc, int ncDst, int nc, EcoEnv_t env>
HPCStatus_t rotate(const Mat<T, ncSrc, env>& /*src*/, Mat<T, ncDst, env>* /*dst*/, float /*degree*/) {
  static_assert(detail::kNever<ncSrc, ncDst, nc, env>,
                "HPC::fastcv::rotate has no such instance: FASTCV_PACKED_INSTANCES lists those that exist");
  return HPC_INVALID_ARGS;
}

/// Rotates a whole YUV 4:2:0 frame clockwise by `degree`, exactly 90, 180 or 270, into `*dst`. The frames
/// must not overlap. Width and luma height (height * 2 / 3) are expected to be even: an odd last chroma
/// column or row is lost.
///
/// Checks, in order: `dst` null: HPC_POINTER_NULL; `src`, then `*dst` empty: HPC_MAT_EMPTY; any other angle,
/// or a destination whose width and luma height are not those of the rotated source: HPC_INVALID_ARGS.
///
/// Malformed: any steps, odd sizes, and a height that is 3/2 of the luma height and one row more, which stays
/// as it is. The luma height is formed in 32 bits: twice a height beyond 2^30 wraps.
template <YUV420Type type, typename T, EcoEnv_t env>
HPCStatus_t rotate_YUV420(const Mat<unsigned char, 1, env>& /*src*/, Mat<unsigned char, 1, env>* /*dst*/,
                          float /*degree*/) {
  static_assert(detail::kNever<type, env>,
                "HPC::fastcv::rotate_YUV420 has no such instance: FASTCV_YUV420_INSTANCES lists the layouts, "
                "and unsigned char is the only element type");
  return HPC_INVALID_ARGS;
}

// The instances that exist.

// X is given (element type, channels): the instances of `crop` and `rotate`.
#define FASTCV_PACKED_INSTANCES(X) \
  X(unsigned char, 1)              \
  X(unsigned char, 3)              \
  X(unsigned char, 4)              \
  X(float, 1)                      \
  X(float, 3)                      \
  X(float, 4)

// X is given (layout): the instances of `rotate_YUV420`, all of `unsigned char`.
#define FASTCV_YUV420_INSTANCES(X) \
  X(YUV420_NV21)                   \
  X(YUV420_NV12)                   \
  X(YUV420_I420)

#define FASTCV_DECLARE_CVT_COLOR(type, T, ncSrc, ncDst)                                          \
  template <>                                                                                    \
  HPCStatus_t cvtColor<type, T, ncSrc, T, ncDst, ECO_ENV_ARM>(const Mat<T, ncSrc, ECO_ENV_ARM>&, \
                                                              Mat<T, ncDst, ECO_ENV_ARM>*);
FASTCV_CVT_COLOR_INSTANCES(FASTCV_DECLARE_CVT_COLOR)
#undef FASTCV_DECLARE_CVT_COLOR

#define FASTCV_DECLARE_PACKED(T, nc)                                                                       \
  template <>                                                                                              \
  HPCStatus_t crop<T, nc, T, nc, nc, ECO_ENV_ARM>(const Mat<T, nc, ECO_ENV_ARM>&, Point2_<int>, T,         \
                                                  Mat<T, nc, ECO_ENV_ARM>*);                               \
  template <>                                                                                              \
  HPCStatus_t rotate<T, nc, nc, nc, ECO_ENV_ARM>(const Mat<T, nc, ECO_ENV_ARM>&, Mat<T, nc, ECO_ENV_ARM>*, \
                                                 float);
FASTCV_PACKED_INSTANCES(FASTCV_DECLARE_PACKED)
#undef FASTCV_DECLARE_PACKED

#define FASTCV_DECLARE_ROTATE_YUV420(type)                                                               \
  template <>                                                                                            \
  HPCStatus_t rotate_YUV420<type, unsigned char, ECO_ENV_ARM>(const Mat<unsigned char, 1, ECO_ENV_ARM>&, \
                                                              Mat<unsigned char, 1, ECO_ENV_ARM>*, float);
FASTCV_YUV420_INSTANCES(FASTCV_DECLARE_ROTATE_YUV420)
#undef FASTCV_DECLARE_ROTATE_YUV420

}  // namespace HPC::fastcv

#pragma GCC visibility pop
