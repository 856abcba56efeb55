// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// The texts of features, as the tests take them apart.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "kyface_api/kyface_api.h"

namespace kyengine::test {

/// Base64 by the book, for comparison.
inline std::string Base64(const std::vector<uint8_t>& bytes) {
  const std::string digits = "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/";
  std::string text;
  for (size_t i = 0; i < bytes.size() * 8; i += 6) {
    unsigned value = 0;
    for (size_t bit = i; bit < i + 6; ++bit) {
      const bool set = bit / 8 < bytes.size() && (bytes[bit / 8] >> (7 - bit % 8) & 1) != 0;
      value = value * 2 + (set ? 1 : 0);
    }
    text += digits[value];
  }
  return text;
}

inline std::vector<uint8_t> FromBase64(const std::string& text) {
  const std::string digits = "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/";
  std::vector<uint8_t> bytes(text.size() * 6 / 8);
  for (size_t bit = 0; bit < bytes.size() * 8; ++bit) {
    const size_t value = digits.find(text[bit / 6]);
    bytes[bit / 8] = static_cast<uint8_t>(bytes[bit / 8] << 1 | (value >> (5 - bit % 6) & 1));
  }
  return bytes;
}

inline bool IsRefused(const std::string& text) {
  const ky_feature_t feature = ky_verify_deserialize_feature(text.c_str());
  ky_verify_release_feature(feature);
  return feature == nullptr;
}

}  // namespace kyengine::test
