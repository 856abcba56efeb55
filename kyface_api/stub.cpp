// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// What is linked against where the engine itself is not at hand: its functions, none of which does anything.
// It is never packaged.
#include "kyface_api/kyface_api.h"

extern "C" {

int ky_face_create_detector(ky_handle_t*, const char*, int) { return 0; }
void ky_face_destroy_detector(ky_handle_t) {}
int ky_face_detect_get_threshold(ky_handle_t, float*) { return 0; }
int ky_face_detect_set_threshold(ky_handle_t, float) { return 0; }
int ky_face_detect(ky_handle_t, const unsigned char*, int, int, int, int, int, ky_face_t**, int*) {
  return 0;
}
void ky_face_release_detector_result(ky_face_t*, int) {}
int ky_face_algorithm_info() { return 0; }
int ky_face_create_tracker(ky_handle_t*, const char*, int) { return 0; }
void ky_face_destroy_tracker(ky_handle_t) {}
int ky_face_track(ky_handle_t, const unsigned char*, int, int, int, int, int, ky_face_t**, int*) { return 0; }
void ky_face_release_tracker_result(ky_face_t*, int) {}
void ky_face_reset_tracker(ky_handle_t) {}
int ky_face_track_set_detect_face_cnt_limit(ky_handle_t, int, int*) { return 0; }
int ky_face_track_set_detect_interval(ky_handle_t, int, int*) { return 0; }
int ky_face_track_set_alignment_threshold(ky_handle_t, int, int*) { return 0; }
int ky_verify_create_handle(ky_handle_t*, const char*) { return 0; }
void ky_verify_destroy_handle(ky_handle_t) {}
int ky_verify_get_version(ky_handle_t) { return 0; }
int ky_verify_get_feature_length(ky_handle_t) { return 0; }
int ky_verify_get_feature(ky_handle_t, const unsigned char*, int, int, int, int, const ky_face_t*,
                          ky_feature_t*, int*) {
  return 0;
}
void ky_verify_serialize_feature(ky_feature_t, char*) {}
ky_feature_t ky_verify_deserialize_feature(const char*) { return nullptr; }
int ky_verify_compare_feature(ky_handle_t, ky_feature_t, ky_feature_t, float*) { return 0; }
void ky_verify_release_feature(ky_feature_t) {}

}  // extern "C"
