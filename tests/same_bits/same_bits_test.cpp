// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// Every build gives the same bits: the checksums of all results, floats included, are those of expected.inc,
// which is what
//
//   same_bits_test --print
//
// of any build prints. Who means to change a result makes it anew, and sees in the difference what else has
// changed.

#include <gtest/gtest.h>

#include <array>
#include <cstdio>
#include <cstring>
#include <map>
#include <string>

#include "instances.h"

namespace {

using same_bits::Instance;
using same_bits::kSizes;
using Checksums = std::array<std::uint32_t, std::size(kSizes)>;

Checksums checksumsOf(const Instance& instance) {
  Checksums sums;
  for (size_t i = 0; i < sums.size(); ++i) {
    same_bits::Checksum sum;
    instance.run(kSizes[i], sum);
    sums[i] = sum.value();
  }
  return sums;
}

void print() {
  for (const Instance& instance : same_bits::instances()) {
    std::printf("{\"%s\", {", instance.name.c_str());
    const char* separator = "";
    for (const std::uint32_t sum : checksumsOf(instance)) {
      std::printf("%s0x%08x", separator, sum);
      separator = ", ";
    }
    std::printf("}},\n");
  }
}

TEST(SameBits, AreThoseOfEveryBuild) {
  std::map<std::string, Checksums> expected = {
#include "expected.inc"
  };
  for (const Instance& instance : same_bits::instances()) {
    const auto found = expected.find(instance.name);
    if (found == expected.end()) {
      ADD_FAILURE() << "nothing is expected of " << instance.name;
      continue;
    }
    const Checksums sums = checksumsOf(instance);
    for (size_t i = 0; i < sums.size(); ++i) {
      EXPECT_EQ(sums[i], found->second[i])
          << instance.name << ", " << kSizes[i].width << " x " << kSizes[i].height;
    }
    expected.erase(found);
  }
  for (const auto& [name, sums] : expected) {
    ADD_FAILURE() << "there is no " << name;
  }
}

}  // namespace

int main(int argc, char** argv) {
  if (argc == 2 && std::strcmp(argv[1], "--print") == 0) {
    print();
    return 0;
  }
  testing::InitGoogleTest(&argc, argv);
  return RUN_ALL_TESTS();
}
