// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

#include "feature.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <cstddef>
#include <cstring>
#include <string_view>

#include "checksum.h"

namespace kyengine {
namespace {

constexpr size_t kMark = 3;
constexpr size_t kChecksum = sizeof(uint32_t);

constexpr size_t kPatternLength = kMark + kPatternBytes + kChecksum;
static_assert(kPatternLength == KY_FEATURE_LENGTH);

constexpr size_t kTagAt = kMark;
constexpr size_t kCountAt = kTagAt + sizeof(uint32_t);
constexpr size_t kNumbersAt = kCountAt + sizeof(uint16_t);
constexpr size_t kDescriptorLength = kNumbersAt + KY_DESCRIPTOR_NUMBERS * sizeof(float) + kChecksum;
static_assert(kDescriptorLength == KY_DESCRIPTOR_LENGTH);

constexpr size_t textLength(size_t length) { return length / 3 * 4 + 1; }
static_assert(kPatternLength % 3 == 0 && kDescriptorLength % 3 == 0, "texts need no padding");
static_assert(textLength(kPatternLength) == KY_FEATURE_TEXT_LENGTH);
static_assert(textLength(kDescriptorLength) == KY_DESCRIPTOR_TEXT_LENGTH);

using Numbers = std::array<float, KY_DESCRIPTOR_NUMBERS>;

/// The length of features that start like this; 0 when none do.
size_t lengthOf(uint8_t first, uint8_t second, uint8_t version) {
  if (first != 'K' || second != 'Y') {
    return 0;
  }
  return version == KY_VERIFY_VERSION       ? kPatternLength
         : version == KY_DESCRIPTOR_VERSION ? kDescriptorLength
                                            : 0;
}

void append(std::vector<uint8_t>& bytes, const void* value, size_t size) {
  const auto* const first = static_cast<const uint8_t*>(value);
  bytes.insert(bytes.end(), first, first + size);
}

uint32_t checksumOf(const std::vector<uint8_t>& bytes) {
  return crcOf(std::span(bytes).first(bytes.size() - kChecksum));
}

Numbers numbersOf(const Feature& feature) {
  Numbers numbers;
  std::memcpy(numbers.data(), &feature.bytes()[kNumbersAt], sizeof(numbers));
  return numbers;
}

std::span<const uint8_t, kPatternBytes> histogramsOf(const Feature& feature) {
  return std::span(feature.bytes()).subspan<kMark, kPatternBytes>();
}

constexpr std::string_view kDigits = "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/";

/// The value of each character as a base64 digit, -1 for those that are none.
constexpr std::array<int16_t, 256> kValueOf = [] {
  std::array<int16_t, 256> values = {};
  values.fill(-1);
  for (size_t i = 0; i < kDigits.size(); ++i) {
    values[static_cast<uint8_t>(kDigits[i])] = static_cast<int16_t>(i);
  }
  return values;
}();

}  // namespace

Feature::Feature(const Patterns& patterns) : bytes_({'K', 'Y', KY_VERIFY_VERSION}) {
  bytes_.reserve(kPatternLength);
  bytes_.insert(bytes_.end(), patterns.begin(), patterns.end());
  seal();
}

Feature::Feature(std::span<const float, KY_DESCRIPTOR_NUMBERS> numbers, uint32_t tag)
    : bytes_({'K', 'Y', KY_DESCRIPTOR_VERSION}) {
  constexpr uint16_t kCount = KY_DESCRIPTOR_NUMBERS;
  bytes_.reserve(kDescriptorLength);
  append(bytes_, &tag, sizeof(tag));
  append(bytes_, &kCount, sizeof(kCount));
  append(bytes_, numbers.data(), numbers.size_bytes());
  seal();
}

void Feature::seal() {
  const uint32_t checksum = crcOf(bytes_);
  append(bytes_, &checksum, sizeof(checksum));
}

std::optional<Feature> Feature::of(std::vector<uint8_t> bytes) {
  if (bytes.size() < kMark || bytes.size() != lengthOf(bytes[0], bytes[1], bytes[2])) {
    return std::nullopt;
  }
  uint32_t checksum = 0;
  std::memcpy(&checksum, &bytes[bytes.size() - kChecksum], kChecksum);
  if (checksum != checksumOf(bytes)) {
    return std::nullopt;
  }
  Feature feature(std::move(bytes));
  if (feature.version() == KY_DESCRIPTOR_VERSION) {
    uint16_t count = 0;
    std::memcpy(&count, &feature.bytes_[kCountAt], sizeof(count));
    const Numbers numbers = numbersOf(feature);
    if (count != numbers.size() ||
        !std::all_of(numbers.begin(), numbers.end(), [](float x) { return std::isfinite(x); })) {
      return std::nullopt;
    }
  }
  return feature;
}

uint32_t Feature::tag() const {
  uint32_t tag = 0;
  if (version() == KY_DESCRIPTOR_VERSION) {
    std::memcpy(&tag, &bytes_[kTagAt], sizeof(tag));
  }
  return tag;
}

float similarity(const Feature& a, const Feature& b) {
  if (a.version() == KY_VERIFY_VERSION) {
    return similarity(histogramsOf(a), histogramsOf(b));
  }
  const Numbers x = numbersOf(a);
  const Numbers y = numbersOf(b);
  double square = 0;
  for (size_t i = 0; i < x.size(); ++i) {
    const double difference = static_cast<double>(x[i]) - static_cast<double>(y[i]);
    square += difference * difference;
  }
  const double similarity = 1 - std::sqrt(square) / (2 * double{KY_DESCRIPTOR_THRESHOLD_DISTANCE});
  return static_cast<float>(std::max(similarity, 0.0));
}

void writeText(const Feature& feature, char* text) {
  const std::vector<uint8_t>& bytes = feature.bytes();
  for (size_t i = 0; i < bytes.size(); i += 3) {
    const unsigned bits = static_cast<unsigned>(bytes[i]) << 16 | static_cast<unsigned>(bytes[i + 1]) << 8 |
                          static_cast<unsigned>(bytes[i + 2]);
    for (int shift = 18; shift >= 0; shift -= 6) {
      *text++ = kDigits[bits >> shift & 63];
    }
  }
  *text = '\0';
}

std::optional<Feature> readText(const char* text) {
  std::vector<uint8_t> bytes;
  // The first three bytes tell the length.
  size_t length = kMark;
  while (bytes.size() < length) {
    unsigned bits = 0;
    for (int digit = 0; digit < 4; ++digit) {
      const int value = kValueOf[static_cast<uint8_t>(*text++)];
      if (value < 0) {
        return std::nullopt;
      }
      bits = bits << 6 | static_cast<unsigned>(value);
    }
    for (const int shift : {16, 8, 0}) {
      bytes.push_back(static_cast<uint8_t>(bits >> shift));
    }
    if (bytes.size() == kMark) {
      length = lengthOf(bytes[0], bytes[1], bytes[2]);
      bytes.reserve(length);
    }
  }
  return *text == '\0' ? Feature::of(std::move(bytes)) : std::nullopt;
}

}  // namespace kyengine
