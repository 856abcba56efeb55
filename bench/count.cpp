// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// The program that is run under the counting plugin:
//
//   bench_count own|all REPEATS PATTERN SIZE...
//
// Every operation that matches is called once to warm up, and REPEATS times between markers. Prints a line
// for each, in the order of their laps: name, library, size, traffic, and the pixels of these calls.

#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>

#include "lap.h"
#include "operation.h"

int main(int argc, char** argv) {
  if (argc < 5) {
    (void)std::fprintf(stderr, "usage: %s own|all REPEATS PATTERN SIZE...\n", argv[0]);
    return 2;
  }
  const bool own = std::strcmp(argv[1], "own") == 0;
  const int repeats = std::stoi(argv[2]);
  const std::vector<bench::Operation> operations = bench::operationsMatching(argv[3], own);
  for (int i = 4; i < argc; ++i) {
    const bench::Size size = bench::sizeOf(argv[i]);
    for (const bench::Operation& operation : operations) {
      bench::measure(operation.prepare(size), repeats);
      std::printf("%s\t%s\t%s\t%g\t%zu\n", operation.name.c_str(), operation.library.c_str(), argv[i],
                  operation.traffic, static_cast<size_t>(repeats) * size.pixels());
    }
  }
  return 0;
}
