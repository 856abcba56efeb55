#include "face_finder.h"

#include <dlib/image_transforms.h>

#include <algorithm>
#include <cmath>
#include <tuple>

#include "failure.h"

namespace kyengine {
namespace {

float ScoreOf(double confidence) { return static_cast<float>(1 / (1 + std::exp(-confidence))); }

/// The confidence that has this score: infinite for 1.
double ConfidenceOf(double score) { return std::log(score / (1 - score)); }

int CheckedConfig(int config) {
  Require(config == KY_CONFIG_DEFAULT || config == KY_CONFIG_LARGE_FACES || config == KY_CONFIG_SMALL_FACES,
          KY_ERROR_CONFIG);
  return config;
}

}  // namespace

FaceFinder::FaceFinder(const char* model_path, int config)
    : config_(CheckedConfig(config)), model_(LoadModel(model_path)) {}

bool FaceFinder::Enlarges(int width, int height) const {
  switch (config_) {
    case KY_CONFIG_LARGE_FACES:
      return false;
    case KY_CONFIG_SMALL_FACES:
      return true;
    default:
      return width * height <= KY_SMALL_FRAME_PIXELS;
  }
}

bool FaceFinder::HasRoom(int width, int height) const {
  const auto& scanner = model_.detector.get_scanner();
  const unsigned long scale = config_ == KY_CONFIG_SMALL_FACES ? 2 : 1;
  return scale * static_cast<unsigned long>(width) >= scanner.get_detection_window_width() &&
         scale * static_cast<unsigned long>(height) >= scanner.get_detection_window_height();
}

std::vector<FoundFace> FaceFinder::Find(const GrayImage& upright, float threshold) {
  const int width = static_cast<int>(upright.nc());
  const int height = static_cast<int>(upright.nr());
  if (!HasRoom(width, height) || threshold >= KY_MAX_THRESHOLD) {
    return {};
  }
  std::vector<dlib::rect_detection> detections;
  const double least = ConfidenceOf(threshold);
  const dlib::pyramid_down<2> half;
  const bool enlarges = Enlarges(width, height);
  if (enlarges) {
    dlib::pyramid_up(upright, enlarged_, half);
    model_.detector(enlarged_, detections, least);
  } else {
    model_.detector(upright, detections, least);
  }

  std::vector<FoundFace> faces;
  faces.reserve(detections.size());
  for (const dlib::rect_detection& d : detections) {
    dlib::drectangle box(d.rect);
    if (enlarges) {
      box = half.rect_down(box);
    }
    faces.push_back({box, ScoreOf(d.detection_confidence)});
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
  Describe(model_.landmarks.get(), upright, face.box, frame, &record);
  return record;
}

}  // namespace kyengine
