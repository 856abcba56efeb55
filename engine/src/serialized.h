// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// Checks of what dlib serialized, before dlib reads it: it takes memory for whatever sizes a file names, and
/// works with whatever indices. After these checks what dlib takes is in proportion to the file, and what it
/// reads fits together.
#pragma once

#include <istream>

namespace kyengine {

/// Checks that a `dlib::frontal_face_detector` comes next. Throws Failure when none does; the stream is where
/// it was.
void checkDetector(std::istream& in);

/// Checks that a `dlib::shape_predictor` comes next, of 1 to KY_FACE_MAX_POINTS points. Throws Failure when
/// none does; the stream is where it was.
void checkLandmarks(std::istream& in);

}  // namespace kyengine
