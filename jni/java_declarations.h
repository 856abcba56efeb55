// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0
/// The native methods as javac declares them, where the build has Java: a definition whose parameters are not
/// those of the Java class does not compile.
#pragma once

#ifdef KYFACE_JAVA_DECLARATIONS
#include <com_vantrel_faceapi_FaceLibrary.h>
#include <com_vantrel_faceapi_PixelConversion.h>
#include <com_vantrel_faceapi_PlaneConversion.h>
#endif
