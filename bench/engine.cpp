// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// What the open engine needs for a frame and for a feature: run under the counting plugin, or by itself for
// its time,
//
//   bench_engine count|time REPEATS [LANDMARKS]
//
// The frame is the portrait, reduced or enlarged to 640 x 480 with the face where a phone held at arm's
// length shows it; the descriptor's weights are random. Prints a line for each operation in the order of
// their laps: its name and how often it was called, or its name and the median of its milliseconds of
// processor time, all operations taking turns. Among those that are timed is a loop of as many multiply-adds
// as a feature takes, in registers: the machine's peak.

#include <unistd.h>

#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <ctime>
#include <functional>
#include <iterator>
#include <string>
#include <vector>

#include "engine/ky_engine.h"
#include "kyface_api/kyface_api.h"
#include "lap.h"
#include "simd/vector.h"
#include "tests/support/descriptor_model.h"
#include "tests/support/picture.h"

namespace {

using kyengine::test::Encode;
using kyengine::test::Part;
using kyengine::test::Picture;

constexpr int kWidth = 640;
constexpr int kHeight = 480;

struct Operation {
  std::string name;
  std::function<void()> call;
};

/// Calls one of the engine's searches, whose faces nobody wants.
template <auto search, auto release>
std::function<void()> searching(ky_handle_t handle, const std::vector<uint8_t>& frame) {
  return [handle, &frame] {
    ky_face_t* faces = nullptr;
    int count = 0;
    const int result = search(handle, frame.data(), KY_PIXEL_NV21, kWidth, kHeight, kWidth, KY_ORIENTATION_0,
                              &faces, &count);
    if (result != KY_SUCCESS || count != 1) {
      (void)std::fprintf(stderr, "bench_engine: result %d, %d faces\n", result, count);
      std::_Exit(1);
    }
    release(faces, count);
  };
}

/// Takes a feature of the portrait's face.
std::function<void()> extracting(ky_handle_t verifier, const ky_face_t& face) {
  return [verifier, &face] {
    const Picture& picture = kyengine::test::Portrait();
    ky_feature_t feature = nullptr;
    int length = 0;
    const int result = ky_verify_get_feature(verifier, picture.rgb.data(), KY_PIXEL_RGB, picture.width,
                                             picture.height, 3 * picture.width, &face, &feature, &length);
    if (result != KY_SUCCESS) {
      (void)std::fprintf(stderr, "bench_engine: result %d, no feature\n", result);
      std::_Exit(1);
    }
    ky_verify_release_feature(feature);
  };
}

/// A verifier by a descriptor whose weights are random, or none.
ky_handle_t randomVerifier() {
  using namespace kyengine;
  const std::vector<uint8_t> model = test::FileOf(test::RandomModel(faceDescriptorShape(), 1));
  char path[] = "/tmp/bench_engine.XXXXXX";
  const int file = mkstemp(path);
  ky_handle_t verifier = nullptr;
  if (file < 0 || write(file, model.data(), model.size()) != static_cast<ssize_t>(model.size()) ||
      ky_verify_create_handle(&verifier, path) != KY_SUCCESS) {
    verifier = nullptr;
  }
  (void)close(file);
  (void)unlink(path);
  return verifier;
}

/// As many multiply-adds as the descriptor's network has by its definition, one independent of the next.
void multiplyAdds() {
  using namespace HPC::fastcv::arm;
  constexpr int kLanes = static_cast<int>(sizeof(Floats) / sizeof(float));
  constexpr int kSums = 10;  // enough for a multiply-add's latency, and few enough for the registers
  constexpr int kRounds = 270'800'000 / (kSums * kLanes);
  static volatile float number = 0.5F;
  const Floats x = splat<Floats>(number);
  Floats sums[kSums];
  for (Floats& sum : sums) {
    sum = splat<Floats>(number);  // read anew: numbers known to be equal would be worked out once
  }
  for (int i = 0; i < kRounds; ++i) {
#pragma GCC unroll 16
    for (Floats& sum : sums) {
      sum = multiplyAdd(x, sum, x);
    }
  }
  for (const Floats& sum : sums) {
    number = (sum[0] + sum[kLanes - 1]) / 4;
  }
}

double millisecondsOf(const std::function<void()>& call) {
  const auto now = [] {
    timespec time = {};
    (void)clock_gettime(CLOCK_THREAD_CPUTIME_ID, &time);
    return static_cast<double>(time.tv_sec) * 1e3 + static_cast<double>(time.tv_nsec) * 1e-6;
  };
  const double begin = now();
  call();
  return now() - begin;
}

void timeAll(const std::vector<Operation>& operations, int repeats) {
  std::vector<std::vector<double>> times(operations.size());
  for (int i = 0; i <= repeats; ++i) {
    for (size_t k = 0; k < operations.size(); ++k) {
      const double time = millisecondsOf(operations[k].call);
      // The first round warms up.
      if (i > 0) {
        times[k].push_back(time);
      }
    }
  }
  for (size_t k = 0; k < operations.size(); ++k) {
    std::sort(times[k].begin(), times[k].end());
    std::printf("%s\t%.2f\n", operations[k].name.c_str(), times[k][times[k].size() / 2]);
  }
}

}  // namespace

int main(int argc, char** argv) {
  if (argc < 3) {
    (void)std::fprintf(stderr, "usage: %s count|time REPEATS [LANDMARKS]\n", argv[0]);
    return 2;
  }
  const bool counts = std::strcmp(argv[1], "count") == 0;
  const int repeats = std::stoi(argv[2]);
  const Picture picture = Part(kyengine::test::Portrait(), -64, 16, kWidth, kHeight);
  const std::vector<uint8_t> frame = Encode(picture, KY_PIXEL_NV21, kWidth);
  const char* const landmarks = argc > 3 ? argv[3] : nullptr;

  ky_handle_t large = nullptr;
  ky_handle_t small = nullptr;
  ky_handle_t usual = nullptr;
  ky_handle_t tracker = nullptr;
  ky_handle_t patterns = nullptr;
  const ky_handle_t descriptor = randomVerifier();
  if (ky_face_create_detector(&large, nullptr, KY_CONFIG_LARGE_FACES) != KY_SUCCESS ||
      ky_face_create_detector(&small, nullptr, KY_CONFIG_SMALL_FACES) != KY_SUCCESS ||
      ky_face_create_detector(&usual, nullptr, KY_CONFIG_DEFAULT) != KY_SUCCESS ||
      ky_face_create_tracker(&tracker, landmarks, KY_CONFIG_DEFAULT) != KY_SUCCESS ||
      ky_face_track_set_detect_interval(tracker, KY_MAX_DETECT_INTERVAL, nullptr) != KY_SUCCESS ||
      ky_verify_create_handle(&patterns, nullptr) != KY_SUCCESS || descriptor == nullptr) {
    return 1;
  }
  constexpr auto detect = searching<ky_face_detect, ky_face_release_detector_result>;
  constexpr auto track = searching<ky_face_track, ky_face_release_tracker_result>;
  ky_face_t face = {};
  face.rect = kyengine::test::kPortraitFace;
  constexpr ky_pointf_t kEyes[] = {{244, 109}, {244, 109}, {201, 106}, {201, 106}, {222, 128}};
  face.points_count = std::size(kEyes);
  std::copy(std::begin(kEyes), std::end(kEyes), face.points_array);

  std::vector<Operation> operations = {
      {"detect, faces from 80 pixels", detect(large, frame)},
      {"detect, faces from 40 pixels", detect(small, frame)},
      {"detect, by default", detect(usual, frame)},
      {"track a face between detections", track(tracker, frame)},
      {"extract a feature, by the descriptor", extracting(descriptor, face)},
      {"extract a feature, by patterns", extracting(patterns, face)},
  };
  if (!counts) {
    operations.push_back({"multiply-adds of a feature, in registers", multiplyAdds});
    timeAll(operations, repeats);
    return 0;
  }
  for (const Operation& operation : operations) {
    bench::measure(operation.call, repeats);
    std::printf("%s\t%d\n", operation.name.c_str(), repeats);
  }
  return 0;
}
