// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// Verifiers: features of faces, and the C interface to them.
#include <algorithm>
#include <array>
#include <cmath>
#include <memory>
#include <optional>
#include <vector>

#include "aligned_face.h"
#include "feature.h"
#include "handles.h"
#include "model.h"

namespace kyengine {
namespace {

// Where the eyes are in the detector's boxes: crops by the eyes and by the box show about the same.
constexpr double kEyeDistance = 0.49;  // of the side of the crop
constexpr double kEyesAboveCentre = 0.235;

FaceCrop cropByEyes(const Eyes& eyes) {
  const dlib::dpoint across = eyes.right - eyes.left;
  const double side = dlib::length(across) / kEyeDistance;
  const dlib::dpoint down = dlib::dpoint(-across.y(), across.x()) / dlib::length(across);
  return {(eyes.left + eyes.right) / 2 + down * (kEyesAboveCentre * side), side,
          std::atan2(across.y(), across.x())};
}

/// The box of a record, with its last row and column as dlib has them. Throws Failure when it is empty.
dlib::drectangle boxOf(const ky_face_t& face) {
  require(face.rect.left < face.rect.right && face.rect.top < face.rect.bottom, KY_ERROR_FACE);
  return {static_cast<double>(face.rect.left), static_cast<double>(face.rect.top), face.rect.right - 1.0,
          face.rect.bottom - 1.0};
}

/// The points of a record. Throws Failure when they cannot be.
std::vector<dlib::dpoint> pointsOf(const ky_face_t& face) {
  require(face.points_count >= 0 && face.points_count <= KY_FACE_MAX_POINTS, KY_ERROR_FACE);
  std::vector<dlib::dpoint> points;
  for (int i = 0; i < face.points_count; ++i) {
    const ky_pointf_t p = face.points_array[i];
    require(std::isfinite(p.x) && std::isfinite(p.y), KY_ERROR_FACE);
    points.emplace_back(p.x, p.y);
  }
  return points;
}

/// Takes features. Holds nothing that a call changes, so that calls need not wait for one another.
class Verifier {
 public:
  explicit Verifier(const char* modelPath) {
    if (modelPath != nullptr) {
      model_ = loadVerifierModel(modelPath);
    }
  }

  int version() const { return model_.descriptor != nullptr ? KY_DESCRIPTOR_VERSION : KY_VERIFY_VERSION; }
  int length() const { return model_.descriptor != nullptr ? KY_DESCRIPTOR_LENGTH : KY_FEATURE_LENGTH; }

  /// Whether a feature is one of this verifier's, or of one like it.
  bool knows(const Feature& feature) const {
    const uint32_t tag = model_.descriptor != nullptr ? model_.descriptor->fingerprint() : 0;
    return feature.version() == version() && feature.tag() == tag;
  }

  Feature extract(const Frame& frame, const ky_face_t& face) const {
    const dlib::drectangle box = boxOf(face);
    const dlib::drectangle view(0, 0, frame.uprightWidth() - 1.0, frame.uprightHeight() - 1.0);
    const double longest = 2 * std::max(view.width(), view.height());
    require(view.contains(dlib::center(box)), KY_ERROR_FACE);
    require(std::max(box.width(), box.height()) <= longest, KY_ERROR_FACE);

    GrayImage gray;
    Eyes eyes;
    bool aligned = findEyes(pointsOf(face), &eyes);
    if (!aligned && model_.landmarks != nullptr) {
      frame.toUprightGray(gray);
      aligned = findEyes(model_.landmarks->locate(gray, box), &eyes);
    }
    require(aligned || model_.descriptor == nullptr, KY_ERROR_EYES);
    const FaceCrop crop =
        aligned ? cropByEyes(eyes) : FaceCrop{dlib::center(box), std::max(box.width(), box.height()), 0};
    const double smallest = model_.descriptor != nullptr ? KY_SMALLEST_EYE_DISTANCE / kEyeDistance
                                                         : double{KY_SMALLEST_VERIFIED_FACE};
    require(crop.side >= smallest && view.contains(crop.centre), KY_ERROR_FACE);
    require(crop.side <= longest, KY_ERROR_FACE);
    if (model_.descriptor != nullptr) {
      return describe(frame, eyes);
    }
    if (gray.size() == 0) {
      frame.toUprightGray(gray);
    }
    return Feature(patternsOf(gray, crop));
  }

 private:
  Feature describe(const Frame& frame, const Eyes& eyes) const {
    const std::vector<uint8_t> picture = alignedFace(frame, eyes, faceDescriptorShape().side);
    std::array<float, KY_DESCRIPTOR_NUMBERS> numbers = {};
    const ky_result_t result = model_.descriptor->describe(picture.data(), numbers.data());
    require(result == KY_SUCCESS, result);
    return {numbers, model_.descriptor->fingerprint()};
  }

  VerifierModel model_;
};

using Verifiers = Handles<Verifier>;
using Features = Handles<Feature>;

/// What a verifier says of itself, or KY_ERROR_HANDLE when `handle` names none.
int constant(ky_handle_t handle, int (Verifier::*value)() const) {
  int answer = 0;
  const int result = guarded([&] { answer = (*Verifiers::find(handle).*value)(); });
  return result == KY_SUCCESS ? answer : result;
}

}  // namespace
}  // namespace kyengine

using kyengine::Feature;
using kyengine::Features;
using kyengine::Frame;
using kyengine::guarded;
using kyengine::require;
using kyengine::Verifiers;

int ky_verify_create_handle(ky_handle_t* handle, const char* modelPath) {
  return Verifiers::create(handle, modelPath);
}

void ky_verify_destroy_handle(ky_handle_t handle) { Verifiers::destroy(handle); }

int ky_verify_get_version(ky_handle_t handle) {
  return kyengine::constant(handle, &kyengine::Verifier::version);
}

int ky_verify_get_feature_length(ky_handle_t handle) {
  return kyengine::constant(handle, &kyengine::Verifier::length);
}

int ky_verify_get_feature(ky_handle_t handle, const unsigned char* image, int pixelFormat, int width,
                          int height, int stride, const ky_face_t* face, ky_feature_t* feature, int* length) {
  return guarded([&] {
    require(feature != nullptr && length != nullptr, KY_ERROR_NULL_POINTER);
    *feature = nullptr;
    *length = 0;
    const auto verifier = Verifiers::find(handle);
    require(face != nullptr, KY_ERROR_NULL_POINTER);
    const Frame frame(image, pixelFormat, width, height, stride, KY_ORIENTATION_0);
    *feature = Features::add(std::make_shared<Feature>(verifier->extract(frame, *face)));
    *length = verifier->length();
  });
}

void ky_verify_serialize_feature(ky_feature_t feature, char* text) {
  if (text == nullptr) {
    return;
  }
  *text = '\0';  // what is no feature has the empty text
  guarded([&] { kyengine::writeText(*Features::find(feature, KY_ERROR_FEATURE), text); });
}

ky_feature_t ky_verify_deserialize_feature(const char* text) {
  ky_feature_t feature = nullptr;
  guarded([&] {
    require(text != nullptr, KY_ERROR_NULL_POINTER);
    const std::optional<Feature> read = kyengine::readText(text);
    require(read.has_value(), KY_ERROR_FEATURE);
    feature = Features::add(std::make_shared<Feature>(*read));
  });
  return feature;
}

int ky_verify_compare_feature(ky_handle_t handle, ky_feature_t feature1, ky_feature_t feature2,
                              float* score) {
  return guarded([&] {
    require(score != nullptr, KY_ERROR_NULL_POINTER);
    *score = 0;
    const auto verifier = Verifiers::find(handle);
    const auto a = Features::find(feature1, KY_ERROR_FEATURE);
    const auto b = Features::find(feature2, KY_ERROR_FEATURE);
    require(verifier->knows(*a) && verifier->knows(*b), KY_ERROR_FEATURE_KIND);
    *score = kyengine::similarity(*a, *b);
  });
}

void ky_verify_release_feature(ky_feature_t feature) { Features::destroy(feature); }
