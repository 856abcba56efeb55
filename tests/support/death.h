// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// For tests of assertions that end the process.
#pragma once

#include <string>

namespace kyface::test {

/// `text` as a regular expression that matches just it.
inline std::string literally(const std::string& text) {
  std::string expression;
  for (const char c : text) {
    if (std::string("\\^$.|?*+()[]{}").find(c) != std::string::npos) {
      expression += '\\';
    }
    expression += c;
  }
  return expression;
}

}  // namespace kyface::test
