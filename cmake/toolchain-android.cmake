# SPDX-FileCopyrightText: the libjni_kyface_api authors
# SPDX-License-Identifier: Apache-2.0
# The toolchain of the NDK that ANDROID_NDK_HOME (or ANDROID_NDK) names. A build folder remembers its NDK, so that it can
# be configured again where neither is set.
set(kyface_named_ndk)
foreach(variable ANDROID_NDK_HOME ANDROID_NDK)
  if(NOT kyface_named_ndk AND NOT "$ENV{${variable}}" STREQUAL "")
    file(REAL_PATH "$ENV{${variable}}" kyface_named_ndk)
    if(NOT EXISTS ${kyface_named_ndk}/build/cmake/android.toolchain.cmake)
      message(FATAL_ERROR "${variable} is \"$ENV{${variable}}\", which is no Android NDK: "
                          "it has no build/cmake/android.toolchain.cmake.")
    endif()
  endif()
endforeach()
if(NOT KYFACE_NDK)
  if(NOT kyface_named_ndk)
    message(FATAL_ERROR "Set ANDROID_NDK_HOME (or ANDROID_NDK) to the folder of an Android NDK.")
  endif()
  set(KYFACE_NDK ${kyface_named_ndk} CACHE PATH "The Android NDK of this build folder")
elseif(kyface_named_ndk AND NOT kyface_named_ndk STREQUAL KYFACE_NDK)
  message(FATAL_ERROR "This build folder is of the NDK in ${KYFACE_NDK}, and another one is named: "
                      "${kyface_named_ndk}. Configure it with --fresh.")
elseif(NOT EXISTS ${KYFACE_NDK}/build/cmake/android.toolchain.cmake)
  message(FATAL_ERROR "This build folder is of the NDK in ${KYFACE_NDK}, which is not there any more. "
                      "Set ANDROID_NDK_HOME and configure it with --fresh.")
endif()
# Checks of the compiler are projects of their own, which read this file too.
list(APPEND CMAKE_TRY_COMPILE_PLATFORM_VARIABLES KYFACE_NDK)
include(${KYFACE_NDK}/build/cmake/android.toolchain.cmake)
