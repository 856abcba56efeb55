// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// To be included before any other header of dlib.
///
/// Debian's package of dlib is configured to use a BLAS, a LAPACK and image file libraries. The engine
/// multiplies no large matrices and reads no image files, and without them its library depends on nothing but
/// the platform. These headers carry dlib's configuration; they are guarded, so what is undefined here stays
/// undefined.
#pragma once

#include <dlib/assert.h>
#include <dlib/test_for_odr_violations.h>

#undef DLIB_USE_BLAS
#undef DLIB_USE_LAPACK
#undef DLIB_JPEG_SUPPORT
#undef DLIB_PNG_SUPPORT
