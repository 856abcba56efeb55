// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

#include "scanner.h"

#include <algorithm>
#include <tuple>

#include "failure.h"

namespace kyengine {
namespace {

using Pyramid = dlib::pyramid_down<6>;
using Weights = Filters::Detector::feature_vector_type;

/// A model may have filters that find something everywhere.
constexpr size_t kMostFound = size_t{1} << 20;

}  // namespace

Filters::Filters(const Detector& detector) : overlap(detector.get_overlap_tester()) {
  const auto& scanner = detector.get_scanner();
  cell = static_cast<int>(scanner.get_cell_size());
  windowWidth = static_cast<int>(scanner.get_detection_window_width());
  windowHeight = static_cast<int>(scanner.get_detection_window_height());
  tapsAcross = static_cast<int>(scanner.get_fhog_window_width());
  tapsDown = static_cast<int>(scanner.get_fhog_window_height());
  padding = scanner.get_padding();
  mostLevels = scanner.get_max_pyramid_levels();
  leastWidth = scanner.get_min_pyramid_layer_width();
  leastHeight = scanner.get_min_pyramid_layer_height();

  struct Part {
    size_t filter;
    std::vector<float> row;
    std::vector<float> column;
  };
  std::vector<std::vector<Part>> parts(kFeatures);
  for (size_t filter = 0; filter < detector.num_detectors(); ++filter) {
    const Weights& weights = detector.get_w(filter);
    biases.push_back(weights(weights.size() - 1));
    const auto bank = scanner.build_fhog_filterbank(weights);
    for (size_t feature = 0; feature < parts.size(); ++feature) {
      for (size_t i = 0; i < bank.row_filters[feature].size(); ++i) {
        const auto& row = bank.row_filters[feature][i];
        const auto& column = bank.col_filters[feature][i];
        parts[feature].push_back({filter, {row.begin(), row.end()}, {column.begin(), column.end()}});
      }
    }
  }

  for (size_t feature = 0; feature < parts.size(); ++feature) {
    const std::vector<Part>& ofFeature = parts[feature];
    for (size_t first = 0; first < ofFeature.size(); first += kMostTogether) {
      Group& group = groups.emplace_back();
      group.feature = static_cast<int>(feature);
      group.size = std::min(kMostTogether, ofFeature.size() - first);
      for (size_t tap = 0; tap < static_cast<size_t>(tapsAcross); ++tap) {
        for (size_t i = 0; i < group.size; ++i) {
          group.rows.push_back(ofFeature[first + i].row[tap]);
        }
      }
      for (size_t i = 0; i < group.size; ++i) {
        group.filters[i] = ofFeature[first + i].filter;
        group.columns[i] = ofFeature[first + i].column;
      }
    }
  }
}

void Scanner::scanTile(int rows, int column) {
  const int taps = filters_->tapsDown;
  const int rowsIn = rows + taps - 1;
  const size_t part = static_cast<size_t>(rowsIn) * kTileColumns;
  const size_t tile = static_cast<size_t>(rows) * kTileColumns;
  rows_.resize(kMostTogether * part);
  sums_.assign(filters_->biases.size() * tile, 0);
  for (const Filters::Group& group : filters_->groups) {
    applyRows(map_.row(group.feature, 0) + column, map_.stride(), group.rows.data(),
              static_cast<int>(group.size), filters_->tapsAcross, rowsIn, kTileColumns, rows_.data());
    for (size_t i = 0; i < group.size; ++i) {
      addColumn(&rows_[i * part], kTileColumns, group.columns[i].data(), taps, rows,
                &sums_[group.filters[i] * tile]);
    }
  }
}

void Scanner::scanLevel(const GrayImage& picture, unsigned int level, double least) {
  const Filters& f = *filters_;
  const int cellsDown = FeatureMap::cellsOf(static_cast<int>(picture.nr()), f.cell);
  const int cellsAcross = FeatureMap::cellsOf(static_cast<int>(picture.nc()), f.cell);
  if (cellsDown < 1 || cellsAcross < 1) {
    return;
  }
  const Pyramid pyramid;
  const dlib::default_fhog_feature_extractor features;
  // The filters are centred, on the later of two middle cells where their size is even.
  const int above = (f.tapsDown - 1) / 2;
  const int before = (f.tapsAcross - 1) / 2;
  const int across = (cellsAcross + kTileColumns - 1) / kTileColumns * kTileColumns;
  for (int top = 0; top < cellsDown; top += kTileRows) {
    const int rows = std::min(kTileRows, cellsDown - top);
    const int wholeRows = (rows + kRowsTogether - 1) / kRowsTogether * kRowsTogether;
    map_.computeCells(picture, f.cell, top - above, wholeRows + f.tapsDown - 1, before,
                      across - cellsAcross + f.tapsAcross - 1 - before);
    for (int left = 0; left < across; left += kTileColumns) {
      scanTile(wholeRows, left);
      const int columns = std::min(kTileColumns, cellsAcross - left);
      for (size_t filter = 0; filter < f.biases.size(); ++filter) {
        for (int y = 0; y < rows; ++y) {
          const float* const scores =
              &sums_[(filter * static_cast<size_t>(wholeRows) + static_cast<size_t>(y)) * kTileColumns];
          for (int x = 0; x < columns; ++x) {
            if (scores[x] < f.biases[filter] + least) {
              continue;
            }
            const dlib::point centre(left + x + f.tapsAcross / 2, top + y + f.tapsDown / 2);
            const dlib::rectangle box = features.feats_to_image(
                dlib::centered_rect(centre, static_cast<unsigned long>(f.tapsAcross) - 2 * f.padding,
                                    static_cast<unsigned long>(f.tapsDown) - 2 * f.padding),
                f.cell, f.tapsDown, f.tapsAcross);
            require(found_.size() < kMostFound, KY_ERROR_MEMORY);
            dlib::rect_detection& detection = found_.emplace_back();
            detection.detection_confidence = scores[x] - f.biases[filter];
            detection.weight_index = filter;
            detection.rect = pyramid.rect_up(dlib::drectangle(box), level);
          }
        }
      }
    }
  }
}

std::vector<dlib::rect_detection> Scanner::find(GrayImage& picture, double least) {
  found_.clear();
  const Pyramid pyramid;
  dlib::rectangle size = dlib::get_rect(picture);
  for (unsigned int level = 0;;) {
    scanLevel(picture, level, least);
    size = pyramid.rect_down(dlib::drectangle(size));
    ++level;
    if (size.width() < filters_->leastWidth || size.height() < filters_->leastHeight ||
        level >= filters_->mostLevels) {
      break;
    }
    // A level is the one before in 5/6 of its size.
    const long rows = picture.nr() * 5 / 6;
    const long columns = picture.nc() * 5 / 6;
    if (rows < 1 || columns < 1) {
      break;
    }
    next_.set_size(rows, columns);
    resizer_.resize(picture, next_);
    swap(picture, next_);
  }

  std::sort(found_.begin(), found_.end(), [](const auto& a, const auto& b) {
    return std::tuple(-a.detection_confidence, a.weight_index, a.rect.top(), a.rect.left()) <
           std::tuple(-b.detection_confidence, b.weight_index, b.rect.top(), b.rect.left());
  });
  std::vector<dlib::rect_detection> kept;
  for (const dlib::rect_detection& detection : found_) {
    if (std::none_of(kept.begin(), kept.end(),
                     [&](const auto& other) { return filters_->overlap(other.rect, detection.rect); })) {
      kept.push_back(detection);
    }
  }
  return kept;
}

}  // namespace kyengine
