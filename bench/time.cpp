// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// The operations as a shared library, whose clock starts and stops on this side: tool/timing.py loads it and
// lets the operations take turns, among themselves and with those of libraries that only Python can call.

#include <ctime>
#include <string>

#include "operation.h"

namespace {

std::vector<bench::Operation> chosen;

using Call = std::function<void()>;

std::int64_t processorNanoseconds() {
  timespec time{};
  clock_gettime(CLOCK_THREAD_CPUTIME_ID, &time);
  return std::int64_t{time.tv_sec} * 1'000'000'000 + time.tv_nsec;
}

}  // namespace

#define BENCH_EXPORT extern "C" __attribute__((visibility("default")))

/// Chooses the operations that match and returns how many they are.
BENCH_EXPORT int bench_choose(const char* pattern) {
  chosen = bench::operationsMatching(pattern, false);
  return static_cast<int>(chosen.size());
}

BENCH_EXPORT const char* bench_name(size_t index) { return chosen[index].name.c_str(); }
BENCH_EXPORT const char* bench_library(size_t index) { return chosen[index].library.c_str(); }
BENCH_EXPORT double bench_traffic(size_t index) { return chosen[index].traffic; }

/// What a chosen operation calls for a picture of a size, until it is released.
BENCH_EXPORT void* bench_prepare(size_t index, int width, int height) {
  return new Call(chosen[index].prepare({width, height}));
}
BENCH_EXPORT void bench_release(void* call) { delete static_cast<Call*>(call); }

/// The processor's nanoseconds that `times` calls take.
BENCH_EXPORT std::int64_t bench_run(const void* call, int times) {
  const std::int64_t start = processorNanoseconds();
  for (int i = 0; i < times; ++i) {
    (*static_cast<const Call*>(call))();
  }
  return processorNanoseconds() - start;
}
