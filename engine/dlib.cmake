# SPDX-FileCopyrightText: the libjni_kyface_api authors
# SPDX-License-Identifier: Apache-2.0
# dlib from its sources, in KYFACE_DLIB_SOURCE: its headers, and the few files behind them that the engine needs. dlib's
# own build would look for libraries of this machine, and make all of it.
if(NOT EXISTS ${KYFACE_DLIB_SOURCE}/dlib/algs.h)
  message(FATAL_ERROR "KYFACE_DLIB_SOURCE is \"${KYFACE_DLIB_SOURCE}\", which has no dlib/algs.h: "
                      "scripts/setup.sh dlib brings the sources to .deps/dlib.")
endif()

# dlib's version is in its CMake file alone.
file(STRINGS ${KYFACE_DLIB_SOURCE}/dlib/CMakeLists.txt kyface_dlib_versions REGEX "set\\(CPACK_PACKAGE_VERSION_")
foreach(part MAJOR MINOR PATCH)
  string(REGEX MATCH "VERSION_${part} +\"?([0-9]+)" found "${kyface_dlib_versions}")
  if(NOT found)
    message(FATAL_ERROR "${KYFACE_DLIB_SOURCE}/dlib/CMakeLists.txt does not say which dlib it is.")
  endif()
  set(CPACK_PACKAGE_VERSION_${part} ${CMAKE_MATCH_1})
endforeach()
set(kyface_dlib_generated ${CMAKE_CURRENT_BINARY_DIR}/dlib)
configure_file(${KYFACE_DLIB_SOURCE}/dlib/revision.h.in ${kyface_dlib_generated}/dlib/revision.h @ONLY)

add_library(kyface_dlib STATIC ${KYFACE_DLIB_SOURCE}/dlib/base64/base64_kernel_1.cpp
                               ${KYFACE_DLIB_SOURCE}/dlib/entropy_decoder/entropy_decoder_kernel_2.cpp
                               # Every file that sees dlib's headers refers to it, if nothing is optimised away.
                               ${KYFACE_DLIB_SOURCE}/dlib/test_for_odr_violations.cpp)
target_include_directories(kyface_dlib SYSTEM PUBLIC ${kyface_dlib_generated} ${KYFACE_DLIB_SOURCE})
# Its defaults are taken, which is a configuration too: neither BLAS nor image files nor windows.
target_compile_definitions(kyface_dlib PUBLIC DLIB__CMAKE_GENERATED_A_CONFIG_H_FILE)
target_compile_options(kyface_dlib PUBLIC "SHELL:-include ${CMAKE_CURRENT_SOURCE_DIR}/dlib/code_points.h"
                                          -ffile-prefix-map=${KYFACE_DLIB_SOURCE}/=
                                   PRIVATE -w -fvisibility=hidden -fvisibility-inlines-hidden ${kyface_prefix_map})
target_link_libraries(kyface_dlib PRIVATE kyface_arithmetic)
