// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

#include <android/log.h>
#include <assert2.h>
#include <gtest/gtest.h>

#include <string>
#include <thread>
#include <vector>

namespace {

// What `print` writes to standard error.
template <typename Print>
std::string written(Print print) {
  testing::internal::CaptureStderr();
  print();
  return testing::internal::GetCapturedStderr();
}

TEST(Log, EachPriorityHasItsLetter) {
  const std::vector<std::pair<int, char>> letters = {{ANDROID_LOG_UNKNOWN, '?'},
                                                     {ANDROID_LOG_DEFAULT, '?'},
                                                     {ANDROID_LOG_VERBOSE, 'V'},
                                                     {ANDROID_LOG_DEBUG, 'D'},
                                                     {ANDROID_LOG_INFO, 'I'},
                                                     {ANDROID_LOG_WARN, 'W'},
                                                     {ANDROID_LOG_ERROR, 'E'},
                                                     {ANDROID_LOG_FATAL, 'F'},
                                                     {ANDROID_LOG_SILENT, 'S'},
                                                     {-1, '?'},
                                                     {9, '?'}};
  for (const auto& [priority, letter] : letters) {
    EXPECT_EQ(written([p = priority] { EXPECT_EQ(__android_log_print(p, "Tag", "text"), 1); }),
              std::string(1, letter) + "/Tag: text\n");
  }
  EXPECT_EQ(ANDROID_LOG_VERBOSE, 2);
  EXPECT_EQ(ANDROID_LOG_ERROR, 6);
}

TEST(Log, FormatsItsArguments) {
  EXPECT_EQ(written([] { __android_log_print(ANDROID_LOG_INFO, "Tag", "%d of %s, %f", -7, "many", 0.5); }),
            "I/Tag: -7 of many, 0.500000\n");
  EXPECT_EQ(written([] { __android_log_print(ANDROID_LOG_INFO, nullptr, "%s", "no tag"); }), "I/: no tag\n");
}

TEST(Log, CutsLongMessagesOff) {
  const std::string longest(1023, 'x');
  const std::string longer = longest + "y";
  EXPECT_EQ(written([&] { __android_log_print(ANDROID_LOG_WARN, "Tag", "%s", longest.c_str()); }),
            "W/Tag: " + longest + "\n");
  EXPECT_EQ(written([&] { __android_log_print(ANDROID_LOG_WARN, "Tag", "%s", longer.c_str()); }),
            "W/Tag: " + longest + "\n");
}

TEST(Log, LinesOfSeveralThreadsDoNotMix) {
  constexpr int kThreads = 4;
  constexpr int kLines = 200;
  const std::string all = written([] {
    std::vector<std::thread> threads;
    for (int t = 0; t < kThreads; ++t) {
      threads.emplace_back([] {
        for (int i = 0; i < kLines; ++i) {
          __android_log_print(ANDROID_LOG_DEBUG, "Tag", "a line of %d", 42);
        }
      });
    }
    for (std::thread& thread : threads) {
      thread.join();
    }
  });
  std::string expected;
  for (int i = 0; i < kThreads * kLines; ++i) {
    expected += "D/Tag: a line of 42\n";
  }
  EXPECT_EQ(all, expected);
}

TEST(Assert2, ReportsAndAborts) {
  EXPECT_EXIT(__assert2("some/file", 12, "void function()", "width > 0"), testing::KilledBySignal(SIGABRT),
              "some/file:12: void function\\(\\): assertion \"width > 0\" failed\n");
}

}  // namespace
