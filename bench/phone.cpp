// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// The operations on a phone's cores:
//
//   bench_phone MILLISECONDS PATTERN SIZE...
//
// Every operation that matches is measured on a small core and on a big one, where there are such: nine
// samples, each of as many calls as take MILLISECONDS (one, for 0). Prints lines of columns separated by
// tabs:
//
//   core      small|big|only  number  kilohertz, 0 where they are not told
//   counters  yes, or what the system says instead
//   result    operation  library  size  traffic  core's number  nanoseconds  cycles  instructions
//
// with the medians per pixel; cycles and instructions are "-" where the system does not let them be counted.

#include <linux/perf_event.h>
#include <sched.h>
#include <sys/ioctl.h>
#include <sys/syscall.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <chrono>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <fstream>
#include <string>
#include <vector>

#include "operation.h"

namespace {

constexpr int kSamples = 9;

struct Core {
  const char* name;
  int number;
  long kilohertz;
};

/// Those that this process may run on: the slowest, and the fastest if that is another.
std::vector<Core> chosenCores() {
  cpu_set_t allowed;
  CPU_ZERO(&allowed);
  if (sched_getaffinity(0, sizeof allowed, &allowed) != 0) {
    std::perror("the cores are not told");
    std::exit(3);
  }
  std::vector<Core> cores;
  for (int i = 0; i < CPU_SETSIZE; ++i) {
    if (CPU_ISSET(i, &allowed)) {
      std::ifstream file("/sys/devices/system/cpu/cpu" + std::to_string(i) + "/cpufreq/cpuinfo_max_freq");
      long kilohertz = 0;
      file >> kilohertz;
      cores.push_back({"only", i, kilohertz});
    }
  }
  const auto slower = [](const Core& a, const Core& b) { return a.kilohertz < b.kilohertz; };
  Core small = *std::min_element(cores.begin(), cores.end(), slower);
  Core big = *std::max_element(cores.begin(), cores.end(), slower);
  if (small.kilohertz == big.kilohertz) {
    return {small};
  }
  small.name = "small";
  big.name = "big";
  return {small, big};
}

void runOn(const Core& core) {
  cpu_set_t one;
  CPU_ZERO(&one);
  CPU_SET(core.number, &one);
  if (sched_setaffinity(0, sizeof one, &one) != 0) {
    std::fprintf(stderr, "core %d cannot be run on: %s\n", core.number, std::strerror(errno));
    std::exit(3);
  }
}

/// Cycles and instructions of this thread outside the kernel, on one core: each kind of core counts for
/// itself.
class Counters {
 public:
  explicit Counters(int core) {
    cycles_ = open(PERF_COUNT_HW_CPU_CYCLES, core, -1);
    instructions_ = cycles_ < 0 ? -1 : open(PERF_COUNT_HW_INSTRUCTIONS, core, cycles_);
    if (!counting()) {
      error_ = std::strerror(errno);
    }
  }
  ~Counters() {
    for (const int file : {instructions_, cycles_}) {
      if (file >= 0) {
        close(file);
      }
    }
  }
  Counters(const Counters&) = delete;
  Counters& operator=(const Counters&) = delete;

  bool counting() const { return instructions_ >= 0; }
  const std::string& error() const { return error_; }

  void start() const {
    if (counting()) {
      ioctl(cycles_, PERF_EVENT_IOC_RESET, PERF_IOC_FLAG_GROUP);
      ioctl(cycles_, PERF_EVENT_IOC_ENABLE, PERF_IOC_FLAG_GROUP);
    }
  }
  /// {cycles, instructions} since the start; zeros where nothing was counted.
  std::array<uint64_t, 2> stop() const {
    std::array<uint64_t, 3> group = {};  // how many, and each
    if (counting()) {
      ioctl(cycles_, PERF_EVENT_IOC_DISABLE, PERF_IOC_FLAG_GROUP);
      if (read(cycles_, group.data(), sizeof group) != static_cast<ssize_t>(sizeof group)) {
        group = {};
      }
    }
    return {group[1], group[2]};
  }

 private:
  static int open(uint64_t event, int core, int leader) {
    perf_event_attr attributes = {};
    attributes.size = sizeof attributes;
    attributes.type = PERF_TYPE_HARDWARE;
    attributes.config = event;
    attributes.disabled = leader < 0 ? 1 : 0;
    attributes.exclude_kernel = 1;
    attributes.exclude_hv = 1;
    attributes.read_format = PERF_FORMAT_GROUP;
    return static_cast<int>(syscall(SYS_perf_event_open, &attributes, 0, core, leader, 0));
  }

  int cycles_;
  int instructions_;
  std::string error_;
};

double median(std::array<double, kSamples>& samples) {
  std::nth_element(samples.begin(), samples.begin() + kSamples / 2, samples.end());
  return samples[kSamples / 2];
}

using Clock = std::chrono::steady_clock;

double nanosecondsSince(Clock::time_point start) {
  return std::chrono::duration<double, std::nano>(Clock::now() - start).count();
}

void measure(const bench::Operation& operation, const char* size, const Core& core, const Counters& counters,
             double milliseconds) {
  const double pixels = static_cast<double>(bench::sizeOf(size).pixels());
  const std::function<void()> call = operation.prepare(bench::sizeOf(size));
  call();
  const Clock::time_point first = Clock::now();
  call();
  const double once = std::max(nanosecondsSince(first), 1.0);
  const int calls = std::max(1, static_cast<int>(std::min(milliseconds * 1e6 / once, 1e6)));

  std::array<double, kSamples> times;
  std::array<double, kSamples> cycles;
  std::array<double, kSamples> instructions;
  for (int sample = 0; sample < kSamples; ++sample) {
    counters.start();
    const Clock::time_point start = Clock::now();
    for (int i = 0; i < calls; ++i) {
      call();
    }
    times[sample] = nanosecondsSince(start) / calls / pixels;
    const std::array<uint64_t, 2> counted = counters.stop();
    cycles[sample] = static_cast<double>(counted[0]) / calls / pixels;
    instructions[sample] = static_cast<double>(counted[1]) / calls / pixels;
  }
  std::printf("result\t%s\t%s\t%s\t%g\t%d\t%.5f", operation.name.c_str(), operation.library.c_str(), size,
              operation.traffic, core.number, median(times));
  for (auto* samples : {&cycles, &instructions}) {
    const double figure = median(*samples);
    figure > 0 ? std::printf("\t%.5f", figure) : std::printf("\t-");
  }
  std::printf("\n");
}

}  // namespace

int main(int argc, char** argv) {
  if (argc < 4) {
    std::fprintf(stderr, "usage: %s MILLISECONDS PATTERN SIZE...\n", argv[0]);
    return 2;
  }
  const double milliseconds = std::atof(argv[1]);
  const std::vector<bench::Operation> operations = bench::operationsMatching(argv[2], false);
  for (const Core& core : chosenCores()) {
    std::printf("core\t%s\t%d\t%ld\n", core.name, core.number, core.kilohertz);
    runOn(core);
    const Counters counters(core.number);
    std::printf("counters\t%s\n", counters.counting() ? "yes" : counters.error().c_str());
    for (int i = 3; i < argc; ++i) {
      for (const bench::Operation& operation : operations) {
        measure(operation, argv[i], core, counters, milliseconds);
      }
    }
  }
  return 0;
}
