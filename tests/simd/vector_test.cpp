// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// The words that both architectures have, against scalar code: over random lanes, many of them at the ends of
// what a word takes.
#include "simd/vector.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <bit>
#include <cmath>
#include <cstdint>
#include <cstring>
#include <limits>
#include <random>
#include <type_traits>
#include <vector>

#include "simd/shuffle.h"
#include "tests/support/guarded_image.h"

using namespace HPC::fastcv::arm;

namespace {

using kyface::test::GuardedImage;
using u8 = unsigned char;

constexpr int kTimes = 2000;
constexpr float kInfinity = std::numeric_limits<float>::infinity();
constexpr float kNaN = std::numeric_limits<float>::quiet_NaN();

template <typename V>
constexpr size_t kLanes = sizeof(V) / sizeof(ElementOf<V>);
constexpr size_t kBlock = kLanes<Bytes>;

template <typename V>
using Lanes = std::array<ElementOf<V>, kLanes<V>>;
template <typename V>
Lanes<V> lanesOf(V v) {
  Lanes<V> lanes;
  memcpy(lanes.data(), &v, sizeof(v));
  return lanes;
}
template <typename V>
V vectorOf(const Lanes<V>& lanes) {
  V v;
  memcpy(&v, lanes.data(), sizeof(v));
  return v;
}

// ---- what lanes are filled with

std::mt19937& generator() {
  static std::mt19937 engine(1);  // NOLINT(cert-msc32-c,cert-msc51-cpp): the same every time
  return engine;
}

uint32_t randomBits() { return static_cast<uint32_t>(generator()()); }

/// An integer from `least` to `most`, half of the time at or next to an end of that, of bytes or of zero.
template <typename T>
T within(T least, T most) {
  if (randomBits() % 2 == 0) {
    const int64_t edges[] = {least, least + 1, most, most - 1, 0,     1,      -1,     127,      128,
                             -128,  255,       256,  32767,    32768, -32767, -32768, least / 2};
    const int64_t edge = edges[randomBits() % std::size(edges)];
    if (edge >= least && edge <= most) {
      return static_cast<T>(edge);
    }
  }
  return static_cast<T>(std::uniform_int_distribution<int64_t>(least, most)(generator()));
}
template <typename T>
T anyOf() {
  if constexpr (std::is_integral_v<T>) {
    return within<T>(std::numeric_limits<T>::min(), std::numeric_limits<T>::max());
  } else {
    static constexpr float kEdges[] = {0,
                                       -0.0f,
                                       1,
                                       -1,
                                       255,
                                       0.5f,
                                       -32768,
                                       0x1p-126f,
                                       0x1p-149f,
                                       -0x1p-130f,
                                       kInfinity,
                                       -kInfinity,
                                       0x1.fffffep127f,
                                       0x1.fffffep-1f};
    const uint32_t choice = randomBits() % (2 * std::size(kEdges));
    if (choice < std::size(kEdges)) {
      return kEdges[choice];
    }
    return std::uniform_real_distribution<float>(-1000, 1000)(generator());
  }
}

template <typename V, typename Next>
V filled(Next next) {
  Lanes<V> lanes;
  std::generate(lanes.begin(), lanes.end(), next);
  return vectorOf<V>(lanes);
}
template <typename V>
V anyVector() {
  return filled<V>(anyOf<ElementOf<V>>);
}
template <typename V>
V vectorWithin(ElementOf<V> least, ElementOf<V> most) {
  return filled<V>([=] { return within(least, most); });
}
/// Lanes that are all set or all clear.
template <typename V>
V anyMask() {
  using T = ElementOf<V>;
  return filled<V>([] { return static_cast<T>(randomBits() % 2 == 0 ? 0 : ~T{0}); });
}
template <typename V>
V counting() {
  int i = 0;
  return filled<V>([&i] { return static_cast<ElementOf<V>>(i++); });
}

// ---- what is compared

template <typename T>
bool same(T a, T b) {
  if constexpr (std::is_floating_point_v<T>) {
    return (std::isnan(a) && std::isnan(b)) || std::bit_cast<uint32_t>(a) == std::bit_cast<uint32_t>(b);
  } else {
    return a == b;
  }
}
/// As numbers: zeros are alike.
bool sameNumber(float a, float b) { return a == b || (std::isnan(a) && std::isnan(b)); }

/// Whether lane i is expected(i).
template <typename T, size_t n, typename Expected>
testing::AssertionResult are(const std::array<T, n>& lanes, const Expected& expected) {
  for (size_t i = 0; i < n; ++i) {
    if (const auto want = static_cast<T>(expected(i)); !same(lanes[i], want)) {
      return testing::AssertionFailure() << "lane " << i << ": " << +lanes[i] << ", expected " << +want;
    }
  }
  return testing::AssertionSuccess();
}
template <typename V, typename Expected>
  requires(sizeof(V) == sizeof(Bytes))
testing::AssertionResult are(V v, const Expected& expected) {
  return are(lanesOf(v), expected);
}

/// Where the pixels of a block are in `Two`: lane i, counted through both registers, is pixel places[i].
template <typename Wide>
std::vector<size_t> placesOf(const Two<Wide>& counted) {
  std::vector<size_t> places;
  for (const Wide& v : {counted.low, counted.high}) {
    for (const auto lane : lanesOf(v)) {
      places.push_back(static_cast<size_t>(lane));
    }
  }
  return places;
}
template <typename V>
const std::vector<size_t>& places() {
  if constexpr (sizeof(ElementOf<V>) == 2) {
    static const auto kPlaces = placesOf(widen(counting<Bytes>()));
    return kPlaces;
  } else {
    static const auto kPlaces = placesOf(floatsOf(counting<Halves>()));
    return kPlaces;
  }
}
/// Two registers as pixels in their order, and back.
template <typename V>
using Pixels = std::array<ElementOf<V>, 2 * kLanes<V>>;
template <typename V>
Pixels<V> pixelsOf(const Two<V>& v) {
  const auto low = lanesOf(v.low), high = lanesOf(v.high);
  Pixels<V> pixels;
  for (size_t i = 0; i < pixels.size(); ++i) {
    pixels[places<V>()[i]] = i < low.size() ? low[i] : high[i - low.size()];
  }
  return pixels;
}
template <typename V>
Two<V> twoOf(const Pixels<V>& pixels) {
  Lanes<V> low, high;
  for (size_t i = 0; i < pixels.size(); ++i) {
    (i < low.size() ? low[i] : high[i - low.size()]) = pixels[places<V>()[i]];
  }
  return {vectorOf<V>(low), vectorOf<V>(high)};
}
template <typename V>
Pixels<V> pixelsWithin(ElementOf<V> least, ElementOf<V> most) {
  Pixels<V> pixels;
  std::generate(pixels.begin(), pixels.end(), [=] { return within(least, most); });
  return pixels;
}
template <typename V>
Pixels<V> anyPixels() {
  return pixelsWithin<V>(std::numeric_limits<ElementOf<V>>::min(), std::numeric_limits<ElementOf<V>>::max());
}

int roundedShift(int a, int n) { return (a + (n > 0 ? 1 << (n - 1) : 0)) >> n; }
int byteOf(int a) { return std::clamp(a, 0, 255); }

// ---- memory

/// `n` elements whose last is the last before a protected page, or which are aligned to no more than one of
/// them, with elements around them that are not to be written.
template <typename T>
class Stretch {
 public:
  Stretch(size_t n, bool flush)
      : size_(n), slack_(flush ? 0 : 1), image_(1, static_cast<int>(n) + 1, static_cast<int>(n) + 1, slack_) {
    image_.data()[0] = kAround;
    if (slack_ > 0) {
      data()[size_] = kAround;
    }
  }

  T* data() { return image_.data() + 1; }
  void fill() { std::generate(data(), data() + size_, anyOf<T>); }
  testing::AssertionResult isUntouchedAround() {
    if (image_.data()[0] != kAround || (slack_ > 0 && data()[size_] != kAround)) {
      return testing::AssertionFailure() << "written outside";
    }
    return testing::AssertionSuccess();
  }
  /// Whether element i is expected(i).
  template <typename Expected>
  testing::AssertionResult holds(const Expected& expected) {
    for (size_t i = 0; i < size_; ++i) {
      if (const auto want = static_cast<T>(expected(i)); !same(data()[i], want)) {
        return testing::AssertionFailure() << "element " << i << ": " << +data()[i] << ", expected " << +want;
      }
    }
    return isUntouchedAround();
  }

 private:
  static constexpr T kAround = 77;

  size_t size_;
  int slack_;
  GuardedImage<T> image_;
};

template <typename V>
void roundTrip() {
  using T = ElementOf<V>;
  constexpr size_t kAll = kLanes<V>;
  for (const bool flush : {false, true}) {
    Stretch<T> in(kAll, flush), out(kAll, flush);
    for (int time = 0; time < kTimes; ++time) {
      in.fill();
      const V v = load(in.data());
      ASSERT_TRUE(are(v, [&](size_t i) { return in.data()[i]; }));
      V by{};
      load(in.data(), by);
      ASSERT_TRUE(are(by, [&](size_t i) { return in.data()[i]; }));
      store(out.data(), v);
      ASSERT_TRUE(out.holds([&](size_t i) { return in.data()[i]; }));
    }
  }
}
TEST(Memory, Vectors) {
  roundTrip<Bytes>();
  roundTrip<Floats>();
}

template <typename V, size_t nc>
void channels() {
  using T = ElementOf<V>;
  for (const bool flush : {false, true}) {
    Stretch<T> in(nc * kLanes<V>, flush), out(nc * kLanes<V>, flush);
    for (int time = 0; time < kTimes; ++time) {
      in.fill();
      V c[nc];
      loadChannels(in.data(), c);
      for (size_t channel = 0; channel < nc; ++channel) {
        ASSERT_TRUE(are(c[channel], [&](size_t i) { return in.data()[nc * i + channel]; }))
            << "channel " << channel;
      }
      storeChannels(out.data(), c);
      ASSERT_TRUE(out.holds([&](size_t i) { return in.data()[i]; }));
    }
  }
}
TEST(Memory, Channels) {
  channels<Bytes, 3>();
  channels<Bytes, 4>();
  channels<Floats, 3>();
  channels<Floats, 4>();
}

template <typename V>
void rows() {
  using T = ElementOf<V>;
  for (const bool flush : {false, true}) {
    Stretch<T> in(4 * kLanes<V>, flush), out(4 * kLanes<V>, flush);
    for (int time = 0; time < kTimes; ++time) {
      in.fill();
      V v[4];
      loadRow(in.data(), v);
      for (size_t part = 0; part < 4; ++part) {
        ASSERT_TRUE(are(v[part], [&](size_t i) { return in.data()[kLanes<V> * part + i]; }));
      }
      storeRow(out.data(), v);
      ASSERT_TRUE(out.holds([&](size_t i) { return in.data()[i]; }));
    }
  }
}
TEST(Memory, Rows) {
  rows<Bytes>();
  rows<Floats>();
}

template <typename V>
void thrice() {
  for (const bool flush : {false, true}) {
    Stretch<ElementOf<V>> out(3 * kLanes<V>, flush);
    for (int time = 0; time < kTimes; ++time) {
      const V v = anyVector<V>();
      storeThrice(out.data(), v);
      ASSERT_TRUE(out.holds([&](size_t i) { return lanesOf(v)[i / 3]; }));
    }
  }
}
TEST(Memory, Thrice) {
  thrice<Bytes>();
  thrice<Floats>();
}

// Where a group may be half a block.
template <size_t nc>
void halfChannels() {
  if constexpr (requires(const u8* p, Bytes(&c)[nc]) { loadHalfChannels(p, c); }) {
    constexpr size_t kHalf = kBlock / 2;
    for (const bool flush : {false, true}) {
      Stretch<u8> in(kHalf * nc, flush), out(kHalf * nc, flush);
      for (int time = 0; time < kTimes; ++time) {
        in.fill();
        Bytes c[nc];
        loadHalfChannels(in.data(), c);
        for (size_t channel = 0; channel < nc; ++channel) {
          ASSERT_TRUE(are(c[channel], [&](size_t i) { return in.data()[i % kHalf * nc + channel]; }));
        }
        storeHalfChannels(out.data(), c);
        ASSERT_TRUE(out.holds([&](size_t i) { return in.data()[i]; }));
      }
    }
  }
}
TEST(Memory, HalfChannels) {
  halfChannels<3>();
  halfChannels<4>();
}

// Where a block has halves they may belong apart.
TEST(Memory, Parts) {
  for (const size_t apart : {16, 23, 64}) {
    const size_t size = kBlock == 16 ? 16 : apart + 16;
    Stretch<u8> out(size, true);
    for (int time = 0; time < kTimes; ++time) {
      out.fill();
      const std::vector<u8> before(out.data(), out.data() + size);
      const Bytes v = anyVector<Bytes>();
      storeParts(out.data(), static_cast<ptrdiff_t>(apart), v);
      ASSERT_TRUE(out.holds([&](size_t i) {
        return i < 16 ? lanesOf(v)[i] : i < apart ? before[i] : lanesOf(v)[i - apart + 16];
      }));
    }
  }
}

// ---- lanes

/// A word of two vectors, lane by lane.
template <typename V, typename Word, typename Expected>
void compare(const Word& word, const Expected& expected) {
  for (int time = 0; time < kTimes; ++time) {
    const V a = anyVector<V>(), b = anyVector<V>();
    ASSERT_TRUE(are(word(a, b), [&](size_t i) { return expected(lanesOf(a)[i], lanesOf(b)[i]); }));
  }
}

TEST(Lanes, AllAlike) {
  for (int time = 0; time < kTimes; ++time) {
    const auto byte = anyOf<uint8_t>();
    EXPECT_TRUE(are(splat<Bytes>(byte), [=](size_t) { return byte; }));
    const auto half = anyOf<int16_t>();
    EXPECT_TRUE(are(splat<SignedHalves>(half), [=](size_t) { return half; }));
    const auto word = anyOf<uint32_t>();
    EXPECT_TRUE(are(splat<Words>(word), [=](size_t) { return word; }));
    const auto number = anyOf<float>();
    EXPECT_TRUE(are(splat<Floats>(number), [=](size_t) { return number; }));
  }
  EXPECT_TRUE(are(splat<Floats>(kNaN), [](size_t) { return kNaN; }));
}

TEST(Lanes, ExtremesOfIntegers) {
  compare<Bytes>([](Bytes a, Bytes b) { return min(a, b); }, [](int a, int b) { return std::min(a, b); });
  compare<Bytes>([](Bytes a, Bytes b) { return max(a, b); }, [](int a, int b) { return std::max(a, b); });
  compare<Words>([](Words a, Words b) { return min(a, b); },
                 [](uint32_t a, uint32_t b) { return std::min(a, b); });
}

TEST(Lanes, ExtremesOfFloats) {
  const auto check = [](auto word, auto expected, float a, float b) {
    for (const float lane : lanesOf(word(splat<Floats>(a), splat<Floats>(b)))) {
      ASSERT_TRUE(sameNumber(lane, expected)) << a << " and " << b << ": " << lane;
    }
  };
  const auto least = [](Floats a, Floats b) { return min(a, b); };
  const auto most = [](Floats a, Floats b) { return max(a, b); };
  const auto leastNumber = [](Floats a, Floats b) { return minNumber(a, b); };
  const auto mostNumber = [](Floats a, Floats b) { return maxNumber(a, b); };
  for (int time = 0; time < kTimes; ++time) {
    const auto a = anyOf<float>(), b = anyOf<float>();
    check(least, std::min(a, b), a, b);
    check(most, std::max(a, b), a, b);
    check(leastNumber, std::min(a, b), a, b);
    check(mostNumber, std::max(a, b), a, b);
    check(least, kNaN, kNaN, b);
    check(most, kNaN, kNaN, b);
    check(leastNumber, b, kNaN, b);
    check(mostNumber, b, kNaN, b);
  }
}

TEST(Lanes, Selected) {
  for (int time = 0; time < kTimes; ++time) {
    const Bytes a = anyVector<Bytes>(), b = anyVector<Bytes>(), mask = anyMask<Bytes>();
    const auto whether = [&](size_t i) { return lanesOf(mask)[i] != 0; };
    ASSERT_TRUE(are(select(mask, a, b), [&](size_t i) { return lanesOf(whether(i) ? a : b)[i]; }));
    ASSERT_TRUE(are(select(a > b, a, b), [&](size_t i) { return std::max(lanesOf(a)[i], lanesOf(b)[i]); }));
    ASSERT_TRUE(are(masked(mask, a), [&](size_t i) { return whether(i) ? lanesOf(a)[i] : 0; }));

    const Floats x = anyVector<Floats>(), y = anyVector<Floats>();
    const Words words = anyMask<Words>();
    const auto whetherWord = [&](size_t i) { return lanesOf(words)[i] != 0; };
    ASSERT_TRUE(are(select(words, x, y), [&](size_t i) { return lanesOf(whetherWord(i) ? x : y)[i]; }));
    ASSERT_TRUE(are(select(x < y, x, y),
                    [&](size_t i) { return lanesOf(x)[i] < lanesOf(y)[i] ? lanesOf(x)[i] : lanesOf(y)[i]; }));
    ASSERT_TRUE(are(masked(words, x), [&](size_t i) { return whetherWord(i) ? lanesOf(x)[i] : 0.0f; }));
  }
}

TEST(Lanes, MaskedBlock) {
  struct Block {
    Bytes c[3];
  };
  for (int time = 0; time < kTimes; ++time) {
    const Block block = {{anyVector<Bytes>(), anyVector<Bytes>(), anyVector<Bytes>()}};
    const Bytes mask = anyMask<Bytes>();
    const Block result = masked(mask, block);
    for (int channel = 0; channel < 3; ++channel) {
      ASSERT_TRUE(
          are(result.c[channel], [&](size_t i) { return lanesOf(block.c[channel])[i] & lanesOf(mask)[i]; }));
    }
  }
}

TEST(Lanes, MixedBits) {
  for (int time = 0; time < kTimes; ++time) {
    const auto mask = anyVector<Words>();
    const auto a = anyVector<Floats>(), b = anyVector<Floats>();
    const auto bits = [](Floats v, size_t i) { return std::bit_cast<uint32_t>(lanesOf(v)[i]); };
    ASSERT_TRUE(are(std::bit_cast<Words>(mixedBits(mask, a, b)), [&](size_t i) {
      const uint32_t m = lanesOf(mask)[i];
      return (bits(a, i) & m) | (bits(b, i) & ~m);
    }));
  }
}

TEST(Lanes, Total) {
  for (int time = 0; time < kTimes; ++time) {
    const auto words = anyVector<Words>();
    uint32_t sum = 0;
    for (const uint32_t lane : lanesOf(words)) {
      sum += lane;
    }
    ASSERT_EQ(total(words), sum);
    const auto numbers = floatsOf(vectorWithin<SignedWords>(-65536, 65536));
    float whole = 0;
    for (const float lane : lanesOf(numbers)) {
      whole += lane;
    }
    ASSERT_EQ(total(numbers), whole);
  }
}

TEST(Lanes, Saturated) {
  compare<Bytes>([](Bytes a, Bytes b) { return addSaturated(a, b); },
                 [](int a, int b) { return byteOf(a + b); });
  compare<Bytes>([](Bytes a, Bytes b) { return subtractSaturated(a, b); },
                 [](int a, int b) { return byteOf(a - b); });
}

TEST(Lanes, FusedAndDistance) {
  for (int time = 0; time < kTimes; ++time) {
    const auto a = anyVector<Floats>(), b = anyVector<Floats>(), c = anyVector<Floats>();
    const auto x = lanesOf(a), y = lanesOf(b), z = lanesOf(c);
    ASSERT_TRUE(are(multiplyAdd(c, a, b), [&](size_t i) { return std::fma(x[i], y[i], z[i]); }));
    ASSERT_TRUE(are(multiplySubtract(c, a, b), [&](size_t i) { return std::fma(-x[i], y[i], z[i]); }));
    ASSERT_TRUE(are(distance(a, b), [&](size_t i) { return std::fabs(x[i] - y[i]); }));
    ASSERT_TRUE(
        are((Words)exceeds(a, b), [&](size_t i) { return std::fabs(x[i]) > std::fabs(y[i]) ? ~0u : 0u; }));
    ASSERT_FALSE(anySet(exceeds(splat<Floats>(kNaN), b)));
    ASSERT_FALSE(anySet(exceeds(a, splat<Floats>(kNaN))));
  }
}

TEST(Lanes, AnySet) {
  EXPECT_FALSE(anySet(Words{}));
  for (size_t i = 0; i < kLanes<Words>; ++i) {
    for (const uint32_t bits : {1u, 0x80000000u, ~0u}) {
      Lanes<Words> lanes{};
      lanes[i] = bits;
      EXPECT_TRUE(anySet(vectorOf<Words>(lanes))) << "lane " << i;
    }
  }
}

TEST(Lanes, Shuffled) {
  for (int time = 0; time < kTimes; ++time) {
    u8 order[16];
    std::generate(std::begin(order), std::end(order), [] { return within<u8>(0, 15); });
    const Bytes v = anyVector<Bytes>();
    ASSERT_TRUE(are(shuffled(v, order), [&](size_t i) { return lanesOf(v)[i / 16 * 16 + order[i % 16]]; }));
  }
}

template <int bytes>
void reverse() {
  const Bytes v = anyVector<Bytes>();
  EXPECT_TRUE(are(reversed<Bytes, bytes>(v),
                  [&](size_t i) { return lanesOf(v)[kBlock - bytes - i / bytes * bytes + i % bytes]; }))
      << bytes << " bytes";
}
TEST(Lanes, Reversed) {
  const Bytes v = anyVector<Bytes>();
  EXPECT_TRUE(are(reversed(v), [&](size_t i) { return lanesOf(v)[kBlock - 1 - i]; }));
  reverse<1>();
  reverse<2>();
  reverse<4>();
  reverse<8>();
  reverse<16>();
}

template <typename V, int bytes>
void arrange() {
  using Lane = LanesOf<V, bytes>;
  constexpr size_t kAll = kLanes<Lane>, kHalf = 16 / bytes;
  const V a = (V)anyVector<Bytes>(), b = (V)anyVector<Bytes>();
  const auto x = lanesOf((Lane)a), y = lanesOf((Lane)b);
  const auto backwards = arranged<V, bytes, [](int i) { return 2 * static_cast<int>(kAll) - 1 - i; }>(a, b);
  EXPECT_TRUE(are((Lane)backwards, [&](size_t i) { return y[kAll - 1 - i]; }));
  const auto inTurn =
      arranged<V, bytes, [](int i) { return i % 2 == 0 ? i : static_cast<int>(kAll) + i; }>(a, b);
  EXPECT_TRUE(are((Lane)inTurn, [&](size_t i) { return i % 2 == 0 ? x[i] : y[i]; }));
  const auto zipped = [&](bool high) {
    return [&, high](size_t i) {
      const size_t from = i / kHalf * kHalf + (high ? kHalf / 2 : 0) + i % kHalf / 2;
      return i % 2 == 0 ? x[from] : y[from];
    };
  };
  EXPECT_TRUE(are((Lane)zip<bytes, false>(a, b), zipped(false)));
  EXPECT_TRUE(are((Lane)zip<bytes, true>(a, b), zipped(true)));
}
TEST(Lanes, ArrangedAndZipped) {
  arrange<Bytes, 1>();
  arrange<Bytes, 2>();
  arrange<Halves, 2>();
  arrange<Floats, 4>();
  arrange<Bytes, 8>();
  // A result of half the size, which on Arm is less than a register.
  using Low = detail::VectorOf<uint8_t, sizeof(Bytes) / 2>::Type;
  const Bytes v = anyVector<Bytes>();
  const auto low = lanesOf(arranged<Low, 1, [](int i) { return 2 * i; }>(v, v));
  EXPECT_TRUE(are(low, [&](size_t i) { return lanesOf(v)[2 * i]; }));
}

TEST(Lanes, LoadedAs) {
  Stretch<u8> in(sizeof(Floats), true), out(sizeof(Floats), true);
  in.fill();
  storeAs(out.data(), loadAs<Floats>(in.data()));
  EXPECT_TRUE(out.holds([&](size_t i) { return in.data()[i]; }));
}

// ---- widening

TEST(Widened, HasEveryPixelOnce) {
  for (auto at : {places<Halves>(), places<Words>()}) {
    std::sort(at.begin(), at.end());
    for (size_t i = 0; i < at.size(); ++i) {
      EXPECT_EQ(at[i], i);
    }
  }
}

template <int n>
void widenBy() {
  for (int time = 0; time < kTimes; ++time) {
    const auto a = anyVector<Bytes>();
    const auto b = anyVector<SignedBytes>();
    ASSERT_TRUE(are(pixelsOf(widenShifted<n>(a)), [&](size_t i) { return lanesOf(a)[i] << n; }));
    ASSERT_TRUE(are(pixelsOf(widenShifted<n>(b)), [&](size_t i) { return lanesOf(b)[i] * (1 << n); }));
  }
}
TEST(Widened, Shifted) {
  widenBy<0>();
  widenBy<1>();
  widenBy<6>();
  widenBy<7>();
}

TEST(Widened, SumsAndProducts) {
  for (int time = 0; time < kTimes; ++time) {
    const Bytes a = anyVector<Bytes>(), b = anyVector<Bytes>();
    const auto x = lanesOf(a), y = lanesOf(b);
    ASSERT_TRUE(are(pixelsOf(widen(a)), [&](size_t i) { return x[i]; }));
    ASSERT_TRUE(are(pixelsOf(difference(a, b)), [&](size_t i) { return x[i] - y[i]; }));

    const auto sum = anyPixels<Halves>();
    ASSERT_TRUE(are(pixelsOf(add(twoOf<Halves>(sum), b)), [&](size_t i) { return sum[i] + y[i]; }));
    const auto signedSum = pixelsWithin<SignedHalves>(-32768, 32767 - 255);
    ASSERT_TRUE(
        are(pixelsOf(add(twoOf<SignedHalves>(signedSum), b)), [&](size_t i) { return signedSum[i] + y[i]; }));

    const auto weight = anyOf<u8>();
    ASSERT_TRUE(are(pixelsOf(multiply(a, weight)), [&](size_t i) { return x[i] * weight; }));
    ASSERT_TRUE(are(pixelsOf(multiplyAdd(twoOf<Halves>(sum), a, weight)),
                    [&](size_t i) { return sum[i] + x[i] * weight; }));

    const auto c = anyVector<SignedBytes>();
    const auto signedWeight = anyOf<signed char>();
    const auto less = pixelsWithin<SignedHalves>(-16384, 16383);
    ASSERT_TRUE(
        are(pixelsOf(multiply(c, signedWeight)), [&](size_t i) { return lanesOf(c)[i] * signedWeight; }));
    ASSERT_TRUE(are(pixelsOf(multiplyAdd(twoOf<SignedHalves>(less), c, signedWeight)),
                    [&](size_t i) { return less[i] + lanesOf(c)[i] * signedWeight; }));
  }
}

// ---- in 16 bits

template <int n>
void halves() {
  for (int time = 0; time < kTimes; ++time) {
    const auto a = anyPixels<Halves>(), b = anyPixels<Halves>();
    const auto two = twoOf<Halves>(a);
    ASSERT_TRUE(
        are(pixelsOf(addShifted<n>(two, twoOf<Halves>(b))), [&](size_t i) { return a[i] + (b[i] >> n); }));

    const auto less = twoOf<Halves>(pixelsWithin<Halves>(0, static_cast<uint16_t>(65535 - (1 << (n - 1)))));
    const auto sum = anyVector<Halves>();
    ASSERT_TRUE(are(addRounded<n>(sum, less), [&](size_t i) {
      return lanesOf(sum)[i] + roundedShift(lanesOf(less.low)[i], n) + roundedShift(lanesOf(less.high)[i], n);
    }));
  }
}
TEST(InHalves, ShiftedSums) {
  halves<1>();
  halves<7>();
  halves<12>();
}

TEST(InHalves, Operators) {
  for (int time = 0; time < kTimes; ++time) {
    const auto a = anyPixels<Halves>();
    const auto two = twoOf<Halves>(a);
    const auto b = anyOf<uint16_t>();
    ASSERT_TRUE(are(pixelsOf(two - splat<Halves>(b)), [&](size_t i) { return a[i] - b; }));
    ASSERT_TRUE(are(pixelsOf(splat<Halves>(b) - two), [&](size_t i) { return b - a[i]; }));
    ASSERT_TRUE(are(pixelsOf(~two), [&](size_t i) { return ~a[i]; }));
    ASSERT_TRUE(are(pixelsOf(asSigned(two)), [&](size_t i) { return static_cast<int16_t>(a[i]); }));
  }
}

TEST(InHalves, Products) {
  for (int time = 0; time < kTimes; ++time) {
    const auto a = anyPixels<SignedHalves>();
    // The product of two -32768 is in 16 bits no more.
    const auto weight = within<int16_t>(-32767, 32767);
    ASSERT_TRUE(are(pixelsOf(multiplyRounded(twoOf<SignedHalves>(a), weight)),
                    [&](size_t i) { return (2 * a[i] * int64_t{weight} + 32768) >> 16; }));

    const auto factor = anyOf<uint16_t>();
    const auto least = anyOf<uint16_t>();
    const auto b = vectorWithin<Halves>(least, 65535);
    const auto offset = within<uint32_t>(0, uint32_t{least} * factor);
    ASSERT_TRUE(are(multiplySubtractHigh(b, factor, offset),
                    [&](size_t i) { return (uint32_t{lanesOf(b)[i]} * factor - offset) >> 16; }));
  }
}

TEST(InHalves, Pairs) {
  for (int time = 0; time < kTimes; ++time) {
    const auto sum = anyVector<Halves>();
    const auto a = anyVector<Bytes>();
    ASSERT_TRUE(are(addPairs(sum, a),
                    [&](size_t i) { return lanesOf(sum)[i] + lanesOf(a)[2 * i] + lanesOf(a)[2 * i + 1]; }));
    const auto words = anyVector<Words>();
    const auto b = vectorWithin<Halves>(0, 32767);
    ASSERT_TRUE(are(addPairs(words, b),
                    [&](size_t i) { return lanesOf(words)[i] + lanesOf(b)[2 * i] + lanesOf(b)[2 * i + 1]; }));
  }
}

// ---- narrowing

TEST(Narrowed, Limited) {
  for (int time = 0; time < kTimes; ++time) {
    const auto a = anyPixels<SignedHalves>();
    ASSERT_TRUE(are(narrow(twoOf<SignedHalves>(a)), [&](size_t i) { return byteOf(a[i]); }));
    ASSERT_TRUE(are(narrowSigned(twoOf<SignedHalves>(a)),
                    [&](size_t i) { return std::clamp<int>(a[i], -128, 127); }));
    const auto bytes = pixelsWithin<Halves>(0, 255);
    ASSERT_TRUE(are(narrow(twoOf<Halves>(bytes)), [&](size_t i) { return bytes[i]; }));
  }
}

template <int n>
void narrowBy() {
  constexpr int kHalf = 1 << (n - 1);
  for (int time = 0; time < kTimes; ++time) {
    const auto a = anyPixels<SignedHalves>();
    ASSERT_TRUE(are(narrowRounded<n>(twoOf<SignedHalves>(a)),
                    [&](size_t i) { return byteOf(roundedShift(a[i], n)); }));
    const auto b = pixelsWithin<Halves>(0, static_cast<uint16_t>((256 << n) - 1 - kHalf));
    ASSERT_TRUE(are(narrowRounded<n>(twoOf<Halves>(b)), [&](size_t i) { return roundedShift(b[i], n); }));
  }
}
TEST(Narrowed, Rounded) {
  narrowBy<1>();
  narrowBy<4>();
  narrowBy<6>();
  narrowBy<7>();
  narrowBy<8>();
}

// ---- weighed pixels

template <int from, bool swappedIn, int to, bool swappedOut>
void colours() {
  for (const bool flush : {false, true}) {
    Stretch<u8> in(kBlock * from, flush), out(kBlock * to, flush);
    for (int time = 0; time < kTimes; ++time) {
      in.fill();
      const auto expected = [&](size_t i) {
        const size_t channel = i % to;
        const size_t source = swappedIn != swappedOut ? 2 - channel : channel;
        return channel == 3 ? u8{255} : in.data()[i / to * from + source];
      };
      const Colours all = loadColours<from, swappedIn>(in.data());
      storeColours<to, swappedOut>(out.data(), all, splat<Bytes>(255));
      ASSERT_TRUE(out.holds(expected));
      const Bytes mask = anyMask<Bytes>();
      storeColours<to, swappedOut>(out.data(), masked(mask, all), splat<Bytes>(255));
      ASSERT_TRUE(
          out.holds([&](size_t i) { return i % to == 3 ? 255 : expected(i) & lanesOf(mask)[i / to]; }));
    }
  }
}
TEST(Weighed, LoadedAndStored) {
  colours<3, false, 3, false>();
  colours<3, true, 3, false>();
  colours<3, false, 3, true>();
  colours<3, true, 3, true>();
  colours<3, false, 4, false>();
  colours<3, true, 4, false>();
  colours<4, false, 3, false>();
  colours<4, false, 3, true>();
  colours<4, false, 4, false>();
}

template <int nc, Weights w>
void weigh() {
  Stretch<u8> in(kBlock * nc, true);
  for (int time = 0; time < kTimes; ++time) {
    in.fill();
    const auto expected = [&](size_t i) {
      const u8* const p = in.data() + i * nc;
      return w.c0 * p[0] + w.c1 * p[1] + w.c2 * p[2];
    };
    const Colours all = loadColours<nc>(in.data());
    ASSERT_TRUE(are(pixelsOf(weighed<w>(all)), expected));
    ASSERT_TRUE(are(weighed<w>(evenColumns(all)), [&](size_t i) { return expected(2 * i); }));
  }
}
template <Weights w>
void weighBoth() {
  weigh<3, w>();
  weigh<4, w>();
}
TEST(Weighed, Sums) {
  weighBoth<Weights{29, 150, 77}>();
  weighBoth<Weights{1, 255, 0}>();
  weighBoth<Weights{25, 64, 127}>();
  weighBoth<Weights{0, 0, 127}>();
  weighBoth<Weights{112, -74, -38}>();
  weighBoth<Weights{-18, -94, 112}>();
  weighBoth<Weights{-21, 127, -106}>();
}

// Where a block has halves, the second one may begin elsewhere.
TEST(Weighed, LoadedApart) {
  constexpr size_t kApart = 21, kHalf = 16;
  const auto check = [&]<int nc>(std::integral_constant<int, nc>) {
    Stretch<u8> in((kBlock == kHalf ? kHalf : kApart + kHalf) * nc, true);
    in.fill();
    u8 out[3 * kBlock];
    storeColours<3, false>(out, loadColours<nc>(in.data(), kApart), splat<Bytes>(255));
    for (size_t i = 0; i < 3 * kBlock; ++i) {
      const size_t pixel = i / 3 < kHalf ? i / 3 : i / 3 - kHalf + kApart;
      EXPECT_EQ(out[i], in.data()[pixel * nc + i % 3]) << "byte " << i;
    }
  };
  check(std::integral_constant<int, 3>{});
  check(std::integral_constant<int, 4>{});
}

template <int n>
void centre() {
  Stretch<u8> out(kBlock, true);
  for (int time = 0; time < kTimes; ++time) {
    const auto a = anyVector<SignedHalves>(), b = anyVector<SignedHalves>();
    storePairs(out.data(), 16, centredPairs<n>((Halves)a, (Halves)b));
    ASSERT_TRUE(out.holds(
        [&](size_t i) { return byteOf(128 + roundedShift(lanesOf(i % 2 == 0 ? a : b)[i / 2], n)); }));
  }
}
TEST(Weighed, CentredPairs) {
  centre<1>();
  centre<6>();
  centre<8>();
}

// ---- samples of chroma

constexpr size_t kSamples = 16;

/// What the bytes of the 32 columns of samples are: byteOfSample(i) of sample i.
template <int n, typename Sums, typename Expected>
testing::AssertionResult areSpread(const Sums& sums, const Expected& byteOfSample) {
  const Bytes bytes = sampleBytes<n>(sums);
  Bytes blocks[kSampleBlocks];
  blocks[0] = spread<0>(bytes);
  blocks[kSampleBlocks - 1] = spread<kSampleBlocks - 1>(bytes);
  std::array<u8, 2 * kSamples> columns;
  memcpy(columns.data(), blocks, sizeof(columns));
  return are(columns, [&](size_t i) { return byteOfSample(i / 2); });
}

TEST(Samples, Weighed) {
  Stretch<u8> first(kSamples, true), second(kSamples, true);
  for (int time = 0; time < kTimes; ++time) {
    first.fill();
    second.fill();
    const auto a = within<u8>(0, 64), b = within<u8>(0, 63);
    const auto offset = within<int16_t>(0, 32767);
    const auto sum = multiplyAdd(multiply(loadSamples(first.data()), a), loadSamples(second.data()), b);
    ASSERT_TRUE(areSpread<7>(asSigned(sum) - splat<SignedHalves>(offset), [&](size_t i) {
      return byteOf(roundedShift(first.data()[i] * a + second.data()[i] * b - offset, 7));
    }));
  }
}

TEST(Samples, Pairs) {
  for (const bool flush : {false, true}) {
    Stretch<u8> in(2 * kSamples, flush);
    for (int time = 0; time < kTimes; ++time) {
      in.fill();
      Samples first, second;
      loadSamplePairs(in.data(), first, second);
      ASSERT_TRUE(areSpread<1>(asSigned(multiply(first, 2)), [&](size_t i) { return in.data()[2 * i]; }));
      ASSERT_TRUE(
          areSpread<1>(asSigned(multiply(second, 2)), [&](size_t i) { return in.data()[2 * i + 1]; }));
    }
  }
}

TEST(Samples, Parts) {
  for (const ptrdiff_t step : {16, 21, -16, -64}) {
    const auto distance = static_cast<size_t>(std::abs(step));
    Stretch<u8> in(distance + 16, true);
    in.fill();
    const u8* const p = in.data() + (step < 0 ? distance : 0);
    std::array<u8, 2 * kSamples> columns;
    for (int part = 0; part < kSampleBlocks; ++part) {
      store(columns.data() + part * static_cast<int>(kBlock), loadParts(p, step, part));
    }
    EXPECT_TRUE(are(columns, [&](size_t i) {
      return p[static_cast<ptrdiff_t>(i / 16) * step + static_cast<int>(i % 16)];
    }));
  }
}

// ---- tables

template <int n>
void lookUpWide() {
  WideTable table;
  uint16_t entries[256];
  for (int i = 0; i < 256; ++i) {
    entries[i] = static_cast<uint16_t>(randomBits());
    table.set(i, entries[i]);
  }
  for (int time = 0; time < kTimes; ++time) {
    Bytes index[n];
    std::generate(index, index + n, anyVector<Bytes>);
    Two<Halves> found[n];
    lookUp(table, index, found);
    for (int k = 0; k < n; ++k) {
      ASSERT_TRUE(are(pixelsOf(found[k]), [&](size_t i) { return entries[lanesOf(index[k])[i]]; }));
    }
  }
}
TEST(Tables, ByBytes) {
  lookUpWide<1>();
  lookUpWide<3>();
}

TEST(Tables, ByWords) {
  constexpr uint32_t kEntries = 65536;
  std::vector<uint32_t> words(kEntries);
  std::generate(words.begin(), words.end(), randomBits);
  std::vector<uint16_t> shorts(kEntries);
  std::generate(shorts.begin(), shorts.end(), anyOf<uint16_t>);
  static float rowsOfFour[kEntries][4];
  for (auto& row : rowsOfFour) {
    std::generate(std::begin(row), std::end(row), anyOf<float>);
  }
  for (int time = 0; time < kTimes; ++time) {
    const auto index = vectorWithin<Words>(0, kEntries - 1);
    ASSERT_TRUE(are(lookUp(words.data(), index), [&](size_t i) { return words[lanesOf(index)[i]]; }));
    Floats columns[4];
    lookUpRows(rowsOfFour, index, columns);
    for (size_t c = 0; c < 4; ++c) {
      ASSERT_TRUE(are(columns[c], [&](size_t i) { return rowsOfFour[lanesOf(index)[i]][c]; }));
    }
    const auto indices = pixelsWithin<Words>(0, kEntries - 1);
    ASSERT_TRUE(
        are(lookUp(shorts.data(), twoOf<Words>(indices)), [&](size_t i) { return shorts[indices[i]]; }));
  }
}

template <int n>
void weighHalves() {
  for (int time = 0; time < kTimes; ++time) {
    const auto factor = [] { return within<uint16_t>(0, 32767); };
    const uint16_t f0 = factor(), f1 = factor(), f2 = factor();
    const auto a = filled<Halves>(factor), b = filled<Halves>(factor), c = filled<Halves>(factor);
    const WeighedHalves<n> sum(f0, f1, f2);
    ASSERT_TRUE(are(pixelsOf(sum(a, b, c)), [&](size_t i) {
      const uint64_t exact = uint64_t{f0} * lanesOf(a)[i] + uint64_t{f1} * lanesOf(b)[i] +
                             uint64_t{f2} * lanesOf(c)[i] + (1u << (n - 1));
      return exact >> n;
    }));
  }
}
TEST(Tables, WeighedHalves) {
  weighHalves<1>();
  weighHalves<12>();
  weighHalves<15>();
}

TEST(Tables, Factors) {
  const Factors factors(1.5f, -0.0f, kInfinity, 0x1p-140f);
  EXPECT_TRUE(are(factors.at<0>(), [](size_t) { return 1.5f; }));
  EXPECT_TRUE(are(factors.at<1>(), [](size_t) { return -0.0f; }));
  EXPECT_TRUE(are(factors.at<2>(), [](size_t) { return kInfinity; }));
  EXPECT_TRUE(are(factors.at<3>(), [](size_t) { return 0x1p-140f; }));
}

// ---- bytes as floats

TEST(Quarters, OfBytes) {
  Floats q[4];
  size_t at[4][kLanes<Floats>];
  std::vector<size_t> seen;
  for (unsigned i = 0; i < 4; ++i) {
    const auto lanes = lanesOf(quarterOf(counting<Bytes>(), i));
    for (size_t k = 0; k < lanes.size(); ++k) {
      seen.push_back(at[i][k] = static_cast<size_t>(lanes[k]));
    }
  }
  std::sort(seen.begin(), seen.end());
  for (size_t i = 0; i < kBlock; ++i) {
    ASSERT_EQ(seen[i], i);
  }
  for (int time = 0; time < kTimes; ++time) {
    const auto v = anyVector<Bytes>();
    for (unsigned i = 0; i < 4; ++i) {
      q[i] = quarterOf(v, i);
      ASSERT_TRUE(are(q[i], [&](size_t k) { return lanesOf(v)[at[i][k]]; }));
    }
    ASSERT_TRUE(are(bytesOf(q), [&](size_t i) { return lanesOf(v)[i]; }));

    // Halves and their neighbours, and what is far from a byte.
    std::array<float, kBlock> numbers{};
    for (unsigned i = 0; i < 4; ++i) {
      q[i] = filled<Floats>([] {
        const auto half = static_cast<float>(within<int>(-600, 600)) / 2;
        const float candidates[] = {half, std::nextafter(half, -1000.0f), std::nextafter(half, 1000.0f),
                                    static_cast<float>(within<int>(-32000, 32000))};
        return candidates[randomBits() % 4];
      });
      for (size_t k = 0; k < kLanes<Floats>; ++k) {
        numbers[at[i][k]] = lanesOf(q[i])[k];
      }
    }
    ASSERT_TRUE(
        are(bytesOf(q), [&](size_t i) { return byteOf(static_cast<int>(std::floor(numbers[i] + 0.5f))); }));
  }
}

/// A number of either sign from 2^-100 on, and below 2^125.
float ordinary() {
  const int exponent = within<int>(-100, 124);
  const auto mantissa = 1 + static_cast<float>(within<uint32_t>(0, 0x7fffff)) * 0x1p-23f;
  return std::ldexp(randomBits() % 2 == 0 ? mantissa : -mantissa, exponent);
}

/// The estimate that Arm's processors make of 1 / v, improved in two steps.
float scalarReciprocal(float v) {
  int exponent;
  const int bits = static_cast<int>(std::frexp(std::fabs(v), &exponent) * 512);
  const int inverse = ((1 << 19) / (2 * bits + 1) + 1) / 2;
  float estimate = std::copysign(std::ldexp(static_cast<float>(inverse) / 256, -exponent), v);
  for (int step = 0; step < 2; ++step) {
    estimate *= std::fma(-v, estimate, 2.0f);
  }
  return estimate;
}

TEST(Reciprocals, OfNumbers) {
  for (int time = 0; time < kTimes; ++time) {
    const auto v = filled<Floats>(ordinary);
    ASSERT_TRUE(are(reciprocal(v), [&](size_t i) { return scalarReciprocal(lanesOf(v)[i]); }));
    for (size_t i = 0; i < kLanes<Floats>; ++i) {
      const double product = double{lanesOf(reciprocal(v))[i]} * lanesOf(v)[i];
      ASSERT_NEAR(product, 1, 0x1p-22) << lanesOf(v)[i];
    }
    const auto less = filled<Floats>([] {
      float number = std::fabs(ordinary());
      while (number >= 2) {
        number *= 0x1p-60f;
      }
      return std::max(number, 0x1p-100f);
    });
    ASSERT_TRUE(are(reciprocalBelow2(less), [&](size_t i) { return scalarReciprocal(lanesOf(less)[i]); }));
  }
}

TEST(Reciprocals, OfZeroAndInfinity) {
  for (const float edge : {0.0f, -0.0f, kInfinity, -kInfinity}) {
    Lanes<Floats> lanes;
    lanes.fill(3);
    for (size_t i = 0; i < lanes.size(); i += 2) {
      lanes[i] = edge;
    }
    const auto result = lanesOf(reciprocal(vectorOf<Floats>(lanes)));
    for (size_t i = 0; i < lanes.size(); ++i) {
      // The sign of an infinity's is not said.
      EXPECT_TRUE(sameNumber(result[i], i % 2 == 0 ? 1 / edge : scalarReciprocal(3)))
          << "of " << lanes[i] << ": " << result[i];
    }
  }
}

TEST(Reciprocals, WhereBelow2) {
  static constexpr float kNumbers[] = {0x1p-100f, 0.5f, 1, 0x1.fffffep0f, 2, 255, kInfinity, -1, 0};
  for (int time = 0; time < kTimes; ++time) {
    const uint32_t choices = randomBits() % 2 == 0 ? 4 : std::size(kNumbers);
    const auto next = [=] { return kNumbers[randomBits() % choices]; };
    const auto a = filled<Floats>(next);
    const auto b = filled<Floats>([&] {
      const float number = next();
      return number == 0 ? 1 : number;
    });
    if (choices == 4) {
      ASSERT_TRUE(areBelow2(a, b));
    }
    if (areBelow2(a, b)) {
      ASSERT_TRUE(are(reciprocalBelow2(a), [&](size_t i) { return lanesOf(reciprocal(a))[i]; }));
      ASSERT_TRUE(are(reciprocalBelow2(b), [&](size_t i) { return lanesOf(reciprocal(b))[i]; }));
    }
  }
}

TEST(Roots, OfWholeNumbers) {
  for (int time = 0; time < kTimes; ++time) {
    const auto v = floatsOf(vectorWithin<Words>(0, 1u << (1 + randomBits() % 30)));
    const auto roots = lanesOf(rootOfWhole(v));
    for (size_t i = 0; i < roots.size(); ++i) {
      const double exact = std::sqrt(double{lanesOf(v)[i]});
      ASSERT_NEAR(roots[i], exact, exact * 0x1p-21) << lanesOf(v)[i];
    }
  }
}

// ---- floats and their bits

TEST(Conversions, OfFloatsAndIntegers) {
  for (int time = 0; time < kTimes; ++time) {
    const auto words = vectorWithin<Words>(0, 0x7fffffff);
    ASSERT_TRUE(are(floatsOf(words), [&](size_t i) { return static_cast<float>(lanesOf(words)[i]); }));
    const auto signedWords = anyVector<SignedWords>();
    ASSERT_TRUE(
        are(floatsOf(signedWords), [&](size_t i) { return static_cast<float>(lanesOf(signedWords)[i]); }));
    const auto a = anyVector<Halves>();
    ASSERT_TRUE(are(pixelsOf(floatsOf(a)), [&](size_t i) { return static_cast<float>(lanesOf(a)[i]); }));

    const auto positive = filled<Floats>([] {
      const float candidates[] = {static_cast<float>(within<int>(0, 1 << 20)) / 64,
                                  static_cast<float>(within<int>(0, 0x7fffff80)), 0x1.fffffep-1f, 0x1p-149f};
      return candidates[randomBits() % 4];
    });
    ASSERT_TRUE(
        are(truncated(positive), [&](size_t i) { return static_cast<uint32_t>(lanesOf(positive)[i]); }));

    Pixels<Floats> numbers;
    std::generate(numbers.begin(), numbers.end(), [] {
      const float candidates[] = {static_cast<float>(within<int>(-(1 << 22), 1 << 22)) / 64,
                                  static_cast<float>(within<int>(-0x7fffff80, 0x7fffff80))};
      return candidates[randomBits() % 2];
    });
    ASSERT_TRUE(are(lanesOf(truncatedHalves(twoOf<Floats>(numbers))),
                    [&](size_t i) { return static_cast<int32_t>(numbers[i]); }));
  }
}

TEST(Conversions, DoubledHigh) {
  for (int time = 0; time < kTimes; ++time) {
    const auto a = anyVector<SignedWords>();
    // The product of two -2^31 is in 32 bits no more.
    const auto factor = within<int32_t>(-0x7fffffff, 0x7fffffff);
    ASSERT_TRUE(are(doubledHigh(a, factor), [&](size_t i) { return int64_t{lanesOf(a)[i]} * factor >> 31; }));
  }
}

// ---- groups of eight pixels

constexpr size_t kGroup = 8;
static_assert(kGroupRegisters * kLanes<Floats> == kGroup);

TEST(Groups, Loaded) {
  for (const bool flush : {false, true}) {
    Stretch<u8> in(3 * kGroup, flush);
    for (int time = 0; time < kTimes; ++time) {
      in.fill();
      Floats c[3][kGroupRegisters];
      loadGroup(in.data(), c);
      for (size_t channel = 0; channel < 3; ++channel) {
        std::array<float, kGroup> pixels;
        memcpy(pixels.data(), c[channel], sizeof(pixels));
        ASSERT_TRUE(
            are(pixels, [&](size_t i) { return in.data()[3 * i + channel] - (channel == 0 ? 0 : 128); }));
      }
    }
  }
}

template <int nc>
void storeGroups() {
  for (const bool flush : {false, true}) {
    Stretch<u8> out(nc * kGroup, flush);
    for (int time = 0; time < kTimes; ++time) {
      Words words[3][kGroupRegisters];
      uint32_t pixels[3][kGroup];
      for (auto& channel : words) {
        std::generate(std::begin(channel), std::end(channel),
                      [] { return vectorWithin<Words>(0, 0xffffff); });
      }
      memcpy(pixels, words, sizeof(pixels));
      storeGroup<nc>(out.data(), [&](int channel, int r) { return words[channel][r]; });
      ASSERT_TRUE(out.holds([&](size_t i) { return i % nc == 3 ? 255u : pixels[i % nc][i / nc] >> 16; }));
    }
  }
}
TEST(Groups, Stored) {
  storeGroups<3>();
  storeGroups<4>();
}

}  // namespace
