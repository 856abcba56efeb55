// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

#include <android/log.h>
#include <errno.h>
#include <stdarg.h>
#include <stdio.h>

namespace {

constexpr int kLongestMessage = 1024;  // Android's, the terminating zero included

char priorityLetter(int priority) {
  constexpr char kLetters[] = "??VDIWEFS";
  return priority < 0 || priority > ANDROID_LOG_SILENT ? '?' : kLetters[priority];
}

}  // namespace

extern "C" int __android_log_print(int prio, const char* tag, const char* fmt, ...) {
  char text[kLongestMessage];
  va_list arguments;
  va_start(arguments, fmt);
  const int length = vsnprintf(text, sizeof text, fmt, arguments);
  va_end(arguments);
  if (length < 0) {
    return -EINVAL;
  }
  // One call of stdio holds the stream's lock from its first byte to its last.
  const int written = fprintf(stderr, "%c/%s: %s\n", priorityLetter(prio), tag == nullptr ? "" : tag, text);
  return written < 0 ? -EIO : 1;
}
