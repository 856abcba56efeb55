// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

#include "face_finder.h"

#include <algorithm>
#include <cmath>
#include <tuple>
#include <utility>

#include "failure.h"

namespace kyengine {
namespace {

float scoreOf(double confidence) { return static_cast<float>(1 / (1 + std::exp(-confidence))); }

/// The confidence that has this score: infinite for 1.
double confidenceOf(double score) { return std::log(score / (1 - score)); }

void checkConfig(int config) {
  const bool size = config >= KY_MIN_SMALLEST_FACE && config <= KY_MAX_SMALLEST_FACE;
  require(size || config == KY_CONFIG_DEFAULT || config == KY_CONFIG_LARGE_FACES ||
              config == KY_CONFIG_SMALL_FACES,
          KY_ERROR_CONFIG);
}

/// The size of `pixels` in a picture that is enlarged by `scale`.
int scaled(int pixels, double scale) { return std::max(static_cast<int>(std::lround(pixels * scale)), 1); }

}  // namespace

FaceFinder::FaceFinder(const char* modelPath, int config, Use use)
    : FaceFinder((checkConfig(config), loadModel(modelPath)), config, use) {}

FaceFinder::FaceFinder(Model model, int config, Use use)
    : config_(config),
      use_(use),
      landmarks_(std::move(model.landmarks)),
      scanner_(std::move(model.detector)) {}

/// By how much a frame is enlarged before it is searched, so that the smallest faces that are to be found
/// fill the detector's window.
double FaceFinder::scaleFor(int width, int height) const {
  const double window = std::max(scanner_.filters().windowWidth, scanner_.filters().windowHeight);
  switch (config_) {
    case KY_CONFIG_LARGE_FACES:
      return 1;
    case KY_CONFIG_SMALL_FACES:
      return 2;
    case KY_CONFIG_DEFAULT:
      if (use_ == Use::kVideo) {
        // As many pixels as a detection may take, whatever the frame has.
        const double pixels = static_cast<double>(width) * height;
        return std::min(std::sqrt(KY_TRACKED_PIXELS / pixels), window / KY_DEFAULT_SMALLEST_FACE);
      }
      return window / KY_DEFAULT_SMALLEST_FACE;
    default:
      return window / config_;
  }
}

bool FaceFinder::hasRoom(int width, int height) const {
  const double scale = scaleFor(width, height);
  return scaled(width, scale) >= scanner_.filters().windowWidth &&
         scaled(height, scale) >= scanner_.filters().windowHeight;
}

std::vector<FoundFace> FaceFinder::find(const GrayImage& upright, float threshold) {
  const int width = static_cast<int>(upright.nc());
  const int height = static_cast<int>(upright.nr());
  if (!hasRoom(width, height) || threshold >= KY_MAX_THRESHOLD) {
    return {};
  }
  const double scale = scaleFor(width, height);
  const int scaledWidth = scaled(width, scale);
  const int scaledHeight = scaled(height, scale);
  // What is to be reduced to less than half is halved first: every pixel counts.
  const GrayImage* source = &upright;
  while (source->nc() > 2 * static_cast<long>(scaledWidth) &&
         source->nr() > 2 * static_cast<long>(scaledHeight)) {
    halve(*source, searched_);
    swap(searched_, halved_);
    source = &halved_;
  }
  searched_.set_size(scaledHeight, scaledWidth);
  resizer_.resize(*source, searched_);

  // The corners' pixels have stayed the corners'.
  const auto factor = [](int pixels, int scaled) {
    return scaled > 1 ? static_cast<double>(pixels - 1) / (scaled - 1) : 1.0;
  };
  const double across = factor(width, scaledWidth);
  const double down = factor(height, scaledHeight);
  std::vector<FoundFace> faces;
  for (const dlib::rect_detection& d : scanner_.find(searched_, confidenceOf(threshold))) {
    const dlib::drectangle box(d.rect);
    faces.push_back({{box.left() * across, box.top() * down, box.right() * across, box.bottom() * down},
                     scoreOf(d.detection_confidence)});
  }
  std::sort(faces.begin(), faces.end(), [](const FoundFace& a, const FoundFace& b) {
    return std::tuple(-a.score, a.box.top(), a.box.left()) < std::tuple(-b.score, b.box.top(), b.box.left());
  });
  return faces;
}

ky_face_t FaceFinder::record(const GrayImage& upright, const FoundFace& face, const Frame& frame) const {
  ky_face_t record = {};
  record.rect = frame.toFrame(face.box);
  record.score = face.score;
  describe(landmarks_.get(), upright, face.box, frame, &record);
  return record;
}

}  // namespace kyengine
