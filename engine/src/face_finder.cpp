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

float ScoreOf(double confidence) { return static_cast<float>(1 / (1 + std::exp(-confidence))); }

/// The confidence that has this score: infinite for 1.
double ConfidenceOf(double score) { return std::log(score / (1 - score)); }

void CheckConfig(int config) {
  const bool size = config >= KY_MIN_SMALLEST_FACE && config <= KY_MAX_SMALLEST_FACE;
  Require(size || config == KY_CONFIG_DEFAULT || config == KY_CONFIG_LARGE_FACES ||
              config == KY_CONFIG_SMALL_FACES,
          KY_ERROR_CONFIG);
}

/// The size of `pixels` in a picture that is enlarged by `scale`.
int Scaled(int pixels, double scale) { return std::max(static_cast<int>(std::lround(pixels * scale)), 1); }

}  // namespace

FaceFinder::FaceFinder(const char* model_path, int config, Use use)
    : FaceFinder((CheckConfig(config), LoadModel(model_path)), config, use) {}

FaceFinder::FaceFinder(Model model, int config, Use use)
    : config_(config),
      use_(use),
      landmarks_(std::move(model.landmarks)),
      scanner_(std::move(model.detector)) {}

/// By how much a frame is enlarged before it is searched, so that the smallest faces that are to be found
/// fill the detector's window.
double FaceFinder::Scale(int width, int height) const {
  const double window = std::max(scanner_.filters().window_width, scanner_.filters().window_height);
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

bool FaceFinder::HasRoom(int width, int height) const {
  const double scale = Scale(width, height);
  return Scaled(width, scale) >= scanner_.filters().window_width &&
         Scaled(height, scale) >= scanner_.filters().window_height;
}

std::vector<FoundFace> FaceFinder::Find(const GrayImage& upright, float threshold) {
  const int width = static_cast<int>(upright.nc());
  const int height = static_cast<int>(upright.nr());
  if (!HasRoom(width, height) || threshold >= KY_MAX_THRESHOLD) {
    return {};
  }
  const double scale = Scale(width, height);
  const int scaled_width = Scaled(width, scale);
  const int scaled_height = Scaled(height, scale);
  // What is to be reduced to less than half is halved first: every pixel counts.
  const GrayImage* source = &upright;
  while (source->nc() > 2 * static_cast<long>(scaled_width) &&
         source->nr() > 2 * static_cast<long>(scaled_height)) {
    Halve(*source, searched_);
    swap(searched_, halved_);
    source = &halved_;
  }
  searched_.set_size(scaled_height, scaled_width);
  resizer_.Resize(*source, searched_);

  // The corners' pixels have stayed the corners'.
  const auto factor = [](int pixels, int scaled) {
    return scaled > 1 ? static_cast<double>(pixels - 1) / (scaled - 1) : 1.0;
  };
  const double across = factor(width, scaled_width);
  const double down = factor(height, scaled_height);
  std::vector<FoundFace> faces;
  for (const dlib::rect_detection& d : scanner_.Find(searched_, ConfidenceOf(threshold))) {
    const dlib::drectangle box(d.rect);
    faces.push_back({{box.left() * across, box.top() * down, box.right() * across, box.bottom() * down},
                     ScoreOf(d.detection_confidence)});
  }
  std::sort(faces.begin(), faces.end(), [](const FoundFace& a, const FoundFace& b) {
    return std::tuple(-a.score, a.box.top(), a.box.left()) < std::tuple(-b.score, b.box.top(), b.box.left());
  });
  return faces;
}

ky_face_t FaceFinder::Record(const GrayImage& upright, const FoundFace& face, const Frame& frame) const {
  ky_face_t record = {};
  record.rect = frame.ToFrame(face.box);
  record.score = face.score;
  Describe(landmarks_.get(), upright, face.box, frame, &record);
  return record;
}

}  // namespace kyengine
