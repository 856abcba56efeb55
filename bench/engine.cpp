// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// What the open engine needs for a frame: run under the counting plugin, or by itself for its time,
//
//   bench_engine count|time REPEATS [LANDMARKS]
//
// The frame is the portrait, reduced or enlarged to 640 x 480 with the face where a phone held at arm's
// length shows it. Prints a line for each operation in the order of their laps: its name and the calls in the
// difference, or its name and the median of its milliseconds.

#include <algorithm>
#include <chrono>
#include <cstdio>
#include <cstring>
#include <functional>
#include <string>
#include <vector>

#include "engine/ky_engine.h"
#include "kyface_api/kyface_api.h"
#include "lap.h"
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
std::function<void()> Search(ky_handle_t handle, const std::vector<uint8_t>& frame) {
  return [handle, &frame] {
    ky_face_t* faces = nullptr;
    int count = 0;
    const int result = search(handle, frame.data(), KY_PIXEL_NV21, kWidth, kHeight, kWidth, KY_ORIENTATION_0,
                              &faces, &count);
    if (result != KY_SUCCESS || count != 1) {
      (void)std::fprintf(stderr, "bench_engine: result %d, %d faces\n", result, count);
      std::exit(1);
    }
    release(faces, count);
  };
}

double MedianMilliseconds(const std::function<void()>& call, int repeats) {
  using Clock = std::chrono::steady_clock;
  call();
  std::vector<double> times;
  for (int i = 0; i < repeats; ++i) {
    const Clock::time_point begin = Clock::now();
    call();
    times.push_back(std::chrono::duration<double, std::milli>(Clock::now() - begin).count());
  }
  std::sort(times.begin(), times.end());
  return times[times.size() / 2];
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
  if (ky_face_create_detector(&large, nullptr, KY_CONFIG_LARGE_FACES) != KY_SUCCESS ||
      ky_face_create_detector(&small, nullptr, KY_CONFIG_SMALL_FACES) != KY_SUCCESS ||
      ky_face_create_detector(&usual, nullptr, KY_CONFIG_DEFAULT) != KY_SUCCESS ||
      ky_face_create_tracker(&tracker, landmarks, KY_CONFIG_DEFAULT) != KY_SUCCESS ||
      ky_face_track_set_detect_interval(tracker, KY_MAX_DETECT_INTERVAL, nullptr) != KY_SUCCESS) {
    return 1;
  }
  constexpr auto detect = Search<ky_face_detect, ky_face_release_detector_result>;
  constexpr auto track = Search<ky_face_track, ky_face_release_tracker_result>;
  const std::vector<Operation> operations = {
      {"detect, faces from 80 pixels", detect(large, frame)},
      {"detect, faces from 40 pixels", detect(small, frame)},
      {"detect, by default", detect(usual, frame)},
      {"track a face between detections", track(tracker, frame)},
  };
  for (const Operation& operation : operations) {
    if (counts) {
      bench::measure(operation.call, repeats);
      std::printf("%s\t%d\n", operation.name.c_str(), 2 * repeats);
    } else {
      std::printf("%s\t%.2f\n", operation.name.c_str(), MedianMilliseconds(operation.call, repeats));
    }
  }
  return 0;
}
