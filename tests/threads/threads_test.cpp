// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// Eight threads that call everything at once, from the first call on, against one thread that calls it alone.

#include <gtest/gtest.h>
#include <pthread.h>
#include <sched.h>

#include <algorithm>
#include <atomic>
#include <barrier>
#include <cerrno>
#include <chrono>
#include <csignal>
#include <cstdio>
#include <ctime>
#include <optional>
#include <random>
#include <thread>

#include "operation.h"
#include "tests/jni/bridge_test.h"

namespace {

using threads::Bytes;
using threads::Operation;

constexpr size_t kThreads = 8;
/// Each operation by all threads at once; then each thread on its own way through all of them.
constexpr size_t kRounds = 2;

std::vector<Operation> allOperations() {
  std::vector<Operation> operations = threads::imageOperations();
  for (Operation& operation : threads::nativeOperations()) {
    operations.push_back(std::move(operation));
  }
  // Those with tables come first: nothing has built them when the threads start.
  std::partition(operations.begin(), operations.end(), [](const Operation& operation) {
    return operation.name.find("LAB") != std::string::npos ||
           operation.name.find("Luminance") != std::string::npos;
  });
  return operations;
}

/// Stops threads at random instructions, of the kernels' too, and lets others go on, until it is destroyed: a
/// scheduler alone, and an emulator's more so, changes threads at few places.
class Interruptions {
 public:
  explicit Interruptions(std::vector<std::thread>& threads) {
    struct sigaction action = {};
    action.sa_handler = &pause;
    action.sa_flags = SA_RESTART;
    sigaction(SIGUSR1, &action, nullptr);
    interrupter_ = std::thread([this, &threads] {
      std::mt19937 random(1);
      while (!stopped_) {
        pthread_kill(threads[random() % threads.size()].native_handle(), SIGUSR1);
        std::this_thread::sleep_for(std::chrono::microseconds(20 + random() % 400));
      }
    });
  }
  ~Interruptions() {
    stopped_ = true;
    interrupter_.join();
  }
  Interruptions(const Interruptions&) = delete;
  Interruptions& operator=(const Interruptions&) = delete;

  static int count() { return count_; }

 private:
  static void pause(int /*signal*/) {
    const int error = errno;
    const auto choice = static_cast<uint32_t>(++count_) * 2654435761U >> 16;
    if (choice % 2 == 0) {
      sched_yield();
    } else {
      const timespec some_time = {0, static_cast<long>(choice % 1000) * 500};
      nanosleep(&some_time, nullptr);
    }
    errno = error;
  }

  static inline std::atomic<int> count_ = 0;
  std::atomic<bool> stopped_ = false;
  std::thread interrupter_;
};

/// What each thread got, by round and operation.
using Results = std::vector<Bytes>[kRounds][kThreads];

void runAll(const std::vector<Operation>& operations, bool interrupted, Results& results) {
  const size_t count = operations.size();
  std::barrier together(kThreads);
  std::barrier finished(kThreads + 1);
  std::vector<std::thread> running;
  running.reserve(kThreads);
  for (size_t thread = 0; thread < kThreads; ++thread) {
    running.emplace_back([&, thread] {
      std::vector<Bytes>& inStep = results[0][thread];
      for (const Operation& operation : operations) {
        together.arrive_and_wait();
        inStep.push_back(operation.run());
      }
      std::vector<Bytes>& mixed = results[1][thread];
      mixed.resize(count);
      for (size_t i = 0; i < count; ++i) {
        const size_t next = (i + thread * count / kThreads) % count;
        mixed[next] = operations[next].run();
      }
      finished.arrive_and_wait();
    });
  }
  {
    std::optional<Interruptions> interruptions;
    if (interrupted) {
      interruptions.emplace(running);
    }
    finished.arrive_and_wait();
  }
  for (std::thread& thread : running) {
    thread.join();
  }
}

void expectAsAlone(const std::vector<Operation>& operations, const Results& results) {
  for (size_t i = 0; i < operations.size(); ++i) {
    const Bytes alone = operations[i].run();
    for (const auto& round : results) {
      for (const std::vector<Bytes>& thread : round) {
        ASSERT_EQ(thread[i], alone) << operations[i].name;
      }
    }
  }
}

TEST(Threads, DoNotDisturbEachOther) {
  fake::Vm loader;  // holds the classes and fields that all others know
  ASSERT_EQ(JNI_OnLoad(loader.java_vm(), nullptr), JNI_VERSION_1_6);
  const std::vector<Operation> operations = allOperations();
  Results results;
  runAll(operations, false, results);
  expectAsAlone(operations, results);
}

TEST(Threads, DoNotDisturbEachOtherWhereverTheyStop) {
  fake::Vm loader;
  ASSERT_EQ(JNI_OnLoad(loader.java_vm(), nullptr), JNI_VERSION_1_6);
  const std::vector<Operation> operations = allOperations();
  constexpr int kEnough = 500;
  int runs = 0;
  for (; runs < 20 && Interruptions::count() < kEnough; ++runs) {
    Results results;
    runAll(operations, true, results);
    expectAsAlone(operations, results);
  }
  EXPECT_GT(Interruptions::count(), kEnough / 10);
  printf("%d interruptions in %d runs\n", Interruptions::count(), runs);
}

}  // namespace
