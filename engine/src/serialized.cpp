// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

#include "serialized.h"

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <ios>
#include <limits>
#include <string>
#include <vector>

#include "failure.h"
#include "gradients.h"

namespace kyengine {
namespace {

/// The fewest bytes that a number takes in a file: a control byte and one of the number; twice that for one
/// with a fraction.
constexpr uint64_t kSmallestInteger = 2;
constexpr uint64_t kSmallestReal = 2 * kSmallestInteger;

/// Larger numbers are in no model, and sums of these stay far from where numbers end.
constexpr double kLargestNumber = 1e6;

/// A cascade of a landmark model compares pixels in trees of this depth at most.
constexpr uint64_t kMostLeaves = 1 << 16;

constexpr uint64_t kMostFilters = 1000;
constexpr uint64_t kMostPyramidLevels = 1000;
/// Filters are taken apart into rows and columns, which takes the cube of their side.
constexpr uint64_t kMostCells = 128;

/// Reads what dlib wrote. Each of its numbers is a control byte, which has the count of the bytes that follow
/// and the sign, and these bytes, the lowest first. What dlib would read in another way than this is refused.
class Reader {
 public:
  explicit Reader(std::istream& in) : in_(in), start_(in.tellg()) {
    // Where the stream says no place it does not move either.
    expect(static_cast<bool>(in.seekg(0, std::ios::end)));
    const std::streamoff length = in.tellg() - start_;
    expect(length >= 0 && in.seekg(start_));
    left_ = static_cast<uint64_t>(length);
  }

  /// Puts the stream back to where it was.
  void rewind() { expect(static_cast<bool>(in_.seekg(start_))); }

  static void expect(bool condition) { require(condition, KY_ERROR_MODEL); }

  /// A number with a sign.
  int64_t integer() {
    const uint8_t control = byte();
    expect((control & 0x70) == 0);
    const uint64_t magnitude = magnitudeOf(control & 0x0F);
    expect(magnitude <= static_cast<uint64_t>(std::numeric_limits<int64_t>::max()));
    const auto value = static_cast<int64_t>(magnitude);
    return (control & 0x80) != 0 ? -value : value;
  }

  /// A number without one.
  uint64_t natural() {
    const uint8_t control = byte();
    expect(control <= 8);
    return magnitudeOf(control);
  }

  /// A number with a fraction: mantissa and exponent.
  double real() {
    const int64_t mantissa = integer();
    const int64_t exponent = integer();
    // Infinities and what is no number have exponents beyond.
    expect(exponent >= -2000 && exponent <= 2000);
    const double value = std::ldexp(static_cast<double>(mantissa), static_cast<int>(exponent));
    expect(std::fabs(value) <= kLargestNumber);
    return value;
  }

  /// How many of something follow, each at least `smallest` bytes of the file.
  uint64_t count(uint64_t smallest) {
    const uint64_t count = natural();
    expect(count <= left_ / smallest);
    return count;
  }

  /// The length of a column of numbers, which follows.
  uint64_t column() {
    int64_t rows = integer();
    int64_t columns = integer();
    if (rows < 0 || columns < 0) {
      rows = -rows;
      columns = -columns;
    }
    expect(rows >= 0 && columns == 1 && static_cast<uint64_t>(rows) <= left_ / kSmallestReal);
    for (int64_t i = 0; i < rows; ++i) {
      real();
    }
    return static_cast<uint64_t>(rows);
  }

 private:
  uint8_t byte() {
    expect(left_ > 0);
    --left_;
    const int byte = in_.rdbuf()->sbumpc();
    expect(byte != std::char_traits<char>::eof());
    return static_cast<uint8_t>(byte);
  }

  uint64_t magnitudeOf(int bytes) {
    expect(bytes >= 1 && bytes <= 8);
    uint64_t value = 0;
    for (int i = 0; i < bytes; ++i) {
      value |= uint64_t{byte()} << (8 * i);
    }
    return value;
  }

  std::istream& in_;
  std::streampos start_;
  uint64_t left_ = 0;  ///< bytes to the end of the file
};

void expect(bool condition) { Reader::expect(condition); }

/// Reads the part of a detector that says how pictures are scanned; how many numbers its filters have.
uint64_t readScanner(Reader& reader) {
  expect(reader.integer() == 1);
  // The features of a picture, which no file has.
  expect(reader.natural() == 0 && reader.natural() == 0);
  const uint64_t cell = reader.natural();
  const uint64_t padding = reader.natural();
  expect(cell >= kSmallestCell && cell <= kLargestCell && padding <= kMostCells);
  const auto side = [&] {
    const uint64_t pixels = reader.natural();
    expect(pixels >= cell && pixels <= KY_MAX_FRAME_SIDE && pixels / cell + 2 * padding <= kMostCells);
  };
  side();
  side();
  const uint64_t levels = reader.natural();
  expect(levels >= 1 && levels <= kMostPyramidLevels);
  for (int i = 0; i < 2; ++i) {
    const uint64_t smallestLevel = reader.natural();
    expect(smallestLevel >= 1 && smallestLevel <= KY_MAX_FRAME_SIDE);
  }
  reader.real();
  const int64_t numbers = reader.integer();
  expect(numbers >= 1);
  return static_cast<uint64_t>(numbers);
}

void readOverlap(Reader& reader) {
  for (int i = 0; i < 2; ++i) {
    const double share = reader.real();
    expect(share >= 0 && share <= 1);
  }
}

/// Reads a tree: decisions, each between two pixels, and for each way through them what to add to the
/// `numbers` of a shape. Raises `pixels` to the count that its decisions ask for.
void readTree(Reader& reader, uint64_t numbers, uint64_t* pixels) {
  const uint64_t splits = reader.count(2 * kSmallestInteger + kSmallestReal);
  for (uint64_t i = 0; i < splits; ++i) {
    for (int side = 0; side < 2; ++side) {
      const uint64_t pixel = reader.natural();
      expect(pixel < std::numeric_limits<uint32_t>::max());
      *pixels = std::max(*pixels, pixel + 1);
    }
    reader.real();
  }
  const uint64_t leaves = reader.count(2 * kSmallestInteger + numbers * kSmallestReal);
  expect(leaves == splits + 1 && leaves <= kMostLeaves && (leaves & splits) == 0);
  for (uint64_t i = 0; i < leaves; ++i) {
    expect(reader.column() == numbers);
  }
}

}  // namespace

void checkDetector(std::istream& in) {
  Reader reader(in);
  const int64_t version = reader.integer();
  expect(version == 1 || version == 2);
  const uint64_t numbers = readScanner(reader);
  const auto readFilter = [&] { expect(reader.column() == numbers + 1); };
  if (version == 1) {
    readFilter();
    readOverlap(reader);
  } else {
    readOverlap(reader);
    const uint64_t filters = reader.count(kSmallestReal);
    expect(filters >= 1 && filters <= kMostFilters);
    for (uint64_t i = 0; i < filters; ++i) {
      readFilter();
    }
  }
  reader.rewind();
}

void checkLandmarks(std::istream& in) {
  Reader reader(in);
  expect(reader.integer() == 1);
  const uint64_t numbers = reader.column();
  expect(numbers >= 2 && numbers <= 2 * uint64_t{KY_FACE_MAX_POINTS} && numbers % 2 == 0);

  // How many pixels the trees of each cascade ask for, and then its pixels: each so far from one of the
  // points.
  std::vector<uint64_t> pixels(reader.count(kSmallestInteger));
  for (uint64_t& asked : pixels) {
    for (uint64_t trees = reader.count(2 * kSmallestInteger); trees > 0; --trees) {
      readTree(reader, numbers, &asked);
    }
  }
  expect(reader.count(kSmallestInteger) == pixels.size());
  for (uint64_t& asked : pixels) {
    const uint64_t anchors = reader.count(kSmallestInteger);
    expect(anchors >= asked);
    for (uint64_t i = 0; i < anchors; ++i) {
      expect(reader.natural() < numbers / 2);
    }
    asked = anchors;
  }
  expect(reader.count(kSmallestInteger) == pixels.size());
  for (const uint64_t anchors : pixels) {
    expect(reader.count(2 * kSmallestReal) == anchors);
    for (uint64_t i = 0; i < 2 * anchors; ++i) {
      reader.real();
    }
  }
  reader.rewind();
}

}  // namespace kyengine
