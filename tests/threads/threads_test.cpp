// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// Eight threads that call everything at once, from the first call on, against one thread that calls it alone.

#include <gtest/gtest.h>

#include <algorithm>
#include <barrier>
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

TEST(Threads, DoNotDisturbEachOther) {
  fake::Vm loader;  // holds the classes and fields that all others know
  ASSERT_EQ(JNI_OnLoad(loader.java_vm(), nullptr), JNI_VERSION_1_6);
  const std::vector<Operation> operations = allOperations();
  const size_t count = operations.size();

  std::vector<Bytes> results[kRounds][kThreads];
  std::barrier together(kThreads);
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
    });
  }
  for (std::thread& thread : running) {
    thread.join();
  }

  for (size_t i = 0; i < count; ++i) {
    const Bytes alone = operations[i].run();
    for (const auto& round : results) {
      for (const std::vector<Bytes>& thread : round) {
        ASSERT_EQ(thread[i], alone) << operations[i].name;
      }
    }
  }
}

}  // namespace
