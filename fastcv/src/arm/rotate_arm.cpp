// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// Rotation of packed images by right angles. With H and W the source's height and width, destination pixel
// (row r, column c) is source pixel
//
//   90:  (H - 1 - c, r)      180: (H - 1 - r, W - 1 - c)      270: (c, W - 1 - r)
//
// A pixel moves whole, so that only its size in bytes matters: four bytes are a pixel of four 8-bit channels
// or of one float. 180 degrees reverses each row. A quarter turn is a transposition, of the source read from
// its last row up (90) or written from the destination's last row up (270), made of register tiles.

#include "rotate.h"

#include <algorithm>
#include <array>
#include <type_traits>

#include "entry.h"
#include "kernel_assert.h"
#include "simd/loop.h"
#include "simd/tile.h"

namespace HPC::fastcv {
namespace arm {
namespace {

// The largest multiple of `block` in `length`.
constexpr ptrdiff_t wholeBlocks(ptrdiff_t length, int block) { return length / block * block; }

// ---- quarter turns

// A rotation by 90 or 270 degrees. Everything in it is inlined into one function, so that its members are
// registers there.
template <int bytes>
class QuarterTurn {
 public:
  TILE_INLINE QuarterTurn(bool upwards, const SourceImage& in, const TargetImage& out)
      : upwards_(upwards),
        source_(upwards ? in.data + (in.width - out.height) * bytes : in.data + (in.height - 1) * in.stride),
        sourceStep_(upwards ? in.stride : -in.stride),
        target_(out),
        offsets_(sourceStep_) {}

  // Whole blocks of destination pixels, then the rows below them, then the columns beside them.
  template <int blockHeight, int blockWidth>
  TILE_INLINE void run() const {
    static_assert(blockHeight % 2 == 0 && blockHeight % kTile.columns == 0 && blockWidth % kTile.rows == 0);
    const ptrdiff_t height = wholeBlocks(target_.height, blockHeight);
    const ptrdiff_t width = wholeBlocks(target_.width, blockWidth);
    // In the order of the source's columns: what a processor reads ahead of a block's pieces of rows is in
    // the next ones.
    const ptrdiff_t step = upwards_ ? -blockHeight : blockHeight;
    for (ptrdiff_t r = upwards_ ? height - blockHeight : 0; r >= 0 && r < height; r += step) {
      for (ptrdiff_t c = 0; c < width; c += blockWidth) {
        area(r, std::integral_constant<int, blockHeight>{}, c, std::integral_constant<int, blockWidth>{});
      }
    }
    const struct {
      ptrdiff_t top, height, left, width;
    } rest[] = {{height, target_.height - height, 0, target_.width},
                {0, height, width, target_.width - width}};
    KERNEL_ROLLED_LOOP
    for (const auto& part : rest) {
      area(part.top, part.height, part.left, part.width);
    }
  }

 private:
  static constexpr TileSize kTile = kLargestTile<bytes>;

  // Destination rows [top, top + height) by columns [left, left + width); `top` is even. The sizes may be
  // constants.
  template <typename Height, typename Width>
  TILE_INLINE void area(ptrdiff_t top, Height height, ptrdiff_t left, Width width) const {
    // The tiles walk along the source rows, from the lowest of the area's columns up.
    const ptrdiff_t lowest = upwards_ ? target_.height - top - height : top;
    const ptrdiff_t first = upwards_ ? top + height - 1 : top;
    const ptrdiff_t second = upwards_ ? first - 1 : first + 1;
    const ptrdiff_t step = target_.rows.afterEven + target_.rows.afterOdd;
    unsigned char* const row = target_.rows.at(first);
    strips<kTile.rows>(source_ + left * sourceStep_ + lowest * bytes, height, target_.height - lowest, width,
                       RowPairs{row + left * bytes, target_.rows.at(second) - row, upwards_ ? -step : step});
  }

  // `width` source rows, in strips of `rows` while as many are left, then in strips of half as many.
  template <int rows, typename Height, typename Width>
  TILE_INLINE void strips(const unsigned char* src, Height length, ptrdiff_t readable, Width width,
                          RowPairs out) const {
    for (ptrdiff_t n = width / rows; n > 0; --n) {
      strip<rows>(src, length, readable, out);
      src += rows * sourceStep_;
      out.first += rows * bytes;
    }
    if constexpr (rows > 1) {
      strips<rows / 2>(src, length, readable, width % rows, out);
    }
  }

  // `length` columns of `rows` source rows. `readable` columns belong to the rotated image.
  template <int rows, typename Length>
  TILE_INLINE void strip(const unsigned char* src, Length length, ptrdiff_t readable, RowPairs out) const {
    constexpr int kColumns = kTile.columns;
    settle(src, out);
    if constexpr (rows == kTile.rows && kTileReadsPast<bytes> > 0) {
      // All but the last tile, unless more columns follow.
      const ptrdiff_t tilesPast = std::min<ptrdiff_t>(length, readable - kTileReadsPast<bytes>) / kColumns;
      for (ptrdiff_t n = tilesPast; n > 0; --n) {
        tile<rows, kColumns, true>(src, out);
      }
      tiles<rows, kColumns>(src, length - std::max<ptrdiff_t>(tilesPast, 0) * kColumns, out);
    } else if constexpr (std::is_same_v<Length, ptrdiff_t>) {
      tiles<rows, kColumns>(src, length, out);
    } else if constexpr (sizeof(Bytes) == 16 && kInterleaves<bytes> && rows == kTile.rows) {
      moveTiles<bytes, length / kColumns>(src, offsets_, out);
    } else {
      detail::unrolled<length / kColumns>([&](auto) TILE_LAMBDA { tile<rows, kColumns, false>(src, out); });
    }
  }

  // `length` columns, in tiles of `columns` while as many are left, then in tiles of half as many.
  template <int rows, int columns>
  TILE_INLINE void tiles(const unsigned char* src, ptrdiff_t length, RowPairs& out) const {
    for (ptrdiff_t n = length / columns; n > 0; --n) {
      tile<rows, columns, false>(src, out);
    }
    if constexpr (columns > 1) {
      tiles<rows, columns / 2>(src, length % columns, out);
    }
  }

  // What moves on does so tile by tile: left to itself the compiler forms many addresses anew from that of
  // the first, and runs out of registers. The two columns of a tile of 16-byte pixels it addresses well.
  static TILE_INLINE void settle(const unsigned char*& src, RowPairs& out) {
    if constexpr (bytes < 16) {
      forget(src);
    }
    forget(out.first);
  }

  template <int rows, int columns, bool past>
  TILE_INLINE void tile(const unsigned char*& src, RowPairs& out) const {
    moveTile<bytes, rows, columns, past>(src, offsets_, out);
    src += columns * bytes;
    settle(src, out);
  }

  bool upwards_;
  const unsigned char* source_;
  ptrdiff_t sourceStep_;
  TargetImage target_;
  RowOffsets<kTile.rows> offsets_;
};

// ---- half turns

// A walk from the end of a source row down, along the destination row up.
struct ReversedRow {
  const unsigned char* src;
  unsigned char* dst;
  ptrdiff_t left;  // pixels

  // Reverses `blocks` blocks of `pixels` pixels of `bytes` bytes at a time, as long as there are as many:
  // `move(source, destination)` does one.
  template <int bytes, int pixels, int blocks, typename Move>
  TILE_INLINE void each(const Move& move) {
    constexpr ptrdiff_t kSize = pixels * bytes;
    // In registers, both steps are the loads' and the stores' own, which pays where little else is done: the
    // bytes of small pixels are shuffled first.
    ptrdiff_t down = -kSize;
    if constexpr (bytes >= 4) {
      forget(down);
    }
    src += down;
    KERNEL_ROLLED_LOOP
    for (ptrdiff_t n = left / (pixels * blocks); n != 0; --n) {
      detail::unrolled<blocks>([&](auto) TILE_LAMBDA {
        move(src, dst);
        src += down;
        dst += kSize;
        forget(dst);
      });
    }
    src -= down;
    left %= pixels * blocks;
  }
};

// Four registers of pixels, or three where a pixel is a multiple of three bytes: what one load and one store
// take.
template <int bytes>
inline constexpr int kReversedBlock = (bytes % 3 == 0 ? 3 : 4) * static_cast<int>(sizeof(Bytes)) / bytes;

template <int bytes>
TILE_INLINE void reverseBlock(const unsigned char* src, unsigned char* dst) {
  if constexpr (bytes == 3) {
    Bytes v[3];
    loadChannels(src, v);
    storeChannels(dst, {reversed(v[0]), reversed(v[1]), reversed(v[2])});
  } else if constexpr (bytes == 12) {
    const auto turned = [](Floats v) { return (Floats)reversed<Bytes, 4>((Bytes)v); };
    Floats v[3];
    loadChannels(reinterpret_cast<const float*>(src), v);
    storeChannels(reinterpret_cast<float*>(dst), {turned(v[0]), turned(v[1]), turned(v[2])});
  } else {
    Bytes v[4];
    loadRow(src, v);
    storeRow(dst, {reversed<Bytes, bytes>(v[3]), reversed<Bytes, bytes>(v[2]), reversed<Bytes, bytes>(v[1]),
                   reversed<Bytes, bytes>(v[0])});
  }
}

// Pieces of `size` bytes, down to a single pixel.
template <int bytes, int size>
TILE_INLINE void reversePieces(ReversedRow& row) {
  row.each<bytes, size / bytes, 1>([](const unsigned char* src, unsigned char* dst) TILE_LAMBDA {
    storeLane<size, 16 / size - 1>(dst, reversed<Part, bytes>(loadBytes<size>(src)));
  });
  if constexpr (size > bytes) {
    reversePieces<bytes, size / 2>(row);
  }
}

// As many pixels of three lanes as go into a register, in reverse order at its low end, from its high end.
// What else is in the register is read before them and written behind them.
template <typename V, int bytes>
TILE_INLINE void reverseTriplets(const unsigned char* src, unsigned char* dst) {
  constexpr int kSize = sizeof(V), kLane = bytes / 3, kPixels = kSize / bytes;
  constexpr auto kFrom = [](int i) { return kSize / kLane - 3 - (i / 3 * 3 - i % 3) % (kPixels * 3); };
  const auto v = loadAs<V>(src + kPixels * bytes - kSize);
  storeAs(dst, arranged<V, kLane, kFrom>(v, v));
}

template <int bytes>
void reverseRow(const unsigned char* end, unsigned char* dst, ptrdiff_t pixels) {
  ReversedRow row = {end, dst, pixels};
  constexpr bool kWide = sizeof(Bytes) > 16;
  if constexpr (bytes % 3 != 0 || !kWide) {
    // A block takes few instructions, six for pixels of a power of two: the loop itself is worth spreading.
    constexpr int kBlock = kReversedBlock<bytes>;
    constexpr int kInFlight = kWide ? 1 : bytes >= 4 ? 8 : 2;
    row.each<bytes, kBlock, kInFlight>(reverseBlock<bytes>);
    row.each<bytes, kBlock, 1>(reverseBlock<bytes>);
  }
  if constexpr (bytes % 3 != 0) {
    reversePieces<bytes, 16>(row);
    return;
  }
#if defined(__ARM_NEON)
  if constexpr (bytes == 3) {
    row.each<bytes, 8, 1>(reverseEightTriplets);
  }
#else
  if constexpr (bytes % 3 == 0) {
    // The last pixel is written over by none.
    using V = std::conditional_t<bytes == 3, Part, Bytes>;
    --row.left;
    constexpr int kPixels = static_cast<int>(sizeof(V)) / bytes;
    row.each<bytes, kPixels, 4>(reverseTriplets<V, bytes>);
    row.each<bytes, kPixels, 1>(reverseTriplets<V, bytes>);
    ++row.left;
  }
#endif
  row.each<bytes, 1, 1>([](const unsigned char* from, unsigned char* to)
                            TILE_LAMBDA { memcpy(to, from, bytes); });
}

template <int bytes>
void halfTurn(const SourceImage& in, const TargetImage& out) {
  const ptrdiff_t rowSize = out.width * bytes;
  const unsigned char* const end = in.data + (in.height - 1) * in.stride + in.width * bytes;
  if (in.stride == rowSize && out.rows.afterEven == rowSize && out.rows.afterOdd == rowSize &&
      in.width == out.width) {
    // With nothing between the rows, all of them are one.
    reverseRow<bytes>(end, out.rows.data, out.height * out.width);
    return;
  }
  for (ptrdiff_t r = 0; r < out.height; ++r) {
    reverseRow<bytes>(end - r * in.stride, out.rows.at(r), out.width);
  }
}

}  // namespace

template <int bytes, int blockHeight, int blockWidth>
void rotatePixels(int degree, const SourceImage& in, const TargetImage& out) {
  if (out.height < 1 || out.width < 1) {
    return;
  }
  if (degree == 90 || degree == 270) {
    QuarterTurn<bytes>(degree == 270, in, out).template run<blockHeight, blockWidth>();
  } else if (degree == 180) {
    halfTurn<bytes>(in, out);
  }
}

// For the 4:2:0 rotations.
template void rotatePixels<1, kRotateBlock, kRotateBlock>(int, const SourceImage&, const TargetImage&);
template void rotatePixels<2, kRotateBlock, kRotateBlock>(int, const SourceImage&, const TargetImage&);

}  // namespace arm

namespace {

// A worker: pixels of `nc` elements of T as so many bytes, strides in elements as bytes.
template <int degree, typename T, int nc, int blockHeight, int blockWidth>
inline void rotateImage(int inHeight, int inWidth, int inWidthStride, const T* inData, int outHeight,
                        int outWidth, int outWidthStride, T* outData) {
  constexpr ptrdiff_t kSize = sizeof(T);
  const ptrdiff_t outStride = outWidthStride * kSize;
  arm::rotatePixels<nc * kSize, blockHeight, blockWidth>(
      degree, {reinterpret_cast<const unsigned char*>(inData), inWidthStride * kSize, inHeight, inWidth},
      {{reinterpret_cast<unsigned char*>(outData), outStride, outStride}, outHeight, outWidth});
}

}  // namespace

template <typename T, int nc, int blockHeight, int blockWidth>
void imgRotate90degree(int inHeight, int inWidth, int inWidthStride, const T* inData, int outHeight,
                       int outWidth, int outWidthStride, T* outData) {
  rotateImage<90, T, nc, blockHeight, blockWidth>(inHeight, inWidth, inWidthStride, inData, outHeight,
                                                  outWidth, outWidthStride, outData);
}

template <typename T, int nc, int blockHeight, int blockWidth>
void imgRotate180degree(int inHeight, int inWidth, int inWidthStride, const T* inData, int outHeight,
                        int outWidth, int outWidthStride, T* outData) {
  rotateImage<180, T, nc, blockHeight, blockWidth>(inHeight, inWidth, inWidthStride, inData, outHeight,
                                                   outWidth, outWidthStride, outData);
}

template <typename T, int nc, int blockHeight, int blockWidth>
void imgRotate270degree(int inHeight, int inWidth, int inWidthStride, const T* inData, int outHeight,
                        int outWidth, int outWidthStride, T* outData) {
  rotateImage<270, T, nc, blockHeight, blockWidth>(inHeight, inWidth, inWidthStride, inData, outHeight,
                                                   outWidth, outWidthStride, outData);
}

template <typename T, int ncSrc, int ncDst, int nc>
void armRotateNx90degree(int inHeight, int inWidth, int inWidthStride, const T* inData, int outHeight,
                         int outWidth, int outWidthStride, T* outData, int degree) {
  // The texts are what the process ends with.
  KERNEL_ASSERT(arm::kRotatePath, inData != NULL);   // NOLINT(modernize-use-nullptr)
  KERNEL_ASSERT(arm::kRotatePath, outData != NULL);  // NOLINT(modernize-use-nullptr)
  // The destination's stride is not looked at (C14).
  KERNEL_ASSERT(arm::kRotatePath,
                inHeight != 0 && inWidth != 0 && inWidthStride != 0 && outHeight != 0 && outWidth != 0);
  if (degree == 90) {
    imgRotate90degree<T, nc, arm::kRotateBlock, arm::kRotateBlock>(
        inHeight, inWidth, inWidthStride, inData, outHeight, outWidth, outWidthStride, outData);
  } else if (degree == 180) {
    imgRotate180degree<T, nc, arm::kRotateBlock, arm::kRotateBlock>(
        inHeight, inWidth, inWidthStride, inData, outHeight, outWidth, outWidthStride, outData);
  } else {
    KERNEL_ASSERT(arm::kRotatePath, degree == 90 || degree == 180 || degree == 270);
    imgRotate270degree<T, nc, arm::kRotateBlock, arm::kRotateBlock>(
        inHeight, inWidth, inWidthStride, inData, outHeight, outWidth, outWidthStride, outData);
  }
}

#define FASTCV_ROTATE_WORKER(name, T, nc)                                                                  \
  template FASTCV_EXPORTED void name<T, nc, arm::kRotateBlock, arm::kRotateBlock>(int, int, int, const T*, \
                                                                                  int, int, int, T*);
#define FASTCV_ROTATE(T, nc)                                                                               \
  FASTCV_ROTATE_WORKER(imgRotate90degree, T, nc)                                                           \
  FASTCV_ROTATE_WORKER(imgRotate180degree, T, nc)                                                          \
  FASTCV_ROTATE_WORKER(imgRotate270degree, T, nc)                                                          \
  template FASTCV_EXPORTED void armRotateNx90degree<T, nc, nc, nc>(int, int, int, const T*, int, int, int, \
                                                                   T*, int);
FASTCV_ROTATE(unsigned char, 1)
FASTCV_ROTATE(unsigned char, 2)
FASTCV_ROTATE(unsigned char, 3)
FASTCV_ROTATE(unsigned char, 4)
FASTCV_ROTATE(float, 1)
FASTCV_ROTATE(float, 2)
FASTCV_ROTATE(float, 3)
FASTCV_ROTATE(float, 4)

}  // namespace HPC::fastcv
