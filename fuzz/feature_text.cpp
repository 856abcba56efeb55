// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// The text of a feature: whatever stands before the end of the buffer, reading it stays inside; what is read
// writes the same text again.

#include <algorithm>
#include <cstdint>
#include <cstring>
#include <span>
#include <string>
#include <vector>

#include "engine/ky_engine.h"
#include "engine/src/checksum.h"
#include "fuzz_input.h"
#include "kyface_api/kyface_api.h"
#include "tests/engine/feature_text.h"
#include "tests/support/guarded_image.h"

namespace {

using kyface::fuzz::Input;
using kyface::test::GuardedImage;

/// Nearly always what could be a feature of one of the two kinds, with the checksum that belongs to it.
std::string someText(Input& input) {
  const bool described = input.seldom(2);
  int length = described ? KY_DESCRIPTOR_LENGTH : KY_FEATURE_LENGTH;
  if (input.seldom(8)) {
    length = input.in(0, 2 * KY_DESCRIPTOR_LENGTH);
  }
  std::vector<uint8_t> bytes(static_cast<size_t>(length));
  std::generate(bytes.begin(), bytes.end(), [&] { return input.pixel(); });
  const auto set = [&](size_t at, int value) {
    if (at < bytes.size() && !input.seldom(16)) {
      bytes[at] = static_cast<uint8_t>(value);
    }
  };
  set(0, 'K');
  set(1, 'Y');
  set(2, described ? KY_DESCRIPTOR_VERSION : KY_VERIFY_VERSION);
  if (described) {
    set(7, KY_DESCRIPTOR_NUMBERS);
    set(8, 0);
    for (size_t i = 12; i < bytes.size() && !input.seldom(64); i += 4) {
      bytes[i] &= 0xbf;  // a number below 2
    }
  }
  if (bytes.size() >= 4 && !input.seldom(16)) {
    const uint32_t checksum = kyengine::crcOf(std::span(bytes).first(bytes.size() - 4));
    std::memcpy(&bytes[bytes.size() - 4], &checksum, sizeof(checksum));
  }
  return kyengine::test::Base64(bytes);
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  Input input(data, size);
  std::string text = someText(input);
  if (input.seldom(4)) {
    for (int changes = input.in(1, 3); changes > 0 && !text.empty(); --changes) {
      text[static_cast<size_t>(input.in(0, 1 << 20)) % text.size()] = static_cast<char>(input.pixel());
    }
  }
  if (input.seldom(8)) {
    text.resize(static_cast<size_t>(input.in(0, static_cast<int>(text.size()) + 3)), '=');
  }

  // The zero is the last byte before a protected page.
  GuardedImage<char> buffer(1, static_cast<int>(text.size()) + 1, static_cast<int>(text.size()) + 1);
  memcpy(buffer.data(), text.c_str(), text.size() + 1);
  const ky_feature_t feature = ky_verify_deserialize_feature(buffer.data());
  if (feature == nullptr) {
    return 0;
  }
  const size_t length = strlen(buffer.data());
  FUZZ_CHECK(length + 1 == KY_FEATURE_TEXT_LENGTH || length + 1 == KY_DESCRIPTOR_TEXT_LENGTH);
  std::string again(length + 1, '?');
  ky_verify_serialize_feature(feature, again.data());
  FUZZ_CHECK(again.back() == '\0' && strcmp(again.c_str(), buffer.data()) == 0);

  static const ky_handle_t verifier = [] {
    ky_handle_t handle = nullptr;
    FUZZ_CHECK(ky_verify_create_handle(&handle, nullptr) == 0);
    return handle;
  }();
  float score = -1;
  const int result = ky_verify_compare_feature(verifier, feature, feature, &score);
  const bool described = length + 1 == KY_DESCRIPTOR_TEXT_LENGTH;
  FUZZ_CHECK(result == (described ? KY_ERROR_FEATURE_KIND : KY_SUCCESS));
  FUZZ_CHECK(score >= 0 && score <= 1);
  ky_verify_release_feature(feature);
  return 0;
}
