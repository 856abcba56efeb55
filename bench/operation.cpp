// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

#include "operation.h"

#include <algorithm>
#include <charconv>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <regex>
#include <set>
#include <system_error>

namespace bench {

void addFloor(std::vector<Operation>& operations) {
  std::set<double> traffics;
  for (const Operation& operation : operations) {
    traffics.insert(operation.traffic);
  }
  for (const double traffic : traffics) {
    operations.push_back(
        {"floor" + std::to_string(traffic), "memcpy", traffic, [traffic](Size size) {
           const size_t bytes = static_cast<size_t>(static_cast<double>(size.pixels()) * traffic / 2);
           return [bytes, in = samples<unsigned char>(bytes), out = samples<unsigned char>(bytes)] {
             std::memcpy(out.get(), in.get(), bytes);
             // The copy is not to be found useless.
             asm volatile("" : : "r"(out.get()) : "memory");
           };
         }});
  }
}

std::vector<Operation> operationsMatching(const std::string& pattern, [[maybe_unused]] bool own) {
  std::vector<Operation> operations;
  addFastcv(operations);
  addPlanes(operations);
#ifdef BENCH_LIBYUV
  if (!own) {
    addLibyuv(operations);
  }
#endif
#ifdef BENCH_OPENCV
  if (!own) {
    addOpencv(operations);
  }
#endif
  const std::regex regex(pattern, std::regex::icase);
  std::erase_if(operations,
                [&](const Operation& operation) { return !std::regex_search(operation.name, regex); });
  if (!own) {
    addFloor(operations);
  }
  return operations;
}

Size sizeOf(const std::string& text) {
  Size size{};
  const char* const end = text.data() + text.size();
  const auto width = std::from_chars(text.data(), end, size.width);
  if (width.ec == std::errc() && width.ptr != end && *width.ptr == 'x') {
    const auto height = std::from_chars(width.ptr + 1, end, size.height);
    if (height.ec == std::errc() && height.ptr == end && size.width >= 1 && size.height >= 1) {
      return size;
    }
  }
  (void)std::fprintf(stderr, "a size is written as 1280x720, not as \"%s\"\n", text.c_str());
  std::exit(2);  // NOLINT(concurrency-mt-unsafe): there is no other thread
}

}  // namespace bench
