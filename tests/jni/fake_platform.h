// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// Android's bitmap interface for tests. Log messages need no script: each is a journal line "log PRIORITY
/// TAG: TEXT".
#pragma once

#include <android/bitmap.h>

#include <vector>

namespace fake {

/// The one bitmap that a thread has.
struct Bitmap {
  AndroidBitmapInfo info = {};
  /// Results of the calls; `getInfo` stores nothing when its result is a failure.
  int info_result = ANDROID_BITMAP_RESULT_SUCCESS;
  int lock_result = ANDROID_BITMAP_RESULT_SUCCESS;
  /// Bytes that a lock gives access to; a lock stores no address when there are none.
  std::vector<unsigned char> pixels;
  int locks = 0;
};

Bitmap& bitmap();

}  // namespace fake
