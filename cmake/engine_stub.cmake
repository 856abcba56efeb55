# SPDX-FileCopyrightText: the libjni_kyface_api authors
# SPDX-License-Identifier: Apache-2.0
# A library with the face engine's symbols and soname, to link against where the engine itself is not at hand. Nothing
# in it works, and it is never packaged. Its symbols are those that kyface_api.h declares.
file(READ ${PROJECT_SOURCE_DIR}/kyface_api/include/kyface_api/kyface_api.h header)
string(REGEX MATCHALL "\nk?[a-z_* ]+[ *](ky_[a-z_]+)\\(" declarations "${header}")
set(stub "/* Generated from kyface_api.h. */\n")
foreach(declaration IN LISTS declarations)
  string(REGEX MATCH "ky_[a-z_]+\\(" name "${declaration}")
  string(APPEND stub "void ${name}void);\nvoid ${name}void) {}\n")
endforeach()
file(CONFIGURE OUTPUT ${CMAKE_CURRENT_BINARY_DIR}/engine_stub.c CONTENT "${stub}" @ONLY)

add_library(kyface_engine_stub SHARED ${CMAKE_CURRENT_BINARY_DIR}/engine_stub.c)
set_target_properties(kyface_engine_stub PROPERTIES
  OUTPUT_NAME kyface_api LIBRARY_OUTPUT_DIRECTORY ${CMAKE_CURRENT_BINARY_DIR}/engine_stub)
target_link_libraries(kyface_engine_stub PRIVATE kyface_link)
