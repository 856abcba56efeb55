// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// A face engine that costs nothing and counts what it has handed out.
///
/// Detection and tracking find as many faces as the image's first byte says, each with as many points as its
/// second byte says. A feature has as many bytes as the image's first byte says. Where the third byte is not
/// 0 it claims more faces, or bytes, than there can be: the most, or with 2 the least that an int can say.
/// `ky_face_algorithm_info` returns how many result arrays and features are out.
#include <atomic>
#include <climits>
#include <cstdlib>
#include <cstring>

#include "kyface_api/kyface_api.h"

namespace {

std::atomic<int> handed_out{0};

struct Feature {
  int length;
};

template <typename T>
T* handOut(size_t count) {
  ++handed_out;
  return static_cast<T*>(calloc(count, sizeof(T)));
}

void takeBack(void* memory) {
  if (memory != nullptr) {
    --handed_out;
    free(memory);
  }
}

/// What is said of a number, given the byte that asks for a wrong one.
int claimed(int number, unsigned char lie) { return lie == 0 ? number : lie == 2 ? INT_MIN : INT_MAX; }

int find(const unsigned char* image, ky_face_t** faces, int* count) {
  *count = image[0];
  *faces = *count == 0 ? nullptr : handOut<ky_face_t>(static_cast<size_t>(*count));
  for (int i = 0; i < *count; ++i) {
    (*faces)[i].id = i + 1;
    (*faces)[i].points_count = image[1];
  }
  *count = claimed(*count, image[2]);
  return 0;
}

int create(ky_handle_t* handle) {
  *handle = &handed_out;
  return 0;
}

}  // namespace

extern "C" {

int ky_face_create_detector(ky_handle_t* handle, const char*, int) { return create(handle); }
void ky_face_destroy_detector(ky_handle_t) {}
int ky_face_detect_get_threshold(ky_handle_t, float*) { return 0; }
int ky_face_detect_set_threshold(ky_handle_t, float) { return 0; }
int ky_face_detect(ky_handle_t, const unsigned char* image, int, int, int, int, int, ky_face_t** faces,
                   int* count) {
  return find(image, faces, count);
}
void ky_face_release_detector_result(ky_face_t* faces, int) { takeBack(faces); }
int ky_face_algorithm_info() { return handed_out; }

int ky_face_create_tracker(ky_handle_t* handle, const char*, int) { return create(handle); }
void ky_face_destroy_tracker(ky_handle_t) {}
int ky_face_track(ky_handle_t, const unsigned char* image, int, int, int, int, int, ky_face_t** faces,
                  int* count) {
  return find(image, faces, count);
}
void ky_face_release_tracker_result(ky_face_t* faces, int) { takeBack(faces); }
void ky_face_reset_tracker(ky_handle_t) {}
int ky_face_track_set_detect_face_cnt_limit(ky_handle_t, int, int*) { return 0; }
int ky_face_track_set_detect_interval(ky_handle_t, int, int*) { return 0; }
int ky_face_track_set_alignment_threshold(ky_handle_t, int, int*) { return 0; }

int ky_verify_create_handle(ky_handle_t* handle, const char*) { return create(handle); }
void ky_verify_destroy_handle(ky_handle_t) {}
int ky_verify_get_version(ky_handle_t) { return 1; }
int ky_verify_get_feature_length(ky_handle_t) { return 0; }
int ky_verify_get_feature(ky_handle_t, const unsigned char* image, int, int, int, int, const ky_face_t*,
                          ky_feature_t* feature, int* length) {
  Feature* made = handOut<Feature>(1);
  made->length = image[0];
  *feature = made;
  *length = claimed(made->length, image[2]);
  return 0;
}
void ky_verify_serialize_feature(ky_feature_t feature, char* text) {
  const auto length = static_cast<size_t>((static_cast<Feature*>(feature)->length + 2) / 3 * 4);
  memset(text, 'A', length);
  text[length] = '\0';
}
ky_feature_t ky_verify_deserialize_feature(const char* text) {
  Feature* made = handOut<Feature>(1);
  made->length = static_cast<int>(strlen(text) / 4 * 3);
  return made;
}
int ky_verify_compare_feature(ky_handle_t, ky_feature_t, ky_feature_t, float* score) {
  *score = 1;
  return 0;
}
void ky_verify_release_feature(ky_feature_t feature) { takeBack(feature); }

}  // extern "C"
