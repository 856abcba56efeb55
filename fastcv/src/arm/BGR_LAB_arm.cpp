// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// BGR to and from CIE L*a*b* (sRGB primaries, D65 white).
//
// 8-bit BGR to Lab is integer arithmetic over the tables of gamma and cube roots:
//
//   X = (1777 R + 1541 G + 778 B + 2048) >> 12 of linear R, G, B; Y of 871, 2929, 296; Z of 73, 448, 3575
//   L = (296 f(Y) - 1320550) >> 15
//   a = (500 (f(X) - f(Y)) + 4210688) >> 15, clamped to a byte: 4210688 is 128.5 * 32768
//   b = (200 (f(Y) - f(Z)) + 4210688) >> 15, clamped
//
// The others are in float, over the splines. A multiplication that an addition follows is fused with it. X,
// Y, Z are R c + (B c + G c), from the bracket outward; blue, green, red are sums of X c, Y c, Z c from left
// to right.

#include <bit>
#include <cstddef>
#include <cstdint>
#include <cstring>

#include "entry.h"
#include "roots.h"
#include "simd/lab_tables.h"
#include "simd/loop.h"
#include "simd/registers.h"

namespace HPC::fastcv {
namespace {

using namespace arm;

// ---- 8-bit BGR to Lab

constexpr LinearWeights kXWeights = {778, 1541, 1777};
constexpr LinearWeights kZWeights = {3575, 448, 73};
constexpr int16_t kAScale = 500;
constexpr int16_t kBScale = 200;
constexpr int kRootShift = 15;

constexpr WideTable wideGammaTable() {
  WideTable table{};
  for (int i = 0; i < 256; ++i) {
    table.set(i, kGammaTable[static_cast<size_t>(i)]);
  }
  return table;
}
constexpr WideTable kWideGammaTable = wideGammaTable();

template <int nc>
struct BgrToLab8 {
  using Src = unsigned char;
  using Dst = unsigned char;
  static constexpr int kSrcChannels = nc;
  static constexpr int kDstChannels = 3;
  static constexpr int kInFlight = 1;
  static constexpr bool kUniform = true;

  [[gnu::always_inline]] Pixels<Bytes, 3> vector(const Pixels<Bytes, nc>& p) const {
    const Bytes bytes[3] = {p.c[0], p.c[1], p.c[2]};
    Two<Halves> light[3];
    lookUp(kWideGammaTable, bytes, light);
    const auto low = roots(light[0].low, light[1].low, light[2].low);
    const auto high = roots(light[0].high, light[1].high, light[2].high);
    return {{narrow(Two<Halves>{lightness(low.c[1]), lightness(high.c[1])}),
             opponent({low.c[0] - low.c[1], high.c[0] - high.c[1]}, kAScale),
             opponent({low.c[1] - low.c[2], high.c[1] - high.c[2]}, kBScale)}};
  }

  void scalar(const unsigned char* in, unsigned char* out) const {
    const int b = kGammaTable[in[0]];
    const int g = kGammaTable[in[1]];
    const int r = kGammaTable[in[2]];
    const int x = root(kXWeights, b, g, r);
    const int y = root(kYWeights, b, g, r);
    const int z = root(kZWeights, b, g, r);
    constexpr int kCentre = (128 << kRootShift) + (1 << (kRootShift - 1));
    out[0] = static_cast<unsigned char>(
        (y * static_cast<int>(kLightnessScale) - static_cast<int>(kLightnessOffset)) >> kLightnessShift);
    out[1] = clampToByte(((x - y) * kAScale + kCentre) >> kRootShift);
    out[2] = clampToByte(((y - z) * kBScale + kCentre) >> kRootShift);
  }

 private:
  using Coordinate = WeighedHalves<kWeightShift>;

  static int root(LinearWeights weights, int b, int g, int r) {
    return kCubeRootTable[static_cast<size_t>(
        (g * weights.g + b * weights.b + r * weights.r + (1 << (kWeightShift - 1))) >> kWeightShift)];
  }

  // f of X, Y and Z.
  [[gnu::always_inline]] Pixels<Halves, 3> roots(Halves b, Halves g, Halves r) const {
    const uint16_t* const table = kCubeRootTable.data();
    return {{lookUp(table, x_(b, g, r)), lookUp(table, y_(b, g, r)), lookUp(table, z_(b, g, r))}};
  }

  // (296 f(Y) - 1320550) >> 15, as the high half of twice the bracket.
  static Halves lightness(Halves root) {
    return multiplySubtractHigh(root, 2 * kLightnessScale, 2 * kLightnessOffset);
  }

  // (scale * difference + 128.5 * 32768) >> 15, clamped to a byte: the difference of two roots fits a signed
  // lane, and 128 more after saturation to a signed byte is the clamp.
  static Bytes opponent(const Two<Halves>& difference, int16_t scale) {
    return (Bytes)narrowSigned(multiplyRounded(asSigned(difference), scale)) ^ splat<Bytes>(0x80);
  }

  Coordinate x_{kXWeights.b, kXWeights.g, kXWeights.r};
  Coordinate y_{kYWeights.b, kYWeights.g, kYWeights.r};
  Coordinate z_{kZWeights.b, kZWeights.g, kZWeights.r};
};

// The roots lie in 4520..32768, so that their differences fit 16 bits.
static_assert(kCubeRootTable[0] == 4520 && kCubeRootTable[kLinearUnit] == 32768);

// ---- what the float kernels share

// The spline's value at t / 1024, in piece k.
inline Floats valueIn(const Spline& spline, Floats t, Words k) {
  Floats a[4];
  lookUpRows(spline.piece, k, a);
  const Floats u = t - floatsOf(k);
  return multiplyAdd(a[0], u, multiplyAdd(a[1], u, multiplyAdd(a[2], u, a[3])));
}

// v0 w0 + v1 w1 + v2 w2, from left to right.
inline Floats weighted(Floats v0, Floats v1, Floats v2, const Factors& w) {
  return multiplyAdd(multiplyAdd(v0 * w.at<0>(), v1, w.at<1>()), v2, w.at<2>());
}

// One pixel through the vector form of `op`.
template <typename Op>
inline void pixelByVector(const Op& op, const typename Op::Src* in, typename Op::Dst* out) {
  constexpr int kBlock = kBlockPixels<typename Op::Src>;
  typename Op::Src src[kBlock * Op::kSrcChannels] = {};
  typename Op::Dst dst[kBlock * Op::kDstChannels];
  for (int i = 0; i < Op::kSrcChannels; ++i) {
    src[i] = in[i];
  }
  storePixels(dst, op.vector(loadPixels<BlockOf<typename Op::Src>, Op::kSrcChannels>(src)));
  for (int i = 0; i < Op::kDstChannels; ++i) {
    out[i] = dst[i];
  }
}

// Where f changes from the line to the cube root, in linear light and in f, and the line.
constexpr float kToe = 0.008856f;
constexpr float kToeRoot = 0.20689271f;
constexpr float kToeSlope = 7.787f;
constexpr float kToeOffset = 0.13793103f;

// ---- float BGR to Lab

// The roots with powf where it is needed. What has been computed of them is computed again: it would cost
// more to keep it ready, every time, for the few calls.
[[gnu::noinline, gnu::cold]] Pixels<Floats, 3> settledRoots(Floats x, Floats y, Floats z,
                                                            const RootFactors& factors) {
  return {{Roots(x, factors).settled(), Roots(y, factors).settled(), Roots(z, factors).settled()}};
}

template <int nc>
struct BgrToLabF32 {
  using Src = float;
  using Dst = float;
  static constexpr int kSrcChannels = nc;
  static constexpr int kDstChannels = 3;
  static constexpr bool kInlined = true;
  static constexpr int kInFlight = 1;
  static constexpr bool kUniform = true;

  Pixels<Floats, 3> vector(const Pixels<Floats, nc>& p) const {
    const Floats b = linear(p.c[0]);
    const Floats g = linear(p.c[1]);
    const Floats r = linear(p.c[2]);
    const Floats x = weighted(g, b, r, x_);
    const Floats y = weighted(g, b, r, y_);
    const Floats z = weighted(g, b, r, z_);
    const Words aboveX = aboveToe(x), aboveY = aboveToe(y), aboveZ = aboveToe(z);
    const Roots rootX(x, root_), rootY(y, root_), rootZ(z, root_);
    Pixels<Floats, 3> roots = {{rootX.rounded(), rootY.rounded(), rootZ.rounded()}};
    const Words unclear = (aboveX & ~rootX.clear()) | (aboveY & ~rootY.clear()) | (aboveZ & ~rootZ.clear());
    if (anySet(unclear)) {
      roots = settledRoots(x, y, z, root_);
    }
    const Floats fx = rootOrToe(aboveX, x, roots.c[0]);
    const Floats fy = rootOrToe(aboveY, y, roots.c[1]);
    const Floats fz = rootOrToe(aboveZ, z, roots.c[2]);
    const Floats l = select(aboveY, multiplyAdd(splat<Floats>(-16.0f), fy, lab_.at<0>()), y * lab_.at<1>());
    return {{l, (fx - fy) * lab_.at<2>(), (fy - fz) * lab_.at<3>()}};
  }

  void scalar(const float* in, float* out) const { pixelByVector(*this, in, out); }

 private:
  // Beyond 0..1 the end pieces go on; a NaN stays one.
  static Floats linear(Floats v) {
    const Floats t = v * splat<Floats>(static_cast<float>(kSplineIntervals));
    const Floats piece =
        minNumber(maxNumber(t, splat<Floats>(0.0f)), splat<Floats>(static_cast<float>(kSplineIntervals - 1)));
    return valueIn(kExpansionSpline, t, truncated(piece));
  }

  static Words aboveToe(Floats t) { return (Words)(t > splat<Floats>(kToe)); }

  Floats rootOrToe(Words above, Floats t, Floats root) const {
    return select(above, root, multiplyAdd(splat<Floats>(kToeOffset), t, x_.at<3>()));
  }

  // Weights of G, B, R in X, Y and Z, and the slope of the toe.
  Factors x_{0.37621942f, 0.18982783f, 0.43395275f, kToeSlope};
  Factors y_{0.71516f, 0.072169f, 0.212671f, 0};
  Factors z_{0.109476514f, 0.87276554f, 0.017757913f, 0};
  // Of L above and in the toe, of a and of b.
  Factors lab_{116.0f, 903.3f, 500.0f, 200.0f};
  RootFactors root_;
};

// ---- Lab to BGR

// Lab to linear light, both kernels' first half.
class LabToLinear {
 public:
  // Linear blue, green and red of a block of pixels.
  struct Linear {
    Floats c[3];
  };

  Linear operator()(Floats l, Floats a, Floats b) const {
    const Floats toeOffset = splat<Floats>(kToeOffset);
    const auto dark = l <= splat<Floats>(7.999625f);
    const Floats darkY = l * blue_.at<3>();
    const Floats darkRoot = multiplyAdd(toeOffset, darkY, green_.at<3>());
    const Floats brightRoot = multiplyAdd(toeOffset, l, red_.at<3>());
    const Floats fy = select(dark, darkRoot, brightRoot);
    const Floats y = select(dark, darkY, cubed(brightRoot));
    const Floats x = unrooted(multiplyAdd(fy, a, others_.at<0>()));
    const Floats z = unrooted(multiplyAdd(fy, b, others_.at<1>()));
    return {{weighted(x, y, z, blue_), weighted(x, y, z, green_), weighted(x, y, z, red_)}};
  }

 private:
  static Floats cubed(Floats v) { return v * v * v; }

  // The inverse of f.
  Floats unrooted(Floats f) const {
    return select(f > splat<Floats>(kToeRoot), cubed(f), (f - splat<Floats>(kToeOffset)) * others_.at<2>());
  }

  // Weights of X, Y, Z in a colour, and one of: Y of a dark L, its root, a bright L's root.
  Factors blue_{0.052890975f, -0.204043f, 1.1511517f, 0.001107052f};
  Factors green_{-0.9212352f, 1.875991f, 0.045244265f, kToeSlope};
  Factors red_{3.0799327f, -1.53715f, -0.542782f, 0.00862069f};
  // A fx of a, fz of b, the inverse toe's slope.
  Factors others_{0.002f, -0.005f, 0.12841916f, 0};
};

template <int nc>
struct LabToBgrF32 {
  using Src = float;
  using Dst = float;
  static constexpr int kSrcChannels = 3;
  static constexpr int kDstChannels = nc;
  static constexpr int kInFlight = 2;
  static constexpr bool kUniform = true;

  Pixels<Floats, nc> vector(const Pixels<Floats, 3>& p) const {
    const LabToLinear::Linear linear = linear_(p.c[0], p.c[1], p.c[2]);
    // Green first: in this order the compiler keeps the most in registers.
    const Floats green = compressed(linear.c[1]);
    const Floats blue = compressed(linear.c[0]);
    return pixelsOf<nc>(blue, green, compressed(linear.c[2]));
  }

  void scalar(const float* in, float* out) const { pixelByVector(*this, in, out); }

 private:
  // At 0 and below the curve is 0, at 1 and above the end of its last piece; a NaN stays one.
  static Floats compressed(Floats v) {
    const Floats limited = min(max(v, splat<Floats>(0.0f)), splat<Floats>(1.0f));
    const Floats t = limited * splat<Floats>(static_cast<float>(kSplineIntervals));
    return valueIn(kCompressionSpline, t, min(truncated(t), splat<Words>(kSplineIntervals - 1)));
  }

  LabToLinear linear_;
};

// A row of 8-bit Lab to BGR.
template <int nc>
struct LabToBgr8Row {
  static constexpr int kGroup = 8;

  const LabToLinear& linear;
  const unsigned char* in;
  unsigned char* out;

  template <int n>
  void block(ptrdiff_t x, Blocks<n>) const {
    for (int i = 0; i < n; ++i) {
      group(in + (x + i * kGroup) * 3, out + (x + i * kGroup) * nc);
    }
  }

  void step(ptrdiff_t x) const {
    unsigned char src[kGroup * 3] = {};
    unsigned char dst[kGroup * nc];
    memcpy(src, in + x * 3, 3);
    group(src, dst);
    memcpy(out + x * nc, dst, nc);
  }

 private:
  void group(const unsigned char* src, unsigned char* dst) const {
    Floats lab[3][kGroupRegisters];
    loadGroup(src, lab);
    LabToLinear::Linear light[kGroupRegisters];
    for (int r = 0; r < kGroupRegisters; ++r) {
      light[r] = linear(lab[0][r] * splat<Floats>(0.39215687f), lab[1][r], lab[2][r]);
    }
    storeGroup<nc>(dst, [&](int channel, int r) { return compressed(light[r].c[channel]); });
  }

  // The nearest byte to 255 times the curve, in bits 16 to 23: see ByteTable.
  static Words compressed(Floats v) {
    const Floats limited = min(max(v, splat<Floats>(ByteTable::kFloor)), splat<Floats>(0x1.fffffep-1f));
    const auto bits = std::bit_cast<Words>(limited);
    const Words index = bits >> ByteTable::kShift;
    // Where entry 0 would be, outside the table: an address that is only ever added to.
    const uintptr_t zeroth =
        reinterpret_cast<uintptr_t>(kCompressedBytes.entry) - ByteTable::kFirst * sizeof(uint32_t);
    const auto* entries = reinterpret_cast<const uint32_t*>(zeroth);  // NOLINT(performance-no-int-to-ptr)
    return lookUp(entries, index) + bits;
  }
};

// The workers of the float kernels, and of 8-bit Lab to BGR.
template <int nc>
inline void cvt_color_bgr2lab_f32(int height, int width, int inWidthStride, const float* inData,
                                  int outWidthStride, float* outData) {
  forEachPixel(BgrToLabF32<nc>{}, height, width, inWidthStride, inData, outWidthStride, outData);
}

template <int nc>
inline void cvt_color_lab2bgr_f32(int height, int width, int inWidthStride, const float* inData,
                                  int outWidthStride, float* outData) {
  forEachPixel(LabToBgrF32<nc>{}, height, width, inWidthStride, inData, outWidthStride, outData);
}

// A row is worked on in groups of 8 while the first pixel of the group lies below width - 3. The last group
// may reach up to 4 pixels beyond the row: callers leave room for that, and may count on the row's end being
// reached.
template <int nc>
inline void cvt_color_lab2bgr_uchar(int height, int width, int inWidthStride, const unsigned char* inData,
                                    int outWidthStride, unsigned char* outData) {
  using Row = LabToBgr8Row<nc>;
  if (width < 1) {
    return;
  }
  const ptrdiff_t grouped = width > 3 ? (static_cast<ptrdiff_t>(width) + 4) / Row::kGroup * Row::kGroup : 0;
  const LabToLinear linear;
  const ptrdiff_t length = grouped > width ? grouped : width;
  for (ptrdiff_t y = 0; y < height; ++y) {
    const Row row{linear, inData + y * inWidthStride, outData + y * outWidthStride};
    walk<Row::kGroup, 2, 1>(
        length, Tail::kSteps, [&](ptrdiff_t x, auto blocks) { row.block(x, blocks); },
        [&](ptrdiff_t x) { row.step(x); });
  }
}

template <int nc>
inline void bgr2lab_uchar(int height, int width, int inWidthStride, const unsigned char* inData,
                          int outWidthStride, unsigned char* outData) {
  forEachPixel(BgrToLab8<nc>{}, height, width, inWidthStride, inData, outWidthStride, outData);
}

}  // namespace

FASTCV_ENTRY(armBGR2LABImage, unsigned char, 3, 3, bgr2lab_uchar<3>)
FASTCV_ENTRY(armBGR2LABImage, unsigned char, 4, 3, bgr2lab_uchar<4>)
FASTCV_ENTRY(armBGR2LABImage, float, 3, 3, cvt_color_bgr2lab_f32<3>)
FASTCV_ENTRY(armBGR2LABImage, float, 4, 3, cvt_color_bgr2lab_f32<4>)
FASTCV_ENTRY(armLAB2BGRImage, unsigned char, 3, 3, cvt_color_lab2bgr_uchar<3>)
FASTCV_ENTRY(armLAB2BGRImage, unsigned char, 3, 4, cvt_color_lab2bgr_uchar<4>)
FASTCV_ENTRY(armLAB2BGRImage, float, 3, 3, cvt_color_lab2bgr_f32<3>)
FASTCV_ENTRY(armLAB2BGRImage, float, 3, 4, cvt_color_lab2bgr_f32<4>)

}  // namespace HPC::fastcv
