// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// The search of a picture for what a detector of dlib's knows.
#pragma once

#include "correlate.h"
#include "gradients.h"
#include "resize.h"
// The configuration comes first.
#include <dlib/image_processing/frontal_face_detector.h>

#include <memory>
#include <utility>
#include <vector>

namespace kyengine {

/// A detector of dlib's, its filters in the form in which they are applied. Immutable, and shared by those
/// who search with it.
struct Filters {
  using Detector = dlib::frontal_face_detector;

  explicit Filters(const Detector& detector);

  /// A filter is a sum of parts for single features, each the product of a row and a column of weights. These
  /// are parts for one feature, of whichever filters. Their rows lie interleaved.
  struct Group {
    int feature;
    size_t size;
    size_t filters[kMostTogether];
    std::vector<float> rows;
    std::vector<float> columns[kMostTogether];
  };

  int cell;
  int windowWidth;   ///< what is searched for has this size, in pixels,
  int windowHeight;  ///< or is larger
  int tapsAcross;
  int tapsDown;
  unsigned long padding;
  unsigned long mostLevels;
  unsigned long leastWidth;
  unsigned long leastHeight;
  dlib::test_box_overlap overlap;
  std::vector<double> biases;  ///< by filter
  std::vector<Group> groups;
};

/// A search. It finds what `dlib::object_detector` finds (whose pyramid and suppression of overlapping boxes
/// it follows), up to rounding, several times as fast. Not for several threads at once: it works in buffers
/// of its own.
class Scanner {
 public:
  explicit Scanner(std::shared_ptr<const Filters> filters) : filters_(std::move(filters)) {}

  const Filters& filters() const { return *filters_; }

  /// Finds everything in `picture` whose confidence is at least `least`, the surest first. `picture` is
  /// changed.
  std::vector<dlib::rect_detection> find(GrayImage& picture, double least);

 private:
  /// A picture is scanned in tiles of so many cells; sums and rows of a tile stay in the nearest cache.
  static constexpr int kTileRows = 32;
  static constexpr int kTileColumns = 16;

  void scanLevel(const GrayImage& picture, unsigned int level, double least);
  void scanTile(int rows, int column);

  std::shared_ptr<const Filters> filters_;
  FeatureMap map_;
  Resizer resizer_;
  GrayImage next_;
  std::vector<float> rows_;  ///< a tile's rows after the rows of a group's parts
  std::vector<float> sums_;  ///< a tile's scores, by filter
  std::vector<dlib::rect_detection> found_;
};

}  // namespace kyengine
