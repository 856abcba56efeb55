// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// Detectors: the C interface over `FaceFinder`.
#include <dlib/revision.h>

#include <cstdio>
#include <memory>
#include <mutex>
#include <vector>

#include "face_finder.h"
#include "search.h"

namespace kyengine {
namespace {

class Detector {
 public:
  Detector(const char* modelPath, int config) : finder_(modelPath, config, Use::kStills) {}

  float threshold() const {
    const std::lock_guard lock(mutex_);
    return threshold_;
  }

  void setThreshold(float threshold) {
    // Refuses NaN, too.
    require(threshold >= KY_MIN_THRESHOLD && threshold <= KY_MAX_THRESHOLD, KY_ERROR_RANGE);
    const std::lock_guard lock(mutex_);
    threshold_ = threshold;
  }

  std::vector<ky_face_t> detect(const Frame& frame) {
    const std::lock_guard lock(mutex_);
    frame.toUprightGray(gray_);
    std::vector<ky_face_t> records;
    for (const FoundFace& face : finder_.find(gray_, threshold_)) {
      records.push_back(finder_.record(gray_, face, frame));
    }
    return records;
  }

 private:
  mutable std::mutex mutex_;
  FaceFinder finder_;
  float threshold_ = KY_DEFAULT_THRESHOLD;
  GrayImage gray_;
};

using Detectors = Handles<Detector>;

}  // namespace
}  // namespace kyengine

using kyengine::Detector;
using kyengine::Detectors;
using kyengine::guarded;
using kyengine::require;

int ky_face_create_detector(ky_handle_t* handle, const char* modelPath, int config) {
  return Detectors::create(handle, modelPath, config);
}

void ky_face_destroy_detector(ky_handle_t handle) { Detectors::destroy(handle); }

int ky_face_detect_get_threshold(ky_handle_t handle, float* threshold) {
  return guarded([&] {
    const auto detector = Detectors::find(handle);
    require(threshold != nullptr, KY_ERROR_NULL_POINTER);
    *threshold = detector->threshold();
  });
}

int ky_face_detect_set_threshold(ky_handle_t handle, float threshold) {
  return guarded([&] { Detectors::find(handle)->setThreshold(threshold); });
}

int ky_face_detect(ky_handle_t handle, const unsigned char* image, int pixelFormat, int width, int height,
                   int stride, int orientation, ky_face_t** faces, int* count) {
  return kyengine::search(&Detector::detect, handle, image, pixelFormat, width, height, stride, orientation,
                          faces, count);
}

void ky_face_release_detector_result(ky_face_t* faces, int /*count*/) { kyengine::releaseFaces(faces); }

int ky_face_algorithm_info() {
  return guarded([] {
    const int written = std::printf(
        "kyface open engine %s, dlib %d.%d.%d\n"
        "  detector: frontal faces by histograms of oriented gradients; built in\n"
        "  landmarks: from a model file of the caller's\n"
        "  tracker: the detector, and correlation filters between its frames\n"
        "  verifier: uniform local binary patterns, version %d, %d bytes a feature\n"
        "  verifier with a descriptor's model: %d numbers, version %d, %d bytes a feature\n",
        KY_ENGINE_VERSION, DLIB_MAJOR_VERSION, DLIB_MINOR_VERSION, DLIB_PATCH_VERSION, KY_VERIFY_VERSION,
        KY_FEATURE_LENGTH, KY_DESCRIPTOR_NUMBERS, KY_DESCRIPTOR_VERSION, KY_DESCRIPTOR_LENGTH);
    require(written > 0 && std::fflush(stdout) == 0, KY_ERROR_INTERNAL);
  });
}
