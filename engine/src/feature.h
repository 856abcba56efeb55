/// Face features: what local binary patterns say about an aligned face, and their text.
#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <optional>

#include "frame.h"

namespace kyengine {

/// Where a face lies in a picture: a square, turned clockwise about its centre.
struct FaceCrop {
  dlib::dpoint centre;
  double side;
  double angle;  ///< in radians
};

/// A feature in its final form: a mark, a version, histograms and a checksum.
using Feature = std::array<uint8_t, KY_FEATURE_LENGTH>;

/// Describes what the crop shows. What lies outside the picture counts as black.
Feature ExtractFeature(const GrayImage& picture, const FaceCrop& crop);

/// How alike two features are, from 0 to 1; symmetric, and 1 for a feature and itself.
float Similarity(const Feature& a, const Feature& b);

/// Writes the text of a feature with its terminating zero: KY_FEATURE_TEXT_LENGTH bytes of base64.
void WriteText(const Feature& feature, char* text);

/// The feature that has this text, if it is one. Reads up to the first character that cannot be, and never
/// more than KY_FEATURE_TEXT_LENGTH bytes.
std::optional<Feature> ReadText(const char* text);

}  // namespace kyengine
