// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// The text of a feature: whatever stands before the end of the buffer, reading it stays inside; what is read
// writes the same text again.

#include <algorithm>
#include <cstring>
#include <string>

#include "fuzz_input.h"
#include "kyface_api/kyface_api.h"
#include "tests/support/guarded_image.h"

namespace {

using kyface::fuzz::Input;
using kyface::test::GuardedImage;

int textLength() {
  static const int length = [] {
    ky_handle_t verifier = nullptr;
    FUZZ_CHECK(ky_verify_create_handle(&verifier, nullptr) == 0);
    const int bytes = ky_verify_get_feature_length(verifier);
    ky_verify_destroy_handle(verifier);
    return (bytes + 2) / 3 * 4;
  }();
  return length;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  static constexpr char kAlphabet[] = "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/";
  Input input(data, size);
  // Near the right form, so that it is not always the first look that refuses.
  std::string text;
  const int length = input.seldom(3) ? input.in(0, 2 * textLength()) : textLength();
  for (int i = 0; i < length; ++i) {
    text += kAlphabet[input.pixel() % 64];
  }
  for (int changes = input.in(0, 3); changes > 0 && !text.empty(); --changes) {
    text[static_cast<size_t>(input.in(0, 1 << 20)) % text.size()] = static_cast<char>(input.pixel());
  }
  if (input.seldom(2) && text.size() >= 2) {
    std::fill(text.end() - input.in(0, 2), text.end(), '=');
  }

  // The zero is the last byte before a protected page.
  GuardedImage<char> buffer(1, static_cast<int>(text.size()) + 1, static_cast<int>(text.size()) + 1);
  memcpy(buffer.data(), text.c_str(), text.size() + 1);
  const ky_feature_t feature = ky_verify_deserialize_feature(buffer.data());
  if (feature != nullptr) {
    FUZZ_CHECK(static_cast<int>(strlen(buffer.data())) == textLength());
    std::string again(static_cast<size_t>(textLength()) + 1, '?');
    ky_verify_serialize_feature(feature, again.data());
    FUZZ_CHECK(again.back() == '\0' && strcmp(again.c_str(), buffer.data()) == 0);
    ky_verify_release_feature(feature);
  }
  return 0;
}
