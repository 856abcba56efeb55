// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

#include "journal.h"

#include <cstdarg>
#include <cstdio>

namespace fake {

std::vector<std::string>& journal() {
  static thread_local std::vector<std::string> lines;
  return lines;
}

void note(const char* format, ...) {
  va_list arguments;
  va_start(arguments, format);
  char line[1024];
  vsnprintf(line, sizeof line, format, arguments);
  va_end(arguments);
  journal().emplace_back(line);
}

std::vector<std::string> entries(const std::string& prefix) {
  std::vector<std::string> found;
  for (const std::string& line : journal()) {
    if (line.rfind(prefix, 0) == 0) {
      found.push_back(line);
    }
  }
  return found;
}

}  // namespace fake
