// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// The operations under Google Benchmark:
//
//   bench_time PATTERN SIZE... [--benchmark_...]
//
// The names of the benchmarks are operation/library/size/traffic.

#include <benchmark/benchmark.h>

#include <cstdio>
#include <string>

#include "operation.h"

int main(int argc, char** argv) {
  benchmark::Initialize(&argc, argv);
  if (argc < 3) {
    std::fprintf(stderr, "usage: %s PATTERN SIZE... [--benchmark_...]\n", argv[0]);
    return 2;
  }
  for (const bench::Operation& operation : bench::operationsMatching(argv[1], false)) {
    for (int i = 2; i < argc; ++i) {
      char name[256];
      std::snprintf(name, sizeof(name), "%s/%s/%s/%g", operation.name.c_str(), operation.library.c_str(),
                    argv[i], operation.traffic);
      const bench::Size size = bench::sizeOf(argv[i]);
      benchmark::RegisterBenchmark(name, [operation, size](benchmark::State& state) {
        const std::function<void()> call = operation.prepare(size);
        for (auto _ : state) {
          call();
        }
      })->Unit(benchmark::kMillisecond);
    }
  }
  benchmark::RunSpecifiedBenchmarks();
  return 0;
}
