// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// Strings of code points, as dlib has them: std::basic_string<unsigned int>. The standard gives no
/// character traits for integers; libstdc++ has a general template for them, and libc++ had one up to
/// version 18. For those from 19 on this header gives them. To be included before any header of dlib.
#pragma once

#include <cstddef>
#include <cstring>
#include <cwchar>
#include <ios>
#include <string>

namespace kyengine {

/// What std::char_traits asks for, over whole numbers. `eof` is no code point.
struct CodePointTraits {
  using char_type = unsigned int;
  using int_type = unsigned int;
  using off_type = std::streamoff;
  using pos_type = std::fpos<std::mbstate_t>;
  using state_type = std::mbstate_t;

  static constexpr void assign(char_type& to, const char_type& from) noexcept { to = from; }
  static constexpr bool eq(char_type a, char_type b) noexcept { return a == b; }
  static constexpr bool lt(char_type a, char_type b) noexcept { return a < b; }

  static constexpr int compare(const char_type* a, const char_type* b, size_t count) {
    for (size_t i = 0; i < count; ++i) {
      if (a[i] != b[i]) {
        return a[i] < b[i] ? -1 : 1;
      }
    }
    return 0;
  }
  static constexpr size_t length(const char_type* text) {
    size_t count = 0;
    while (text[count] != 0) {
      ++count;
    }
    return count;
  }
  static constexpr const char_type* find(const char_type* text, size_t count, const char_type& sought) {
    for (size_t i = 0; i < count; ++i) {
      if (text[i] == sought) {
        return text + i;
      }
    }
    return nullptr;
  }
  /// The two may overlap.
  static char_type* move(char_type* to, const char_type* from, size_t count) {
    if (count != 0) {
      std::memmove(to, from, count * sizeof(char_type));
    }
    return to;
  }
  static char_type* copy(char_type* to, const char_type* from, size_t count) {
    if (count != 0) {
      std::memcpy(to, from, count * sizeof(char_type));
    }
    return to;
  }
  static constexpr char_type* assign(char_type* to, size_t count, char_type value) {
    for (size_t i = 0; i < count; ++i) {
      to[i] = value;
    }
    return to;
  }

  static constexpr int_type not_eof(int_type c) noexcept { return c == eof() ? 0 : c; }
  static constexpr char_type to_char_type(int_type c) noexcept { return c; }
  static constexpr int_type to_int_type(char_type c) noexcept { return c; }
  static constexpr bool eq_int_type(int_type a, int_type b) noexcept { return a == b; }
  static constexpr int_type eof() noexcept { return ~0U; }
};

}  // namespace kyengine

#if defined(_LIBCPP_VERSION) && _LIBCPP_VERSION >= 190000
template <>
struct std::char_traits<unsigned int> : kyengine::CodePointTraits {};
#endif
