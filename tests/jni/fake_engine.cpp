// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

#include "fake_engine.h"

#include <cinttypes>
#include <cstdio>
#include <cstring>

#include "journal.h"

namespace fake {

Engine& engine() {
  static thread_local Engine instance;
  return instance;
}

namespace {

std::string value(const void* pointer) {
  char text[32];
  snprintf(text, sizeof text, "%#" PRIxPTR, reinterpret_cast<uintptr_t>(pointer));
  return pointer == nullptr ? "0" : text;
}

std::string pin_name(const void* pointer) { return engine().vm->pin_name(pointer); }

std::string faces_name(const ky_face_t* faces) {
  return faces == nullptr ? "null" : faces == engine().faces.data() ? "faces" : "?";
}

template <typename Container, typename Value>
Value take(Container& from, Value otherwise) {
  if (from.empty()) {
    return otherwise;
  }
  Value first = from.front();
  from.erase(from.begin());
  return first;
}

int create(ky_handle_t* handle) {
  const int result = take(engine().create_results, 0);
  *handle = reinterpret_cast<ky_handle_t>(static_cast<uintptr_t>(0x1000 + ++engine().creations));
  return result;
}

int analyse(const char* name, ky_handle_t handle, const unsigned char* image, int pixel_format, int width,
            int height, int stride, int orientation, ky_face_t** faces, int* count) {
  note("%s(%s, %s, %d, %d, %d, %d, %d)", name, value(handle).c_str(), pin_name(image).c_str(), pixel_format,
       width, height, stride, orientation);
  Engine& self = engine();
  if (*faces != nullptr || *count != 0) {
    note("%s was not given null and 0", name);
  }
  if (!self.faces.empty() || self.count != Engine::kAsMany) {
    *faces = self.null_faces ? nullptr : self.faces.data();
    *count = self.count == Engine::kAsMany ? static_cast<int>(self.faces.size()) : self.count;
  }
  return self.result;
}

int set(const char* name, ky_handle_t handle, int new_value, int* previous) {
  note("%s(%s, %d)", name, value(handle).c_str(), new_value);
  *previous = 99;
  return engine().result;
}

}  // namespace

}  // namespace fake

using fake::engine;
using fake::note;
using fake::value;

extern "C" {

int ky_face_create_detector(ky_handle_t* handle, const char* model_path, int config) {
  note("ky_face_create_detector(%s, %d)", model_path == nullptr ? "null" : model_path, config);
  return fake::create(handle);
}

void ky_face_destroy_detector(ky_handle_t handle) {
  note("ky_face_destroy_detector(%s)", value(handle).c_str());
}

int ky_face_detect_get_threshold(ky_handle_t handle, float* threshold) {
  note("ky_face_detect_get_threshold(%s, %g)", value(handle).c_str(), static_cast<double>(*threshold));
  if (!engine().store_nothing) {
    *threshold = engine().value;
  }
  return engine().result;
}

int ky_face_detect_set_threshold(ky_handle_t handle, float threshold) {
  note("ky_face_detect_set_threshold(%s, %g)", value(handle).c_str(), static_cast<double>(threshold));
  return engine().result;
}

int ky_face_detect(ky_handle_t handle, const unsigned char* image, int pixel_format, int width, int height,
                   int stride, int orientation, ky_face_t** faces, int* count) {
  return fake::analyse("ky_face_detect", handle, image, pixel_format, width, height, stride, orientation,
                       faces, count);
}

void ky_face_release_detector_result(ky_face_t* faces, int count) {
  note("ky_face_release_detector_result(%s, %d)", fake::faces_name(faces).c_str(), count);
}

int ky_face_algorithm_info(void) {
  note("ky_face_algorithm_info()");
  return engine().result;
}

int ky_face_create_tracker(ky_handle_t* handle, const char* model_path, int config) {
  note("ky_face_create_tracker(%s, %d)", model_path == nullptr ? "null" : model_path, config);
  return fake::create(handle);
}

void ky_face_destroy_tracker(ky_handle_t handle) {
  note("ky_face_destroy_tracker(%s)", value(handle).c_str());
}

int ky_face_track(ky_handle_t handle, const unsigned char* image, int pixel_format, int width, int height,
                  int stride, int orientation, ky_face_t** faces, int* count) {
  return fake::analyse("ky_face_track", handle, image, pixel_format, width, height, stride, orientation,
                       faces, count);
}

void ky_face_release_tracker_result(ky_face_t* faces, int count) {
  note("ky_face_release_tracker_result(%s, %d)", fake::faces_name(faces).c_str(), count);
}

void ky_face_reset_tracker(ky_handle_t handle) { note("ky_face_reset_tracker(%s)", value(handle).c_str()); }

int ky_face_track_set_detect_face_cnt_limit(ky_handle_t handle, int limit, int* previous) {
  return fake::set("ky_face_track_set_detect_face_cnt_limit", handle, limit, previous);
}

int ky_face_track_set_detect_interval(ky_handle_t handle, int interval, int* previous) {
  return fake::set("ky_face_track_set_detect_interval", handle, interval, previous);
}

int ky_face_track_set_alignment_threshold(ky_handle_t handle, int threshold, int* previous) {
  return fake::set("ky_face_track_set_alignment_threshold", handle, threshold, previous);
}

int ky_verify_create_handle(ky_handle_t* handle, const char* model_path) {
  note("ky_verify_create_handle(%s)", model_path == nullptr ? "null" : model_path);
  return fake::create(handle);
}

void ky_verify_destroy_handle(ky_handle_t handle) {
  note("ky_verify_destroy_handle(%s)", value(handle).c_str());
}

int ky_verify_get_version(ky_handle_t handle) {
  note("ky_verify_get_version(%s)", value(handle).c_str());
  return engine().result;
}

int ky_verify_get_feature_length(ky_handle_t handle) {
  note("ky_verify_get_feature_length(%s)", value(handle).c_str());
  return engine().result;
}

int ky_verify_get_feature(ky_handle_t handle, const unsigned char* image, int pixel_format, int width,
                          int height, int stride, const ky_face_t* face, ky_feature_t* feature, int* length) {
  note("ky_verify_get_feature(%s, %s, %d, %d, %d, %d)", value(handle).c_str(), fake::pin_name(image).c_str(),
       pixel_format, width, height, stride);
  engine().record = *face;
  *feature = engine().feature;
  *length = engine().feature_length;
  return engine().result;
}

void ky_verify_serialize_feature(ky_feature_t feature, char* text) {
  note("ky_verify_serialize_feature(%s, %s)", value(feature).c_str(), fake::pin_name(text).c_str());
  if (engine().text.size() < engine().vm->pin_size(text)) {
    std::memcpy(text, engine().text.c_str(), engine().text.size() + 1);
  }
}

ky_feature_t ky_verify_deserialize_feature(const char* text) {
  note("ky_verify_deserialize_feature(%s)", fake::pin_name(text).c_str());
  return fake::take(engine().features, ky_feature_t{nullptr});
}

int ky_verify_compare_feature(ky_handle_t handle, ky_feature_t feature1, ky_feature_t feature2,
                              float* score) {
  note("ky_verify_compare_feature(%s, %s, %s)", value(handle).c_str(), value(feature1).c_str(),
       value(feature2).c_str());
  if (!engine().store_nothing) {
    *score = engine().value;
  }
  return engine().result;
}

void ky_verify_release_feature(ky_feature_t feature) {
  note("ky_verify_release_feature(%s)", value(feature).c_str());
}

}  // extern "C"
