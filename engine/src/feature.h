// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// Features in their final form, and their text.
#pragma once

#include <cstdint>
#include <optional>
#include <span>
#include <vector>

#include "patterns.h"

namespace kyengine {

/// A feature: a mark, a version that tells its kind, for descriptors the tag of their model, what was found,
/// and a checksum.
///
///   patterns      'K' 'Y' 1  histograms[3776]                               checksum u32
///   descriptor    'K' 'Y' 2  tag u32  count u16 = 128  numbers f32[128]     checksum u32
///
/// Numbers are little-endian. Only features of one kind, descriptors of one model, compare.
class Feature {
 public:
  explicit Feature(const Patterns& patterns);
  Feature(std::span<const float, KY_DESCRIPTOR_NUMBERS> numbers, uint32_t tag);

  /// The feature with these bytes, if they are one.
  static std::optional<Feature> of(std::vector<uint8_t> bytes);

  const std::vector<uint8_t>& bytes() const { return bytes_; }

  /// KY_VERIFY_VERSION or KY_DESCRIPTOR_VERSION.
  int version() const { return bytes_[2]; }

  /// The tag of the descriptor's model; 0 for patterns.
  uint32_t tag() const;

 private:
  explicit Feature(std::vector<uint8_t> bytes) : bytes_(std::move(bytes)) {}
  void seal();

  std::vector<uint8_t> bytes_;
};

/// How alike two features of one version and tag are, from 0 to 1; symmetric, and 1 for a feature and itself.
float similarity(const Feature& a, const Feature& b);

/// Writes the text of a feature with its terminating zero: base64.
void writeText(const Feature& feature, char* text);

/// The feature that has this text, if it is one. Reads up to the first character that cannot be, and never
/// more than KY_FEATURE_TEXT_LENGTH bytes.
std::optional<Feature> readText(const char* text);

}  // namespace kyengine
