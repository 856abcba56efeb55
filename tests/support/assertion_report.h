// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// Takes the place of the platform's assertion report, for death tests of what asserts its arguments: include
/// it in one source of a test program.
#pragma once

#include <assert2.h>
#include <gtest/gtest.h>

#include <cstdio>
#include <cstdlib>
#include <functional>
#include <string>

namespace kyface::test {

/// Whether the call under test had changed anything when its assertion failed; asked in the process that
/// dies.
inline std::function<bool()> somethingWritten = [] { return false; };

/// What the process that dies prints, as EXPECT_DEATH wants it: a regular expression. `function` is what the
/// signature of the function must contain, `expression` the text of the assertion; neither may hold what is
/// special in regular expressions.
inline std::string assertionReport(const std::string& path, const std::string& function,
                                   const std::string& expression) {
  return "^path " + path + "\nline [1-9][0-9]*\nfunction [^\n]*" + function + "[^\n]*\nexpression " +
         expression + "\nnothing written\n";
}

}  // namespace kyface::test

extern "C" __attribute__((visibility("default"))) void __assert2(const char* file, int line,
                                                                 const char* function,
                                                                 const char* expression) {
  (void)fprintf(stderr, "path %s\nline %d\nfunction %s\nexpression %s\n%s\n", file, line, function,
                expression, kyface::test::somethingWritten() ? "something written" : "nothing written");
  abort();
}
