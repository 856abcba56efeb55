// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
// The numbers of faces, at the end of their range.
#include "engine/src/identities.h"

#include <gtest/gtest.h>

#include <limits>
#include <set>

namespace kyengine::test {
namespace {

TEST(IdentitiesTest, CountFromOne) {
  Identities identities;
  const auto none = [](int32_t) { return false; };
  EXPECT_EQ(1, identities.next(none));
  EXPECT_EQ(2, identities.next(none));
}

TEST(IdentitiesTest, BeginAnewAfterTheLargest) {
  constexpr int32_t kLargest = std::numeric_limits<int32_t>::max();
  Identities identities(kLargest - 1);
  const std::set<int32_t> living = {1, 2, kLargest};
  const auto taken = [&](int32_t number) { return living.count(number) != 0; };
  EXPECT_EQ(3, identities.next(taken)) << "the largest, 1 and 2 have owners";
  EXPECT_EQ(4, identities.next(taken));
  EXPECT_EQ(kLargest, Identities(kLargest - 1).next([](int32_t) { return false; }));
}

}  // namespace
}  // namespace kyengine::test
