// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// Full-range YUV 4:2:0 to colours: what the conversions of whole frames and of a camera's planes share. The
/// coefficients are this library's own; with U and V the stored bytes minus 128:
///
///   B = (64 Y + 110 U + 32) >> 6, clamped to a byte
///   G = (64 Y - 24 U - 44 V + 32) >> 6, clamped
///   R = (64 Y + 86 V + 32) >> 6, clamped
///
/// Shifts floor. A chroma sample belongs to 2 x 2 pixels.
#pragma once

#include "simd/loop.h"
#include "simd/pixel.h"
#include "simd/registers.h"
#include "simd/tile.h"

namespace HPC::fastcv::arm {

inline constexpr int kDecodeShift = 6;

/// What a chroma sample counts in the colour that is its own, B for U and R for V, and, taken away, in green.
struct ChromaWeights {
  int colour;
  int green;
};
inline constexpr ChromaWeights kWeightsU = {110, 24};
inline constexpr ChromaWeights kWeightsV = {86, 44};

/// What chroma samples add to a colour channel. As 64 Y is a multiple of 64, (64 Y + t + 32) >> 6 is
/// Y + ((t + 32) >> 6), and the added term, -220 to 218, splits into two bytes of which one is 0: adding the
/// one and subtracting the other, both saturating, is the clamped sum for 16 pixels at once.
struct ChromaTerm {
  Bytes plus;
  Bytes minus;
};

namespace detail {

/// The terms of 16 chroma samples from t, their products in 16 bits, which reach at most 110 * 128 = 14080.
template <typename Products>
inline ChromaTerm chromaTerm(const Products& t) {
  // The negative part is -((t + 32) >> 6) = (31 - t) >> 6, which is the rounding shift of -1 - t: of the bits
  // of t inverted, for which no constant takes a register.
  return {sampleBytes<kDecodeShift>(t), sampleBytes<kDecodeShift>(~t)};
}

inline SignedHalves offset(int weight) { return splat<SignedHalves>(static_cast<int16_t>(weight * 128)); }
inline unsigned char byteOf(int weight) { return static_cast<unsigned char>(weight); }

/// weight * (stored - 128): the product with the stored byte, which a core finds faster than with a 16-bit
/// difference, less that with 128.
inline ChromaTerm colourTerm(Samples stored, int weight) {
  return chromaTerm(asSigned(multiply(stored, byteOf(weight))) - offset(weight));
}

/// -weight1 * (stored1 - 128) - weight2 * (stored2 - 128)
inline ChromaTerm greenTerm(Samples stored1, int weight1, Samples stored2, int weight2) {
  return chromaTerm(offset(weight1 + weight2) -
                    asSigned(multiplyAdd(multiply(stored1, byteOf(weight1)), stored2, byteOf(weight2))));
}

}  // namespace detail

/// The terms of 16 chroma samples, or, spread, those of a block of a row's pixels.
struct ChromaTerms {
  ChromaTerm first;  ///< of the colour that is the first sample's
  ChromaTerm green;
  ChromaTerm second;  ///< of the colour that is the second sample's
};

/// The terms of 16 first and 16 second chroma samples, U and V in either order.
inline ChromaTerms chromaTerms(Samples first, ChromaWeights firstWeights, Samples second,
                               ChromaWeights secondWeights) {
  return {detail::colourTerm(first, firstWeights.colour),
          detail::greenTerm(first, firstWeights.green, second, secondWeights.green),
          detail::colourTerm(second, secondWeights.colour)};
}

/// Spreads 16 chroma terms over the columns of a block, the first or the second.
template <int part>
inline ChromaTerms spread(const ChromaTerms& terms) {
  const auto each = [](const ChromaTerm& term) {
    return ChromaTerm{spread<part>(term.plus), spread<part>(term.minus)};
  };
  return {each(terms.first), each(terms.green), each(terms.second)};
}

inline Bytes addTerm(Bytes luma, const ChromaTerm& term) {
  return subtractSaturated(addSaturated(luma, term.plus), term.minus);
}

/// A block of pixels of their luma and their terms. The first channel is the first sample's colour; with
/// `swapped` the second's.
template <bool swapped>
inline Pixels<Bytes, 3> decodedPixels(Bytes luma, const ChromaTerms& terms) {
  const Bytes first = addTerm(luma, terms.first);
  const Bytes green = addTerm(luma, terms.green);
  const Bytes second = addTerm(luma, terms.second);
  return swapped ? Pixels<Bytes, 3>{{second, green, first}} : Pixels<Bytes, 3>{{first, green, second}};
}

/// The column pairs of a chroma sample in up to two rows, pixel by pixel. `u` and `v` are the stored bytes.
template <int nc, bool rgb>
class DecodedSample {
 public:
  DecodedSample(unsigned char u, unsigned char v)
      : b_(kWeightsU.colour * (u - 128)),
        g_(-kWeightsU.green * (u - 128) - kWeightsV.green * (v - 128)),
        r_(kWeightsV.colour * (v - 128)) {}

  void store(unsigned char luma, unsigned char* out) const {
    constexpr int kHalf = 1 << (kDecodeShift - 1);
    const int scaled = (luma << kDecodeShift) + kHalf;
    const unsigned char blue = clampToByte((scaled + b_) >> kDecodeShift);
    const unsigned char green = clampToByte((scaled + g_) >> kDecodeShift);
    const unsigned char red = clampToByte((scaled + r_) >> kDecodeShift);
    if constexpr (rgb) {
      storePixel<nc>(out, red, green, blue);
    } else {
      storePixel<nc>(out, blue, green, red);
    }
  }

 private:
  int b_;
  int g_;
  int r_;
};

// ---- blocks and rows

/// Columns that are decoded at once: those of the 16 chroma samples of a register.
inline constexpr int kDecodeColumns = 32;

/// 16 first and 16 second chroma samples.
struct ChromaBlock {
  Samples first;
  Samples second;
};

/// What is the same for all blocks of a picture. `swapped` as for `decodedPixels`.
template <int nc, bool swapped>
class ColourDecoder {
 public:
  /// The first samples are V, or U.
  explicit ColourDecoder(bool firstIsV)
      : first_(firstIsV ? kWeightsV : kWeightsU), second_(firstIsV ? kWeightsU : kWeightsV) {
    Bytes alpha = splat<Bytes>(kOpaque<unsigned char>);
    for (Bytes& ofRow : alpha_) {
      forget(alpha);
      ofRow = alpha;
    }
  }

  /// Decodes 32 columns of two rows: `luma(row, part)` gives those of one block. Each row's last 16 pixels
  /// are stored behind the first, then its pointer moves on from them by `step`. The luma is asked for when
  /// it is needed, as registers are few.
  template <typename Luma>
  TILE_INLINE void decode(const Luma& luma, const ChromaBlock& chroma, unsigned char* (&out)[2],
                          ptrdiff_t step) const {
    const ChromaTerms terms = chromaTerms(chroma.first, first_, chroma.second, second_);
    if constexpr (kSampleBlocks == 2) {
      part(luma(0, 0), luma(1, 0), spread<0>(terms), out, 16 * nc);
      part(luma(0, 1), luma(1, 1), spread<1>(terms), out, step);
    } else {
      part(luma(0, 0), luma(1, 0), terms, out, 16 * nc + step);
    }
  }

 private:
  TILE_INLINE void part(Bytes luma0, Bytes luma1, const ChromaTerms& terms, unsigned char* (&out)[2],
                        ptrdiff_t step) const {
    store<0>(decodedPixels<swapped>(luma0, terms), out[0], step);
    store<1>(decodedPixels<swapped>(luma1, terms), out[1], step);
  }

  /// An alpha for each row: one register cannot stand behind several colour registers.
  template <int row>
  TILE_INLINE void store(const Pixels<Bytes, 3>& pixels, unsigned char*& out, ptrdiff_t step) const {
    storePixels(out, withAlpha<nc>(pixels, alpha_[row]));
    out += step;
    forget(out);
  }

  ChromaWeights first_;
  ChromaWeights second_;
  Bytes alpha_[2];
};

/// Two rows of luma and their row of chroma.
struct RowPair {
  const unsigned char* luma0;
  const unsigned char* luma1;
  const unsigned char* first;   ///< the first samples, or pairs of a first and a second
  const unsigned char* second;  ///< not used with pairs
};

/// Reads blocks from a row pair, along it or from its end down.
template <bool pairs, bool mirrored>
class RowPairReader {
 public:
  /// The first block is the one at `column`.
  RowPairReader(const RowPair& rows, ptrdiff_t column)
      : luma_{rows.luma0 + column, rows.luma1 + column},
        first_(rows.first + (pairs ? column : column / 2)),
        second_(pairs ? nullptr : rows.second + column / 2) {}

  TILE_INLINE ChromaBlock chroma() const {
    ChromaBlock block;
    if constexpr (pairs) {
      loadSamplePairs(first_, block.first, block.second);
    } else {
      block = {loadSamples(first_), loadSamples(second_)};
    }
    return mirrored ? ChromaBlock{reversed(block.first), reversed(block.second)} : block;
  }

  TILE_INLINE Bytes luma(int row, int part) const {
    const Bytes v = load(luma_[row] + 16 * (mirrored && kSampleBlocks == 2 ? 1 - part : part));
    return mirrored ? reversed(v) : v;
  }

  TILE_INLINE void next() {
    advance(luma_[0], kDecodeColumns);
    advance(luma_[1], kDecodeColumns);
    advance(first_, pairs ? kDecodeColumns : kDecodeColumns / 2);
    if constexpr (!pairs) {
      advance(second_, kDecodeColumns / 2);
    }
  }

 private:
  static TILE_INLINE void advance(const unsigned char*& at, ptrdiff_t step) {
    at += mirrored ? -step : step;
    forget(at);
  }

  const unsigned char* luma_[2];
  const unsigned char* first_;
  const unsigned char* second_;
};

/// Asks for the memory of a block that will be written some turns later. On x86-64 that takes up to a third
/// of the time away where a picture is beyond the second-level cache, and costs nothing where it is in it.
/// Arm's cores write whole lines without reading them first, which asking for them would undo.
TILE_INLINE void expectStores([[maybe_unused]] const unsigned char* out) {
#if !defined(__ARM_NEON)
  constexpr ptrdiff_t kAhead = 2048;
  constexpr ptrdiff_t kLine = 64;
  __builtin_prefetch(out + kAhead, 1);
  __builtin_prefetch(out + kAhead + kLine, 1);
#endif
}

/// Decodes `width` columns, even and at least kDecodeColumns, of a row pair; the last block is flush with
/// the row's end. With `mirrored` the first column becomes the last. Inlined, so that the decoder is
/// registers.
template <bool pairs, bool mirrored, int nc, bool swapped>
TILE_INLINE void decodeRowPair(const ColourDecoder<nc, swapped>& decoder, const RowPair& rows,
                               ptrdiff_t width, unsigned char* out0, unsigned char* out1) {
  const auto run = [&](ptrdiff_t x, ptrdiff_t blocks) TILE_LAMBDA {
    RowPairReader<pairs, mirrored> from(rows, mirrored ? width - x - kDecodeColumns : x);
    unsigned char* out[2] = {out0 + x * nc, out1 + x * nc};
    KERNEL_ROLLED_LOOP
    for (; blocks != 0; --blocks) {
      decoder.decode([&](int row, int part) TILE_LAMBDA { return from.luma(row, part); }, from.chroma(), out,
                     16 * nc);
      expectStores(out[0]);
      expectStores(out[1]);
      from.next();
    }
  };
  run(0, width / kDecodeColumns);
  if (width % kDecodeColumns != 0) {
    run(width - kDecodeColumns, 1);
  }
}

}  // namespace HPC::fastcv::arm
