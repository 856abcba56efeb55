// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// The values that the open face engine gives to the arguments and results of the C interface in
/// `kyface_api.h`.
///
/// The engine finds and tracks faces with dlib and needs no model file. Every function may be called from any
/// thread: calls on one handle wait for one another, calls on different handles run side by side. No function
/// throws, and none keeps a pointer to the caller's memory.
///
/// Rectangles are in pixels of the frame as it was handed over, `right` and `bottom` being the first column
/// and row outside, and lie within the frame.
#pragma once

#ifdef __cplusplus
extern "C" {
#endif

/// How the pixels of a frame are laid out. `stride` is the distance between two rows in bytes; interleaved
/// formats need at least `width` times their bytes per pixel, gray and the 4:2:0 formats at least `width`.
typedef enum ky_pixel_format_t {
  KY_PIXEL_GRAY = 0,  ///< one byte per pixel
  KY_PIXEL_BGR = 1,   ///< three bytes per pixel, blue first
  KY_PIXEL_RGB = 2,   ///< three bytes per pixel, red first
  KY_PIXEL_BGRA = 3,  ///< four bytes per pixel, blue first; alpha is ignored
  KY_PIXEL_RGBA = 4,  ///< four bytes per pixel, red first; alpha is ignored
  KY_PIXEL_NV21 = 5,  ///< `height` rows of luma, then `height / 2` rows of V, U pairs; even width and height
  KY_PIXEL_NV12 = 6   ///< `height` rows of luma, then `height / 2` rows of U, V pairs; even width and height
} ky_pixel_format_t;

/// By how many degrees a frame must be turned clockwise to show its faces upright: for the frames of a phone
/// held upright, what Android calls the sensor's orientation. Only the search turns the frame; what it finds
/// comes back in the coordinates of the frame as it was handed over.
typedef enum ky_orientation_t {
  KY_ORIENTATION_0 = 0,
  KY_ORIENTATION_90 = 90,
  KY_ORIENTATION_180 = 180,
  KY_ORIENTATION_270 = 270
} ky_orientation_t;

/// Configuration of a detector or tracker: one of these, or the size of the smallest faces that are to be
/// found, in pixels of the frame, from KY_MIN_SMALLEST_FACE to KY_MAX_SMALLEST_FACE. The detector sees faces
/// from the size of its window on (80 pixels for the built-in one); the frame is enlarged, or reduced, until
/// the smallest faces have that size. Time and memory grow with the pixels of the enlarged frame: half the
/// size takes four times as much.
typedef enum ky_config_t {
  KY_CONFIG_DEFAULT = 0,      ///< KY_DEFAULT_SMALLEST_FACE for a detector, KY_TRACKED_PIXELS for a tracker
  KY_CONFIG_LARGE_FACES = 1,  ///< never enlarges: faces from 80 pixels on with the built-in detector
  KY_CONFIG_SMALL_FACES = 2   ///< always enlarges to twice the size: faces from 40 pixels on
} ky_config_t;
#define KY_MIN_SMALLEST_FACE 20
#define KY_MAX_SMALLEST_FACE 8192

/// The smallest faces that a detector finds by default, in pixels, whatever the frame's size.
#define KY_DEFAULT_SMALLEST_FACE 36

/// By default a tracker searches a picture of at most this many pixels (640 x 480), to which the frame is
/// reduced or enlarged, so that a search takes the same time in frames of any size. The smallest faces that
/// it finds thus have a height of 80/480, a sixth, of a frame's of 4 : 3: 80 pixels at 640 x 480, 139 at 1280
/// x 720, 208 at 1920 x 1080, and 40 at 320 x 240. They are never smaller than KY_DEFAULT_SMALLEST_FACE.
#define KY_TRACKED_PIXELS 307200

/// Longest side of a frame, in pixels.
#define KY_MAX_FRAME_SIDE 8192

/// A face's score is the detector's confidence m (its distance from the border between face and no face) as
/// 1 / (1 + exp(-m)): 0.5 at the border, towards 1 for what is certainly a face. A detection counts when its
/// score reaches the threshold; 1 lets nothing pass.
///
/// The faces of a frame come in the order of their scores, the most certain first. Of equal ones a detector's
/// come from top to bottom, then from left to right; a tracker's by their identities.
#define KY_DEFAULT_THRESHOLD 0.55f
#define KY_MIN_THRESHOLD 0.01f
#define KY_MAX_THRESHOLD 1.0f

/// A tracker looks for faces in the first frame and then in every `interval`-th; in the frames between it
/// follows those that it knows. A face keeps its identity, a number from 1 on, as long as detections overlap
/// with where it is followed to, through up to KY_FORGIVEN_MISSES detections in a row that miss it; no living
/// face's number is given to another (after 2^31 - 1 the numbers begin anew), and ky_face_reset_tracker does
/// not start the numbers over. The score of a face is that of its last detection. Frames of one tracker have
/// one size and orientation: a frame of another size starts anew.
#define KY_DEFAULT_DETECT_INTERVAL 10
#define KY_MIN_DETECT_INTERVAL 1
#define KY_MAX_DETECT_INTERVAL 1000
#define KY_FORGIVEN_MISSES 4

/// The most faces that a tracker knows at a time; the best are kept.
#define KY_DEFAULT_FACE_LIMIT 8
#define KY_MIN_FACE_LIMIT 1
#define KY_MAX_FACE_LIMIT 32

/// How well what is seen must agree with a face for it to be followed there, in percent: a peak-to-side-lobe
/// ratio of the correlation of 20 and more is 100. A face that moves steadily has 60 and more, one that is
/// half covered 40, and another place 30 and less. A face below the threshold is not reported until a
/// detection finds it again.
#define KY_DEFAULT_ALIGNMENT_THRESHOLD 40
#define KY_MIN_ALIGNMENT_THRESHOLD 0
#define KY_MAX_ALIGNMENT_THRESHOLD 100

/// A verifier takes features of faces and compares two of them to a similarity from 0 to 1, of which
/// KY_VERIFY_THRESHOLD is the border between the same and another. What it is depends on what its model path
/// names, which is told by the file's content:
///
/// - NULL, or a landmark model (a `dlib::shape_predictor`): uniform local binary patterns, version
///   KY_VERIFY_VERSION. Similarity is 1 for the same picture, 0.5 at the border between the same face in
///   another frame and something else, 0 for nothing in common. That tells a face that is followed from what
///   it might be confused with; it says next to nothing about who somebody is. The crop that is described
///   goes by the eyes when the face record has the landmarks of a model of 68 or 5 points, or when the
///   verifier has a landmark model; it is upright then. Otherwise it is the face's rectangle as the frame
///   shows it, so that features compare between frames of one orientation.
/// - a descriptor, or a descriptor and a landmark model in one file (`scripts/setup.sh models` makes both):
/// 128
///   numbers by dlib's residual network for faces, version KY_DESCRIPTOR_VERSION, in colour where the frame
///   has it. Pictures of one person lie close together. The similarity of two at the distance d is 1 - d
///   / 1.2, at least 0: 0.5 at the distance 0.6 that the network was trained to separate persons at. The face
///   is aligned by its eyes, which come from the record's landmarks (68 or 5 points) or from the verifier's
///   landmark model; one whose eyes are not known is refused with KY_ERROR_EYES. Who relies on it reads
///   `docs/verification.md` first.
///
/// A feature has as many bytes, and its text as many with the terminating zero, as the constants of its
/// version say. A text that is not exactly one that was written is refused; no text is read beyond its zero
/// or its full length. Features compare with a verifier of their version, and descriptors with one of their
/// model: anything else is KY_ERROR_FEATURE_KIND. For no verifier at all, version and length are
/// KY_ERROR_HANDLE.
#define KY_VERIFY_VERSION 1
#define KY_FEATURE_LENGTH 3783
#define KY_FEATURE_TEXT_LENGTH 5045
#define KY_DESCRIPTOR_VERSION 2
#define KY_DESCRIPTOR_NUMBERS 128
#define KY_DESCRIPTOR_LENGTH 525
#define KY_DESCRIPTOR_TEXT_LENGTH 701
#define KY_DESCRIPTOR_THRESHOLD_DISTANCE 0.6f
#define KY_VERIFY_THRESHOLD 0.5f

/// Smallest face that patterns are taken of: the longer side of its rectangle, or twice the distance of its
/// eyes, in pixels.
#define KY_SMALLEST_VERIFIED_FACE 16

/// Smallest distance of the eyes that a descriptor is taken at, in pixels.
#define KY_SMALLEST_EYE_DISTANCE 12

/// Result codes: one for each kind of failure. A function that fails writes nothing but null pointers,
/// zero counts and zero scores.
typedef enum ky_result_t {
  KY_SUCCESS = 0,
  KY_ERROR_NULL_POINTER = -1,     ///< a pointer that must not be null is
  KY_ERROR_HANDLE = -2,           ///< the handle is null, destroyed, or of another kind
  KY_ERROR_PIXEL_FORMAT = -3,     ///< no ky_pixel_format_t
  KY_ERROR_SIZE = -4,             ///< a side is outside 1 to KY_MAX_FRAME_SIDE, or odd in a 4:2:0 format
  KY_ERROR_STRIDE = -5,           ///< the stride is shorter than a row
  KY_ERROR_ORIENTATION = -6,      ///< no ky_orientation_t
  KY_ERROR_CONFIG = -7,           ///< no ky_config_t
  KY_ERROR_RANGE = -8,            ///< a setting is outside its range
  KY_ERROR_MODEL_FILE = -9,       ///< the model file cannot be opened
  KY_ERROR_MODEL = -10,           ///< the model file holds no model that fits
  KY_ERROR_LANDMARK_MODEL = -11,  ///< the file beside the model is no landmark model that fits
  KY_ERROR_FACE = -12,            ///< the face record cannot belong to the frame, or the face is too small
  KY_ERROR_FEATURE = -13,         ///< the feature is null, released, or no feature
  KY_ERROR_MEMORY = -14,          ///< not enough memory
  KY_ERROR_INTERNAL = -15,        ///< anything else
  KY_ERROR_EYES = -16,            ///< nothing tells where the face's eyes are
  KY_ERROR_FEATURE_KIND = -17     ///< the feature is another verifier's
} ky_result_t;

// Detectors and trackers take as their model path
// - NULL: the built-in frontal face detector, without landmarks;
// - a detector serialized by dlib (`dlib::frontal_face_detector`); when there is a file of the same name with
//   KY_LANDMARKS_SUFFIX behind it, that is a landmark model serialized by dlib (`dlib::shape_predictor`);
// - a landmark model alone, which then goes with the built-in detector.
//
// Without a landmark model a face has no points, and its angles and eye distance are 0. With one it has the
// model's points (at most KY_FACE_MAX_POINTS); a model of 68 points in the usual order, or of 5 (two corners
// of each eye, and the nose), also gives the eye distance in pixels and the roll, and one of 68 points yaw
// and pitch. Angles are in degrees and describe the face in the upright frame, as the viewer sees it: yaw is
// positive when the nose points to the viewer's right, pitch when it points down, roll when the head leans
// clockwise. Yaw and pitch are estimates from an average head: a smile, which lifts the corners of the mouth,
// reads as a nod.
#define KY_LANDMARKS_SUFFIX ".landmarks"

#ifdef __cplusplus
}
#endif
