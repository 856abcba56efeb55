# SPDX-FileCopyrightText: the libjni_kyface_api authors
# SPDX-License-Identifier: Apache-2.0
# This machine's clang, with the first version of cmake/llvm-versions that there is: 19 before others, as what is
# measured is measured with it. For toolchain files.
file(STRINGS ${CMAKE_CURRENT_LIST_DIR}/llvm-versions kyface_clangs)
list(TRANSFORM kyface_clangs PREPEND clang-)
find_program(KYFACE_CLANG NAMES ${kyface_clangs} NAMES_PER_DIR NO_CMAKE_FIND_ROOT_PATH)
if(NOT KYFACE_CLANG)
  message(FATAL_ERROR "There is no clang from 16 on. Run scripts/setup.sh, which installs one.")
endif()
set(CMAKE_C_COMPILER ${KYFACE_CLANG})
string(REGEX REPLACE "clang-([0-9]+)$" "clang++-\\1" CMAKE_CXX_COMPILER ${KYFACE_CLANG})
