// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
// Strings of code points where the C++ library has no traits for them: against vectors of the same numbers.

#include "engine/dlib/code_points.h"

#include <gtest/gtest.h>

#include <string>
#include <vector>

namespace kyengine {
namespace {

using Text = std::basic_string<unsigned int, CodePointTraits>;

Text Of(const std::vector<unsigned int>& points) { return Text(points.begin(), points.end()); }

std::vector<unsigned int> Points(const Text& text) { return {text.begin(), text.end()}; }

TEST(CodePoints, LengthEndsAtZero) {
  const unsigned int points[] = {0x10ffff, 1, 0x80000000U, 0, 7};
  EXPECT_EQ(CodePointTraits::length(points), 3U);
  EXPECT_EQ(Points(Text(points)), (std::vector<unsigned int>{0x10ffff, 1, 0x80000000U}));
  EXPECT_EQ(CodePointTraits::length(points + 3), 0U);
}

TEST(CodePoints, CompareAsUnsignedNumbers) {
  const std::vector<std::vector<unsigned int>> texts = {
      {}, {0}, {0, 5}, {1}, {255, 256}, {256}, {0x7fffffff}, {0x80000000U}, {0x80000000U, 0}, {~0U}};
  for (size_t a = 0; a < texts.size(); ++a) {
    for (size_t b = 0; b < texts.size(); ++b) {
      EXPECT_EQ(Of(texts[a]) < Of(texts[b]), texts[a] < texts[b]) << a << " " << b;
      EXPECT_EQ(Of(texts[a]) == Of(texts[b]), a == b) << a << " " << b;
    }
  }
}

TEST(CodePoints, FindTheFirst) {
  const unsigned int points[] = {9, 0x100, 3, 0x100};
  EXPECT_EQ(CodePointTraits::find(points, 4, 0x100), points + 1);
  EXPECT_EQ(CodePointTraits::find(points, 4, 0), nullptr);
  EXPECT_EQ(CodePointTraits::find(points, 2, 3), nullptr);
  EXPECT_EQ(CodePointTraits::find(points, 0, 9), nullptr);
}

TEST(CodePoints, MoveWhereTheyOverlap) {
  for (size_t length : {size_t{0}, size_t{1}, size_t{5}, size_t{40}}) {
    Text text;
    std::vector<unsigned int> expected;
    for (unsigned int i = 0; i < length; ++i) {
      text.push_back(0x10000 + i);
      expected.push_back(0x10000 + i);
    }
    text.insert(text.begin(), 3, 42U);
    expected.insert(expected.begin(), 3, 42U);
    EXPECT_EQ(Points(text), expected);
    text.erase(1, 2);
    expected.erase(expected.begin() + 1, expected.begin() + 3);
    EXPECT_EQ(Points(text), expected);
    text.resize(length + 9, 0xffffU);
    expected.resize(length + 9, 0xffffU);
    EXPECT_EQ(Points(text), expected);
  }
}

TEST(CodePoints, TheEndIsNone) {
  EXPECT_NE(CodePointTraits::eof(), 0x10ffffU);
  EXPECT_FALSE(
      CodePointTraits::eq_int_type(CodePointTraits::not_eof(CodePointTraits::eof()), CodePointTraits::eof()));
  EXPECT_EQ(CodePointTraits::not_eof(7), 7U);
}

}  // namespace
}  // namespace kyengine
