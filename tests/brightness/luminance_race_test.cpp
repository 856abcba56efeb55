// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// Lightness measured, and so the tables rebuilt, by several threads at once. A report of ThreadSanitizer ends
// the program with an error.

#include <gtest/gtest.h>

#include <atomic>
#include <thread>
#include <vector>

#include "brightness/brightness.h"

namespace {

TEST(LuminanceRace, ThreadsDoNotDisturbEachOther) {
  constexpr int kThreads = 4, kCalls = 40, kSize = 37;
  std::vector<unsigned char> pixels(kSize * kSize * 4);
  for (size_t i = 0; i < pixels.size(); ++i) {
    pixels[i] = static_cast<unsigned char>(i * 7);
  }
  const auto measure = [&](bool blueFirst) {
    return (blueFirst ? calcLuminance_BGRA : calcLuminance_RGBA)(pixels.data(), kSize, kSize * 4, kSize,
                                                                 kSize, 0, 0, kSize, kSize);
  };
  std::atomic<bool> go{false};
  unsigned char results[kThreads][kCalls];
  std::vector<std::thread> threads;
  for (int thread = 0; thread < kThreads; ++thread) {
    threads.emplace_back([&, thread] {
      while (!go) {
      }
      for (int call = 0; call < kCalls; ++call) {
        results[thread][call] = measure(thread % 2 == 0);
      }
    });
  }
  go = true;
  for (std::thread& thread : threads) {
    thread.join();
  }
  for (int thread = 0; thread < kThreads; ++thread) {
    for (const unsigned char result : results[thread]) {
      ASSERT_EQ(result, measure(thread % 2 == 0));
    }
  }
}

}  // namespace
