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

double Overlap(const dlib::drectangle& a, const dlib::drectangle& b) {
  const double both = a.intersect(b).area();
  return both / (a.area() + b.area() - both);
}

/// A peak-to-side-lobe ratio in percent. Not a number, as in a picture without any contrast, is no agreement.
double Alignment(double peak_to_side_lobe) {
  constexpr double kFullRatio = 20;
  return std::isnan(peak_to_side_lobe) ? -1 : std::clamp(100 * peak_to_side_lobe / kFullRatio, 0.0, 100.0);
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
  Tracker(const char* model_path, int config) : finder_(model_path, config, Use::kVideo) {}

  std::vector<ky_face_t> Track(const Frame& frame) {
    const std::lock_guard lock(mutex_);
    Resize(frame.upright_width(), frame.upright_height());
    const bool due = frames_to_detection_ == 0;
    frames_to_detection_ = due ? detect_interval_ - 1 : frames_to_detection_ - 1;
    const bool detects = due && finder_.HasRoom(width_, height_);
    if (!detects && std::none_of(faces_.begin(), faces_.end(), [](const TrackedFace& f) { return f.seen; })) {
      return {};
    }

    frame.ToUprightGray(gray_);
    for (TrackedFace& face : faces_) {
      if (face.seen) {
        Follow(face);
      }
    }
    if (detects) {
      Detect();
    }
    return Records(frame);
  }

  void Reset() {
    const std::lock_guard lock(mutex_);
    Clear();
  }

  /// The setters throw Failure when a value is out of its range, and return the one before.
  int SetFaceLimit(int limit) {
    Require(limit >= KY_MIN_FACE_LIMIT && limit <= KY_MAX_FACE_LIMIT, KY_ERROR_RANGE);
    const std::lock_guard lock(mutex_);
    while (faces_.size() > static_cast<size_t>(limit)) {
      faces_.erase(Weakest());
    }
    return std::exchange(face_limit_, limit);
  }

  int SetDetectInterval(int interval) {
    Require(interval >= KY_MIN_DETECT_INTERVAL && interval <= KY_MAX_DETECT_INTERVAL, KY_ERROR_RANGE);
    const std::lock_guard lock(mutex_);
    frames_to_detection_ = std::min(frames_to_detection_, interval - 1);
    return std::exchange(detect_interval_, interval);
  }

  int SetAlignmentThreshold(int threshold) {
    Require(threshold >= KY_MIN_ALIGNMENT_THRESHOLD && threshold <= KY_MAX_ALIGNMENT_THRESHOLD,
            KY_ERROR_RANGE);
    const std::lock_guard lock(mutex_);
    return std::exchange(alignment_threshold_, threshold);
  }

 private:
  using Faces = std::vector<TrackedFace>;

  void Clear() {
    faces_.clear();
    frames_to_detection_ = 0;
  }

  /// Where faces were means nothing in frames of another size.
  void Resize(int width, int height) {
    if (width != width_ || height != height_) {
      Clear();
      width_ = width;
      height_ = height;
    }
  }

  /// The face to evict first: one that is out of sight before one that is not, then the one of the lowest
  /// score.
  Faces::iterator Weakest() {
    return std::min_element(faces_.begin(), faces_.end(), [](const TrackedFace& a, const TrackedFace& b) {
      return std::tuple(a.seen, a.face.score) < std::tuple(b.seen, b.face.score);
    });
  }

  /// Moves a face to where it is in this picture. A face that is lost stays where it was seen last: what the
  /// follower learns elsewhere would only lead it astray.
  void Follow(TrackedFace& face) {
    const double alignment = Alignment(face.follower.update(gray_));
    const dlib::drectangle box = face.follower.get_position();
    face.seen = alignment >= alignment_threshold_ && box.width() >= kSmallestBox &&
                box.height() >= kSmallestBox &&
                dlib::drectangle(dlib::get_rect(gray_)).contains(dlib::center(box));
    if (face.seen) {
      face.face.box = box;
    }
  }

  /// Sets a face to where it was detected.
  void Confirm(TrackedFace& face, const FoundFace& found) {
    face.follower.start_track(gray_, found.box);
    face.face = found;
    face.seen = true;
    face.misses = 0;
  }

  /// Detects faces, known and new.
  void Detect() {
    std::vector<FoundFace> found = finder_.Find(gray_, kConfirmingScore);

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
          if (const double overlap = Overlap((*face)->face.box, detection->box); overlap >= most) {
            most = overlap;
            known = face;
            shown = detection;
          }
        }
      }
      if (known == unmatched.end()) {
        break;
      }
      Confirm(**known, *shown);
      unmatched.erase(known);
      found.erase(shown);
    }

    for (TrackedFace* face : unmatched) {
      ++face->misses;
    }
    std::erase_if(faces_, [](const TrackedFace& face) { return face.misses > KY_FORGIVEN_MISSES; });
    for (const FoundFace& face : found) {
      Spawn(face);
    }
  }

  /// Spawns a track for a new face if it is certain enough and there is room, made at the cost of one out of
  /// sight.
  void Spawn(const FoundFace& found) {
    if (found.score < KY_DEFAULT_THRESHOLD) {
      return;
    }
    if (faces_.size() >= static_cast<size_t>(face_limit_)) {
      const auto weakest = Weakest();
      if (weakest->seen) {
        return;
      }
      faces_.erase(weakest);
    }
    const int32_t id = identities_.Next([this](int32_t number) {
      return std::any_of(faces_.begin(), faces_.end(),
                         [number](const TrackedFace& face) { return face.id == number; });
    });
    TrackedFace& face = faces_.emplace_back();
    face.id = id;
    Confirm(face, found);
  }

  std::vector<ky_face_t> Records(const Frame& frame) const {
    std::vector<ky_face_t> records;
    for (const TrackedFace& face : faces_) {
      if (face.seen) {
        records.push_back(finder_.Record(gray_, face.face, frame));
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
  int face_limit_ = KY_DEFAULT_FACE_LIMIT;
  int detect_interval_ = KY_DEFAULT_DETECT_INTERVAL;
  int alignment_threshold_ = KY_DEFAULT_ALIGNMENT_THRESHOLD;

  int width_ = 0;
  int height_ = 0;
  int frames_to_detection_ = 0;
  Identities identities_;
  Faces faces_;
  GrayImage gray_;
};

using Trackers = Handles<Tracker>;

/// Changes a setting of a tracker and tells the caller, who need not ask, what it was.
int Set(int (Tracker::*setter)(int), ky_handle_t handle, int value, int* previous) {
  return Guarded([&] {
    const int before = (*Trackers::Find(handle).*setter)(value);
    if (previous != nullptr) {
      *previous = before;
    }
  });
}

}  // namespace
}  // namespace kyengine

using kyengine::Tracker;
using kyengine::Trackers;

int ky_face_create_tracker(ky_handle_t* handle, const char* model_path, int config) {
  return Trackers::Create(handle, model_path, config);
}

void ky_face_destroy_tracker(ky_handle_t handle) { Trackers::Destroy(handle); }

int ky_face_track(ky_handle_t handle, const unsigned char* image, int pixel_format, int width, int height,
                  int stride, int orientation, ky_face_t** faces, int* count) {
  return kyengine::Search(&Tracker::Track, handle, image, pixel_format, width, height, stride, orientation,
                          faces, count);
}

void ky_face_release_tracker_result(ky_face_t* faces, int /*count*/) { kyengine::ReleaseFaces(faces); }

void ky_face_reset_tracker(ky_handle_t handle) {
  kyengine::Guarded([&] { Trackers::Find(handle)->Reset(); });
}

int ky_face_track_set_detect_face_cnt_limit(ky_handle_t handle, int limit, int* previous) {
  return kyengine::Set(&Tracker::SetFaceLimit, handle, limit, previous);
}

int ky_face_track_set_detect_interval(ky_handle_t handle, int interval, int* previous) {
  return kyengine::Set(&Tracker::SetDetectInterval, handle, interval, previous);
}

int ky_face_track_set_alignment_threshold(ky_handle_t handle, int threshold, int* previous) {
  return kyengine::Set(&Tracker::SetAlignmentThreshold, handle, threshold, previous);
}
