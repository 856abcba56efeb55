// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// Trackers: faces followed from frame to frame, and the C interface to them.
#include "face_finder.h"
// The configuration of dlib comes first.
#include <dlib/image_processing/correlation_tracker.h>

#include <algorithm>
#include <cmath>
#include <memory>
#include <mutex>
#include <tuple>
#include <utility>
#include <vector>

#include "identities.h"
#include "search.h"

namespace kyengine {
namespace {

/// Overlap (intersection over union) from which on a detection shows a face that is followed to that place.
constexpr double kSameFace = 0.3;
/// Score of a detection that is enough to confirm a face; a new one must reach KY_DEFAULT_THRESHOLD.
constexpr float kConfirmingScore = 0.4F;
/// Boxes that shrink below this, in pixels, hold nothing to follow.
constexpr double kSmallestBox = 16;

double overlapOf(const dlib::drectangle& a, const dlib::drectangle& b) {
  const double both = a.intersect(b).area();
  return both / (a.area() + b.area() - both);
}

/// A peak-to-side-lobe ratio in percent. Not a number, as in a picture without any contrast, is no agreement.
double alignmentOf(double peakToSideLobe) {
  constexpr double kFullRatio = 20;
  return std::isnan(peakToSideLobe) ? -1 : std::clamp(100 * peakToSideLobe / kFullRatio, 0.0, 100.0);
}

/// A face with an identity.
struct TrackedFace {
  int32_t id = 0;
  FoundFace face = {};
  bool seen = false;  ///< found or followed in the last frame
  int misses = 0;     ///< detections in a row that did not show it
  dlib::correlation_tracker follower;
};

class Tracker {
 public:
  Tracker(const char* modelPath, int config) : finder_(modelPath, config, Use::kVideo) {}

  std::vector<ky_face_t> track(const Frame& frame) {
    const std::lock_guard lock(mutex_);
    resize(frame.uprightWidth(), frame.uprightHeight());
    const bool due = framesToDetection_ == 0;
    framesToDetection_ = due ? detectInterval_ - 1 : framesToDetection_ - 1;
    const bool detects = due && finder_.hasRoom(width_, height_);
    if (!detects && std::none_of(faces_.begin(), faces_.end(), [](const TrackedFace& f) { return f.seen; })) {
      return {};
    }

    frame.toUprightGray(gray_);
    for (TrackedFace& face : faces_) {
      if (face.seen) {
        follow(face);
      }
    }
    if (detects) {
      detect();
    }
    return records(frame);
  }

  void reset() {
    const std::lock_guard lock(mutex_);
    clear();
  }

  /// The setters throw Failure when a value is out of its range, and return the one before.
  int setFaceLimit(int limit) {
    require(limit >= KY_MIN_FACE_LIMIT && limit <= KY_MAX_FACE_LIMIT, KY_ERROR_RANGE);
    const std::lock_guard lock(mutex_);
    while (faces_.size() > static_cast<size_t>(limit)) {
      faces_.erase(findWeakest());
    }
    return std::exchange(faceLimit_, limit);
  }

  int setDetectInterval(int interval) {
    require(interval >= KY_MIN_DETECT_INTERVAL && interval <= KY_MAX_DETECT_INTERVAL, KY_ERROR_RANGE);
    const std::lock_guard lock(mutex_);
    framesToDetection_ = std::min(framesToDetection_, interval - 1);
    return std::exchange(detectInterval_, interval);
  }

  int setAlignmentThreshold(int threshold) {
    require(threshold >= KY_MIN_ALIGNMENT_THRESHOLD && threshold <= KY_MAX_ALIGNMENT_THRESHOLD,
            KY_ERROR_RANGE);
    const std::lock_guard lock(mutex_);
    return std::exchange(alignmentThreshold_, threshold);
  }

 private:
  using Faces = std::vector<TrackedFace>;

  void clear() {
    faces_.clear();
    framesToDetection_ = 0;
  }

  /// Where faces were means nothing in frames of another size.
  void resize(int width, int height) {
    if (width != width_ || height != height_) {
      clear();
      width_ = width;
      height_ = height;
    }
  }

  /// The face to evict first: one that is out of sight before one that is not, then the one of the lowest
  /// score.
  Faces::iterator findWeakest() {
    return std::min_element(faces_.begin(), faces_.end(), [](const TrackedFace& a, const TrackedFace& b) {
      return std::tuple(a.seen, a.face.score) < std::tuple(b.seen, b.face.score);
    });
  }

  /// Moves a face to where it is in this picture. A face that is lost stays where it was seen last: what the
  /// follower learns elsewhere would only lead it astray.
  void follow(TrackedFace& face) {
    const double alignment = alignmentOf(face.follower.update(gray_));
    const dlib::drectangle box = face.follower.get_position();
    face.seen = alignment >= alignmentThreshold_ && box.width() >= kSmallestBox &&
                box.height() >= kSmallestBox &&
                dlib::drectangle(dlib::get_rect(gray_)).contains(dlib::center(box));
    if (face.seen) {
      face.face.box = box;
    }
  }

  /// Sets a face to where it was detected.
  void confirm(TrackedFace& face, const FoundFace& found) {
    face.follower.start_track(gray_, found.box);
    face.face = found;
    face.seen = true;
    face.misses = 0;
  }

  /// Detects faces, known and new.
  void detect() {
    std::vector<FoundFace> found = finder_.find(gray_, kConfirmingScore);

    // Each known face takes the detection that overlaps with it most, the closest pair first.
    std::vector<TrackedFace*> unmatched;
    for (TrackedFace& face : faces_) {
      unmatched.push_back(&face);
    }
    for (;;) {
      double most = kSameFace;
      auto known = unmatched.end();
      auto shown = found.end();
      for (auto face = unmatched.begin(); face != unmatched.end(); ++face) {
        for (auto detection = found.begin(); detection != found.end(); ++detection) {
          if (const double overlap = overlapOf((*face)->face.box, detection->box); overlap >= most) {
            most = overlap;
            known = face;
            shown = detection;
          }
        }
      }
      if (known == unmatched.end()) {
        break;
      }
      confirm(**known, *shown);
      unmatched.erase(known);
      found.erase(shown);
    }

    for (TrackedFace* face : unmatched) {
      ++face->misses;
    }
    std::erase_if(faces_, [](const TrackedFace& face) { return face.misses > KY_FORGIVEN_MISSES; });
    for (const FoundFace& face : found) {
      spawn(face);
    }
  }

  /// Spawns a track for a new face if it is certain enough and there is room, made at the cost of one out of
  /// sight.
  void spawn(const FoundFace& found) {
    if (found.score < KY_DEFAULT_THRESHOLD) {
      return;
    }
    if (faces_.size() >= static_cast<size_t>(faceLimit_)) {
      const auto weakest = findWeakest();
      if (weakest->seen) {
        return;
      }
      faces_.erase(weakest);
    }
    const int32_t id = identities_.next([this](int32_t number) {
      return std::any_of(faces_.begin(), faces_.end(),
                         [number](const TrackedFace& face) { return face.id == number; });
    });
    TrackedFace& face = faces_.emplace_back();
    face.id = id;
    confirm(face, found);
  }

  std::vector<ky_face_t> records(const Frame& frame) const {
    std::vector<ky_face_t> records;
    for (const TrackedFace& face : faces_) {
      if (face.seen) {
        records.push_back(finder_.record(gray_, face.face, frame));
        records.back().id = face.id;
      }
    }
    std::sort(records.begin(), records.end(), [](const ky_face_t& a, const ky_face_t& b) {
      return std::tuple(-a.score, a.id) < std::tuple(-b.score, b.id);
    });
    return records;
  }

  std::mutex mutex_;
  FaceFinder finder_;
  int faceLimit_ = KY_DEFAULT_FACE_LIMIT;
  int detectInterval_ = KY_DEFAULT_DETECT_INTERVAL;
  int alignmentThreshold_ = KY_DEFAULT_ALIGNMENT_THRESHOLD;

  int width_ = 0;
  int height_ = 0;
  int framesToDetection_ = 0;
  Identities identities_;
  Faces faces_;
  GrayImage gray_;
};

using Trackers = Handles<Tracker>;

/// Changes a setting of a tracker and tells the caller, who need not ask, what it was.
int set(int (Tracker::*setter)(int), ky_handle_t handle, int value, int* previous) {
  return guarded([&] {
    const int before = (*Trackers::find(handle).*setter)(value);
    if (previous != nullptr) {
      *previous = before;
    }
  });
}

}  // namespace
}  // namespace kyengine

using kyengine::Tracker;
using kyengine::Trackers;

int ky_face_create_tracker(ky_handle_t* handle, const char* modelPath, int config) {
  return Trackers::create(handle, modelPath, config);
}

void ky_face_destroy_tracker(ky_handle_t handle) { Trackers::destroy(handle); }

int ky_face_track(ky_handle_t handle, const unsigned char* image, int pixelFormat, int width, int height,
                  int stride, int orientation, ky_face_t** faces, int* count) {
  return kyengine::search(&Tracker::track, handle, image, pixelFormat, width, height, stride, orientation,
                          faces, count);
}

void ky_face_release_tracker_result(ky_face_t* faces, int /*count*/) { kyengine::releaseFaces(faces); }

void ky_face_reset_tracker(ky_handle_t handle) {
  kyengine::guarded([&] { Trackers::find(handle)->reset(); });
}

int ky_face_track_set_detect_face_cnt_limit(ky_handle_t handle, int limit, int* previous) {
  return kyengine::set(&Tracker::setFaceLimit, handle, limit, previous);
}

int ky_face_track_set_detect_interval(ky_handle_t handle, int interval, int* previous) {
  return kyengine::set(&Tracker::setDetectInterval, handle, interval, previous);
}

int ky_face_track_set_alignment_threshold(ky_handle_t handle, int threshold, int* previous) {
  return kyengine::set(&Tracker::setAlignmentThreshold, handle, threshold, previous);
}
