// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// The face engine's C interface (`libkyface_api`), as the bridge uses it.
///
/// The engine is a separate shared library with unmangled functions. Records cross the boundary as they stand
/// in memory, so their layout is fixed: every field offset below is checked at compile time.
///
/// Unless stated otherwise an int result is the engine's result code: 0 is success, any other value names a
/// failure and is the engine's own. Pixel formats, orientations and configuration flags are engine values.
#pragma once

#include <stddef.h>
#include <stdint.h>

#ifdef __cplusplus
extern "C" {
#endif

/// Largest number of landmark points that a face record holds.
#define KY_FACE_MAX_POINTS 256

/// A landmark in image coordinates (pixels).
typedef struct ky_pointf_t {
  float x;
  float y;
} ky_pointf_t;

/// A rectangle in image coordinates (pixels).
typedef struct ky_rect_t {
  int32_t left;
  int32_t top;
  int32_t right;
  int32_t bottom;
} ky_rect_t;

/// One face. Arrays of faces are packed, 2092 bytes a record.
typedef struct ky_face_t {
  ky_rect_t rect;
  float score;           ///< detection confidence
  int32_t points_count;  ///< valid entries of `points_array`, 0 to KY_FACE_MAX_POINTS
  float yaw;             ///< head pose, degrees
  float pitch;
  float roll;
  float eye_dist;  ///< distance between the eyes, pixels
  int32_t id;      ///< identity given by the tracker
  ky_pointf_t points_array[KY_FACE_MAX_POINTS];
} ky_face_t;

/// A detector, tracker or verifier: an opaque, pointer-sized engine value, NULL for none. Java carries it
/// as a `long`.
typedef void* ky_handle_t;

/// An engine-owned face feature.
typedef void* ky_feature_t;

// ---- detector -----------------------------------------------------------------------------------

/// Creates a detector from the model file at `model_path` (NULL: the engine's built-in model) and stores it
/// in `*handle`.
int ky_face_create_detector(ky_handle_t* handle, const char* model_path, int config);

/// Frees a detector.
void ky_face_destroy_detector(ky_handle_t handle);

/// Stores the current detection threshold in `*threshold`.
int ky_face_detect_get_threshold(ky_handle_t handle, float* threshold);

/// Sets the detection threshold.
int ky_face_detect_set_threshold(ky_handle_t handle, float threshold);

/// Detects the faces of one image. `stride` is the distance between two rows in bytes. On success `*faces` is
/// an engine-owned array of `*count` records, freed by `ky_face_release_detector_result`.
int ky_face_detect(ky_handle_t handle, const unsigned char* image, int pixel_format, int width, int height,
                   int stride, int orientation, ky_face_t** faces, int* count);

/// Frees a result of `ky_face_detect`; accepts NULL with a count of 0.
void ky_face_release_detector_result(ky_face_t* faces, int count);

/// Shows the engine's algorithm and model information.
int ky_face_algorithm_info(void);

// ---- tracker ------------------------------------------------------------------------------------

/// Creates a tracker from the model file at `model_path` (NULL: the built-in model) and stores it
/// in `*handle`.
int ky_face_create_tracker(ky_handle_t* handle, const char* model_path, int config);

/// Frees a tracker.
void ky_face_destroy_tracker(ky_handle_t handle);

/// Tracks the faces of the next frame; arguments and result as of `ky_face_detect`, the result being freed by
/// `ky_face_release_tracker_result`.
int ky_face_track(ky_handle_t handle, const unsigned char* image, int pixel_format, int width, int height,
                  int stride, int orientation, ky_face_t** faces, int* count);

/// Frees a result of `ky_face_track`; accepts NULL with a count of 0.
void ky_face_release_tracker_result(ky_face_t* faces, int count);

/// Forgets all tracked faces.
void ky_face_reset_tracker(ky_handle_t handle);

/// Sets how many faces are looked for at most; may write an int to `*previous`.
int ky_face_track_set_detect_face_cnt_limit(ky_handle_t handle, int limit, int* previous);

/// Sets how many frames lie between two detections; may write an int to `*previous`.
int ky_face_track_set_detect_interval(ky_handle_t handle, int interval, int* previous);

/// Sets the alignment threshold; may write an int to `*previous`.
int ky_face_track_set_alignment_threshold(ky_handle_t handle, int threshold, int* previous);

// ---- verifier -----------------------------------------------------------------------------------

/// Creates a verifier from the model file at `model_path` (NULL: the built-in model) and stores it
/// in `*handle`.
int ky_verify_create_handle(ky_handle_t* handle, const char* model_path);

/// Frees a verifier.
void ky_verify_destroy_handle(ky_handle_t handle);

/// Returns the model's version.
int ky_verify_get_version(ky_handle_t handle);

/// Returns the length of a feature, in bytes.
int ky_verify_get_feature_length(ky_handle_t handle);

/// Extracts the feature of `face` from an image. On success `*feature` is an engine-owned feature of
/// `*length` bytes, freed by `ky_verify_release_feature`.
int ky_verify_get_feature(ky_handle_t handle, const unsigned char* image, int pixel_format, int width,
                          int height, int stride, const ky_face_t* face, ky_feature_t* feature, int* length);

/// Writes the feature's text, zero-terminated, into `text`: ((length + 2) / 3) * 4 + 1 bytes.
void ky_verify_serialize_feature(ky_feature_t feature, char* text);

/// Returns a new feature read from a serialized, zero-terminated text, or NULL.
ky_feature_t ky_verify_deserialize_feature(const char* text);

/// Compares two features and stores their similarity in `*score`.
int ky_verify_compare_feature(ky_handle_t handle, ky_feature_t feature1, ky_feature_t feature2, float* score);

/// Frees a feature.
void ky_verify_release_feature(ky_feature_t feature);

#ifdef __cplusplus
}

static_assert(sizeof(ky_pointf_t) == 8 && sizeof(ky_rect_t) == 16 && sizeof(ky_face_t) == 2092);
static_assert(offsetof(ky_face_t, score) == 16 && offsetof(ky_face_t, points_count) == 20);
static_assert(offsetof(ky_face_t, yaw) == 24 && offsetof(ky_face_t, eye_dist) == 36);
static_assert(offsetof(ky_face_t, id) == 40 && offsetof(ky_face_t, points_array) == 44);
#endif
